// CalSyncSide: what a sync needs of one kind of item at the server: its data manager and the requests that list books and items.
// Owner: a director.   Threads: one worker.   Errors: SyncResult.h codes, each failure logged.
#pragma once

#include <memory>
#include <string>

#include "calendar/CalBookSnapshot.h"
#include "calendar/CalDownSyncTasks.h"
#include "calendar/CalManager.h"

class CalSyncSide {
public:
    virtual ~CalSyncSide() = default;

    [[nodiscard]] virtual CalManager& manager() = 0;
    [[nodiscard]] virtual int getBooks(const std::string& pageToken, CalListPage* page) = 0;
    // Items with id and etag; whole ones where the server lists them so.
    [[nodiscard]] virtual int getItems(const std::string& bookUri, const std::string& pageToken,
                                       CalListPage* page) = 0;
    // Ids and etags.
    [[nodiscard]] virtual int getIds(const std::string& bookUri, const std::string& pageToken,
                                     CalListPage* page) = 0;
    // Fetches the content of those entries that the plan for the page will take. An entry whose content cannot be had is left out of
    // the page and counts as listed.
    [[nodiscard]] virtual int getContent(const std::string& bookUri, const CalBookSnapshot& snapshot,
                                         CalListPage* page) = 0;

    // Of the last request.
    [[nodiscard]] virtual const std::string& failure() const = 0;
    [[nodiscard]] virtual bool unreachable() const = 0;
    // Whether the server has no such service.
    [[nodiscard]] virtual bool isMissing() const = 0;
};

class CalEventSide : public CalSyncSide {
public:
    CalEventSide(Account* account, IProgressObserver* observer, const std::shared_ptr<HttpShare>& share);

    [[nodiscard]] CalManager& manager() override;
    [[nodiscard]] int getBooks(const std::string& pageToken, CalListPage* page) override;
    [[nodiscard]] int getItems(const std::string& bookUri, const std::string& pageToken,
                               CalListPage* page) override;
    [[nodiscard]] int getIds(const std::string& bookUri, const std::string& pageToken,
                             CalListPage* page) override;
    [[nodiscard]] int getContent(const std::string&, const CalBookSnapshot&, CalListPage*) override {
        return sync_result::kOk;
    }
    [[nodiscard]] const std::string& failure() const override { return mpLast->failure(); }
    [[nodiscard]] bool unreachable() const override { return mpLast->unreachable(); }
    [[nodiscard]] bool isMissing() const override { return false; }  // there is no account without calendars

private:
    CalDownSyncBookListTask mBookListTask;
    CalDownSyncEventListTask mEventListTask;
    const CalRequestTask* mpLast;
};

class CalTodoSide : public CalSyncSide {
public:
    CalTodoSide(Account* account, IProgressObserver* observer, const std::shared_ptr<HttpShare>& share);

    [[nodiscard]] CalManager& manager() override;
    [[nodiscard]] int getBooks(const std::string& pageToken, CalListPage* page) override;
    [[nodiscard]] int getItems(const std::string& bookUri, const std::string& pageToken,
                               CalListPage* page) override;
    [[nodiscard]] int getIds(const std::string& bookUri, const std::string& pageToken,
                             CalListPage* page) override {
        return getItems(bookUri, pageToken, page);
    }
    [[nodiscard]] int getContent(const std::string& bookUri, const CalBookSnapshot& snapshot,
                                 CalListPage* page) override;
    [[nodiscard]] const std::string& failure() const override { return mpLast->failure(); }
    [[nodiscard]] bool unreachable() const override { return mpLast->unreachable(); }
    [[nodiscard]] bool isMissing() const override { return mBookListTask.notFound(); }

private:
    [[nodiscard]] int fetchTask(const std::string& listId, CalListInfo* entry);

    CalDownSyncTodoBookListTask mBookListTask;
    CalDownSyncTodoListTask mTodoListTask;
    CalDownSyncTodoTask mTodoTask;
    const CalRequestTask* mpLast;
};
