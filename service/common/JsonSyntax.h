// JsonSyntax: whether a text is JSON to the letter. The library that parses it afterwards is more lenient (comments, trailing
// commas, text after the document), and recursion over hostile depth is not wanted.
#pragma once

#include <string_view>

namespace json_syntax {

inline constexpr int kMaxDepth = 512;

// True for one JSON value of at most kMaxDepth levels with nothing but white space around it, in valid UTF-8.
bool isValid(std::string_view text);

}  // namespace json_syntax
