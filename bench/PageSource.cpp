#include "PageSource.h"

#include <stdexcept>

namespace bench {

namespace {

constexpr std::chrono::hours kTokenLifetime{24};
constexpr const char* kJson = "application/json; charset=UTF-8";

using HeaderList = std::unique_ptr<curl_slist, decltype(&curl_slist_free_all)>;

void add(HeaderList& list, const std::string& header) {
    curl_slist* longer = curl_slist_append(list.get(), header.c_str());
    if (longer == nullptr) throw std::bad_alloc();
    (void)list.release();
    list.reset(longer);
}

std::size_t append(char* data, std::size_t size, std::size_t count, void* text) {
    static_cast<std::string*>(text)->append(data, size * count);
    return size * count;
}

provider::ServerOptions options(bool isTls) {
    provider::ServerOptions result;
    result.isTls = isTls;
    result.isQuiet = true;
    result.tokenLifetime = kTokenLifetime;
    return result;
}

}  // namespace

std::string makeReply(long status, const std::string& contentType, const std::string& body, bool isGzip) {
    std::string reply = "HTTP/1.1 " + std::to_string(status) + (status < 300 ? " OK" : " Error") +
                        "\r\nContent-Type: " + contentType +
                        "\r\nContent-Length: " + std::to_string(body.size()) + "\r\n";
    if (isGzip) reply += "Content-Encoding: gzip\r\n";
    return reply + "\r\n" + body;
}

PageSource::PageSource(const ItemCounts& counts, bool isTls)
    : mProvider(options(isTls)), mCurl(curl_easy_init()) {
    if (!mCurl) throw std::runtime_error("curl_easy_init() failed");
    fill(mProvider.store(), counts);
    mProvider.start();
    const provider::Json known = mProvider.ready();
    const std::string form = "client_id=" + known["clientId"].get<std::string>() +
                             "&client_secret=" + known["clientSecret"].get<std::string>() +
                             "&refresh_token=" + known["accounts"][0]["refreshToken"].get<std::string>() +
                             "&grant_type=refresh_token";
    if (fetch("/o/oauth2/token", form.c_str(), /*isGzip=*/false, &mTokenBody) != 200)
        throw std::runtime_error("the provider gives no token");
    mToken = provider::Json::parse(mTokenBody)["access_token"];
}

PageSource::~PageSource() {
    mCurl.reset();
    mProvider.stop();
}

std::string PageSource::tokenReply() const {
    return makeReply(200, kJson, mTokenBody);
}

std::string PageSource::get(const std::string& target, bool isGzip) {
    std::string body;
    const long status = fetch(target, nullptr, isGzip, &body);
    return makeReply(status, kJson, body, isGzip && body.starts_with("\x1f\x8b"));
}

long PageSource::fetch(const std::string& target, const char* form, bool isGzip, std::string* body) {
    const std::lock_guard lock(mMutex);
    CURL* curl = mCurl.get();
    curl_easy_reset(curl);
    HeaderList headers(nullptr, curl_slist_free_all);
    if (!mHost.empty()) add(headers, "Host: " + mHost);
    if (!mToken.empty()) add(headers, "Authorization: Bearer " + mToken);
    if (isGzip) add(headers, "Accept-Encoding: gzip");
    add(headers, "XData-Version: 3.0");
    const std::string url = mProvider.url() + target;
    curl_easy_setopt(curl, CURLOPT_URL, url.c_str());
    curl_easy_setopt(curl, CURLOPT_USERAGENT, "bench (gzip)");
    curl_easy_setopt(curl, CURLOPT_HTTPHEADER, headers.get());
    if (form != nullptr) curl_easy_setopt(curl, CURLOPT_POSTFIELDS, form);
    // The provider's certificate is one of its own making.
    curl_easy_setopt(curl, CURLOPT_SSL_VERIFYPEER, 0L);
    curl_easy_setopt(curl, CURLOPT_SSL_VERIFYHOST, 0L);
    curl_easy_setopt(curl, CURLOPT_NOSIGNAL, 1L);
    curl_easy_setopt(curl, CURLOPT_WRITEFUNCTION, append);
    curl_easy_setopt(curl, CURLOPT_WRITEDATA, body);
    if (const CURLcode code = curl_easy_perform(curl); code != CURLE_OK)
        throw std::runtime_error("GET " + target + ": " + curl_easy_strerror(code));
    long status = 0;
    curl_easy_getinfo(curl, CURLINFO_RESPONSE_CODE, &status);
    return status;
}

}  // namespace bench
