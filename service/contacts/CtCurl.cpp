#include "contacts/CtCurl.h"

#include <curl/curl.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <mutex>

#include "common/Account.h"
#include "common/Handles.h"
#include "common/HttpStatus.h"
#include "common/JsonText.h"
#include "common/ServerAddress.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "common/TokenRequest.h"
#include "common/UrlText.h"
#include "contacts/CtFeedParsers.h"
#include "contacts/CtWire.h"
#include "platform/root.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kTokenFailed;
using sync_result::kTransferTimeout;

namespace {

constexpr int kMaxAttempts = 3;
constexpr int kTimedOut = -2;
constexpr size_t kLogSlice = 900;
constexpr size_t kMaxPhotoBytes = 16UL * 1024 * 1024;
constexpr const char* kVersionHeader = "XData-Version: 3.0";
constexpr const char* kEntryHeader = "Content-Type:application/atom+xml;charset=utf-8";
constexpr const char* kPhotoHeader = "Content-Type: image/jpeg";
constexpr const char* kNoExpect = "Expect:";

struct StatusText {
    long status;
    const char* text;
};
constexpr StatusText kStatusTexts[] = {
    {400, "BAD_REQUEST. - Invalid request URI or header, or unsupported nonstandard parameter."},
    {401, "UNAUTHORIZED"},
    {403,
     "FORBIDDEN. - Unsupported standard parameter, or authentication or authorization failed. maybe daily "
     "limit"},
    {404, "NOT_FOUND. - Resource (such as a feed or entry) not found."},
    {409,
     "CONFLICT. - Specified version number doesn't match resource's latest version number. precondition "
     "failed"},
    {410,
     "GONE.- Requested change history is no longer available on the server. Refer to service-specific "
     "documentation "
     "for more details."},
    {500,
     "INTERNAL_SERVER_ERROR. - Internal error. This is the default code that is used for all unrecognized "
     "server "
     "errors."},
};

void logStatus(long status) {
    for (const StatusText& row : kStatusTexts) {
        if (row.status != status) continue;
        SYNC_ERR("%s", row.text);
        return;
    }
    SYNC_ERR("UNCAUGHT EXCEPTION NUMBER %ld", status);
}

using CurlUrl = std::unique_ptr<CURLU, FreeWith<curl_url_cleanup>>;

std::string partOf(CURLU* url, CURLUPart part) {
    char* raw = nullptr;
    if (curl_url_get(url, part, &raw, CURLU_DEFAULT_PORT) != CURLUE_OK) return {};
    const std::unique_ptr<char, FreeWith<curl_free>> text(raw);
    return raw;
}

// Scheme, host and port; empty when the text is no URL, or one with a user in it.
std::string originOfUrl(const std::string& text) {
    const CurlUrl url(curl_url());
    if (!url || curl_url_set(url.get(), CURLUPART_URL, text.c_str(), 0) != CURLUE_OK) return {};
    if (!partOf(url.get(), CURLUPART_USER).empty()) return {};
    return partOf(url.get(), CURLUPART_SCHEME) + "://" + partOf(url.get(), CURLUPART_HOST) + ":" +
           partOf(url.get(), CURLUPART_PORT);
}

using FileHandle = std::unique_ptr<FILE, FreeWith<fclose>>;

FileHandle openImage(const std::string& path, long* size) {
    const int fd = open(platform::rootedPath(path).c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK);
    if (fd == -1) return nullptr;
    FileHandle file(fdopen(fd, "rb"));
    if (!file) {
        close(fd);
        return nullptr;
    }
    struct stat info {};
    if (fstat(fd, &info) != 0 || !S_ISREG(info.st_mode)) return nullptr;
    *size = static_cast<long>(info.st_size);
    return file;
}

}  // namespace

void logReply(const std::string& text) {
    for (size_t at = 0; at < text.size(); at += kLogSlice) SYNC_DBG("%s", text.substr(at, kLogSlice).c_str());
}

std::string withPhotoSize(const std::string& imageUrl) {
    constexpr const char* kSize = "720";
    const size_t query = imageUrl.find('?');
    for (size_t at = query; at != std::string::npos; at = imageUrl.find('&', at + 1)) {
        if (imageUrl.compare(at + 1, 3, "sz=") != 0) continue;
        const size_t end = std::min(imageUrl.find_first_of("&#", at + 1), imageUrl.size());
        return imageUrl.substr(0, at + 4) + kSize + imageUrl.substr(end);
    }
    return imageUrl + (query == std::string::npos ? "?sz=" : "&sz=") + kSize;
}

CtCurl::CtCurl(Account* account, IProgressObserver* observer, std::shared_ptr<HttpShare> share)
    : mpAccount(account), mpObserver(observer), mpShare(std::move(share)) {}

std::string CtCurl::feedBase() const {
    return server_address::contactsBase(*mpAccount) + ct_wire::kFeeds;
}

std::string CtCurl::peopleBase() const {
    return server_address::peopleBase(*mpAccount);
}

// A server that knows itself by another name, behind a proxy or by its number, writes its links so. The token goes nowhere but to
// the account's own.
std::string CtCurl::atOwnServer(const std::string& url) {
    const std::string origin = originOfUrl(url);
    const std::string own = originOfUrl(feedBase());
    if (!origin.starts_with("http") || own.empty()) return {};
    if (origin == own) {
        mAskedServer = own;
        return url;
    }
    // A link of the server that the account had before says nothing about the new one.
    if (mAskedServer != own) return {};
    const CurlUrl parsed(curl_url());
    if (!parsed || curl_url_set(parsed.get(), CURLUPART_URL, url.c_str(), 0) != CURLUE_OK) return {};
    const std::string query = partOf(parsed.get(), CURLUPART_QUERY);
    SYNC_INFO("%s is asked of the account's server", url.c_str());
    return own + partOf(parsed.get(), CURLUPART_PATH) + (query.empty() ? "" : "?" + query);
}

int CtCurl::notAsked(const std::string& url) {
    SYNC_ERR("%s is no address that can be asked", url.c_str());
    mHttpStatus = 0;
    mHasAsked = false;
    return kFailed;
}

bool CtCurl::isAskedToWait() const {
    return mpAccount->retryGate(VANTOR_PIM_SYNC_TYPE_CONTACTS).isAskedToWait();
}

HttpTransfer CtCurl::makeTransfer(const std::string& url, const char* method, Access access) {
    HttpTransfer transfer{
        .url = url, .method = method, .timeout = mTimeout, .observer = mpObserver, .share = mpShare};
    if (access == Access::kAccount) transfer.headers.emplace_back(kVersionHeader);
    return transfer;
}

int CtCurl::exchange(HttpTransfer& transfer) {
    mHttpStatus = 0;
    mHasAsked = true;
    const int result = transfer.perform();
    mHttpStatus = transfer.status;
    // Whom anybody may ask (profiles, their images) does not speak for the account's server.
    const bool isAccounts = !transfer.headers.empty();
    if (transfer.retryAfter > 0 && isAccounts)
        mpAccount->retryGate(VANTOR_PIM_SYNC_TYPE_CONTACTS).askedToWait(transfer.retryAfter);
    if (transfer.reply != nullptr) logReply(*transfer.reply);
    if (result == kTransferTimeout) return kTimedOut;
    return result == kOk ? kOk : kFailed;
}

// --- one exchange each

namespace {

void addBearer(std::vector<std::string>* headers, const std::string& token) {
    headers->push_back("Authorization: Bearer " + token);
}

void addMatch(std::vector<std::string>* headers, const std::string& etag) {
    if (!etag.empty()) headers->push_back("If-Match: " + etag);
}

}  // namespace

int CtCurl::getImpl(const std::string& url, std::string* text) {
    HttpTransfer transfer = makeTransfer(url, "GET", Access::kAccount);
    addBearer(&transfer.headers, mUsedToken);
    text->clear();
    transfer.reply = text;
    return exchange(transfer);
}

int CtCurl::sendEntry(const char* method, const std::string& url, const std::string& etag,
                      const std::string& entry, std::string* reply) {
    HttpTransfer transfer = makeTransfer(url, method, Access::kAccount);
    transfer.headers.insert(transfer.headers.end(), {kEntryHeader, kNoExpect});
    addBearer(&transfer.headers, mUsedToken);
    addMatch(&transfer.headers, etag);
    transfer.body = entry.c_str();
    reply->clear();
    transfer.reply = reply;
    return exchange(transfer);
}

int CtCurl::insertImpl(const std::string& url, const std::string& entry, std::string* reply) {
    return sendEntry("POST", url, {}, entry, reply);
}

int CtCurl::updateImpl(const std::string& url, const std::string& etag, const std::string& entry,
                       std::string* reply) {
    return sendEntry("PUT", url, etag, entry, reply);
}

int CtCurl::removeImpl(const std::string& url, const std::string& etag, std::string* reply) {
    HttpTransfer transfer = makeTransfer(url, "DELETE", Access::kAccount);
    transfer.headers.insert(transfer.headers.end(), {kNoExpect, kEntryHeader});
    addBearer(&transfer.headers, mUsedToken);
    addMatch(&transfer.headers, etag);
    reply->clear();
    transfer.reply = reply;
    return exchange(transfer);
}

int CtCurl::fetchImage(HttpTransfer& transfer, CtStagedPhoto* photo) {
    transfer.replyFile = photo->file();
    transfer.maxReplyBytes = kMaxPhotoBytes;
    if (fseek(photo->file(), 0, SEEK_SET) != 0 || ftruncate(fileno(photo->file()), 0) != 0) return kFailed;
    const int result = exchange(transfer);
    if (result != kOk || !http_status::isSuccess(mHttpStatus)) return result;
    return photo->finish(transfer.contentType) ? kOk : kFailed;
}

int CtCurl::getImageImpl(const std::string& url, const std::string& etag, CtStagedPhoto* photo) {
    HttpTransfer transfer = makeTransfer(url, "GET", Access::kAccount);
    addBearer(&transfer.headers, mUsedToken);
    addMatch(&transfer.headers, etag);
    return fetchImage(transfer, photo);
}

int CtCurl::upsertImageImpl(const std::string& url, const std::string& etag, const std::string& path,
                            std::string* reply) {
    long size = 0;
    const FileHandle file = openImage(path, &size);
    if (!file) {
        SYNC_ERR("The image file doesn't exist!");
        return kFailed;
    }
    HttpTransfer transfer = makeTransfer(url, "PUT", Access::kAccount);
    transfer.headers.insert(transfer.headers.end(), {kPhotoHeader, kNoExpect});
    addBearer(&transfer.headers, mUsedToken);
    addMatch(&transfer.headers, etag);
    transfer.bodyFile = file.get();
    transfer.bodyFileSize = size;
    reply->clear();
    transfer.reply = reply;
    return exchange(transfer);
}

int CtCurl::getOrbitImpl(const std::string& url, std::string* profile) {
    HttpTransfer transfer = makeTransfer(url, "GET", Access::kOpen);
    profile->clear();
    transfer.reply = profile;
    return exchange(transfer);
}

int CtCurl::getOrbitImageImpl(const std::string& url, CtStagedPhoto* photo) {
    HttpTransfer transfer = makeTransfer(url, "GET", Access::kOpen);
    return fetchImage(transfer, photo);
}

// --- operations

int CtCurl::get(const std::string& url, std::string* text) {
    const std::string own = atOwnServer(url);
    if (own.empty()) return notAsked(url);
    return decide("Getting XML from server Failed!", Access::kAccount, Timeouts::kRepeated,
                  [&] { return getImpl(own, text); });
}

int CtCurl::insert(CtItemType type, const std::string& entry, std::string* reply) {
    const std::string url =
        feedBase() + "/" +
        (type == CtItemType::kGroup ? "groups/default/full?alt=json" : "contacts/default/full?alt=json");
    return decide("Inserting XML to server Failed!", Access::kAccount, Timeouts::kFinal,
                  [&] { return insertImpl(url, entry, reply); });
}

int CtCurl::update(const std::string& editUrl, const std::string& etag, const std::string& entry,
                   std::string* reply) {
    if (etag.empty()) {
        SYNC_ERR("Etag should be provided!");
        mHttpStatus = 0;
        return kFailed;
    }
    return decide("Updating item on server Failed!", Access::kAccount, Timeouts::kRepeated,
                  [&] { return updateImpl(editUrl, etag, entry, reply); });
}

int CtCurl::remove(const std::string& editUrl, const std::string& etag, std::string* reply) {
    if (etag.empty()) {
        SYNC_ERR("Etag should be provided!");
        mHttpStatus = 0;
        return kFailed;
    }
    return decide("Removing item on server Failed!", Access::kAccount, Timeouts::kRepeated,
                  [&] { return removeImpl(editUrl, etag, reply); });
}

int CtCurl::getImage(const std::string& photoUrl, const std::string& photoEtag, CtStagedPhoto* photo) {
    const std::string own = atOwnServer(photoUrl);
    if (own.empty()) return notAsked(photoUrl);
    return decide("Getting Image from server Failed!", Access::kAccount, Timeouts::kRepeated,
                  [&] { return getImageImpl(own, photoEtag, photo); });
}

int CtCurl::upsertImage(const std::string& photoUrl, const std::string& photoEtag, const std::string& path,
                        std::string* reply) {
    return decide("Updating item on server Failed!", Access::kAccount, Timeouts::kRepeated,
                  [&] { return upsertImageImpl(photoUrl, photoEtag, path, reply); });
}

int CtCurl::getOrbit(const std::string& personId, std::string* profile) {
    if (personId.empty()) {
        SYNC_ERR("id is null");
        mHttpStatus = 0;
        return kFailed;
    }
    const std::string url =
        peopleBase() + ct_wire::kPeople + url_text::hrefSegment(personId) + "?key=" + ct_wire::kPeopleKey;
    return decide("Getting XML from server Failed!", Access::kOpen, Timeouts::kRepeated,
                  [&] { return getOrbitImpl(url, profile); });
}

int CtCurl::getOrbitImage(const std::string& imageUrl, CtStagedPhoto* photo) {
    const std::string url = withPhotoSize(imageUrl);
    return decide("Getting Image from server Failed!", Access::kOpen, Timeouts::kRepeated,
                  [&] { return getOrbitImageImpl(url, photo); });
}

// --- the decision

int CtCurl::decide(const char* failureText, Access access, Timeouts timeouts,
                   const std::function<int()>& impl) {
    bool isTimeout = false;
    mHttpStatus = 0;
    mHasAsked = false;
    for (int attempt = 0; attempt < kMaxAttempts; ++attempt) {
        mUsedToken = access == Access::kAccount ? mpAccount->getAccessToken() : std::string();
        const int result = impl();
        isTimeout = result == kTimedOut;
        if (isTimeout && timeouts == Timeouts::kRepeated) continue;
        if (result != kOk) break;
        if (http_status::isSuccess(mHttpStatus)) return kOk;
        if (mHttpStatus != http_status::kUnauthorized || access == Access::kOpen) {
            logStatus(mHttpStatus);
            break;
        }
        if (const int renewed = renewToken(); renewed != kOk) {
            SYNC_ERR("Refreshing access token failed!");
            return renewed;
        }
    }
    if (isTimeout) SYNC_ERR("timeout fail");
    if (mHttpStatus == http_status::kUnauthorized && access == Access::kAccount) SYNC_ERR("UNAUTHORIZED");
    SYNC_ERR("%s", failureText);
    return kFailed;
}

// One refresh per account at a time; whoever comes second finds that the token has changed already.
int CtCurl::renewToken() {
    const std::lock_guard refreshing(mpAccount->refreshMutex());
    if (mpAccount->getAccessToken() != mUsedToken) return kOk;
    std::string token;
    const int result = getAnotherAccessToken(&token);
    if (result == kOk) mpAccount->setAccessToken(token);
    return result;
}

int CtCurl::getAnotherAccessToken(std::string* token) {
    std::string response;
    if (requestAccessToken(*mpAccount, mpObserver, mpShare, mTimeout, &response) != kOk) {
        SYNC_ERR("getAccessToken fail");
        return kFailed;
    }
    const std::string body = response.substr(std::min(response.find('{'), response.size()));
    // A reply that is no JSON says nothing about the authorisation.
    if (!json_text::parse(body)) return kFailed;
    return CtAccessTokenParser::getAccessToken(body, token) == kOk ? kOk : kTokenFailed;
}
