// Identifiers inside URLs. They are inserted as they are, but for characters that would end the path segment or the query
// value they stand in: a calendar id with a "#" must not address another calendar. Threads: any.
//
// An id that was cut out of an href is encoded already, by the server. It goes back through hrefSegment(), which leaves that as it is.
#pragma once

#include <string>
#include <string_view>

namespace url_text {

inline bool isEscape(std::string_view text) {
    constexpr std::string_view kHexDigits = "0123456789ABCDEFabcdef";
    return text.size() >= 3 && text[0] == '%' && kHexDigits.find(text[1]) != std::string_view::npos &&
           kHexDigits.find(text[2]) != std::string_view::npos;
}

enum class Escapes { kNone, kKept };

// `special`: the characters beside controls, space and non-ASCII that are percent-encoded. `escapes`: whether the text may
// hold percent-encoded characters, which then stay.
inline std::string encode(std::string_view text, std::string_view special, Escapes escapes = Escapes::kNone) {
    constexpr char kHex[] = "0123456789ABCDEF";
    std::string encoded;
    encoded.reserve(text.size());
    for (size_t at = 0; at < text.size(); ++at) {
        const char c = text[at];
        const auto byte = static_cast<unsigned char>(c);
        const bool isPlain = byte > ' ' && byte < 0x7f && special.find(c) == std::string_view::npos;
        if (isPlain || (escapes == Escapes::kKept && isEscape(text.substr(at)))) {
            encoded += c;
        } else {
            encoded += '%';
            encoded += kHex[byte >> 4];
            encoded += kHex[byte & 0x0f];
        }
    }
    return encoded;
}

inline constexpr std::string_view kNotInSegment = "%/?#\"<>\\^`{|}";
inline std::string segment(std::string_view id) {
    return encode(id, kNotInSegment);
}
inline std::string hrefSegment(std::string_view id) {
    return encode(id, kNotInSegment, Escapes::kKept);
}
inline std::string queryValue(std::string_view value) {
    return encode(value, "%&+#\"<>\\^`{|}");
}

}  // namespace url_text
