// Identifiers inside URLs. They are inserted as they are, but for characters that would end the path segment or the query
// value they stand in: a calendar id with a "#" must not address another calendar. Threads: any.
#pragma once

#include <string>
#include <string_view>

namespace url_text {

// `special`: the characters beside controls, space and non-ASCII that are percent-encoded.
inline std::string encode(std::string_view text, std::string_view special) {
    constexpr char kHex[] = "0123456789ABCDEF";
    std::string encoded;
    encoded.reserve(text.size());
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if (byte > ' ' && byte < 0x7f && special.find(c) == std::string_view::npos) {
            encoded += c;
        } else {
            encoded += '%';
            encoded += kHex[byte >> 4];
            encoded += kHex[byte & 0x0f];
        }
    }
    return encoded;
}

inline std::string segment(std::string_view id) {
    return encode(id, "%/?#\"<>\\^`{|}");
}
inline std::string queryValue(std::string_view value) {
    return encode(value, "%&+#\"<>\\^`{|}");
}

}  // namespace url_text
