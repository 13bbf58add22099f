#include "common/CalSyncAgent.h"

#include <initializer_list>

#include "calendar/CalDataManager.h"
#include "calendar/CalTodoDataManager.h"
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
    const int accountId = mpAccount->getAccountId();
    return CalDataManager::getInstance().hasSomethingToSend(accountId) ||
           CalTodoDataManager::getInstance().hasSomethingToSend(accountId);
}

void CalSyncAgent::countPending(int* dirty, int* deleted) {
    *dirty = *deleted = 0;
    for (CalManager* manager : std::initializer_list<CalManager*>{&CalDataManager::getInstance(),
                                                                  &CalTodoDataManager::getInstance()}) {
        int dirtyOfKind = 0;
        int deletedOfKind = 0;
        if (manager->countPending(mpAccount->getAccountId(), &dirtyOfKind, &deletedOfKind) != kOk) continue;
        *dirty += dirtyOfKind;
        *deleted += deletedOfKind;
    }
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
