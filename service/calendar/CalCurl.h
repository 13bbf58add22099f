// CalCurl: the calendar and tasks services' requests: URLs, methods, JSON bodies, gzip replies, and the decision after
// each attempt whether to stop or to try again with a fresh access token.
// Owner: a request task.   Threads: one worker at a time.
// Errors: 0 (any HTTP status: the reply's error body tells, and lastHttpStatus()), -1, or -5 when no new token could be had.
#pragma once

#include <memory>
#include <string>

#include "common/SyncCurl.h"

// What the paths of items begin with; the encoded id of the calendar or the list follows.
namespace cal_path {
inline constexpr const char* kCalendars = "/calendar/v3/calendars/";
inline constexpr const char* kLists = "/tasks/v1/lists/";
}  // namespace cal_path

class CalCurl {
public:
    CalCurl(Account* account, IProgressObserver* observer, std::shared_ptr<HttpShare> share = nullptr);

    // How long one attempt may take; a minute unless told otherwise.
    void setTimeout(long seconds);

    // `response` may be NULL for each; otherwise it is replaced by the reply's body.
    [[nodiscard]] int insert(const std::string& calendarId, const std::string& body, std::string* response);
    [[nodiscard]] int update(const std::string& calendarId, const std::string& eventId,
                             const std::string& body, std::string* response);
    [[nodiscard]] int remove(const std::string& calendarId, const std::string& eventId,
                             std::string* response);
    [[nodiscard]] int getEtagUri(const std::string& calendarId, const std::string& eventId,
                                 std::string* response);

    [[nodiscard]] int insertTodo(const std::string& listId, const std::string& body, std::string* response);
    [[nodiscard]] int updateTodo(const std::string& listId, const std::string& taskId,
                                 const std::string& body, std::string* response);
    [[nodiscard]] int removeTodo(const std::string& listId, const std::string& taskId, std::string* response);
    [[nodiscard]] int getTodoEtagUri(const std::string& listId, const std::string& taskId,
                                     std::string* response);

    // `path` is composed by the caller and appended to the server base. get() asks for a gzip reply.
    [[nodiscard]] int get(const std::string& path, std::string* response);
    [[nodiscard]] int getTodo(const std::string& path, std::string* response);

    // HTTP status of the last attempt, 0 when there was no reply.
    [[nodiscard]] long lastHttpStatus() const { return mHttpStatus; }
    // Whether the server has asked for a pause: whatever is sent before its end is refused.
    [[nodiscard]] bool isAskedToWait() const;

private:
    enum class Decision { kStop, kRetry };

    [[nodiscard]] int performCurl(const std::string& path, const char* method, const std::string* body,
                                  std::string* response);
    [[nodiscard]] int performCurlCompress(const std::string& path, const char* method,
                                          const std::string* body, std::string* response);
    [[nodiscard]] Decision decideResponse(long httpStatus, const std::string& usedToken, int* result);
    [[nodiscard]] int getAccessToken(std::string* reply);
    [[nodiscard]] static int checked(const char* operation, int result);

    Account* mpAccount;
    std::unique_ptr<SyncCurl> mpTransport;
    long mHttpStatus = 0;
};

// Inflates a gzip body; a body that is not gzip is taken as it is. -1 on a broken one. `maxBytes` bounds the output.
[[nodiscard]] int inflateGzip(const std::string& body, std::string* out, size_t maxBytes);
