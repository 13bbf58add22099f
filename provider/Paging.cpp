#include "Paging.h"

#include <array>
#include <charconv>
#include <cstdint>
#include <cstdio>

#include "Http.h"

namespace provider {

// Letters that need no escaping in a query, since clients put the token there as it is.
std::string pageToken(const std::string& list, std::size_t next) {
    std::uint64_t sum = 1469598103934665603ULL ^ next;
    for (const char c : list) sum = (sum ^ static_cast<unsigned char>(c)) * 1099511628211ULL;
    std::array<char, 48> text{};
    std::snprintf(text.data(), text.size(), "P%zx-%016llx", next, static_cast<unsigned long long>(sum));
    return text.data();
}

std::size_t readPageToken(const std::string& list, const std::string& token) {
    if (token.empty()) return 0;
    std::size_t next = 0;
    const char* end = token.data() + token.size();
    if (token[0] == 'P' && std::from_chars(token.data() + 1, end, next, 16).ec == std::errc() &&
        token == pageToken(list, next)) {
        return next;
    }
    throw ApiError{400, "invalid", "Invalid page token value.", "pageToken"};
}

}  // namespace provider
