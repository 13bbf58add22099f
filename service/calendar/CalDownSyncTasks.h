// The request tasks of the calendar download: compose the path, send it, read the reply.
// Owner: a director.   Threads: one worker.   Errors: SyncResult.h codes, each failure logged; the page is filled on success
// only. A reply counts as failed when its HTTP status is not 2xx or its body carries an error.
#pragma once

#include <memory>
#include <string>

#include "calendar/CalCurl.h"
#include "calendar/CalJsonParser.h"
#include "common/HttpStatus.h"

// What every task does: one request, one checked reply.
class CalRequestTask {
public:
    CalRequestTask(Account* account, IProgressObserver* observer, std::shared_ptr<HttpShare> share);

    // Why the last request failed, for people; empty after a success.
    [[nodiscard]] const std::string& failure() const { return mFailure; }
    // Whether the last request had no answer at all.
    [[nodiscard]] bool unreachable() const { return mCurl.lastHttpStatus() == 0; }
    // Whether the server does not know what was asked for.
    [[nodiscard]] bool notFound() const { return mCurl.lastHttpStatus() == http_status::kNotFound; }

protected:
    using ListOperation = int (CalJsonParser::*)(CalListPage*) const;
    using Send = int (CalCurl::*)(const std::string& path, std::string* response);
    // Sends and parses.
    [[nodiscard]] int request(Send send, const std::string& path, const char* unreadableText);
    [[nodiscard]] int fetch(Send send, const std::string& path, const char* unreadableText,
                            ListOperation read, CalListPage* page);

    CalCurl mCurl;
    CalJsonParser mParser;

private:
    std::string mFailure;
};

class CalDownSyncBookListTask : public CalRequestTask {
public:
    using CalRequestTask::CalRequestTask;
    // One reply as a rule; a server that answers with a token all the same is asked for the rest.
    [[nodiscard]] int getList(const std::string& pageToken, CalListPage* page);
};

class CalDownSyncEventListTask : public CalRequestTask {
public:
    using CalRequestTask::CalRequestTask;
    // Ids, etags and titles of all events in one reply.
    [[nodiscard]] int getList(const std::string& calendarId, CalListPage* page);
    // The same in pages of 50; an empty token asks for the first.
    [[nodiscard]] int getListPage(const std::string& calendarId, const std::string& pageToken,
                                  CalListPage* page);
    // Whole events in pages of 50.
    [[nodiscard]] int getAllPage(const std::string& calendarId, const std::string& pageToken,
                                 CalListPage* page);
};

class CalDownSyncTodoBookListTask : public CalRequestTask {
public:
    using CalRequestTask::CalRequestTask;
    [[nodiscard]] int getList(const std::string& pageToken, CalListPage* page);
};

class CalDownSyncTodoListTask : public CalRequestTask {
public:
    using CalRequestTask::CalRequestTask;
    // Ids, etags and titles in pages of 50.
    [[nodiscard]] int getListPage(const std::string& listId, const std::string& pageToken, CalListPage* page);
};

class CalDownSyncTodoTask : public CalRequestTask {
public:
    using CalRequestTask::CalRequestTask;
    // The whole task.
    [[nodiscard]] int get(const std::string& listId, const std::string& taskId, JsonNodePtr* task);
};
