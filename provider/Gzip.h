// Gzip: compression of replies, quick rather than small.
#pragma once

#include <string>

namespace provider {

// Throws std::runtime_error when zlib has no memory.
std::string gzip(const std::string& text);

}  // namespace provider
