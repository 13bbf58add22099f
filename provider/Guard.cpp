#include "Guard.h"

#include <algorithm>
#include <array>
#include <string_view>

namespace provider {

namespace {

constexpr std::array<std::string_view, 3> kLoopbackNames = {"127.0.0.1", "localhost", "[::1]"};

struct Header {
    const char* name;
    const char* value;
};
constexpr Header kProtection[] = {
    // Photos are whatever somebody sent as an image; one that holds a script is shown, but not run.
    {"Content-Security-Policy", "default-src 'none'; sandbox; frame-ancestors 'none'"},
    {"Cross-Origin-Resource-Policy", "same-origin"},
    {"X-Content-Type-Options", "nosniff"},
    {"Referrer-Policy", "no-referrer"},
    {"Cache-Control", "no-store"},
};

bool isLoopback(const std::string& host) {
    const std::size_t colon = host.rfind(':');
    const bool hasPort = colon != std::string::npos && host.find(']', colon) == std::string::npos;
    std::string name = host.substr(0, hasPort ? colon : std::string::npos);
    std::transform(name.begin(), name.end(), name.begin(), [](unsigned char c) { return std::tolower(c); });
    return std::find(kLoopbackNames.begin(), kLoopbackNames.end(), name) != kLoopbackNames.end();
}

// Browsers send Origin with every request that writes, and Sec-Fetch-Site with all; other ports of this machine are
// other origins, but the same site.
bool isForeign(const Call& call) {
    const std::string origin = call.header("Origin");
    const std::string site = call.header("Sec-Fetch-Site");
    return (!origin.empty() && origin != call.origin) || site == "cross-site" || site == "same-site";
}

}  // namespace

void checkCaller(const Call& call) {
    const std::string host = call.header("Host");
    if (!host.empty() && !isLoopback(host))
        throw ApiError{421, "misdirected", "This provider answers to the loopback address only", "Host"};
    if (call.path.starts_with("/admin") && isForeign(call))
        throw ApiError{403, "forbidden", "Pages of another origin may not do this", "Origin"};
}

void protectReply(Reply& reply) {
    for (const auto& [name, value] : kProtection) reply.headers.try_emplace(name, value);
}

}  // namespace provider
