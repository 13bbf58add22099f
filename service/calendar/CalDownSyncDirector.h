// CalDownSyncDirector: brings one account's server calendars and events, task lists and tasks down to the device.
// Owner: the calendar agent; lives as long as it.   Threads: run() on the worker, one at a time.
//
// Steps of a run, first for calendars, then for task lists ("books"), each waiting for the one before:
//   1. make the rows of the account's books agree with the device's books; mark what was changed on the device
//   2. fetch the list of books; compare with what is known; a list that would delete much is fetched twice
//   3. delete books that are gone, update those that changed
//   4. compare the items of each known book, page by page; a complete list then deletes
//   5. create new books and fill them
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "calendar/CalSyncSide.h"
#include "common/SyncCurl.h"
#include "common/SyncDirector.h"
#include "common/SyncProgress.h"

class Account;
class CalItemWriter;

class CalDownSyncDirector : public SyncDirector, private IProgressObserver {
public:
    // Neither pointer is owned. `stopQuery` may be NULL.
    CalDownSyncDirector(Account* account, IStopQuery* stopQuery);
    ~CalDownSyncDirector() override;

    int run() override;
    [[nodiscard]] std::string lastFailure() const override;

    // Calendars and events.
    [[nodiscard]] int syncCalendar() { return syncBooks(mEvents); }
    // Task lists and tasks.
    [[nodiscard]] int syncTodo() { return syncBooks(mTodos); }

private:
    // What is to be done with the account's books.
    struct BookPlan {
        CalListPage listed;
        CalList known;  // on the device already
        CalList changed;
        CalList fresh;
        std::vector<std::string> gone;
    };
    enum class PageMode { kComparing = 0, kFirstTime = 1 };

    int onProgress(double downloadTotal, double downloaded, double uploadTotal, double uploaded) override;
    [[nodiscard]] bool isStopped() const;
    // Remembers why the run failed (the first reason) and gives `result` back.
    int fail(int result, const std::string& text);

    [[nodiscard]] int syncBooks(CalSyncSide& side);
    [[nodiscard]] int fetchBooks(CalSyncSide& side, CalListPage* listed);
    [[nodiscard]] int planBooks(CalSyncSide& side, BookPlan* plan);
    [[nodiscard]] int proveBookDeletions(CalSyncSide& side, BookPlan* plan);
    [[nodiscard]] int deleteBooks(CalSyncSide& side, const BookPlan& plan);
    [[nodiscard]] int insertBooks(CalSyncSide& side, const BookPlan& plan);
    // Compares the items of each book; one that fails does not keep the others, unless the server is out of reach.
    [[nodiscard]] int syncItems(CalSyncSide& side, const CalList& books, PageMode mode);
    [[nodiscard]] int syncPage(CalSyncSide& side, const std::string& bookUri, PageMode mode);
    [[nodiscard]] int writePages(CalSyncSide& side, const std::string& bookUri,
                                 const CalBookSnapshot& snapshot, CalItemWriter* writer, int* written);
    [[nodiscard]] int deleteProven(CalSyncSide& side, const std::string& bookUri,
                                   const CalBookSnapshot& snapshot, CalItemWriter* writer, int* written);
    [[nodiscard]] int secondLook(CalSyncSide& side, const std::string& bookUri, CalItemWriter* writer);

    Account* const mpAccount;
    IStopQuery* const mpStopQuery;
    std::shared_ptr<HttpShare> mpShare;
    CalEventSide mEvents;
    CalTodoSide mTodos;
    SyncProgress mProgress;
    std::string mFailure;  // worker thread while a run is going on, main thread after it
};
