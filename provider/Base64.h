// Base64: bytes in JSON.
#pragma once

#include <optional>
#include <string>

namespace provider {

std::string toBase64(const std::string& bytes);
// Nothing for a text that is not base64.
std::optional<std::string> fromBase64(const std::string& text);

}  // namespace provider
