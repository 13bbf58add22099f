// CalDownSyncDirector: brings one account's server calendars and events down to the device.
// Owner: the calendar agent; lives as long as it.   Threads: run() on the worker, one at a time.
//
// Steps of a run, each waiting for the one before:
//   1. make the rows of the account's books agree with the device's books
//   2. fetch the calendar list; compare by id and etag; a list that would delete much is fetched twice
//   3. delete books that are gone, update those that changed
//   4. compare the events of each known book, page by page; a complete list then deletes
//   5. create new books and fill them
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "calendar/CalDownSyncTasks.h"
#include "common/SyncCurl.h"
#include "common/SyncDirector.h"

class Account;
class CalEventWriter;

class CalDownSyncDirector : public SyncDirector, private IProgressObserver {
public:
    // Neither pointer is owned. `stopQuery` may be NULL.
    CalDownSyncDirector(Account* account, IStopQuery* stopQuery);
    ~CalDownSyncDirector() override;

    int run() override;
    [[nodiscard]] std::string lastFailure() const override;

    // Calendars and events.
    [[nodiscard]] int syncCalendar();

private:
    // What is to be done with the account's books.
    struct BookPlan {
        CalListPage listed;
        CalList known;  // on the device already
        CalList changed;
        CalList fresh;
        std::vector<std::string> gone;
    };
    enum class EventPageMode { kComparing = 0, kFirstTime = 1 };

    int onProgress(double downloadTotal, double downloaded, double uploadTotal, double uploaded) override;
    [[nodiscard]] bool isStopped() const;
    // Remembers why the run failed (the first reason) and gives `result` back.
    int fail(int result, const std::string& text);

    [[nodiscard]] int fetchCalendars(CalListPage* listed);
    [[nodiscard]] int planBooks(BookPlan* plan);
    [[nodiscard]] int proveBookDeletions(BookPlan* plan);
    [[nodiscard]] int deleteBooks(const BookPlan& plan);
    [[nodiscard]] int insertBooks(const BookPlan& plan);
    // Compares the events of each calendar; one that fails does not keep the others, unless the server is out of reach.
    [[nodiscard]] int syncEvents(const CalList& calendars, EventPageMode mode);
    [[nodiscard]] int syncEventPage(const std::string& calendarUri, EventPageMode mode);
    [[nodiscard]] int secondLook(const std::string& calendarUri, CalEventWriter* writer);

    Account* const mpAccount;
    IStopQuery* const mpStopQuery;
    std::shared_ptr<HttpShare> mpShare;
    CalDownSyncBookListTask mBookListTask;
    CalDownSyncEventListTask mEventListTask;
    std::string mFailure;  // worker thread while a run is going on, main thread after it
};
