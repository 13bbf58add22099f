#include "calendar/CalDownSyncTasks.h"

#include <utility>

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "common/UrlText.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

constexpr long kHttpOkFirst = 200;
constexpr long kHttpOkLast = 299;
constexpr const char* kCalendars = "/calendar/v3/calendars/";

std::string withToken(std::string path, const std::string& pageToken) {
    if (!pageToken.empty()) path += "&pageToken=" + url_text::queryValue(pageToken);
    return path;
}

}  // namespace

CalRequestTask::CalRequestTask(Account* account, IProgressObserver* observer,
                               std::shared_ptr<HttpShare> share)
    : mCurl(account, observer, std::move(share)) {}

int CalRequestTask::fetch(const std::string& path, const char* unreadableText, ListOperation read,
                          CalListPage* page) {
    mFailure.clear();
    std::string reply;
    if (const int result = mCurl.get(path, &reply); result != kOk) {
        SYNC_ERR("CalCurl get fail(%d)", result);
        mFailure = "the server could not be reached or gave no usable answer";
        return result;
    }
    const long status = mCurl.lastHttpStatus();
    SYNC_DBG("%s: status %ld, %zu bytes", path.c_str(), status, reply.size());
    const int parsed = mParser.setString(reply);
    const int errorCode = parsed == kOk ? mParser.checkData() : 0;
    if (status < kHttpOkFirst || status > kHttpOkLast || errorCode != 0) {
        const long code = errorCode != 0 ? errorCode : status;
        SYNC_ERR("CalCurl get fail(%d)", kFailed);
        SYNC_ERR("the server answered %ld to %s", code, path.c_str());
        mFailure = "the server answered with error " + std::to_string(code);
        return kFailed;
    }
    if (parsed != kOk) {
        SYNC_ERR("%s", unreadableText);
        mFailure = "the server's answer could not be read";
        return kFailed;
    }
    CalListPage result;
    if ((mParser.*read)(&result) != kOk) {
        mFailure = "the server's answer has not the expected shape";
        return kFailed;
    }
    *page = std::move(result);
    return kOk;
}

int CalDownSyncBookListTask::getList(const std::string& pageToken, CalListPage* page) {
    return fetch(withToken("/calendar/v3/users/me/calendarList?maxResults=100000000", pageToken),
                 "setString fail", &CalJsonParser::getBookList, page);
}

int CalDownSyncEventListTask::getList(const std::string& calendarId, CalListPage* page) {
    return fetch(kCalendars + url_text::segment(calendarId) +
                     "/events?fields=items(etag%2Cid%2Csummary)&maxResults=100000000",
                 "set string fail", &CalJsonParser::getEventList, page);
}

int CalDownSyncEventListTask::getListPage(const std::string& calendarId, const std::string& pageToken,
                                          CalListPage* page) {
    const std::string path = kCalendars + url_text::segment(calendarId) +
                             "/events?fields=items(etag%2Cid%2Csummary)%2CnextPageToken&maxResults=50";
    return fetch(withToken(path, pageToken), "set string fail", &CalJsonParser::getEventListPage, page);
}

int CalDownSyncEventListTask::getAllPage(const std::string& calendarId, const std::string& pageToken,
                                         CalListPage* page) {
    return fetch(withToken(kCalendars + url_text::segment(calendarId) + "/events?maxResults=50", pageToken),
                 "set string fail", &CalJsonParser::getEventAllPage, page);
}
