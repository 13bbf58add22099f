// CtCurl: the HTTP client of the contacts service: feed pages and entries, photos, public profiles.
// Owner: a director's tasks.   Threads: one worker.
//
// An operation ends with 0 for a 2xx answer, -5 when the server does not give a new access token, else -1 (logged);
// lastHttpStatus() tells then. Outputs hold the answer's body whatever the status. What only reads or carries a version is asked up to
// three times when it times out; a POST never is, since it may have been carried out.
#pragma once

#include <functional>
#include <memory>
#include <string>

#include "common/HttpTransfer.h"
#include "contacts/CtIdUtil.h"
#include "contacts/CtStagedPhoto.h"

class Account;

class CtCurl {
public:
    // Nothing is owned; the observer and the share may be NULL.
    CtCurl(Account* account, IProgressObserver* observer, std::shared_ptr<HttpShare> share);

    // How long one attempt may take.
    void setTimeout(long seconds) { mTimeout = seconds; }

    // Where the contacts and the people service live, as the account and the settings say now: they may change while the
    // client lives. Without a trailing slash.
    [[nodiscard]] std::string feedBase() const;
    [[nodiscard]] std::string peopleBase() const;
    // The URL that the server gave, at the account's server: nothing else gets the account's token. Empty when it is none.
    [[nodiscard]] std::string atOwnServer(const std::string& url);

    [[nodiscard]] int get(const std::string& url, std::string* text);
    [[nodiscard]] int insert(CtItemType type, const std::string& entry, std::string* reply);
    // Without an etag neither goes out.
    [[nodiscard]] int update(const std::string& editUrl, const std::string& etag, const std::string& entry,
                             std::string* reply);
    [[nodiscard]] int remove(const std::string& editUrl, const std::string& etag, std::string* reply);
    [[nodiscard]] int getImage(const std::string& photoUrl, const std::string& photoEtag,
                               CtStagedPhoto* photo);
    // An empty etag: there was no photo. `path` is below the root.
    [[nodiscard]] int upsertImage(const std::string& photoUrl, const std::string& photoEtag,
                                  const std::string& path, std::string* reply);
    // Without authorisation, as the next.
    [[nodiscard]] int getOrbit(const std::string& personId, std::string* profile);
    [[nodiscard]] int getOrbitImage(const std::string& imageUrl, CtStagedPhoto* photo);

    // Of the last attempt, 0 when there was no reply.
    [[nodiscard]] long lastHttpStatus() const { return mHttpStatus; }
    // Whether the last operation came as far as a request; a file that cannot be read ends it before.
    [[nodiscard]] bool hasAsked() const { return mHasAsked; }
    // Whether the server has asked for a pause: whatever is sent before its end is refused.
    [[nodiscard]] bool isAskedToWait() const;

private:
    enum class Access { kAccount, kOpen };
    enum class Timeouts { kRepeated, kFinal };

    [[nodiscard]] HttpTransfer makeTransfer(const std::string& url, const char* method, Access access);
    [[nodiscard]] int notAsked(const std::string& url);
    // One exchange: 0 with lastHttpStatus(), -1, or -2 when it timed out.
    [[nodiscard]] int exchange(HttpTransfer& transfer);
    [[nodiscard]] int sendEntry(const char* method, const std::string& url, const std::string& etag,
                                const std::string& entry, std::string* reply);
    [[nodiscard]] int fetchImage(HttpTransfer& transfer, CtStagedPhoto* photo);
    [[nodiscard]] int getImpl(const std::string& url, std::string* text);
    [[nodiscard]] int insertImpl(const std::string& url, const std::string& entry, std::string* reply);
    [[nodiscard]] int updateImpl(const std::string& url, const std::string& etag, const std::string& entry,
                                 std::string* reply);
    [[nodiscard]] int removeImpl(const std::string& url, const std::string& etag, std::string* reply);
    [[nodiscard]] int getImageImpl(const std::string& url, const std::string& etag, CtStagedPhoto* photo);
    [[nodiscard]] int upsertImageImpl(const std::string& url, const std::string& etag,
                                      const std::string& path, std::string* reply);
    [[nodiscard]] int getOrbitImpl(const std::string& url, std::string* profile);
    [[nodiscard]] int getOrbitImageImpl(const std::string& url, CtStagedPhoto* photo);

    // Repeats `impl` until its answer is final.
    [[nodiscard]] int decide(const char* failureText, Access access, Timeouts timeouts,
                             const std::function<int()>& impl);
    [[nodiscard]] int renewToken();
    [[nodiscard]] int getAnotherAccessToken(std::string* token);

    Account* mpAccount;
    IProgressObserver* mpObserver;
    std::shared_ptr<HttpShare> mpShare;
    std::string mUsedToken;
    long mHttpStatus = 0;
    bool mHasAsked = false;
    std::string mAskedServer;  // of the last URL that was the server's own
    long mTimeout = 30;        // seconds
};

// A reply in the debug log, in lines of a length that the journal takes whole.
void logReply(const std::string& text);

// The URL with its size parameter set to 720.
std::string withPhotoSize(const std::string& imageUrl);
