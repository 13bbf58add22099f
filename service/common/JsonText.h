// JsonText: JSON between text and document. Threads: any.
#pragma once

#include <string>
#include <string_view>

#include "common/Handles.h"

namespace json_text {

// NULL when the text is no JSON to the letter or nested too deeply. Half a surrogate pair is read as U+FFFD.
[[nodiscard]] JsonNodePtr parse(std::string_view text);
[[nodiscard]] std::string textOf(JsonNode* node);

}  // namespace json_text
