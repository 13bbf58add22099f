#include "TextFields.h"

#include <array>
#include <cstdio>

namespace text_fields {

std::string webColor(const std::string& stored) {
    unsigned red = 0;
    unsigned green = 0;
    unsigned blue = 0;
    unsigned alpha = 0;
    int end = 0;
    constexpr unsigned kMost = 255;
    if (std::sscanf(stored.c_str(), "%3u.%3u.%3u.%3u%n", &red, &green, &blue, &alpha, &end) != 4 ||
        static_cast<size_t>(end) != stored.size() || red > kMost || green > kMost || blue > kMost) {
        return {};
    }
    std::array<char, 16> text{};
    std::snprintf(text.data(), text.size(), "#%02x%02x%02x", red, green, blue);
    return text.data();
}

}  // namespace text_fields
