#include "common/SyncService.h"

#include <curl/curl.h>
#include <openssl/crypto.h>

#include <atomic>
#include <cstdlib>
#include <ctime>
#include <mutex>
#include <set>
#include <vector>

#include "calendar/CalDataManager.h"
#include "calendar/CalTodoDataManager.h"
#include "common/AccountDBHelper.h"
#include "common/CalSyncAgent.h"
#include "common/CtSyncAgent.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "common/SyncScheduleManager.h"
#include "contacts/CtDataManager.h"
#include "platform/database.h"
#include "platform/error.h"
#include "platform/service_manager.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

constexpr const char* kPackage = "com.morvane.vantor-service-account-lite";
constexpr long kRemovalTimeoutMs = 10'000;
constexpr int kSecondsPerMinute = 60;

std::atomic<bool> gExists{false};

// Without an account of the provider on the device there is nothing to do.
void queryAccounts(account_cb callback, void* userData) {
    if (account_query_account_by_package_name(callback, kPackage, userData) != PLATFORM_ERROR_NONE) {
        SYNC_INFO("there is no account of the provider on this device, the daemon ends");
        // An end before it was ready would count as a failure.
        platform::tellReady("There is no account");
        platform::tellStopping();
        exit(EXIT_SUCCESS);
    }
}

// Served by this version, a store that it does not know would be half the truth; what is on the device stays as it is.
void endWithNewerStore() {
    constexpr int kExitNotConfigured = 78;  // no restart can help, as the service manager is told
    if (!db_util_met_newer()) return;
    SYNC_ERR(
        "a store on this device was written by a newer version, the daemon ends; install that version again");
    exit(kExitNotConfigured);
}

}  // namespace

const SyncService::Kind SyncService::kKinds[2] = {
    {VANTOR_PIM_SYNC_TYPE_CALENDAR, &Account::getCalendarSync, &Account::getCalendarPeriod,
     &SyncService::mCalendarAgents, "The sync option for calendar is disabled"},
    {VANTOR_PIM_SYNC_TYPE_CONTACTS, &Account::getContactsSync, &Account::getContactsPeriod,
     &SyncService::mContactsAgents, "The sync option for contacts is disabled"},
};

const SyncService::Kind* SyncService::kindOf(int type) {
    for (const Kind& kind : kKinds) {
        if (kind.type == type) return &kind;
    }
    return nullptr;
}

SyncService& SyncService::getInstance() {
    static SyncService* const instance = new SyncService;
    return *instance;
}

bool SyncService::exists() {
    return gExists;
}

SyncService::SyncService() {
    initializeAccount();
    prepareDataManagers();
    (void)initialize();
    endWithNewerStore();
    curl_global_init(CURL_GLOBAL_ALL);
    setUpCryptoLocks();
    gExists = true;
    catchUp();
}

void SyncService::initializeAccount() {
    if (const int code = account_connect(); code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("account_connect error: %d", code);
        endWithNewerStore();
        SYNC_ASSERT_TEXT(false, "ret == ACCOUNT_ERROR_NONE");
    }
    queryAccounts([](account_h, void*) { return true; }, nullptr);
}

// Before there is an agent, and on the main thread: change callbacks can only be registered there. The to-dos are kept by the
// calendar service, which the calendar's manager connects.
void SyncService::prepareDataManagers() {
    if (CalDataManager::getInstance().prepareSync() != kOk) SYNC_ERR("not prepare sync");
    if (CalTodoDataManager::getInstance().prepareSync() != kOk) SYNC_ERR("not prepare sync");
    (void)CtDataManager::getInstance().prepareSync();
}

int SyncService::initialize() {
    std::set<int> onDevice;
    queryAccounts(
        [](account_h account, void* ids) {
            int id = 0;
            if (account_get_account_id(account, &id) == PLATFORM_ERROR_NONE)
                static_cast<std::set<int>*>(ids)->insert(id);
            return true;
        },
        &onDevice);
    AccountDBHelper& store = AccountDBHelper::getInstance();
    std::list<int> stored;
    (void)store.getAllAccountIds(&stored);
    for (const int id : stored) {
        if (onDevice.contains(id)) continue;
        SYNC_ERR("removed account[%d]", id);
        (void)store.deleteAccount(id);
        for (const Kind& kind : kKinds) deleteData(kind, id);
    }
    std::list<std::unique_ptr<Account>> accounts;
    if (store.getAllAccounts(&accounts) != kOk) {
        SYNC_ERR("getAllAccounts fail");
        return kFailed;
    }
    for (std::unique_ptr<Account>& account : accounts) {
        const int id = account->getAccountId();
        const bool isOn = account->getCalendarSync() || account->getContactsSync();
        (void)addAccount(std::move(account));
        if (isOn) (void)account_update_sync_status_by_id(id, ACCOUNT_SYNC_STATUS_IDLE);
    }
    watchEvents();
    return kOk;
}

// Today's library locks by itself and these calls are empty; an older one is told to lock with our mutexes.
void SyncService::setUpCryptoLocks() {
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wunused-value"
    static std::vector<std::mutex> locks(static_cast<size_t>(CRYPTO_num_locks()));
    [[maybe_unused]] const auto identify = [] { return static_cast<unsigned long>(pthread_self()); };
    [[maybe_unused]] const auto lock = [](int mode, int index, const char*, int) {
        std::mutex& mutex = locks[static_cast<size_t>(index)];
        (mode & CRYPTO_LOCK) != 0 ? mutex.lock() : mutex.unlock();
    };
    CRYPTO_set_id_callback(+identify);
    CRYPTO_set_locking_callback(+lock);
#pragma GCC diagnostic pop
}

void SyncService::catchUp() {
    const int64_t now = time(nullptr);
    for (const Kind& kind : kKinds) {
        for (const auto& [id, agent] : this->*kind.agents) {
            const Account& account = *mAccounts.at(id);
            const int64_t period = (account.*kind.period)();
            int last = 0;
            const bool known = AccountDBHelper::getInstance().getSyncTime(id, kind.type, &last) == kOk;
            if ((account.*kind.isOn)() && known && period > 0 && now - last >= period * kSecondsPerMinute) {
                agent->onSchedule();
            }
            if ((account.*kind.isOn)()) agent->sendWhatWaits();
        }
    }
}

void SyncService::quiesce() {
    account_unsubscribe_notification(std::exchange(mSubscription, nullptr));
    // All are told before the first is waited for: a transfer notices only within a second.
    for (const Kind& kind : kKinds) {
        for (const auto& [id, agent] : this->*kind.agents) agent->abandonRun();
    }
    for (const Kind& kind : kKinds) (this->*kind.agents).clear();
}

// --- accounts

int SyncService::addAccount(const vantor_pim_sync_account_s* record) {
    if (record == nullptr) return kFailed;
    const int id = record->account_id;
    if (mAccounts.contains(id)) {
        SYNC_ERR("The account(id=%d) already exists in the map", id);
        return kFailed;
    }
    if (AccountDBHelper::getInstance().hasAccount(id)) {
        SYNC_ERR("already exist (account_id=[%d])", id);
        return kFailed;
    }
    auto account = std::make_unique<Account>(*record);
    SYNC_ASSERT_TEXT(account != nullptr, "pAccount");
    if (AccountDBHelper::getInstance().insertAccount(*account) != kOk) {
        SYNC_ERR("account insert fail (account_id=[%d])", id);
        return kFailed;
    }
    return addAccount(std::move(account));
}

int SyncService::addAccount(std::unique_ptr<Account> account) {
    Account* added = account.get();
    addAccountToMap(std::move(account));
    for (const Kind& kind : kKinds) {
        if (!(added->*kind.isOn)()) continue;
        if (SyncAgent* agent = addAgent(kind, added)) schedule(kind, *added, agent);
    }
    return kOk;
}

void SyncService::addAccountToMap(std::unique_ptr<Account> account) {
    const int id = account->getAccountId();
    const bool ret = mAccounts.emplace(id, std::move(account)).second;
    SYNC_ASSERT_TEXT(ret, "ret");
}

std::unique_ptr<SyncAgent> SyncService::makeAgent(const Kind& kind, Account* account) {
    if (kind.type == VANTOR_PIM_SYNC_TYPE_CALENDAR) return std::make_unique<CalSyncAgent>(account);
    return std::make_unique<CtSyncAgent>(account);
}

SyncAgent* SyncService::addAgent(const Kind& kind, Account* account) {
    const auto [entry, ret] = (this->*kind.agents).emplace(account->getAccountId(), makeAgent(kind, account));
    SYNC_ASSERT_TEXT(ret, "ret");
    if (kind.type == VANTOR_PIM_SYNC_TYPE_CONTACTS)
        (void)CtDataManager::getInstance().addAccount(account->getAccountId());
    return entry->second.get();
}

SyncAgent* SyncService::findAgent(const Kind& kind, int accountId) {
    const auto found = (this->*kind.agents).find(accountId);
    return found == (this->*kind.agents).end() ? nullptr : found->second.get();
}

void SyncService::schedule(const Kind& kind, const Account& account, SyncAgent* agent) {
    (void)SyncScheduleManager::getInstance().addSchedule(agent, (account.*kind.period)());
    agent->runStatus().setNextAlarm(SyncScheduleManager::getInstance().nextAlarm(agent));
}

void SyncService::unschedule(SyncAgent* agent) {
    SyncScheduleManager::getInstance().removeSchedule(agent);
    SyncScheduleManager::getInstance().forget(agent);
    agent->runStatus().setNextAlarm(0);
}

void SyncService::deleteData(const Kind& kind, int accountId) {
    if (kind.type == VANTOR_PIM_SYNC_TYPE_CONTACTS) {
        (void)CtDataManager::getInstance().deleteAccount(accountId);
        return;
    }
    (void)CalDataManager::getInstance().deleteAccount(accountId);
    (void)CalTodoDataManager::getInstance().deleteAccount(accountId);
}

int SyncService::updateAccount(const vantor_pim_sync_account_s* record) {
    if (record == nullptr) return kFailed;
    const int id = record->account_id;
    const auto found = mAccounts.find(id);
    if (found == mAccounts.end()) {
        SYNC_ERR("Unable to find the account(id=%d) from the map", id);
        return kFailed;
    }
    if (!AccountDBHelper::getInstance().hasAccount(id)) {
        SYNC_ERR("account not exist (account_id=[%d])", id);
        return kFailed;
    }
    if (AccountDBHelper::getInstance().updateAccount(*record) != kOk) {
        SYNC_ERR("account insert fail (account_id=[%d])", id);
        return kFailed;
    }
    Account* account = found->second.get();
    const bool credentialsChanged =
        record->refresh_token != nullptr && account->getRefreshToken() != record->refresh_token;
    account->update(record);
    return updateAccount(account, credentialsChanged);
}

int SyncService::updateAccount(Account* account, bool credentialsChanged) {
    if (account == nullptr) return kFailed;
    for (const Kind& kind : kKinds) updateKind(kind, account, credentialsChanged);
    return kOk;
}

void SyncService::updateKind(const Kind& kind, Account* account, bool credentialsChanged) {
    const bool isOn = (account->*kind.isOn)();
    SyncAgent* agent = findAgent(kind, account->getAccountId());
    if (agent != nullptr) {
        if (credentialsChanged) agent->makeAvailable();
        unschedule(agent);
        if (!isOn) (void)agent->stopSync();
    } else if (isOn) {
        agent = addAgent(kind, account);
    }
    if (isOn && agent != nullptr) schedule(kind, *account, agent);
}

int SyncService::removeAccount(int accountId) {
    for (const Kind& kind : kKinds) {
        if (SyncAgent* agent = findAgent(kind, accountId)) (void)agent->stopSyncForRemoval();
    }
    for (const Kind& kind : kKinds) {
        if (removeKind(kind, accountId) != kOk) return kFailed;
    }
    if (!AccountDBHelper::getInstance().hasAccount(accountId)) {
        SYNC_ERR("account not exist (account_id=[%d])", accountId);
        return kFailed;
    }
    // An account that stays in the store would come back with the next start, so it stays in the map as well and can be removed
    // again.
    if (AccountDBHelper::getInstance().deleteAccount(accountId) != kOk) return kFailed;
    mAccounts.erase(accountId);
    return kOk;
}

int SyncService::removeKind(const Kind& kind, int accountId) {
    SyncAgent* agent = findAgent(kind, accountId);
    if (agent == nullptr) {
        // What was downloaded before the option was switched off goes with the account. Of an id that is not ours nothing goes:
        // it may be another provider's.
        if (mAccounts.contains(accountId)) deleteData(kind, accountId);
        return kOk;
    }
    if (agent->waitForResult(kRemovalTimeoutMs) != 0) {
        if (kind.type == VANTOR_PIM_SYNC_TYPE_CALENDAR) {
            SYNC_ERR("Unable to stop Calendar sync of an account (account_id=[%d])", accountId);
        } else {
            SYNC_ERR("Unable to stop Contacts sync of an account (account_id=[%d])", accountId);
        }
        return kFailed;
    }
    unschedule(agent);
    (this->*kind.agents).erase(accountId);
    deleteData(kind, accountId);
    return kOk;
}

int SyncService::getAccount(int accountId, vantor_pim_sync_account_s** out) {
    if (out == nullptr) return kFailed;
    if (!AccountDBHelper::getInstance().hasAccount(accountId)) {
        SYNC_ERR("account not exist (account_id=[%d])", accountId);
        return kFailed;
    }
    auto* record = static_cast<vantor_pim_sync_account_s*>(calloc(1, sizeof(vantor_pim_sync_account_s)));
    if (record == nullptr) {
        SYNC_ERR("calloc fail");
        return kFailed;
    }
    if (AccountDBHelper::getInstance().getAccount(accountId, record) != kOk) {
        SYNC_ERR("get fail");
        vantor_pim_sync_free_account(record);
        return kFailed;
    }
    *out = record;
    return kOk;
}

int SyncService::getSynctime(int accountId, int type, int* time) {
    if (!AccountDBHelper::getInstance().hasAccount(accountId)) {
        SYNC_ERR("account not exist (account_id=[%d])", accountId);
        return kFailed;
    }
    const int result = AccountDBHelper::getInstance().getSyncTime(accountId, type, time);
    if (result != kOk) SYNC_ERR("getSyncTime fail");
    return result;
}

int SyncService::getState(int accountId, int type) {
    const Kind* kind = kindOf(type);
    SyncAgent* agent = kind != nullptr ? findAgent(*kind, accountId) : nullptr;
    return agent != nullptr ? agent->getState() : SYNC_AGENT_STATE_NONE;
}

int SyncService::checkedAgent(int accountId, int type, SyncAgent** agent) {
    const auto found = mAccounts.find(accountId);
    if (found == mAccounts.end()) {
        SYNC_ERR("Unable to find the account(id=%d)", accountId);
        return kFailed;
    }
    const Kind* kind = kindOf(type);
    if (kind == nullptr) return kFailed;
    if (!((*found->second).*kind->isOn)()) {
        SYNC_ERR("%s", kind->disabledText);
        return kFailed;
    }
    *agent = findAgent(*kind, accountId);
    return *agent != nullptr ? kOk : kFailed;
}

int SyncService::startSync(int accountId, int type) {
    SyncAgent* agent = nullptr;
    return checkedAgent(accountId, type, &agent) == kOk ? agent->startSync() : kFailed;
}

int SyncService::stopSync(int accountId, int type) {
    SyncAgent* agent = nullptr;
    return checkedAgent(accountId, type, &agent) == kOk ? agent->stopSync() : kFailed;
}

int SyncService::startUpSync(int accountId, int type) {
    SyncAgent* agent = nullptr;
    return checkedAgent(accountId, type, &agent) == kOk ? agent->startUpSync() : kFailed;
}

bool SyncService::requestUpSync(int accountId, int type) {
    SyncAgent* agent = nullptr;
    return checkedAgent(accountId, type, &agent) == kOk && agent->requestUpSync();
}
