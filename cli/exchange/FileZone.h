// FileZone.h: a time zone as a calendar file defines it.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

struct _icaltimezone;

namespace exchange {

class FileZone {
public:
    FileZone() = default;
    // The text of a VTIMEZONE component. One that is broken, or whose rules are none of a time zone, is empty.
    explicit FileZone(const std::string& component);

    explicit operator bool() const { return mZone != nullptr; }
    [[nodiscard]] int offsetOfWall(int64_t wallSec) const;
    [[nodiscard]] int offsetOfUtc(int64_t utcSec) const;

private:
    struct Deleter {
        void operator()(_icaltimezone* zone) const noexcept;
    };
    std::unique_ptr<_icaltimezone, Deleter> mZone;
};

}  // namespace exchange
