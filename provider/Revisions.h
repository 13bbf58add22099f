// Revisions: the source of etags and time stamps. A count instead of the clock, so that a seed is always the same.
// Owner: Store, whose mutex guards it.
#pragma once

#include <cstdint>
#include <string>

namespace provider {

class Revisions {
public:
    std::uint64_t next() { return ++mLast; }
    [[nodiscard]] std::uint64_t last() const { return mLast; }
    void restore(std::uint64_t last) { mLast = last; }

private:
    std::uint64_t mLast = 0;
};

std::string etagOf(std::uint64_t revision);
std::string stampOf(std::uint64_t revision);

}  // namespace provider
