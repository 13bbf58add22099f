#include "calendar/CalCurl.h"

#include <zlib.h>

#include <string_view>

#include "calendar/CalJsonParser.h"
#include "common/Account.h"
#include "common/ServerAddress.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "common/UrlText.h"

using sync_result::kAborted;
using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kTokenFailed;
using sync_result::kTransferTimeout;

namespace {

constexpr long kTimeoutSeconds = 60;
constexpr int kMaxAttempts = 5;
constexpr long kUnauthorized = 401;
// The service takes updates of tasks under another prefix than everything else.
constexpr const char* kUpdateLists = "/tasks/v3/list/";
constexpr const char* kEtagFields = "?fields=etag%2Cid";

struct MethodOf {
    std::string_view text;
    HttpMethod method;
};
constexpr MethodOf kMethods[] = {
    {"GET", HttpMethod::kGet}, {"POST", HttpMethod::kPost}, {"PATCH", HttpMethod::kPatch}};

HttpMethod methodOf(std::string_view text) {
    for (const MethodOf& row : kMethods) {
        if (row.text == text) return row.method;
    }
    return HttpMethod::kDelete;
}

std::string eventPath(const std::string& calendarId) {
    return cal_path::kCalendars + url_text::segment(calendarId) + "/events";
}

std::string eventPath(const std::string& calendarId, const std::string& eventId) {
    return eventPath(calendarId) + "/" + url_text::segment(eventId);
}

std::string taskPath(const char* prefix, const std::string& listId) {
    return prefix + url_text::segment(listId) + "/tasks";
}

std::string taskPath(const char* prefix, const std::string& listId, const std::string& taskId) {
    return taskPath(prefix, listId) + "/" + url_text::segment(taskId);
}

bool isGzip(const std::string& body) {
    return body.size() > 1 && body[0] == '\x1f' && body[1] == '\x8b';
}

}  // namespace

CalCurl::CalCurl(Account* account, IProgressObserver* observer, std::shared_ptr<HttpShare> share)
    : mpAccount(account), mpTransport(std::make_unique<SyncCurl>(account, observer, std::move(share))) {
    mpTransport->setTimeout(kTimeoutSeconds);
}

void CalCurl::setTimeout(long seconds) {
    mpTransport->setTimeout(seconds);
}

bool CalCurl::isAskedToWait() const {
    return mpAccount->retryGate(VANTOR_PIM_SYNC_TYPE_CALENDAR).isAskedToWait();
}

int CalCurl::checked(const char* operation, int result) {
    if (result != kOk) SYNC_ERR_AS(operation, "performCurl fail(%d)", result);
    return result;
}

int CalCurl::insert(const std::string& calendarId, const std::string& body, std::string* response) {
    return checked("insert", performCurl(eventPath(calendarId), "POST", &body, response));
}

int CalCurl::update(const std::string& calendarId, const std::string& eventId, const std::string& body,
                    std::string* response) {
    return checked("update", performCurl(eventPath(calendarId, eventId), "PATCH", &body, response));
}

int CalCurl::remove(const std::string& calendarId, const std::string& eventId, std::string* response) {
    return checked("remove", performCurl(eventPath(calendarId, eventId), "DELETE", nullptr, response));
}

int CalCurl::getEtagUri(const std::string& calendarId, const std::string& eventId, std::string* response) {
    return checked("getEtagUri",
                   performCurl(eventPath(calendarId, eventId) + kEtagFields, "GET", nullptr, response));
}

int CalCurl::insertTodo(const std::string& listId, const std::string& body, std::string* response) {
    return checked("insertTodo", performCurl(taskPath(cal_path::kLists, listId), "POST", &body, response));
}

int CalCurl::updateTodo(const std::string& listId, const std::string& taskId, const std::string& body,
                        std::string* response) {
    return checked("updateTodo",
                   performCurl(taskPath(kUpdateLists, listId, taskId), "PATCH", &body, response));
}

int CalCurl::removeTodo(const std::string& listId, const std::string& taskId, std::string* response) {
    return checked("removeTodo",
                   performCurl(taskPath(cal_path::kLists, listId, taskId), "DELETE", nullptr, response));
}

int CalCurl::getTodoEtagUri(const std::string& listId, const std::string& taskId, std::string* response) {
    return checked("getTodoEtagUri", performCurl(taskPath(cal_path::kLists, listId, taskId) + kEtagFields,
                                                 "GET", nullptr, response));
}

int CalCurl::get(const std::string& path, std::string* response) {
    return checked("get", performCurlCompress(path, "GET", nullptr, response));
}

int CalCurl::getTodo(const std::string& path, std::string* response) {
    return checked("getTodo", performCurl(path, "GET", nullptr, response));
}

int CalCurl::performCurl(const std::string& path, const char* method, const std::string* body,
                         std::string* response) {
    const std::string url = server_address::calendarBase(*mpAccount) + path;
    const HttpMethod code = methodOf(method);
    std::string reply;
    int result = kFailed;
    for (int attempt = 0; attempt < kMaxAttempts; ++attempt) {
        mHttpStatus = 0;
        reply.clear();
        result = mpTransport->sendRequest(url, code, body != nullptr ? body->c_str() : nullptr, &reply,
                                          &mHttpStatus);
        // A request that writes may have been carried out although its answer is missing; only reads are asked again.
        if (result == kTransferTimeout && code == HttpMethod::kGet) continue;
        if (result == kAborted) return kFailed;
        if (result != kOk) SYNC_ERR("performCurl fail");
        if (decideResponse(mHttpStatus, mpTransport->lastToken(), &result) == Decision::kStop) break;
    }
    if (response != nullptr) *response = std::move(reply);
    return result;
}

int CalCurl::performCurlCompress(const std::string& path, const char* method, const std::string* body,
                                 std::string* response) {
    const std::string url = server_address::calendarBase(*mpAccount) + path;
    const HttpMethod code = methodOf(method);
    std::string reply;
    int result = kFailed;
    for (int attempt = 0; attempt < kMaxAttempts; ++attempt) {
        const std::string token = mpAccount->getAccessToken();
        const std::vector<std::string> headers = {"Authorization: Bearer " + token,
                                                  "Content-Type:application/json", "Accept-Encoding: gzip",
                                                  "User-Agent: Tovik (gzip)"};
        mHttpStatus = 0;
        reply.clear();
        result = mpTransport->performCurl(url, code, body != nullptr ? body->c_str() : nullptr, &reply,
                                          headers, &mHttpStatus);
        if (result != kOk) SYNC_ERR("performCurl fail");
        if (decideResponse(mHttpStatus, token, &result) == Decision::kStop) break;
    }
    if (response == nullptr) return result;
    std::string inflated;
    if (inflateGzip(reply, &inflated, HttpTransfer::kMaxReplyBytes) != kOk) {
        SYNC_ERR("fail");
        return kFailed;
    }
    *response = std::move(inflated);
    return result;
}

CalCurl::Decision CalCurl::decideResponse(long httpStatus, const std::string& usedToken, int* result) {
    if (httpStatus != kUnauthorized) return Decision::kStop;
    // One refresh per account at a time; whoever comes second finds that the token has changed already.
    const std::lock_guard refreshing(mpAccount->refreshMutex());
    if (mpAccount->getAccessToken() != usedToken) return Decision::kRetry;
    std::string reply;
    const int refreshed = getAccessToken(&reply);
    CalJsonParser parser;
    if (parser.setString(reply) != kOk) {
        // The reply itself may hold a token and is not logged.
        SYNC_ERR("setString fail(%s)", refreshed == kOk ? "unreadable token reply" : "no token reply");
        return Decision::kRetry;
    }
    std::string token;
    if (parser.getAccessToken(&token) != kOk) {
        SYNC_ERR("get token fail");
        *result = kTokenFailed;
        return Decision::kStop;
    }
    mpAccount->setAccessToken(token);
    return Decision::kRetry;
}

int CalCurl::getAccessToken(std::string* reply) {
    std::string response;
    if (mpTransport->getAnotherAccessToken(&response) != kOk) {
        SYNC_ERR("getAccessToken fail");
        return kFailed;
    }
    const size_t begin = response.find('{');
    *reply = begin == std::string::npos ? std::string() : response.substr(begin);
    return kOk;
}

int inflateGzip(const std::string& body, std::string* out, size_t maxBytes) {
    if (!isGzip(body)) {
        *out = body;
        return kOk;
    }
    constexpr int kGzipWindowBits = 31;
    z_stream stream{};
    if (inflateInit2(&stream, kGzipWindowBits) != Z_OK) return kFailed;
    stream.next_in = const_cast<Bytef*>(reinterpret_cast<const Bytef*>(body.data()));
    stream.avail_in = static_cast<uInt>(body.size());
    constexpr size_t kUsualGrowth = 4;  // of the text of a page; from there on the space doubles
    std::string text(std::min(body.size() * kUsualGrowth, maxBytes) + 1, '\0');
    int code = Z_OK;
    while (code == Z_OK) {
        if (stream.total_out >= text.size()) {
            if (text.size() > maxBytes) break;
            text.resize(std::min(text.size() * 2, maxBytes + 1), '\0');
        }
        stream.next_out = reinterpret_cast<Bytef*>(text.data() + stream.total_out);
        stream.avail_out = static_cast<uInt>(text.size() - stream.total_out);
        code = inflate(&stream, Z_SYNC_FLUSH);
    }
    const size_t length = stream.total_out;
    const bool isComplete = inflateEnd(&stream) == Z_OK && code == Z_STREAM_END;
    if (length > maxBytes) {
        SYNC_ERR("the server's answer inflates to more than %zu bytes, it is not taken", maxBytes);
        return kFailed;
    }
    if (!isComplete) return kFailed;
    text.resize(length);
    // A text ends at its first zero byte. More than zeros behind it is a broken reply; cut there, a list could prove a deletion.
    const size_t end = std::min(length, text.find('\0'));
    if (text.find_first_not_of('\0', end) != std::string::npos) {
        SYNC_ERR("the server's answer goes on after a zero byte, it is not taken");
        return kFailed;
    }
    text.resize(end);
    *out = std::move(text);
    return kOk;
}
