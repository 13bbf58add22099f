#include "common/SyncCurl.h"

#include "common/Account.h"
#include "common/SyncResult.h"
#include "common/TokenRequest.h"

namespace {

constexpr const char* kMethodNames[] = {"GET", "POST", "PATCH", "DELETE"};

}  // namespace

SyncCurl::SyncCurl(Account* account, IProgressObserver* observer, std::shared_ptr<HttpShare> share)
    : mpAccount(account), mpProgressObserver(observer), mpShare(std::move(share)) {}

SyncCurl::~SyncCurl() = default;

int SyncCurl::performCurl(const std::string& url, const HttpMethod& method, const char* body,
                          std::string* response, const std::vector<std::string>& headers, long* httpCode) {
    HttpTransfer transfer{.url = url,
                          .method = kMethodNames[static_cast<int>(method)],
                          .headers = headers,
                          .body = body,
                          .reply = response,
                          .timeout = mTimeout,
                          .observer = mpProgressObserver,
                          .share = mpShare};
    const int result = transfer.perform();
    if (result == sync_result::kOk) *httpCode = transfer.status;
    if (transfer.retryAfter > 0)
        mpAccount->retryGate(VANTOR_PIM_SYNC_TYPE_CALENDAR).askedToWait(transfer.retryAfter);
    return result;
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
    return requestAccessToken(*mpAccount, mpProgressObserver, mpShare, mTimeout, response);
}
