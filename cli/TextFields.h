// TextFields.h: small conversions of stored texts. Pure functions.
#pragma once

#include <string>

namespace text_fields {

// "10.20.30.255" (red, green, blue, alpha) as "#0a141e"; "" for anything else.
std::string webColor(const std::string& stored);

}  // namespace text_fields
