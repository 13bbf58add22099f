// JsonReader: a document from JSON text, in one pass that is strict to the letter: the parser of the library is more lenient
// (comments, trailing commas, text after the document) and half as fast. Threads: any.
#pragma once

#include <string_view>

#include "common/Handles.h"

namespace json_reader {

inline constexpr int kMaxDepth = 512;  // recursion over hostile depth is not wanted

// NULL unless the text is one JSON value of at most kMaxDepth levels with nothing but white space around it, in valid UTF-8, whose
// whole numbers an int64 and whose others a double can hold. An escape "\uXXXX" that is one half of a surrogate pair without the
// other is read as U+FFFD.
[[nodiscard]] JsonNodePtr read(std::string_view text);

}  // namespace json_reader
