// CalUpSyncDirector: sends one account's local changes of events and tasks to the server.
// Owner: the calendar agent; lives as long as it.   Threads: run() on the worker, one at a time.
#pragma once

#include <memory>
#include <string>

#include "calendar/CalSyncSide.h"
#include "calendar/CalUpSyncTasks.h"
#include "common/ParkedItems.h"
#include "common/SyncCurl.h"
#include "common/SyncDirector.h"

class Account;

class CalUpSyncDirector : public SyncDirector, private IProgressObserver {
public:
    // Neither pointer is owned. `stopQuery` may be NULL.
    CalUpSyncDirector(Account* account, IStopQuery* stopQuery);

    int run() override;
    [[nodiscard]] std::string lastFailure() const override { return mFailure; }
    [[nodiscard]] bool isInTrouble() const override { return mIsInTrouble; }
    void forgetRefusals() override { mParked.clear(); }

    [[nodiscard]] int syncCalendar() { return syncBooks(mEvents, mEventTask); }
    [[nodiscard]] int syncTodo() { return syncBooks(mTodos, mTodoTask); }

private:
    int onProgress(double downloadTotal, double downloaded, double uploadTotal, double uploaded) override;
    [[nodiscard]] bool isStopped() const { return mpStopQuery != nullptr && mpStopQuery->isStopped(); }
    [[nodiscard]] int syncBooks(CalSyncSide& side, CalUpSyncTask& task);

    Account* const mpAccount;
    IStopQuery* const mpStopQuery;
    std::shared_ptr<HttpShare> mpShare;
    CalEventSide mEvents;
    CalTodoSide mTodos;
    CalUpSyncEventTask mEventTask;
    CalUpSyncTodoTask mTodoTask;
    ParkedItems mParked;
    bool mMustEnd = false;  // the server is out of reach
    bool mIsInTrouble = false;
    std::string mFailure;  // worker thread while a run is going on, main thread after it
};
