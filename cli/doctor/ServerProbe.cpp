#include "doctor/ServerProbe.h"

#include <curl/curl.h>

#include <cstring>
#include <memory>
#include <string_view>

#include "Failure.h"

namespace {

constexpr long kConnectSeconds = 5;
constexpr long kTotalSeconds = 8;
constexpr std::string_view kDateHeader = "date:";
constexpr std::string_view kExpiry = "Expire date:";

struct CurlDeleter {
    void operator()(CURL* handle) const noexcept { curl_easy_cleanup(handle); }
};
using Curl = std::unique_ptr<CURL, CurlDeleter>;

size_t readHeader(const char* data, size_t size, size_t count, void* answer) {
    const std::string line(data, size * count);
    if (strncasecmp(line.c_str(), kDateHeader.data(), kDateHeader.size()) == 0) {
        const time_t date = curl_getdate(line.c_str() + kDateHeader.size(), nullptr);
        static_cast<ServerAnswer*>(answer)->dateSec = date > 0 ? date : 0;
    }
    return size * count;
}

size_t dropBody(const char*, size_t size, size_t count, void*) {
    return size * count;
}

// Of the server's own certificate, the first of its chain.
int64_t certificateEnd(CURL* handle) {
    curl_certinfo* info = nullptr;
    if (curl_easy_getinfo(handle, CURLINFO_CERTINFO, &info) != CURLE_OK || info == nullptr ||
        info->num_of_certs < 1)
        return 0;
    for (const curl_slist* line = info->certinfo[0]; line != nullptr; line = line->next) {
        const std::string_view text(line->data);
        if (!text.starts_with(kExpiry)) continue;
        const time_t end = curl_getdate(line->data + kExpiry.size(), nullptr);
        return end > 0 ? end : 0;
    }
    return 0;
}

CURLcode ask(const std::string& url, bool verifies, ServerAnswer* answer, std::string* why) {
    const Curl handle(curl_easy_init());
    if (handle == nullptr) throw Failure("the HTTP library cannot be used");
    char text[CURL_ERROR_SIZE] = "";
    CURL* const curl = handle.get();
    curl_easy_setopt(curl, CURLOPT_URL, url.c_str());
    curl_easy_setopt(curl, CURLOPT_NOBODY, 1L);
    curl_easy_setopt(curl, CURLOPT_PROTOCOLS_STR, "http,https");
    curl_easy_setopt(curl, CURLOPT_CONNECTTIMEOUT, kConnectSeconds);
    curl_easy_setopt(curl, CURLOPT_TIMEOUT, kTotalSeconds);
    curl_easy_setopt(curl, CURLOPT_NOSIGNAL, 1L);
    curl_easy_setopt(curl, CURLOPT_CERTINFO, 1L);
    curl_easy_setopt(curl, CURLOPT_SSL_VERIFYPEER, verifies ? 1L : 0L);
    curl_easy_setopt(curl, CURLOPT_SSL_VERIFYHOST, verifies ? 2L : 0L);
    curl_easy_setopt(curl, CURLOPT_HEADERFUNCTION, readHeader);
    curl_easy_setopt(curl, CURLOPT_HEADERDATA, answer);
    curl_easy_setopt(curl, CURLOPT_WRITEFUNCTION, dropBody);
    curl_easy_setopt(curl, CURLOPT_ERRORBUFFER, text);
    const CURLcode code = curl_easy_perform(curl);
    answer->certificateEndSec = certificateEnd(curl);
    *why = *text != '\0' ? text : curl_easy_strerror(code);
    return code;
}

}  // namespace

ServerAnswer probeServer(const std::string& url) {
    ServerAnswer answer;
    std::string why;
    CURLcode code = ask(url, /*verifies=*/true, &answer, &why);
    if (code == CURLE_PEER_FAILED_VERIFICATION) {
        answer.certificateProblem = why;
        code = ask(url, /*verifies=*/false, &answer, &why);
    }
    answer.isReached = code == CURLE_OK;
    if (!answer.isReached) answer.failure = why;
    return answer;
}
