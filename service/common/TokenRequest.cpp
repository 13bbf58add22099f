#include "common/TokenRequest.h"

#include "common/Account.h"
#include "common/Handles.h"
#include "common/HttpStatus.h"
#include "common/HttpTransfer.h"
#include "common/ServerAddress.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/error.h"
#include "platform/keys.h"

using sync_result::kFailed;
using sync_result::kOk;

int requestAccessToken(Account& account, IProgressObserver* observer, std::shared_ptr<HttpShare> share,
                       long timeout, std::string* response) {
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
                             "&refresh_token=" + account.getRefreshToken() + "&grant_type=refresh_token";
    HttpTransfer transfer{.url = server_address::tokenBase(account) + "/o/oauth2/token",
                          .method = "POST",
                          .body = body.c_str(),
                          .reply = response,
                          .withReplyHead = true,
                          .changesNothing = true,
                          .timeout = timeout,
                          .observer = observer,
                          .share = std::move(share)};
    if (transfer.perform() != kOk) return kFailed;
    if (transfer.status < http_status::kServerError && transfer.status != http_status::kTooManyRequests)
        return kOk;
    // A server in trouble says nothing about the authorisation, whatever its error reads like.
    SYNC_ERR("the token server answered with error %ld", transfer.status);
    response->clear();
    return kFailed;
}
