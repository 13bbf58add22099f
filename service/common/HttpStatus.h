// HttpStatus: the answers of a server that the sync tells apart.
#pragma once

namespace http_status {

inline constexpr long kUnauthorized = 401;
inline constexpr long kNotFound = 404;
inline constexpr long kConflict = 409;
inline constexpr long kGone = 410;
inline constexpr long kPreconditionFailed = 412;
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

}  // namespace http_status
