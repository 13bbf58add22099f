// CalSyncAgent: the agent of an account's calendars and events.
#pragma once

#include "calendar/CalDownSyncDirector.h"
#include "calendar/CalUpSyncDirector.h"
#include "common/SyncAgent.h"
#include "common/SyncWorker.h"

class CalSyncAgent : public SyncAgent, private SyncWorker::IResultListener {
public:
    explicit CalSyncAgent(Account* account);
    ~CalSyncAgent() override;

    int doUpSync() override;
    int doDownSync() override;
    int doStop() override;
    void abandonRun() override { mpWorker->abandon(); }
    [[nodiscard]] vantor_pim_sync_type_e getType() const override { return VANTOR_PIM_SYNC_TYPE_CALENDAR; }

protected:
    [[nodiscard]] bool hasSomethingToSend() override;
    void countPending(int* dirty, int* deleted) override;

private:
    void onSyncCompleted(SyncDirector* director, int result) override;
    void onSyncStopped(SyncDirector* director, int result) override;
    [[nodiscard]] bool isDown(const SyncDirector* director) const { return director == mpDownDirector.get(); }

    // The worker goes first: a director must outlive the thread that runs it.
    std::unique_ptr<SyncWorker> mpWorker;
    std::unique_ptr<CalDownSyncDirector> mpDownDirector;
    std::unique_ptr<CalUpSyncDirector> mpUpDirector;
};
