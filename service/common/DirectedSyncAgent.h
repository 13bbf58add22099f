// DirectedSyncAgent: an agent whose halves are two directors on a worker of its own.
#pragma once

#include <memory>

#include "common/SyncAgent.h"
#include "common/SyncDirector.h"
#include "common/SyncWorker.h"

class DirectedSyncAgent : public SyncAgent, private SyncWorker::IResultListener {
public:
    ~DirectedSyncAgent() override;

    int doUpSync() override;
    int doDownSync() override;
    int doStop() override;
    void abandonRun() override { mpWorker->abandon(); }
    [[nodiscard]] vantor_pim_sync_type_e getType() const override { return mType; }

protected:
    DirectedSyncAgent(Account* account, vantor_pim_sync_type_e type);
    // The derived constructor gives the directors, which ask the worker whether they are stopped.
    void setDirectors(std::unique_ptr<SyncDirector> down, std::unique_ptr<SyncDirector> up);
    [[nodiscard]] SyncWorker* worker() { return mpWorker.get(); }
    // A run did not begin, was told to stop or lost its authorisation: an up sync that was asked for meanwhile may not come.
    virtual void onRequestsDropped() {}
    void forgetRefusals() override;

private:
    void onSyncCompleted(SyncDirector* director, int result) override;
    void onSyncStopped(SyncDirector* director, int result) override;
    [[nodiscard]] bool isDown(const SyncDirector* director) const { return director == mpDownDirector.get(); }

    const vantor_pim_sync_type_e mType;
    // The worker goes first: a director must outlive the thread that runs it.
    std::unique_ptr<SyncWorker> mpWorker;
    std::unique_ptr<SyncDirector> mpDownDirector;
    std::unique_ptr<SyncDirector> mpUpDirector;
};
