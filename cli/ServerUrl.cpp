#include "ServerUrl.h"

#include <algorithm>
#include <charconv>

namespace {

constexpr int kHighestPort = 65535;
constexpr std::string_view kHostCharacters =
    "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789.-";
constexpr std::string_view kAddressCharacters = "0123456789abcdefABCDEF:.";

bool consists(std::string_view text, std::string_view of) {
    return !text.empty() && text.find_first_not_of(of) == std::string_view::npos;
}

bool takeScheme(std::string_view& rest, ServerUrl::Scheme* scheme) {
    const size_t end = rest.find("://");
    if (end == std::string_view::npos) return true;
    const std::string_view name = rest.substr(0, end);
    if (name != "http" && name != "https") return false;
    *scheme = name == "http" ? ServerUrl::Scheme::kHttp : ServerUrl::Scheme::kHttps;
    rest.remove_prefix(end + 3);
    return true;
}

// "[::1]" or a name; what follows is left in `rest`.
bool takeHost(std::string_view& rest, std::string* host) {
    if (rest.starts_with('[')) {
        const size_t end = rest.find(']');
        if (end == std::string_view::npos || !consists(rest.substr(1, end - 1), kAddressCharacters))
            return false;
        *host = rest.substr(0, end + 1);
        rest.remove_prefix(end + 1);
        return true;
    }
    *host = rest.substr(0, rest.find(':'));
    rest.remove_prefix(host->size());
    return consists(*host, kHostCharacters) && host->front() != '-' && host->front() != '.';
}

bool readPort(std::string_view text, int* port) {
    if (text.empty()) return true;
    text.remove_prefix(1);  // the colon
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), *port);
    return error == std::errc() && end == text.data() + text.size() && *port > 0 && *port <= kHighestPort;
}

}  // namespace

std::optional<ServerUrl> ServerUrl::parse(std::string_view text) {
    const bool isPlain = std::all_of(text.begin(), text.end(), [](char c) { return c > ' ' && c < '\x7f'; });
    if (!isPlain || text.find_first_of("@?#\"<>\\^`{|}") != std::string_view::npos) return std::nullopt;
    ServerUrl url;
    if (!takeScheme(text, &url.scheme)) return std::nullopt;
    std::string_view authority = text.substr(0, text.find('/'));
    if (!takeHost(authority, &url.host)) return std::nullopt;
    if (!authority.empty() && authority.front() != ':') return std::nullopt;
    if (!readPort(authority, &url.port)) return std::nullopt;
    return url;
}
