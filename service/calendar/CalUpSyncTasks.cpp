#include "calendar/CalUpSyncTasks.h"

#include <utility>

#include "common/HttpStatus.h"
#include "common/JsonAccess.h"
#include "common/SyncLog.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

UpAnswer answerOf(long status) {
    if (http_status::isSuccess(status)) return UpAnswer::kAccepted;
    if (http_status::isGone(status)) return UpAnswer::kGone;
    if (status == http_status::kUnauthorized)
        return UpAnswer::kNoAnswer;  // every request would be answered so
    constexpr long kClientError = 400;
    return status >= kClientError && status < http_status::kServerError ? UpAnswer::kRefused
                                                                        : UpAnswer::kUnclear;
}

}  // namespace

CalUpSyncTask::CalUpSyncTask(const Requests& requests, Account* account, IProgressObserver* observer,
                             std::shared_ptr<HttpShare> share)
    : mRequests(requests), mCurl(account, observer, std::move(share)) {}

UpReply CalUpSyncTask::judge(int result, const std::string& body) {
    UpReply reply;
    reply.result = result;
    if (result != kOk) {
        reply.reason = "the server could not be reached or gave no usable answer";
        return reply;
    }
    long status = mCurl.lastHttpStatus();
    std::string message;
    CalJsonParser parser;
    const bool isRead = !body.empty() && parser.setString(body) == kOk;
    if (isRead) {
        JsonObject* item = parser.root();
        if (const int code = parser.checkData(); code != 0) {
            if (http_status::isSuccess(status)) status = code;
            message = json_access::textOr(json_access::object(item, "error"), "message", "");
        } else {
            (void)parser.getEtagUri(&reply.etag, &reply.uri);
        }
    } else if (!body.empty()) {
        SYNC_ERR("setString fail");
    }
    reply.answer = answerOf(status);
    reply.isForGood = http_status::isRefusedForGood(status);
    if (isRead && reply.answer == UpAnswer::kAccepted && !reply.uri.empty()) reply.item = parser.copyRoot();
    reply.isCancelled = isRead && json_access::textOr(parser.root(), "status", "") == "cancelled";
    if (reply.answer == UpAnswer::kAccepted && !isRead && !body.empty()) {
        // Whoever answers so, as the page where a network wants a login, is not the provider.
        reply.answer = UpAnswer::kUnclear;
        reply.result = kFailed;
        reply.reason = "the answer is not one of the provider's";
        return reply;
    }
    if (reply.answer != UpAnswer::kAccepted) {
        reply.result = kFailed;
        reply.reason = "the server answered with error " + std::to_string(status);
        if (!message.empty()) reply.reason += ": " + message;
    }
    return reply;
}

UpReply CalUpSyncTask::twice(const std::function<UpReply()>& request) {
    UpReply reply = request();
    if (reply.answer != UpAnswer::kGone) return reply;
    SYNC_ERR("the server says that it does not have the item, it is asked again");
    return request();
}

UpReply CalUpSyncTask::getEtag(const std::string& bookUri, const std::string& uri) {
    return twice([&] { return getEtagOnce(bookUri, uri); });
}

UpReply CalUpSyncTask::getEtagOnce(const std::string& bookUri, const std::string& uri) {
    std::string body;
    const int result = (mCurl.*mRequests.getEtag)(bookUri, uri, &body);
    if (result != kOk) SYNC_ERR("CalCurl getEtagUri fail(%d)", result);
    UpReply reply = judge(result, body);
    if (reply.answer == UpAnswer::kAccepted && reply.isCancelled) reply.answer = UpAnswer::kGone;
    if (reply.answer != UpAnswer::kAccepted || (reply.uri == uri && !reply.etag.empty())) return reply;
    reply.answer = UpAnswer::kUnclear;
    reply.result = kFailed;
    reply.reason =
        reply.uri == uri ? "the server's answer has no etag" : "the server answered for another item";
    return reply;
}

UpReply CalUpSyncTask::insert(const std::string& bookUri, const std::string& body) {
    std::string answer;
    const int result = (mCurl.*mRequests.insert)(bookUri, body, &answer);
    if (result != kOk) SYNC_ERR("CalCurl insert fail(%d)", result);
    UpReply reply = judge(result, answer);
    if (reply.answer == UpAnswer::kGone && reply.uri.empty())
        reply.answer = UpAnswer::kRefused;  // the book is
    if (reply.answer != UpAnswer::kAccepted || !reply.uri.empty()) return reply;
    reply.answer = UpAnswer::kUnclear;
    reply.result = kFailed;
    reply.reason = "the server's answer does not name the new item";
    return reply;
}

UpReply CalUpSyncTask::update(const std::string& bookUri, const std::string& uri, const std::string& body) {
    int result = kOk;
    UpReply reply = twice([&] {
        std::string answer;
        result = (mCurl.*mRequests.update)(bookUri, uri, body, &answer);
        return judge(result, answer);
    });
    if (result != kOk) SYNC_ERR("CalCurl update fail(%d)", result);
    if (reply.answer != UpAnswer::kAccepted || reply.uri.empty() || reply.uri == uri) return reply;
    reply.answer = UpAnswer::kUnclear;
    reply.result = kFailed;
    reply.reason = "the server answered for another item";
    return reply;
}

UpReply CalUpSyncTask::remove(const std::string& bookUri, const std::string& uri) {
    int result = kOk;
    UpReply reply = twice([&] {
        std::string answer;
        result = (mCurl.*mRequests.remove)(bookUri, uri, &answer);
        return judge(result, answer);
    });
    if (result != kOk) SYNC_ERR("CalCurl update fail(%d)", result);
    return reply;
}

CalUpSyncEventTask::CalUpSyncEventTask(Account* account, IProgressObserver* observer,
                                       std::shared_ptr<HttpShare> share)
    : CalUpSyncTask(kRequests, account, observer, std::move(share)) {}

CalUpSyncTodoTask::CalUpSyncTodoTask(Account* account, IProgressObserver* observer,
                                     std::shared_ptr<HttpShare> share)
    : CalUpSyncTask(kRequests, account, observer, std::move(share)) {}
