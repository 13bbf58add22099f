#include "common/CalSyncAgent.h"

#include "calendar/CalDataManager.h"
#include "common/Account.h"
#include "common/SyncResult.h"

using sync_result::kOk;

CalSyncAgent::CalSyncAgent(Account* account)
    : SyncAgent(account, VANTOR_PIM_SYNC_TYPE_CALENDAR),
      mpWorker(std::make_unique<SyncWorker>()),
      mpDownDirector(std::make_unique<CalDownSyncDirector>(account, mpWorker.get())),
      mpUpDirector(std::make_unique<CalUpSyncDirector>(account, mpWorker.get())) {}

CalSyncAgent::~CalSyncAgent() {
    mpWorker.reset();
}

int CalSyncAgent::doUpSync() {
    return mpWorker->start(mpUpDirector.get(), this);
}

int CalSyncAgent::doDownSync() {
    return mpWorker->start(mpDownDirector.get(), this);
}

int CalSyncAgent::doStop() {
    return mpWorker->stop(this);
}

bool CalSyncAgent::hasSomethingToSend() {
    return CalDataManager::getInstance().hasSomethingToSend(mpAccount->getAccountId());
}

void CalSyncAgent::countPending(int* dirty, int* deleted) {
    *dirty = *deleted = 0;
    (void)CalDataManager::getInstance().countPending(mpAccount->getAccountId(), dirty, deleted);
}

void CalSyncAgent::onSyncCompleted(SyncDirector* director, int result) {
    noteHalf(isDown(director), result, director->lastFailure());
    // Reserved before the run is ended, so that both halves are one visible sync.
    if (isDown(director) && result == kOk && hasSomethingToSend()) (void)startUpSync();
    continueSync(result);
}

void CalSyncAgent::onSyncStopped(SyncDirector* director, int result) {
    noteHalf(isDown(director), result, director->lastFailure());
    continueSync(result);
}
