// The request tasks of the upload: one request each, and what its answer means.
// Owner: a director.   Threads: one worker.
#pragma once

#include <functional>
#include <memory>
#include <string>

#include "calendar/CalCurl.h"
#include "calendar/CalJsonParser.h"
#include "common/SyncResult.h"

enum class UpAnswer {
    kAccepted,  // 2xx without an error body
    kGone,      // the server has the item no more
    kRefused,   // it was not done
    kUnclear,   // an answer that does not tell whether it was done
    kNoAnswer,  // no answer, or nobody may ask any more: `result` tells
};

struct UpReply {
    UpAnswer answer = UpAnswer::kNoAnswer;
    int result = sync_result::kFailed;  // SyncResult.h
    std::string uri;                    // of the item, where the answer names it
    std::string etag;                   // likewise
    bool isCancelled = false;           // the answer says so of the item
    JsonNodePtr item;                   // the item as the server has it now, where the answer is one
    std::string reason;                 // for people, of what was not accepted
    bool isForGood = false;             // a refusal that holds as long as the item stays as it is

    // Whether an item that was to be deleted is gone for good.
    [[nodiscard]] bool isRemoved() const {
        return answer == UpAnswer::kAccepted || answer == UpAnswer::kGone;
    }
};

class CalUpSyncTask {
public:
    // The item's etag now. An answer for another item, or without an etag, is unclear.
    [[nodiscard]] UpReply getEtag(const std::string& bookUri, const std::string& uri);
    // The new item's id and etag. An answer without an id is unclear.
    [[nodiscard]] UpReply insert(const std::string& bookUri, const std::string& body);
    [[nodiscard]] UpReply update(const std::string& bookUri, const std::string& uri, const std::string& body);
    [[nodiscard]] UpReply remove(const std::string& bookUri, const std::string& uri);

    [[nodiscard]] bool isAskedToWait() const { return mCurl.isAskedToWait(); }

protected:
    // The service's requests.
    struct Requests {
        int (CalCurl::*getEtag)(const std::string&, const std::string&, std::string*);
        int (CalCurl::*insert)(const std::string&, const std::string&, std::string*);
        int (CalCurl::*update)(const std::string&, const std::string&, const std::string&, std::string*);
        int (CalCurl::*remove)(const std::string&, const std::string&, std::string*);
    };
    CalUpSyncTask(const Requests& requests, Account* account, IProgressObserver* observer,
                  std::shared_ptr<HttpShare> share);

private:
    // What the answer means; reads id, etag and the error from the body.
    [[nodiscard]] UpReply judge(int result, const std::string& body);
    // One answer that the item is gone is not believed: what a user changed goes with it.
    [[nodiscard]] static UpReply twice(const std::function<UpReply()>& request);
    [[nodiscard]] UpReply getEtagOnce(const std::string& bookUri, const std::string& uri);

    const Requests& mRequests;
    CalCurl mCurl;
};

class CalUpSyncEventTask : public CalUpSyncTask {
public:
    CalUpSyncEventTask(Account* account, IProgressObserver* observer, std::shared_ptr<HttpShare> share);

private:
    static constexpr Requests kRequests{&CalCurl::getEtagUri, &CalCurl::insert, &CalCurl::update,
                                        &CalCurl::remove};
};

class CalUpSyncTodoTask : public CalUpSyncTask {
public:
    CalUpSyncTodoTask(Account* account, IProgressObserver* observer, std::shared_ptr<HttpShare> share);

private:
    static constexpr Requests kRequests{&CalCurl::getTodoEtagUri, &CalCurl::insertTodo, &CalCurl::updateTodo,
                                        &CalCurl::removeTodo};
};
