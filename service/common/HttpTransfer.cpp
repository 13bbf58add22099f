#include "common/HttpTransfer.h"

#include <array>
#include <mutex>
#include <string_view>
#include <utility>

#include "common/Handles.h"
#include "common/HeaderText.h"
#include "common/HttpStatus.h"
#include "common/PeerVerification.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/error.h"

using sync_result::kAborted;
using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kTransferTimeout;

namespace {

// Where the answer's bytes go.
struct Sink {
    HttpTransfer& transfer;
    size_t taken = 0;
};

size_t takeReply(char* data, size_t size, size_t count, void* sink) {
    auto* state = static_cast<Sink*>(sink);
    HttpTransfer& transfer = state->transfer;
    state->taken += size * count;
    if (state->taken > transfer.maxReplyBytes) {
        SYNC_ERR("the server's answer is larger than %zu bytes, it is not taken", transfer.maxReplyBytes);
        return 0;
    }
    if (transfer.replyFile != nullptr) return fwrite(data, size, count, transfer.replyFile) * size;
    if (transfer.reply != nullptr) transfer.reply->append(data, size * count);
    return size * count;
}

int askObserver(void* observer, double downloadTotal, double downloaded, double uploadTotal,
                double uploaded) {
    if (observer == nullptr) return 0;
    return static_cast<IProgressObserver*>(observer)->onProgress(downloadTotal, downloaded, uploadTotal,
                                                                 uploaded);
}

int ignoreDebug(CURL*, curl_infotype, char*, size_t, void*) {
    return 0;
}

// libcurl sends a request again by itself when a kept connection turns out to be dead; one that writes must not go out twice.
struct SendGuard {
    bool writes = false;
    int sent = 0;
};

int beforeRequest(void* guard, char*, char*, int, int) {
    auto* state = static_cast<SendGuard*>(guard);
    ++state->sent;
    return state->writes && state->sent > 1 ? CURL_PREREQFUNC_ABORT : CURL_PREREQFUNC_OK;
}

int resultOf(CURLcode code) {
    switch (static_cast<int>(code)) {
        case CURLE_OK:
            return kOk;
        case CURLE_OPERATION_TIMEDOUT:
            return kTransferTimeout;
        case CURLE_ABORTED_BY_CALLBACK:
            return kAborted;
        default:
            return kFailed;
    }
}

}  // namespace

// --- what the handles of one worker share

namespace {

struct ShareLocks {
    std::array<std::mutex, CURL_LOCK_DATA_LAST> mutexes;
};

void lockShare(CURL*, curl_lock_data data, curl_lock_access, void* locks) {
    static_cast<ShareLocks*>(locks)->mutexes[data].lock();
}

void unlockShare(CURL*, curl_lock_data data, void* locks) {
    static_cast<ShareLocks*>(locks)->mutexes[data].unlock();
}

}  // namespace

struct HttpShare::State {
    ShareLocks locks;
    CurlShare share;
    std::mutex idleMutex;
    CurlEasy idle;  // of the last exchange; goes before the share
};

HttpShare::HttpShare() : mpState(std::make_unique<State>()) {
    mpState->share.reset(curl_share_init());
    CURLSH* share = mpState->share.get();
    curl_share_setopt(share, CURLSHOPT_LOCKFUNC, lockShare);
    curl_share_setopt(share, CURLSHOPT_UNLOCKFUNC, unlockShare);
    curl_share_setopt(share, CURLSHOPT_USERDATA, &mpState->locks);
    for (const curl_lock_data data :
         {CURL_LOCK_DATA_CONNECT, CURL_LOCK_DATA_DNS, CURL_LOCK_DATA_SSL_SESSION}) {
        curl_share_setopt(share, CURLSHOPT_SHARE, data);
    }
}

HttpShare::~HttpShare() = default;

void* HttpShare::handle() const {
    return mpState->share.get();
}

CurlEasy HttpShare::takeIdle() {
    const std::lock_guard lock(mpState->idleMutex);
    return std::move(mpState->idle);
}

void HttpShare::giveBack(CurlEasy curl) {
    // Nothing of the exchange is kept: neither its options nor what they point to.
    curl_easy_reset(curl.get());
    const std::lock_guard lock(mpState->idleMutex);
    mpState->idle.swap(curl);
}

// --- the exchange

namespace {

// An easy handle for one exchange: making one costs more than a small request.
class UsedHandle {
public:
    explicit UsedHandle(std::shared_ptr<HttpShare> share) : mShare(std::move(share)) {
        if (mShare) mCurl = mShare->takeIdle();
        if (!mCurl) mCurl.reset(curl_easy_init());
    }
    ~UsedHandle() {
        if (mShare && mCurl) mShare->giveBack(std::move(mCurl));
    }
    UsedHandle(const UsedHandle&) = delete;
    UsedHandle& operator=(const UsedHandle&) = delete;
    [[nodiscard]] CURL* get() const { return mCurl.get(); }

private:
    const std::shared_ptr<HttpShare> mShare;
    CurlEasy mCurl;
};

void setCommonOptions(CURL* curl, HttpTransfer& transfer, Sink* sink) {
    const bool verified = isPeerVerified();
    curl_easy_setopt(curl, CURLOPT_SSL_VERIFYPEER, verified ? 1L : 0L);
    // Without a verified certificate the name in it means nothing.
    curl_easy_setopt(curl, CURLOPT_SSL_VERIFYHOST, verified ? 2L : 0L);
    curl_easy_setopt(curl, CURLOPT_CONNECTTIMEOUT, transfer.timeout);
    curl_easy_setopt(curl, CURLOPT_TIMEOUT, transfer.timeout);
    curl_easy_setopt(curl, CURLOPT_VERBOSE, 0L);
    curl_easy_setopt(curl, CURLOPT_DEBUGFUNCTION, ignoreDebug);
    curl_easy_setopt(curl, CURLOPT_NOPROGRESS, 0L);
    // The successor counts in integers; the observer's figures are doubles.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"
    curl_easy_setopt(curl, CURLOPT_PROGRESSFUNCTION, askObserver);
#pragma GCC diagnostic pop
    curl_easy_setopt(curl, CURLOPT_PROGRESSDATA, transfer.observer);
    curl_easy_setopt(curl, CURLOPT_WRITEFUNCTION, takeReply);
    curl_easy_setopt(curl, CURLOPT_WRITEDATA, sink);
    curl_easy_setopt(curl, CURLOPT_HEADER, transfer.withReplyHead ? 1L : 0L);
    curl_easy_setopt(curl, CURLOPT_NOSIGNAL, 1L);
    curl_easy_setopt(curl, CURLOPT_FOLLOWLOCATION, 0L);
    curl_easy_setopt(curl, CURLOPT_PROTOCOLS_STR, "http,https");
    if (transfer.share) curl_easy_setopt(curl, CURLOPT_SHARE, transfer.share->handle());
}

void setBody(CURL* curl, const HttpTransfer& transfer) {
    if (transfer.bodyFile != nullptr) {
        curl_easy_setopt(curl, CURLOPT_UPLOAD, 1L);
        curl_easy_setopt(curl, CURLOPT_READDATA, transfer.bodyFile);
        curl_easy_setopt(curl, CURLOPT_INFILESIZE_LARGE, static_cast<curl_off_t>(transfer.bodyFileSize));
    } else if (transfer.body != nullptr) {
        curl_easy_setopt(curl, CURLOPT_POST, 1L);
        curl_easy_setopt(curl, CURLOPT_POSTFIELDS, transfer.body);
    }
    curl_easy_setopt(curl, CURLOPT_CUSTOMREQUEST, transfer.method);
}

}  // namespace

int HttpTransfer::perform() {
    status = 0;
    CurlList list;  // outlives its use by the handle
    const UsedHandle curl(share);
    if (curl.get() == nullptr) {
        SYNC_ERR("curl_easy_init() failed");
        return kFailed;
    }
    for (const std::string& header : headers) {
        if (!header_text::isValid(header)) {
            SYNC_ERR("a header of the request would not stay on its line, nothing is sent");
            return kFailed;
        }
        curl_slist* longer = curl_slist_append(list.get(), header.c_str());
        if (longer == nullptr) return kFailed;
        (void)list.release();
        list.reset(longer);
    }
    Sink sink{*this};
    SendGuard guard{.writes = std::string_view(method) != "GET" && !changesNothing};
    curl_easy_setopt(curl.get(), CURLOPT_HTTPHEADER, list.get());
    curl_easy_setopt(curl.get(), CURLOPT_URL, url.c_str());
    setCommonOptions(curl.get(), *this, &sink);
    setBody(curl.get(), *this);
    curl_easy_setopt(curl.get(), CURLOPT_PREREQFUNCTION, beforeRequest);
    curl_easy_setopt(curl.get(), CURLOPT_PREREQDATA, &guard);

    const CURLcode code = curl_easy_perform(curl.get());
    // A second sending that was refused looks like an abort, but it is a connection that died.
    if (guard.writes && guard.sent > 1) return kFailed;
    if (code != CURLE_OK) {
        SYNC_DBG("%s: %s", method, curl_easy_strerror(code));
        return resultOf(code);
    }
    curl_easy_getinfo(curl.get(), CURLINFO_RESPONSE_CODE, &status);
    curl_off_t wait = 0;
    const bool isBusy = status == http_status::kTooManyRequests || status == http_status::kUnavailable;
    if (isBusy && curl_easy_getinfo(curl.get(), CURLINFO_RETRY_AFTER, &wait) == CURLE_OK)
        retryAfter = static_cast<long>(wait);
    const char* type = nullptr;
    if (curl_easy_getinfo(curl.get(), CURLINFO_CONTENT_TYPE, &type) == CURLE_OK && type != nullptr)
        contentType = type;
    return kOk;
}
