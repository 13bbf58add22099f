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

#include <atomic>
#include <memory>
#include <string>
#include <vector>

#include "calendar/CalDownSyncTasks.h"
#include "common/SyncCurl.h"
#include "common/SyncDirector.h"

class Account;
class CalBookSnapshot;
class CalDataManager;

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
    struct BookPlan;

    int onProgress(double downloadTotal, double downloaded, double uploadTotal, double uploaded) override;
    [[nodiscard]] bool isStopped() const;
    [[nodiscard]] int fail(int result, const std::string& text);

    [[nodiscard]] int fetchCalendars(CalListPage* page);
    [[nodiscard]] int planBooks(const CalListPage& listed, BookPlan* plan);
    [[nodiscard]] int proveBookDeletions(BookPlan* plan);
    [[nodiscard]] int syncEventPage(const std::string& calendarUri);
    [[nodiscard]] int applyPages(const std::string& calendarUri, class CalEventWriter* writer);
    [[nodiscard]] int deleteUnlisted(const std::string& calendarUri, class CalEventWriter* writer);
    [[nodiscard]] int secondLook(const std::string& calendarUri, class CalEventWriter* writer);

    Account* const mpAccount;
    IStopQuery* const mpStopQuery;
    std::shared_ptr<HttpShare> mpShare;
    CalDownSyncBookListTask mBookListTask;
    CalDownSyncEventListTask mEventListTask;
    std::string mFailure;  // worker thread while a run is going on, main thread after it
};
