// SyncService: the owner of the accounts and of their sync agents; reacts to clients' commands, to the account service, to
// settings and to local changes.
// Owner: process-wide, made on the first exported call, never destroyed.   Threads: main thread.
// Errors: 0, or -1 with a log line; results of agents are handed through.
#pragma once

#include <map>
#include <memory>

#include "common/Account.h"
#include "common/SyncAgent.h"
#include "common/SyncScheduleManager.h"
#include "common/vantor_pim_sync.h"
#include "platform/account.h"
#include "platform/settings.h"

class SyncService {
public:
    // Made on the first call. Without any account of the provider the process ends here with status 0.
    static SyncService& getInstance();
    // Whether getInstance() has made it.
    static bool exists();

    SyncService(const SyncService&) = delete;
    SyncService& operator=(const SyncService&) = delete;

    int addAccount(const vantor_pim_sync_account_s* record);
    int updateAccount(const vantor_pim_sync_account_s* record);
    int removeAccount(int accountId);
    // On success the caller owns the record.
    int getAccount(int accountId, vantor_pim_sync_account_s** out);
    int getSynctime(int accountId, int type, int* time);
    // 0 when there is no agent.
    int getState(int accountId, int type);
    int startSync(int accountId, int type);
    int stopSync(int accountId, int type);
    int startUpSync(int accountId, int type);
    // Whether the account's agent has begun an up sync or queued it.
    bool requestUpSync(int accountId, int type);

    // For the end of the daemon: running syncs are told to stop and waited for; no agent is left.
    void quiesce();

private:
    using AgentMap = std::map<int, std::unique_ptr<SyncAgent>>;  // by account id

    // What the two kinds differ in.
    struct Kind {
        vantor_pim_sync_type_e type;
        bool (Account::*isOn)() const;
        int (Account::*period)() const;
        AgentMap SyncService::*agents;
        const char* disabledText;
    };
    static const Kind kKinds[2];
    static const Kind* kindOf(int type);

    SyncService();
    void initializeAccount();
    static void prepareDataManagers();
    int initialize();
    void setUpCryptoLocks();

    int addAccount(std::unique_ptr<Account> account);
    void addAccountToMap(std::unique_ptr<Account> account);
    int updateAccount(Account* account, bool credentialsChanged);
    void updateKind(const Kind& kind, Account* account, bool credentialsChanged);
    int removeKind(const Kind& kind, int accountId);
    SyncAgent* addAgent(const Kind& kind, Account* account);
    static std::unique_ptr<SyncAgent> makeAgent(const Kind& kind, Account* account);
    SyncAgent* findAgent(const Kind& kind, int accountId);
    static void schedule(const Kind& kind, const Account& account, SyncAgent* agent);
    static void unschedule(SyncAgent* agent);
    // What the device keeps of the account's data of this kind.
    static void deleteData(const Kind& kind, int accountId);
    // The agent that a command is for, by the checks that all commands share.
    int checkedAgent(int accountId, int type, SyncAgent** agent);
    // What a daemon that was away owes: syncs whose time has passed, changes that were not sent.
    void catchUp();

    // Events (SyncServiceEvents.cpp).
    void watchEvents();
    static bool account_cb(const char* eventType, int accountId, void* userData);
    static void calendar_sync_cb(keynode_t* node, void* userData);
    static void psmCallback(keynode_t* node, void* userData);
    void setPowerSaving(bool on);
    void onPowerSavingMode(bool on);
    void restoreRunningStatus(int accountId);

    AgentMap mCalendarAgents;
    AgentMap mContactsAgents;
    std::map<int, std::unique_ptr<Account>> mAccounts;
    account_subscribe_h mSubscription = nullptr;
    bool mIsPowerSaving = SyncScheduleManager::isPowerSaving();  // what the schedules follow
};
