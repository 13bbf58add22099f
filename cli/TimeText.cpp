#include "TimeText.h"

#include <array>
#include <chrono>
#include <cstdio>

namespace time_text {

namespace {

constexpr int64_t kSecondsPerDay = 86400;

struct Fields {
    int year = 0, month = 0, day = 0, hour = 0, minute = 0, second = 0;
};

// Reads text of a fixed shape from its start.
class Reader {
public:
    explicit Reader(std::string_view text) : mText(text) {}

    bool number(size_t digits, int* out) {
        if (mText.size() < digits) return false;
        int value = 0;
        for (size_t at = 0; at < digits; ++at) {
            if (mText[at] < '0' || mText[at] > '9') return false;
            value = value * 10 + (mText[at] - '0');
        }
        mText.remove_prefix(digits);
        *out = value;
        return true;
    }
    bool oneOf(std::string_view characters) {
        if (mText.empty() || characters.find(mText.front()) == std::string_view::npos) return false;
        mText.remove_prefix(1);
        return true;
    }
    void skipFraction() {
        if (mText.size() < 2 || mText[0] != '.' || mText[1] < '0' || mText[1] > '9') return;
        mText.remove_prefix(1);
        while (oneOf("0123456789")) continue;
    }
    [[nodiscard]] bool atEnd() const { return mText.empty(); }
    [[nodiscard]] bool startsWith(char character) const {
        return !mText.empty() && mText.front() == character;
    }

private:
    std::string_view mText;
};

std::chrono::year_month_day dateOf(const Fields& f) {
    return std::chrono::year{f.year} / std::chrono::month{static_cast<unsigned>(f.month)} /
           std::chrono::day{static_cast<unsigned>(f.day)};
}

bool isReal(const Fields& f) {
    return f.year > 0 && dateOf(f).ok() && f.hour < 24 && f.minute < 60 && f.second < 60;
}

calendar_time_s dateTime(const Fields& f) {
    calendar_time_s time;
    time.type = CALENDAR_TIME_LOCALTIME;
    time.year = f.year;
    time.month = f.month;
    time.mday = f.day;
    return time;
}

calendar_time_s instant(const Fields& f, int offsetSec) {
    calendar_time_s time;
    time.utime = std::chrono::sys_days{dateOf(f)}.time_since_epoch().count() * kSecondsPerDay +
                 f.hour * 3600 + f.minute * 60 + f.second - offsetSec;
    return time;
}

Fields fieldsOf(int64_t utcSec) {
    int64_t days = utcSec / kSecondsPerDay;
    int64_t rest = utcSec % kSecondsPerDay;
    if (rest < 0) {
        --days;
        rest += kSecondsPerDay;
    }
    const std::chrono::year_month_day date{std::chrono::sys_days{std::chrono::days{days}}};
    const int inDay = static_cast<int>(rest);
    return {static_cast<int>(date.year()),
            static_cast<int>(static_cast<unsigned>(date.month())),
            static_cast<int>(static_cast<unsigned>(date.day())),
            inDay / 3600,
            inDay / 60 % 60,
            inDay % 60};
}

enum class Style { kRfc3339, kCompact };

std::string compose(const calendar_time_s& time, Style style) {
    std::array<char, 96> text{};
    if (isDate(time)) {
        std::snprintf(text.data(), text.size(), style == Style::kRfc3339 ? "%04d-%02d-%02d" : "%04d%02d%02d",
                      time.year, time.month, time.mday);
        return text.data();
    }
    const Fields f = fieldsOf(time.utime);
    std::snprintf(text.data(), text.size(),
                  style == Style::kRfc3339 ? "%04d-%02d-%02dT%02d:%02d:%02dZ" : "%04d%02d%02dT%02d%02d%02dZ",
                  f.year, f.month, f.day, f.hour, f.minute, f.second);
    return text.data();
}

bool readOffset(Reader& reader, int* offsetSec) {
    if (reader.oneOf("Zz")) return true;
    const int sign = reader.startsWith('-') ? -1 : 1;
    int hours = 0;
    int minutes = 0;
    if (!reader.oneOf("+-") || !reader.number(2, &hours) || !reader.oneOf(":") ||
        !reader.number(2, &minutes)) {
        return false;
    }
    *offsetSec = sign * (hours * 3600 + minutes * 60);
    return hours < 24 && minutes < 60;
}

}  // namespace

std::string composeRfc3339(const calendar_time_s& time) {
    return compose(time, Style::kRfc3339);
}

std::string composeRfc3339(int64_t utcSec) {
    calendar_time_s time;
    time.utime = utcSec;
    return composeRfc3339(time);
}

std::optional<calendar_time_s> parseRfc3339(std::string_view text) {
    Reader reader(text);
    Fields f;
    if (!reader.number(4, &f.year) || !reader.oneOf("-") || !reader.number(2, &f.month) ||
        !reader.oneOf("-") || !reader.number(2, &f.day)) {
        return std::nullopt;
    }
    if (reader.atEnd()) return isReal(f) ? std::optional(dateTime(f)) : std::nullopt;
    if (!reader.oneOf("Tt") || !reader.number(2, &f.hour) || !reader.oneOf(":") ||
        !reader.number(2, &f.minute) || !reader.oneOf(":") || !reader.number(2, &f.second)) {
        return std::nullopt;
    }
    reader.skipFraction();
    int offsetSec = 0;
    if (!readOffset(reader, &offsetSec) || !reader.atEnd() || !isReal(f)) return std::nullopt;
    return instant(f, offsetSec);
}

std::string composeCompact(const calendar_time_s& time) {
    return compose(time, Style::kCompact);
}

std::optional<calendar_time_s> parseCompact(std::string_view text) {
    Reader reader(text);
    Fields f;
    if (!reader.number(4, &f.year) || !reader.number(2, &f.month) || !reader.number(2, &f.day))
        return std::nullopt;
    if (reader.atEnd()) return isReal(f) ? std::optional(dateTime(f)) : std::nullopt;
    if (!reader.oneOf("T") || !reader.number(2, &f.hour) || !reader.number(2, &f.minute) ||
        !reader.number(2, &f.second) || !reader.oneOf("Z") || !reader.atEnd() || !isReal(f)) {
        return std::nullopt;
    }
    return instant(f, 0);
}

calendar_time_s shifted(const calendar_time_s& start, const calendar_time_s& from,
                        const calendar_time_s& to) {
    const auto daysOf = [](const calendar_time_s& time) {
        return std::chrono::sys_days{dateOf({.year = time.year, .month = time.month, .day = time.mday})};
    };
    if (!isDate(start)) {
        calendar_time_s end = start;
        end.utime += to.utime - from.utime;
        return end;
    }
    const std::chrono::year_month_day day{daysOf(start) + (daysOf(to) - daysOf(from))};
    return dateTime({.year = static_cast<int>(day.year()),
                     .month = static_cast<int>(static_cast<unsigned>(day.month())),
                     .day = static_cast<int>(static_cast<unsigned>(day.day()))});
}

}  // namespace time_text
