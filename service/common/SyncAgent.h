// SyncAgent: the state machine that runs the synchronisation of one data kind of one account.
// Owner: SyncService.   Threads: public operations on the main thread; mMutex guards every member all the same. The worker thread
// never touches an agent.
//
// Visible states (vantor_pim_sync_state_e) and what changes them:
//
//   from  event                                                                              to  notified as
//   1     startSync                                                                          2   started
//   2     continueSync with nothing queued, with an up sync queued behind an up sync or
//         a stop, or while the account is being removed                                      1   ended
//   2     continueSync with -5                                                               3   ended
//   1     continueSync with -5 (after an up sync that nobody saw)                            3   no change
//   3     makeAvailable                                                                      1   no change
//   any   destructor                                                                         0   not notified
//
// A sync that a user sees is: the queued up sync, if any, then the down sync; or the down sync, then the up sync that was queued
// while it ran. An up sync that begins in state 1 is not visible.
#pragma once

#include <glib.h>
#include <pthread.h>

#include <set>

#include "common/ISyncScheduleListener.h"
#include "common/SyncRunStatus.h"
#include "common/vantor_pim_sync.h"

class Account;

class SyncAgent : public ISyncScheduleListener {
public:
    // What the worker is doing. The values are fixed.
    enum SyncAgentRunningOperation {
        SYNC_OPERATION_IDLE = 1,
        SYNC_OPERATION_UP_SYNC = 2,
        SYNC_OPERATION_DOWN_SYNC = 3,
        SYNC_OPERATION_STOPPING = 4,
    };
    // The request posted to the main loop.
    enum SyncAgentOperation {
        SYNC_AGENT_OPERATION_UP_SYNC = 1,
        SYNC_AGENT_OPERATION_DOWN_SYNC = 2,
        SYNC_AGENT_OPERATION_STOP = 3,
    };

    void onSchedule() override;
    ~SyncAgent() override;
    // Each returns 0 when the operation has begun.
    virtual int doUpSync() = 0;
    virtual int doDownSync() = 0;
    virtual int doStop() = 0;
    // For the end of the daemon: tells a running operation to end and does not wait. Its result reaches nobody.
    virtual void abandonRun() = 0;
    [[nodiscard]] virtual vantor_pim_sync_type_e getType() const = 0;

    SyncAgent(const SyncAgent&) = delete;
    SyncAgent& operator=(const SyncAgent&) = delete;

    // All: 0, or -1 for refusal. A sync that a client asks for begins whatever the server said before; an up sync, which nobody asks
    // for, waits until the server may be asked again.
    [[nodiscard]] int startSync();
    [[nodiscard]] int startUpSync();
    // The same for whoever need not ask twice: whether an up sync has begun or is queued behind what runs.
    [[nodiscard]] bool requestUpSync();
    [[nodiscard]] int stopSync();
    [[nodiscard]] int stopSyncForRemoval();
    // State 3 becomes 1; what waits on the device is then sent.
    void makeAvailable();
    // Asks for an up sync when marks or unexamined changes wait on the device.
    void sendWhatWaits();
    // Waits until the operation that runs has ended: 0, or a pthread code (ETIMEDOUT).
    [[nodiscard]] int waitForResult(long timeoutMs);
    // The decision after every finished operation.
    int continueSync(int result);

    [[nodiscard]] int getState();
    [[nodiscard]] SyncRunStatus& runStatus() { return mRunStatus; }

protected:
    // `account` is not owned and outlives the agent.
    SyncAgent(Account* account, vantor_pim_sync_type_e type);

    // Records how a half ended, for the tool. Called before continueSync.
    void noteHalf(bool isDown, int result, const std::string& failure);
    // What the half's end means for runs that nobody asks for; `isInTrouble` as in SyncDirector.h.
    void noteServer(int result, bool isInTrouble);
    // The up sync that begins is one that a client has asked for: what was refused for good is tried again.
    virtual void forgetRefusals() {}

    // Whether marks or unexamined changes wait on the device.
    [[nodiscard]] virtual bool hasSomethingToSend() { return false; }
    virtual void countPending(int* dirty, int* deleted) { *dirty = *deleted = 0; }

    Account* mpAccount;

private:
    friend struct SyncAgentProbe;  // lets a test put an agent into any state
    struct IdleRequest;

    // The caller holds mMutex.
    void setState(int newState);
    [[nodiscard]] int startUpSyncWithoutLock();
    [[nodiscard]] int startDownSyncWithoutLock();
    [[nodiscard]] int continueWithoutLock(int result);
    [[nodiscard]] int startSyncWithoutLock();
    // Whether the server is left alone for now; then what waits is sent when the pause is over.
    [[nodiscard]] bool mustWait();
    static gboolean onPauseOver(gpointer data);
    void updateSyncTime();
    void signal();
    [[nodiscard]] int addIdleRequest(SyncAgentOperation operation);
    static gboolean onIdleRequest(gpointer data);

    pthread_mutex_t mMutex;
    pthread_cond_t mResultCond;
    int mState;
    int mOperation;
    bool mIsDownSyncReserved;
    bool mIsUpSyncReserved;
    bool mIsRemoving;
    bool mIsWaitingResult;
    bool mMustForgetRefusals = false;
    guint mPauseSource = 0;        // likewise, 0 when no pause is waited for
    std::set<guint> mIdleSources;  // posted and not yet run; they go with the agent
    SyncRunStatus mRunStatus;
};
