// HttpTransfer: one blocking HTTP exchange with libcurl, and what several exchanges share.
// Threads: one worker per exchange; a share may serve several.
#pragma once

#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "common/Handles.h"

// Asked during transfers whether to go on; non-zero aborts.
class IProgressObserver {
public:
    virtual ~IProgressObserver() = default;
    virtual int onProgress(double downloadTotal, double downloaded, double uploadTotal, double uploaded) = 0;
};

// HttpShare: what the exchanges of one worker share: one kept connection per server, and an easy handle.
class HttpShare {
public:
    HttpShare();
    ~HttpShare();
    HttpShare(const HttpShare&) = delete;
    HttpShare& operator=(const HttpShare&) = delete;
    [[nodiscard]] void* handle() const;  // a CURLSH
    // The easy handle that waits for the next exchange, NULL when there is none.
    [[nodiscard]] CurlEasy takeIdle();
    void giveBack(CurlEasy curl);

private:
    struct State;
    std::unique_ptr<State> mpState;
};

// One exchange. Pointers are not owned and may be NULL. Redirects are not followed.
struct HttpTransfer {
    static constexpr size_t kMaxReplyBytes = 64UL * 1024 * 1024;

    std::string url;
    const char* method = "GET";
    std::vector<std::string> headers = {};
    const char* body = nullptr;
    FILE* bodyFile = nullptr;  // sent from its position to its end instead of `body`
    long bodyFileSize = 0;     // bytes

    std::string* reply = nullptr;  // appended
    FILE* replyFile = nullptr;     // written instead of `reply`
    size_t maxReplyBytes = kMaxReplyBytes;
    bool withReplyHead = false;  // status line and headers go into the reply as well

    bool changesNothing =
        false;  // of a method other than GET: sent again on a new connection where the kept one is dead
    long timeout = 30;  // seconds
    IProgressObserver* observer = nullptr;
    std::shared_ptr<HttpShare> share = nullptr;

    long status = 0;               // of the answer, 0 without one
    std::string contentType = {};  // likewise
    long retryAfter = 0;           // seconds that an answer 429 or 503 asks to wait, 0 when it does not say

    // 0 for any HTTP status, else -1, -2 (aborted by the observer) or -3 (time-out). A request that writes goes to the wire once.
    [[nodiscard]] int perform();
};
