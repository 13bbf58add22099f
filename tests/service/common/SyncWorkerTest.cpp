// A worker with directors that a test holds open.
#include <gtest/gtest.h>

#include <condition_variable>
#include <mutex>
#include <thread>

#include "common/SyncWorker.h"
#include "service/common/MainLoop.h"

namespace {

// Runs until it is released, or until the worker says that it was stopped.
class HeldDirector : public SyncDirector {
public:
    explicit HeldDirector(int result, IStopQuery* stopQuery = nullptr)
        : mResult(result), mpStopQuery(stopQuery) {}

    int run() override {
        thread = std::this_thread::get_id();
        running = true;
        std::unique_lock lock(mMutex);
        while (!mReleased && !(mpStopQuery != nullptr && mpStopQuery->isStopped())) {
            mCondition.wait_for(lock, std::chrono::milliseconds(2));
        }
        return mResult;
    }
    void release() {
        const std::lock_guard lock(mMutex);
        mReleased = true;
        mCondition.notify_all();
    }
    std::atomic<bool> running{false};
    std::thread::id thread;

private:
    const int mResult;
    IStopQuery* const mpStopQuery;
    std::mutex mMutex;
    std::condition_variable mCondition;
    bool mReleased = false;
};

struct Listener : SyncWorker::IResultListener {
    void onSyncCompleted(SyncDirector* director, int result) override { note("completed", director, result); }
    void onSyncStopped(SyncDirector* director, int result) override { note("stopped", director, result); }
    void note(const char* how, SyncDirector* director, int result) {
        calls.push_back(std::string(how) + " " + std::to_string(result));
        thread = std::this_thread::get_id();
        last = director;
    }
    std::vector<std::string> calls;
    std::thread::id thread;
    SyncDirector* last = nullptr;
};

}  // namespace

TEST(SyncWorker, RunsElsewhereAndAnswersOnTheMainLoopOnce) {
    SyncWorker worker(7, "calendar");
    HeldDirector director(-1);
    Listener listener;
    EXPECT_TRUE(worker.isStopped());
    ASSERT_EQ(worker.start(&director, &listener), 0);
    EXPECT_FALSE(worker.isStopped());
    HeldDirector second(0);
    EXPECT_EQ(worker.start(&second, &listener), -1) << "busy";
    director.release();
    ASSERT_TRUE(iterateUntil([&] { return !listener.calls.empty(); }));
    iterateReady();
    EXPECT_EQ(listener.calls, std::vector<std::string>{"completed -1"});
    EXPECT_EQ(listener.last, &director);
    EXPECT_EQ(listener.thread, std::this_thread::get_id());
    EXPECT_NE(director.thread, std::this_thread::get_id());
    EXPECT_FALSE(second.running);
}

TEST(SyncWorker, AStoppedRunStillReportsItsResult) {
    SyncWorker worker(7, "calendar");
    Listener listener;
    EXPECT_EQ(worker.stop(&listener), -1) << "idle";
    HeldDirector director(-5);
    ASSERT_EQ(worker.start(&director, &listener), 0);
    ASSERT_EQ(worker.stop(&listener), 0);
    director.release();
    ASSERT_TRUE(iterateUntil([&] { return !listener.calls.empty(); }));
    EXPECT_EQ(listener.calls, std::vector<std::string>{"stopped -5"});
    HeldDirector next(0);
    next.release();
    ASSERT_EQ(worker.start(&next, &listener), 0);
    EXPECT_TRUE(iterateUntil([&] { return listener.calls.size() == 2; }));
}

TEST(SyncWorker, DestructionStopsTheRunAndNobodyHearsOfIt) {
    Listener listener;
    {
        auto worker = std::make_unique<SyncWorker>(7, "calendar");
        HeldDirector director(0, worker.get());
        ASSERT_EQ(worker->start(&director, &listener), 0);
        ASSERT_TRUE(iterateUntil([&] { return director.running.load(); }));
        worker.reset();  // waits for the director, which sees the stop
    }
    {
        // The response is queued already when the worker goes.
        HeldDirector director(0);
        director.release();
        iterateReady();
        SyncWorker worker(7, "calendar");
        ASSERT_EQ(worker.start(&director, &listener), 0);
        const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
        while (g_main_context_pending(nullptr) == FALSE && std::chrono::steady_clock::now() < deadline) {
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
    }
    iterateReady();
    EXPECT_TRUE(listener.calls.empty());
}
