// HeaderText: values that the server gives and the sync sends back in a request's header (tokens, etags). Threads: any.
#pragma once

#include <algorithm>
#include <string_view>

namespace header_text {

// Whether it stays on its line: without control characters.
inline bool isValid(std::string_view text) {
    return std::none_of(text.begin(), text.end(), [](unsigned char c) { return c < 0x20 || c == 0x7F; });
}

}  // namespace header_text
