// SyncWorker: a thread with a GLib context of its own that runs one sync director at a time and hands the result back to the
// default main context.
// Owner: a sync agent, for its whole life.   Threads: constructor, start, stop and destructor on the main thread; isStopped from
// any; listeners are called on the default main context.
//
// The destructor tells a running director to stop and waits for it; its result then reaches nobody.
#pragma once

#include <glib.h>

#include <atomic>
#include <memory>

#include "common/SyncDirector.h"

class SyncWorker : public IStopQuery {
public:
    class IResultListener {
    public:
        virtual ~IResultListener() = default;
        // Exactly one of them, once per started request.
        virtual void onSyncCompleted(SyncDirector* director, int result) = 0;
        virtual void onSyncStopped(SyncDirector* director, int result) = 0;
    };

    // The log lines of its runs are those of `accountId`; 0 for none.
    explicit SyncWorker(int accountId = 0);
    ~SyncWorker() override;
    SyncWorker(const SyncWorker&) = delete;
    SyncWorker& operator=(const SyncWorker&) = delete;

    // Neither is owned. 0, or -1 when busy or when the request could not be posted.
    [[nodiscard]] int start(SyncDirector* director, IResultListener* listener);
    // The director goes on until it returns by itself; its result arrives through onSyncStopped. -1 when idle.
    [[nodiscard]] int stop(IResultListener* listener);
    // Tells a running director to stop, ahead of the destruction that waits for it.
    void abandon() { mIsInProgress = false; }
    // True when no request is in progress or the running one was stopped.
    [[nodiscard]] bool isStopped() override { return !mIsInProgress; }

private:
    struct SyncRequest;

    void initialize();
    [[nodiscard]] int addRequest();
    static gpointer threadBody(gpointer loop);
    static gboolean runRequest(gpointer request);
    static void addResponse(std::shared_ptr<SyncRequest> request);
    static gboolean onResponse(gpointer request);

    const int mAccountId;
    std::atomic<bool> mIsInProgress{false};
    SyncDirector* mpSyncDirector = nullptr;
    IResultListener* mpResultListener = nullptr;
    GMainContext* mpContext = nullptr;  // the loop holds the reference
    GMainLoop* mpLoop = nullptr;
    GThread* mpThread = nullptr;
    std::shared_ptr<SyncRequest> mpRequest;  // the latest; tells it when the worker is gone
};
