#include "calendar/CalDownSyncTasks.h"

#include <utility>

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "common/UrlText.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

std::string withToken(std::string path, const std::string& pageToken) {
    if (pageToken.empty()) return path;
    path += path.find('?') == std::string::npos ? '?' : '&';
    return path + "pageToken=" + url_text::queryValue(pageToken);
}

}  // namespace

CalRequestTask::CalRequestTask(Account* account, IProgressObserver* observer,
                               std::shared_ptr<HttpShare> share)
    : mCurl(account, observer, std::move(share)) {}

int CalRequestTask::request(Send send, const std::string& path, const char* unreadableText) {
    mFailure.clear();
    std::string reply;
    if (const int result = (mCurl.*send)(path, &reply); result != kOk) {
        SYNC_ERR("CalCurl get fail(%d)", result);
        mFailure = "the server could not be reached or gave no usable answer";
        return result;
    }
    const long status = mCurl.lastHttpStatus();
    SYNC_DBG("%s: status %ld, %zu bytes", path.c_str(), status, reply.size());
    const int parsed = mParser.setString(reply);
    const int errorCode = parsed == kOk ? mParser.checkData() : 0;
    if (!http_status::isSuccess(status) || errorCode != 0) {
        const long code = errorCode != 0 ? errorCode : status;
        SYNC_ERR("CalCurl get fail(%d)", kFailed);
        SYNC_ERR("the server answered %ld to %s", code, path.c_str());
        mFailure = "the server answered with error " + std::to_string(code);
        return kFailed;
    }
    if (parsed != kOk) {
        SYNC_ERR("%s", unreadableText);
        mFailure = "the server's answer could not be read";
    }
    return parsed;
}

int CalRequestTask::fetch(Send send, const std::string& path, const char* unreadableText, ListOperation read,
                          CalListPage* page) {
    if (const int result = request(send, path, unreadableText); result != kOk) return result;
    CalListPage result;
    if ((mParser.*read)(&result) != kOk) {
        mFailure = "the server's answer has not the expected shape";
        return kFailed;
    }
    *page = std::move(result);
    return kOk;
}

int CalDownSyncBookListTask::getList(const std::string& pageToken, CalListPage* page) {
    return fetch(&CalCurl::get,
                 withToken("/calendar/v3/users/me/calendarList?maxResults=100000000", pageToken),
                 "setString fail", &CalJsonParser::getBookList, page);
}

int CalDownSyncEventListTask::getList(const std::string& calendarId, CalListPage* page) {
    return fetch(&CalCurl::get,
                 cal_path::kCalendars + url_text::segment(calendarId) +
                     "/events?fields=items(etag%2Cid%2Csummary)&maxResults=100000000",
                 "set string fail", &CalJsonParser::getEventList, page);
}

int CalDownSyncEventListTask::getListPage(const std::string& calendarId, const std::string& pageToken,
                                          CalListPage* page) {
    const std::string path = cal_path::kCalendars + url_text::segment(calendarId) +
                             "/events?fields=items(etag%2Cid%2Csummary)%2CnextPageToken&maxResults=50";
    return fetch(&CalCurl::get, withToken(path, pageToken), "set string fail",
                 &CalJsonParser::getEventListPage, page);
}

int CalDownSyncEventListTask::getAllPage(const std::string& calendarId, const std::string& pageToken,
                                         CalListPage* page) {
    return fetch(
        &CalCurl::get,
        withToken(cal_path::kCalendars + url_text::segment(calendarId) + "/events?maxResults=50", pageToken),
        "set string fail", &CalJsonParser::getEventAllPage, page);
}

int CalDownSyncTodoBookListTask::getList(const std::string& pageToken, CalListPage* page) {
    return fetch(&CalCurl::getTodo, withToken("/tasks/v1/users/@me/lists", pageToken), "setString fail",
                 &CalJsonParser::getTodoBookList, page);
}

int CalDownSyncTodoListTask::getListPage(const std::string& listId, const std::string& pageToken,
                                         CalListPage* page) {
    const std::string path = cal_path::kLists + url_text::segment(listId) +
                             "/tasks?fields=items(etag%2Cid%2Ctitle)%2CnextPageToken&maxResults=50";
    return fetch(&CalCurl::getTodo, withToken(path, pageToken), "setString fail",
                 &CalJsonParser::getTodoListPage, page);
}

int CalDownSyncTodoTask::get(const std::string& listId, const std::string& taskId, JsonNodePtr* task) {
    const std::string path =
        cal_path::kLists + url_text::segment(listId) + "/tasks/" + url_text::segment(taskId);
    if (const int result = request(&CalCurl::getTodo, path, "setString fail"); result != kOk) return result;
    *task = mParser.takeRoot();
    return kOk;
}
