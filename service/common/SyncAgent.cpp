#include "common/SyncAgent.h"

#include <cerrno>
#include <ctime>
#include <utility>

#include "common/Account.h"
#include "common/AccountDBHelper.h"
#include "common/NetworkUtil.h"
#include "common/NotificationSendManager.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "common/SyncScheduleManager.h"
#include "common/SyncUtil.h"
#include "platform/error.h"
#include "platform/settings.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStopped;
using sync_result::kTokenFailed;

namespace {

class AgentLock {
public:
    explicit AgentLock(pthread_mutex_t* mutex) : mpMutex(mutex) { pthread_mutex_lock(mpMutex); }
    ~AgentLock() { pthread_mutex_unlock(mpMutex); }
    AgentLock(const AgentLock&) = delete;
    AgentLock& operator=(const AgentLock&) = delete;

private:
    pthread_mutex_t* mpMutex;
};

}  // namespace

struct SyncAgent::IdleRequest {
    SyncAgentOperation operation;
    SyncAgent* agent;
    guint source;
};

SyncAgent::SyncAgent(Account* account, vantor_pim_sync_type_e type)
    : mpAccount(account),
      mMutex PTHREAD_MUTEX_INITIALIZER,
      mResultCond PTHREAD_COND_INITIALIZER,
      mState(SYNC_AGENT_STATE_READY),
      mOperation(SYNC_OPERATION_IDLE),
      mIsDownSyncReserved(false),
      mIsUpSyncReserved(false),
      mIsRemoving(false),
      mIsWaitingResult(false),
      mRunStatus(account->getAccountId(), type) {}

SyncAgent::~SyncAgent() {
    for (const guint source : mIdleSources) g_source_remove(source);
    if (mPauseSource != 0) g_source_remove(mPauseSource);
    mpAccount = nullptr;
    mState = SYNC_AGENT_STATE_NONE;
    mOperation = 0;
    pthread_mutex_destroy(&mMutex);
    pthread_cond_destroy(&mResultCond);
    mIsDownSyncReserved = mIsUpSyncReserved = mIsRemoving = mIsWaitingResult = false;
}

int SyncAgent::getState() {
    const AgentLock lock(&mMutex);
    return mState;
}

void SyncAgent::setState(int newState) {
    if (newState == mState) return;
    auto change = NotificationSendManager::SYNC_STATE_NO_CHANGE;
    if (mState == SYNC_AGENT_STATE_IN_PROGRESS) {
        change = NotificationSendManager::SYNC_STATE_ENDED;
    } else if (newState == SYNC_AGENT_STATE_IN_PROGRESS) {
        change = NotificationSendManager::SYNC_STATE_STARTED;
        mRunStatus.begin();  // before anybody sees the state
    }
    mState = newState;
    if (change == NotificationSendManager::SYNC_STATE_ENDED) mRunStatus.end();
    NotificationSendManager::getInstance().notifyChange(mpAccount->getAccountId(), getType(), change);
}

int SyncAgent::startSync() {
    const AgentLock lock(&mMutex);
    mpAccount->retryGate(getType()).open();
    mMustForgetRefusals = true;
    return startSyncWithoutLock();
}

int SyncAgent::startSyncWithoutLock() {
    if (mState == SYNC_AGENT_STATE_IN_PROGRESS) return kFailed;
    if (mState != SYNC_AGENT_STATE_READY) {
        SYNC_ERR("The sync agent isn't available");
        return kFailed;
    }
    setState(SYNC_AGENT_STATE_IN_PROGRESS);
    SYNC_ASSERT(mIsDownSyncReserved == false);
    if (mIsUpSyncReserved) {
        mIsDownSyncReserved = true;
        return startUpSyncWithoutLock();
    }
    return startDownSyncWithoutLock();
}

int SyncAgent::startUpSync() {
    const AgentLock lock(&mMutex);
    return mustWait() ? kFailed : startUpSyncWithoutLock();
}

bool SyncAgent::requestUpSync() {
    const AgentLock lock(&mMutex);
    return mustWait() || startUpSyncWithoutLock() == kOk || mIsUpSyncReserved;
}

bool SyncAgent::mustWait() {
    const int seconds = mpAccount->retryGate(getType()).secondsLeft();
    if (seconds <= 0) return false;
    if (mPauseSource == 0)
        mPauseSource = g_timeout_add_seconds(static_cast<guint>(seconds), onPauseOver, this);
    return true;
}

gboolean SyncAgent::onPauseOver(gpointer data) {
    auto* agent = static_cast<SyncAgent*>(data);
    {
        const AgentLock lock(&agent->mMutex);
        agent->mPauseSource = 0;
    }
    agent->sendWhatWaits();
    return FALSE;
}

int SyncAgent::startUpSyncWithoutLock() {
    mIsUpSyncReserved = false;
    switch (mOperation) {
        case SYNC_OPERATION_IDLE:
            mOperation = SYNC_OPERATION_UP_SYNC;
            return addIdleRequest(SYNC_AGENT_OPERATION_UP_SYNC);
        case SYNC_OPERATION_UP_SYNC:
        case SYNC_OPERATION_DOWN_SYNC:
        case SYNC_OPERATION_STOPPING:
            mIsUpSyncReserved = true;
            return kFailed;
        default:
            SYNC_ASSERT_TEXT(false, "0");
            return kFailed;
    }
}

int SyncAgent::startDownSyncWithoutLock() {
    mIsDownSyncReserved = false;
    switch (mOperation) {
        case SYNC_OPERATION_IDLE:
            mOperation = SYNC_OPERATION_DOWN_SYNC;
            return addIdleRequest(SYNC_AGENT_OPERATION_DOWN_SYNC);
        case SYNC_OPERATION_UP_SYNC:
            mIsDownSyncReserved = true;
            return kFailed;
        default:
            SYNC_ASSERT_TEXT(false, "0");
            return kFailed;
    }
}

int SyncAgent::stopSync() {
    const AgentLock lock(&mMutex);
    if (mState != SYNC_AGENT_STATE_IN_PROGRESS) {
        SYNC_ERR("The sync agent isn't in progress");
        return kFailed;
    }
    switch (mOperation) {
        case SYNC_OPERATION_STOPPING:
            return kOk;
        case SYNC_OPERATION_UP_SYNC:
            mIsDownSyncReserved = false;
            mIsUpSyncReserved = true;
            break;
        case SYNC_OPERATION_DOWN_SYNC:
            break;
        default:
            SYNC_ASSERT_TEXT(false, "0");
    }
    mOperation = SYNC_OPERATION_STOPPING;
    return addIdleRequest(SYNC_AGENT_OPERATION_STOP);
}

int SyncAgent::stopSyncForRemoval() {
    {
        const AgentLock lock(&mMutex);
        mIsRemoving = true;
    }
    return stopSync();
}

int SyncAgent::continueSync(int result) {
    const AgentLock lock(&mMutex);
    const int code = continueWithoutLock(result);
    signal();
    return code;
}

int SyncAgent::continueWithoutLock(int result) {
    if (mState == SYNC_AGENT_STATE_NONE || mState == SYNC_AGENT_STATE_UNAVAILABLE) {
        SYNC_ERR("The sync agent isn't ready");
        // The worker is done all the same; an agent that stayed busy would never send again.
        if (mState == SYNC_AGENT_STATE_UNAVAILABLE) mOperation = SYNC_OPERATION_IDLE;
        return kFailed;
    }
    if (mOperation < SYNC_OPERATION_UP_SYNC) {
        SYNC_ERR("The sync operation cannot be continued");
        return kFailed;
    }
    const int finished = mOperation;
    if (mIsRemoving) {
        mOperation = SYNC_OPERATION_IDLE;
        setState(SYNC_AGENT_STATE_READY);
        return kOk;
    }
    if (result == kTokenFailed) {
        mOperation = SYNC_OPERATION_IDLE;
        mIsDownSyncReserved = mIsUpSyncReserved = false;
        setState(SYNC_AGENT_STATE_UNAVAILABLE);
        return kFailed;
    }
    if (mIsDownSyncReserved) {
        mOperation = SYNC_OPERATION_IDLE;
        return startDownSyncWithoutLock();
    }
    if (result == kOk && finished == SYNC_OPERATION_DOWN_SYNC) updateSyncTime();
    if (mustWait()) mIsUpSyncReserved = false;
    if (mIsUpSyncReserved) {
        if (finished != SYNC_OPERATION_DOWN_SYNC) setState(SYNC_AGENT_STATE_READY);
        mOperation = SYNC_OPERATION_IDLE;
        return startUpSyncWithoutLock();
    }
    mOperation = SYNC_OPERATION_IDLE;
    setState(SYNC_AGENT_STATE_READY);
    return kOk;
}

void SyncAgent::signal() {
    mIsWaitingResult = false;
    pthread_cond_signal(&mResultCond);
}

int SyncAgent::addIdleRequest(SyncAgentOperation operation) {
    auto* request = new IdleRequest{operation, this, 0};
    const guint srcId = g_idle_add_full(G_PRIORITY_DEFAULT_IDLE, onIdleRequest, request,
                                        [](gpointer data) { delete static_cast<IdleRequest*>(data); });
    SYNC_ASSERT(srcId != 0);
    request->source = srcId;
    mIdleSources.insert(srcId);
    return kOk;
}

gboolean SyncAgent::onIdleRequest(gpointer data) {
    const IdleRequest request = *static_cast<IdleRequest*>(data);
    SyncAgent* agent = request.agent;
    bool mustForget = false;
    {
        const AgentLock lock(&agent->mMutex);
        agent->mIdleSources.erase(request.source);
        if (request.operation == SYNC_AGENT_OPERATION_UP_SYNC)
            mustForget = std::exchange(agent->mMustForgetRefusals, false);
    }
    int result = kFailed;
    switch (request.operation) {
        case SYNC_AGENT_OPERATION_UP_SYNC:
            if (mustForget) agent->forgetRefusals();
            result = agent->doUpSync();
            break;
        case SYNC_AGENT_OPERATION_DOWN_SYNC:
            result = agent->doDownSync();
            break;
        case SYNC_AGENT_OPERATION_STOP:
            result = agent->doStop();
            break;
        default:
            SYNC_ASSERT_TEXT(false, "0");
    }
    if (result != kOk) {
        SYNC_ERR("A sync operation failed due to an internal problem : %d", result);
        agent->continueSync(kOk);
    }
    return FALSE;
}

void SyncAgent::updateSyncTime() {
    const auto now = static_cast<int>(time(nullptr));
    if (AccountDBHelper::getInstance().updateSyncTime(mpAccount->getAccountId(), getType(), now) != kOk) {
        SYNC_ERR("updateSyncTime fail");
    }
}

int SyncAgent::waitForResult(long timeoutMs) {
    constexpr long kMsPerSecond = 1000;
    constexpr long kNsPerMs = 1'000'000;
    const AgentLock lock(&mMutex);
    if (mState != SYNC_AGENT_STATE_IN_PROGRESS) return 0;
    timespec deadline{};
    clock_gettime(CLOCK_REALTIME, &deadline);
    deadline.tv_sec += timeoutMs / kMsPerSecond;
    deadline.tv_nsec += kNsPerMs * (timeoutMs % kMsPerSecond);  // not carried over
    mIsWaitingResult = true;
    for (;;) {
        const int code = pthread_cond_timedwait(&mResultCond, &mMutex, &deadline);
        if (code == 0) {
            if (mIsWaitingResult) continue;
            return 0;
        }
        if (code == ETIMEDOUT) {
            mIsWaitingResult = false;
            return ETIMEDOUT;
        }
        SYNC_ERR("pthread_cond_timedwait error: %d", code);
        SYNC_ASSERT_TEXT(false, "0");
    }
}

void SyncAgent::onSchedule() {
    const LogContext context(mpAccount->getAccountId(), SyncRunStatus::nameOf(getType()));
    if (is_storage_full() < 0) {
        SYNC_ERR("storage fail");
        return;
    }
    int autoSync = 1;
    if (vconf_get_int("db/account/auto_sync", &autoSync) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("vconf_get_int failed");
        autoSync = 1;
    }
    if (autoSync == 0) return;
    if (mpAccount->getRoaming() == 0 && is_roaming_zone() != 0) return;
    if (const int seconds = mpAccount->retryGate(getType()).secondsLeft(); seconds > 0) {
        SYNC_INFO("the scheduled sync is left out, the server is left alone for %d more seconds", seconds);
        return;
    }
    const AgentLock lock(&mMutex);
    (void)startSyncWithoutLock();
}

void SyncAgent::makeAvailable() {
    {
        const AgentLock lock(&mMutex);
        if (mState != SYNC_AGENT_STATE_UNAVAILABLE) return;
        setState(SYNC_AGENT_STATE_READY);
    }
    sendWhatWaits();
}

void SyncAgent::sendWhatWaits() {
    if (hasSomethingToSend()) (void)startUpSync();
}

void SyncAgent::noteServer(int result, bool isInTrouble) {
    RetryGate& gate = mpAccount->retryGate(getType());
    if (result == kOk) gate.open();
    if (result != kFailed || !isInTrouble) return;
    gate.runFailed();
    if (!hasSomethingToSend()) return;
    const AgentLock lock(&mMutex);
    (void)mustWait();
}

void SyncAgent::noteHalf(bool isDown, int result, const std::string& failure) {
    int dirty = 0;
    int deleted = 0;
    countPending(&dirty, &deleted);
    std::string reason = failure;
    if (reason.empty() && result != kOk)
        reason = result == kStopped ? "the sync was stopped" : "the sync failed";
    const AgentLock lock(&mMutex);
    mRunStatus.endHalf(isDown, result, reason);
    mRunStatus.setPending(dirty, deleted);
    mRunStatus.setNextAlarm(SyncScheduleManager::getInstance().nextAlarm(this));
}
