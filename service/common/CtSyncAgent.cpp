#include "common/CtSyncAgent.h"

#include "common/Account.h"
#include "common/SyncResult.h"
#include "contacts/CtDataManager.h"
#include "contacts/CtDownSyncDirector.h"
#include "contacts/CtUpSyncDirector.h"

CtSyncAgent::CtSyncAgent(Account* account) : DirectedSyncAgent(account, VANTOR_PIM_SYNC_TYPE_CONTACTS) {
    setDirectors(std::make_unique<CtDownSyncDirector>(account, worker()),
                 std::make_unique<CtUpSyncDirector>(account, worker()));
}

// A store that could not be opened at the start is opened once it can be.
void CtSyncAgent::prepare() {
    CtDataManager& manager = CtDataManager::getInstance();
    if (manager.metaData() == nullptr && manager.prepareSync() == sync_result::kOk)
        (void)manager.addAccount(mpAccount->getAccountId());
}

int CtSyncAgent::doUpSync() {
    prepare();
    return DirectedSyncAgent::doUpSync();
}

int CtSyncAgent::doDownSync() {
    prepare();
    return DirectedSyncAgent::doDownSync();
}

bool CtSyncAgent::hasSomethingToSend() {
    return CtDataManager::getInstance().hasSomethingToSend(mpAccount->getAccountId());
}

void CtSyncAgent::countPending(int* dirty, int* deleted) {
    *dirty = *deleted = 0;
    const int accountId = mpAccount->getAccountId();
    if (CtDataManager::getInstance().countPending(accountId, dirty, deleted) != sync_result::kOk)
        *dirty = *deleted = 0;
}

// The next change asks for another upload.
void CtSyncAgent::onRequestsDropped() {
    CtDataManager::getInstance().forgetPending(mpAccount->getAccountId());
}
