// AlarmTime: when an alarm is due next. All times in milliseconds of the clock that counts suspended time.
#pragma once

#include <cstdint>

namespace platform::alarm {

// The next expiry of a repeating alarm that was due at `due` and is delivered at `now`: the first of its phase after `now`, so
// a long sleep brings one late delivery and not many.
constexpr int64_t nextExpiry(int64_t due, int64_t interval, int64_t now) {
    if (now < due) return due;
    return due + ((now - due) / interval + 1) * interval;
}

}  // namespace platform::alarm
