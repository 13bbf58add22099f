// JsonSyntax: whether a text is JSON to the letter. The library that parses it afterwards is more lenient (comments, trailing
// commas, text after the document), and recursion over hostile depth is not wanted.
#pragma once

#include <cstddef>
#include <string_view>
#include <vector>

namespace json_syntax {

inline constexpr int kMaxDepth = 512;

// True for one JSON value of at most kMaxDepth levels with nothing but white space around it, whose whole numbers an int64 and whose
// others a double can hold. Whether its strings are UTF-8 the library looks itself.
// *lone: where the escapes "\uXXXX" begin that are one half of a surrogate pair without the other. They are JSON, but stand for no
// character.
bool isValid(std::string_view text, std::vector<size_t>* lone);

}  // namespace json_syntax
