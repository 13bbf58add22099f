// HttpStatus: the answers of a server that the sync tells apart.
#pragma once

namespace http_status {

inline constexpr long kUnauthorized = 401;
inline constexpr long kNotFound = 404;
inline constexpr long kConflict = 409;
inline constexpr long kGone = 410;
inline constexpr long kPreconditionFailed = 412;
inline constexpr long kTooManyRequests = 429;
inline constexpr long kUnavailable = 503;
inline constexpr long kServerError = 500;  // and above: what became of the request is not known

constexpr bool isSuccess(long status) {
    return status >= 200 && status <= 299;
}
// The item is not there, or not any more.
constexpr bool isGone(long status) {
    return status == kNotFound || status == kGone;
}

// The server has another version of the item than the request named.
constexpr bool isConflict(long status) {
    return status == kConflict || status == kPreconditionFailed;
}

// The request was not done and will not be as long as it stays as it is.
constexpr bool isRefusedForGood(long status) {
    constexpr long kClientError = 400;
    constexpr long kRequestTimeout = 408;
    constexpr long kLocked = 423;
    constexpr long kTooEarly = 425;
    return status >= kClientError && status < kServerError && status != kUnauthorized && !isGone(status) &&
           !isConflict(status) && status != kRequestTimeout && status != kLocked && status != kTooEarly &&
           status != kTooManyRequests;
}

}  // namespace http_status
