// ServerUrl.h: what may be given as an account's server. Pure functions.
#pragma once

#include <optional>
#include <string>
#include <string_view>

struct ServerUrl {
    enum class Scheme { kNone, kHttp, kHttps };
    Scheme scheme = Scheme::kNone;  // kNone: a bare host
    std::string host;
    int port = 0;  // 0: not given

    // A URL or a bare host, with a port and a path if need be. Nothing for another scheme, a user name or password (a
    // secret has no place there), a query, a fragment, blanks, or a port that is none.
    static std::optional<ServerUrl> parse(std::string_view text);
};
