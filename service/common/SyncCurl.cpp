#include "common/SyncCurl.h"

#include <array>
#include <mutex>

#include "common/Account.h"
#include "common/Handles.h"
#include "common/ServerAddress.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/error.h"
#include "platform/keys.h"
#include "platform/settings.h"

using sync_result::kAborted;
using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kTransferTimeout;

namespace {

constexpr const char* kMethodNames[] = {"GET", "POST", "PATCH", "DELETE"};
constexpr size_t kMaxReplyBytes = 64UL * 1024 * 1024;

const char* nameOf(HttpMethod method) {
    return kMethodNames[static_cast<int>(method)];
}

size_t appendReply(char* data, size_t size, size_t count, void* reply) {
    auto* text = static_cast<std::string*>(reply);
    if (text->size() + size * count > kMaxReplyBytes) {
        SYNC_ERR("the server's answer is larger than %zu bytes, it is not taken", kMaxReplyBytes);
        return 0;
    }
    text->append(data, size * count);
    return size * count;
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

bool isPeerVerified() {
    int value = 0;
    return vconf_get_int("db/vantor-pim-sync/verify_peer", &value) == PLATFORM_ERROR_NONE && value == 1;
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

// --- exchanges

SyncCurl::SyncCurl(Account* account, IProgressObserver* observer, std::shared_ptr<HttpShare> share)
    : mpAccount(account), mpProgressObserver(observer), mpShare(std::move(share)) {}

SyncCurl::~SyncCurl() = default;

int SyncCurl::onProgress(void* self, double downloadTotal, double downloaded, double uploadTotal,
                         double uploaded) {
    const auto* curl = static_cast<SyncCurl*>(self);
    if (curl == nullptr || curl->mpProgressObserver == nullptr) return 0;
    return curl->mpProgressObserver->onProgress(downloadTotal, downloaded, uploadTotal, uploaded);
}

void SyncCurl::setCommonOptions(void* handle, std::string* reply) {
    CURL* curl = handle;
    curl_easy_setopt(curl, CURLOPT_SSL_VERIFYPEER, isPeerVerified() ? 1L : 0L);
    curl_easy_setopt(curl, CURLOPT_CONNECTTIMEOUT, mTimeout);
    curl_easy_setopt(curl, CURLOPT_TIMEOUT, mTimeout);
    curl_easy_setopt(curl, CURLOPT_VERBOSE, 0L);
    curl_easy_setopt(curl, CURLOPT_DEBUGFUNCTION, ignoreDebug);
    curl_easy_setopt(curl, CURLOPT_NOPROGRESS, 0L);
    // The successor counts in integers; the observer's figures are doubles.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"
    curl_easy_setopt(curl, CURLOPT_PROGRESSFUNCTION, &SyncCurl::onProgress);
#pragma GCC diagnostic pop
    curl_easy_setopt(curl, CURLOPT_PROGRESSDATA, this);
    curl_easy_setopt(curl, CURLOPT_WRITEFUNCTION, appendReply);
    curl_easy_setopt(curl, CURLOPT_WRITEDATA, reply);
}

void SyncCurl::setOwnOptions(void* handle) {
    CURL* curl = handle;
    // Without a verified certificate the name in it means nothing.
    curl_easy_setopt(curl, CURLOPT_SSL_VERIFYHOST, isPeerVerified() ? 2L : 0L);
    curl_easy_setopt(curl, CURLOPT_NOSIGNAL, 1L);
    curl_easy_setopt(curl, CURLOPT_FOLLOWLOCATION, 0L);
    curl_easy_setopt(curl, CURLOPT_PROTOCOLS_STR, "http,https");
    if (mpShare) curl_easy_setopt(curl, CURLOPT_SHARE, mpShare->handle());
}

int SyncCurl::performCurl(const std::string& url, const HttpMethod& method, const char* body,
                          std::string* response, const std::vector<std::string>& headers, long* httpCode) {
    const CurlEasy curl(curl_easy_init());
    if (!curl) {
        SYNC_ERR("curl_easy_init() failed");
        return kFailed;
    }
    CurlList list;
    for (const std::string& header : headers) {
        curl_slist* longer = curl_slist_append(list.get(), header.c_str());
        if (longer == nullptr) return kFailed;
        (void)list.release();
        list.reset(longer);
    }
    std::string discarded;
    SendGuard guard{.writes = method != HttpMethod::kGet};

    curl_easy_setopt(curl.get(), CURLOPT_HTTPHEADER, list.get());
    curl_easy_setopt(curl.get(), CURLOPT_URL, url.c_str());
    curl_easy_setopt(curl.get(), CURLOPT_CUSTOMREQUEST, nameOf(method));
    setCommonOptions(curl.get(), response != nullptr ? response : &discarded);
    if (body != nullptr) {
        curl_easy_setopt(curl.get(), CURLOPT_POST, 1L);
        curl_easy_setopt(curl.get(), CURLOPT_POSTFIELDS, body);
    }
    setOwnOptions(curl.get());
    curl_easy_setopt(curl.get(), CURLOPT_PREREQFUNCTION, beforeRequest);
    curl_easy_setopt(curl.get(), CURLOPT_PREREQDATA, &guard);

    const CURLcode code = curl_easy_perform(curl.get());
    // A second sending that was refused looks like an abort, but it is a connection that died.
    if (guard.writes && guard.sent > 1) return kFailed;
    if (code != CURLE_OK) {
        SYNC_DBG("%s: %s", nameOf(method), curl_easy_strerror(code));
        return resultOf(code);
    }
    curl_easy_getinfo(curl.get(), CURLINFO_RESPONSE_CODE, httpCode);
    return kOk;
}

int SyncCurl::sendRequest(const std::string& url, const HttpMethod& method, const char* body,
                          std::string* response, long* httpCode) {
    mLastToken = mpAccount->getAccessToken();
    std::vector<std::string> headers = {"Authorization: Bearer " + mLastToken};
    if (method != HttpMethod::kGet) {
        headers.emplace_back("Content-Type:application/json");
        headers.emplace_back("Expect:");
    }
    return performCurl(url, method, body, response, headers, httpCode);
}

int SyncCurl::getAnotherAccessToken(std::string* response) {
    const CurlEasy curl(curl_easy_init());
    if (!curl) {
        SYNC_ERR("curl_easy_init() failed");
        return kFailed;
    }
    char* raw = nullptr;
    if (key_storage_get("vantor.tovik.client.id", &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("key_storage_get fail");
        return kFailed;
    }
    const CChars clientId(raw);
    if (key_storage_get("vantor.tovik.client.secret", &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("key_storage fail");
        return kFailed;
    }
    const CChars clientSecret(raw);
    const std::string body = std::string("client_id=") + clientId.get() +
                             "&client_secret=" + clientSecret.get() +
                             "&refresh_token=" + mpAccount->getRefreshToken() + "&grant_type=refresh_token";
    const std::string url = server_address::tokenBase(*mpAccount) + "/o/oauth2/token";

    curl_easy_setopt(curl.get(), CURLOPT_URL, url.c_str());
    curl_easy_setopt(curl.get(), CURLOPT_POST, 1L);
    curl_easy_setopt(curl.get(), CURLOPT_POSTFIELDS, body.c_str());
    setCommonOptions(curl.get(), response);
    curl_easy_setopt(curl.get(), CURLOPT_HEADER, 1L);
    setOwnOptions(curl.get());
    const CURLcode code = curl_easy_perform(curl.get());
    if (code != CURLE_OK) {
        SYNC_DBG("token refresh: %s", curl_easy_strerror(code));
        return kFailed;
    }
    return kOk;
}
