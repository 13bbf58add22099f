#include "common/DirectedSyncAgent.h"

#include "common/Account.h"
#include "common/SyncResult.h"

using sync_result::kOk;
using sync_result::kTokenFailed;

DirectedSyncAgent::DirectedSyncAgent(Account* account, vantor_pim_sync_type_e type)
    : SyncAgent(account, type),
      mType(type),
      mpWorker(std::make_unique<SyncWorker>(account->getAccountId())) {}

DirectedSyncAgent::~DirectedSyncAgent() {
    mpWorker.reset();
}

void DirectedSyncAgent::setDirectors(std::unique_ptr<SyncDirector> down, std::unique_ptr<SyncDirector> up) {
    mpDownDirector = std::move(down);
    mpUpDirector = std::move(up);
}

void DirectedSyncAgent::forgetRefusals() {
    mpUpDirector->forgetRefusals();
}

int DirectedSyncAgent::doUpSync() {
    const int result = mpWorker->start(mpUpDirector.get(), this);
    if (result != kOk) onRequestsDropped();
    return result;
}

int DirectedSyncAgent::doDownSync() {
    return mpWorker->start(mpDownDirector.get(), this);
}

int DirectedSyncAgent::doStop() {
    return mpWorker->stop(this);
}

void DirectedSyncAgent::onSyncCompleted(SyncDirector* director, int result) {
    noteHalf(isDown(director), result, director->lastFailure());
    noteServer(result, director->isInTrouble());
    if (result == kTokenFailed) onRequestsDropped();
    // Reserved before the run is ended, so that both halves are one visible sync.
    if (isDown(director) && result == kOk && hasSomethingToSend()) (void)startUpSync();
    continueSync(result);
}

void DirectedSyncAgent::onSyncStopped(SyncDirector* director, int result) {
    noteHalf(isDown(director), result, director->lastFailure());
    onRequestsDropped();
    continueSync(result);
}
