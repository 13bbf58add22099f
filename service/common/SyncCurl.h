// SyncCurl: blocking HTTP exchanges of one account: raw, authorised, and the OAuth 2.0 token refresh.
// Interpreting statuses, storing tokens and retrying are the REST clients' business.
// Owner: a REST client.   Threads: one worker at a time; the share object keeps connections, DNS entries and TLS
// sessions across the easy handles of this SyncCurl.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "common/HttpTransfer.h"

class Account;

enum class HttpMethod { kGet = 0, kPost = 1, kPatch = 2, kDelete = 3 };

class SyncCurl {
public:
    // Neither pointer is owned; the observer may be NULL. `share` may be NULL: then nothing is shared.
    SyncCurl(Account* account, IProgressObserver* observer, std::shared_ptr<HttpShare> share = nullptr);
    virtual ~SyncCurl();
    SyncCurl(const SyncCurl&) = delete;
    SyncCurl& operator=(const SyncCurl&) = delete;

    // One exchange. 0 for any HTTP status (in *httpCode), else -1, -2 (aborted) or -3 (time-out). `body` and `response`
    // may be NULL; the response is appended. Redirects are not followed.
    [[nodiscard]] int performCurl(const std::string& url, const HttpMethod& method, const char* body,
                                  std::string* response, const std::vector<std::string>& headers,
                                  long* httpCode);

    // With the account's bearer token and, but for GET, the JSON headers.
    [[nodiscard]] int sendRequest(const std::string& url, const HttpMethod& method, const char* body,
                                  std::string* response, long* httpCode);

    // The refresh-token grant. `response` receives status line, headers and body. 0 for any HTTP status, else -1.
    [[nodiscard]] int getAnotherAccessToken(std::string* response);

    void setTimeout(long seconds) { mTimeout = seconds; }

    // The bearer token that the last sendRequest carried.
    [[nodiscard]] const std::string& lastToken() const { return mLastToken; }

private:
    Account* mpAccount;
    IProgressObserver* mpProgressObserver;
    std::shared_ptr<HttpShare> mpShare;
    long mTimeout = 30;  // seconds
    std::string mLastToken;
};
