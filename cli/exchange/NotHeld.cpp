#include "exchange/NotHeld.h"

#include <cstdio>

namespace exchange {

namespace {

// A file can invent names without end.
constexpr size_t kMostNames = 500;
constexpr const char* kRest = "other properties";

}  // namespace

void NotHeld::add(const std::string& what, int count) {
    const bool hasRoom = mCounts.size() < kMostNames || mCounts.contains(what);
    mCounts[hasRoom ? what : kRest] += count;
}

void NotHeld::merge(const NotHeld& other) {
    for (const auto& [what, count] : other.mCounts) add(what, count);
}

Json NotHeld::json() const {
    Json object = Json::object();
    for (const auto& [what, count] : mCounts) object[what] = count;
    return object;
}

void NotHeld::print(const char* title) const {
    if (mCounts.empty()) return;
    std::fprintf(stderr, "%s\n", title);
    for (const auto& [what, count] : mCounts)
        std::fprintf(stderr, "  %6d  %s\n", count, output::printable(what).c_str());
}

}  // namespace exchange
