// PageSource: where the page server's answers come from: the real provider, in this process, asked once for each address.
// Threads: any, one at a time.   Errors: std::runtime_error where the provider gives no answer at all.
#pragma once

#include <curl/curl.h>

#include <memory>
#include <mutex>
#include <string>

#include "BulkContent.h"
#include "ProviderServer.h"

namespace bench {

class PageSource {
public:
    PageSource(const ItemCounts& counts, bool isTls);
    ~PageSource();
    PageSource(const PageSource&) = delete;
    PageSource& operator=(const PageSource&) = delete;

    // Host and port that links in the answers lead to.
    void setHost(const std::string& host) { mHost = host; }
    // A whole HTTP answer to GET `target`, ready to be sent.
    [[nodiscard]] std::string get(const std::string& target, bool isGzip);
    // The access token that all requests carry.
    [[nodiscard]] const std::string& token() const { return mToken; }
    // A whole HTTP answer to the token request.
    [[nodiscard]] std::string tokenReply() const;
    // What a client needs to know, as the provider prints it, but for the address.
    [[nodiscard]] provider::Json ready() { return mProvider.ready(); }
    void touch(const std::string& kind) { bench::touch(mProvider.store(), kind); }

private:
    struct FreeCurl {
        void operator()(CURL* curl) const noexcept { curl_easy_cleanup(curl); }
    };
    // Status, and the body as it came over the wire.
    long fetch(const std::string& target, const char* form, bool isGzip, std::string* body);

    provider::ProviderServer mProvider;
    std::unique_ptr<CURL, FreeCurl> mCurl;
    std::mutex mMutex;
    std::string mHost;
    std::string mToken;
    std::string mTokenBody;
};

// An HTTP answer with its head.
std::string makeReply(long status, const std::string& contentType, const std::string& body,
                      bool isGzip = false);

}  // namespace bench
