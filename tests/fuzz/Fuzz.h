// What the fuzz targets share.
#pragma once

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace fuzz {

inline std::string textOf(const uint8_t* data, size_t size) {
    return {reinterpret_cast<const char*>(data), size};
}

// Ends the program as a finding; `text` is what the promise was broken with.
inline void require(bool isKept, const char* promise, const std::string& text = {}) {
    if (isKept) return;
    std::fprintf(stderr, "broken promise: %s\n%s\n", promise, text.c_str());
    std::abort();
}

}  // namespace fuzz
