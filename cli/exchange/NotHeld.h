// NotHeld.h: what the other side has no place for, summed up by what it is called.
#pragma once

#include <map>
#include <string>

#include "Output.h"

namespace exchange {

class NotHeld {
public:
    void add(const std::string& what, int count = 1);
    void merge(const NotHeld& other);
    [[nodiscard]] Json json() const;
    // One line a name on standard error, below `title`.
    void print(const char* title) const;

private:
    std::map<std::string, int> mCounts;
};

}  // namespace exchange
