#include "Times.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <chrono>
#include <cstdio>
#include <filesystem>

namespace provider {

namespace {

// Reads text by a pattern in which '0' stands for a digit and anything else for itself. The digits of each run
// of zeros become one number.
template <std::size_t N>
bool readDigits(std::string_view text, std::string_view pattern, std::array<int, N>& numbers) {
    if (text.size() != pattern.size()) return false;
    std::size_t field = 0;
    bool inNumber = false;
    numbers.fill(0);
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (pattern[i] != '0') {
            if (text[i] != pattern[i]) return false;
            if (inNumber) ++field;
            inNumber = false;
            continue;
        }
        if (std::isdigit(static_cast<unsigned char>(text[i])) == 0) return false;
        numbers[field] = numbers[field] * 10 + (text[i] - '0');
        inNumber = true;
    }
    return true;
}

std::optional<std::int64_t> dayStart(int year, int month, int day) {
    const std::chrono::year_month_day date{std::chrono::year(year),
                                           std::chrono::month(static_cast<unsigned>(month)),
                                           std::chrono::day(static_cast<unsigned>(day))};
    if (!date.ok()) return std::nullopt;
    return std::chrono::sys_days(date).time_since_epoch().count() * kSecondsPerDay;
}

std::optional<std::int64_t> clockSeconds(int hour, int minute, int second) {
    if (hour > 23 || minute > 59 || second > 60) return std::nullopt;
    return hour * 3600 + minute * 60 + second;
}

std::chrono::year_month_day dateOf(std::int64_t local) {
    return std::chrono::floor<std::chrono::days>(std::chrono::sys_seconds(std::chrono::seconds(local)));
}

// Offset text "Z" or "+HH:MM"; empty text is no offset.
bool readOffset(std::string_view text, std::optional<int>& offset) {
    if (text.empty()) return true;
    if (text == "Z" || text == "z") {
        offset = 0;
        return true;
    }
    std::array<int, 2> parts{};
    if (text[0] != '+' && text[0] != '-') return false;
    if (!readDigits(text.substr(1), "00:00", parts) || parts[0] > 23 || parts[1] > 59) return false;
    offset = (parts[0] * 3600 + parts[1] * 60) * (text[0] == '-' ? -1 : 1);
    return true;
}

const std::string& stringOf(const Json& value, const std::string& member) {
    if (!value.is_string()) invalid(member, "must be a string");
    return value.get_ref<const std::string&>();
}

}  // namespace

std::optional<std::int64_t> parseDate(std::string_view text) {
    std::array<int, 3> date{};
    if (!readDigits(text, "0000-00-00", date)) return std::nullopt;
    return dayStart(date[0], date[1], date[2]);
}

std::optional<EventTime> parseDateTime(std::string_view text) {
    constexpr std::string_view kPattern = "0000-00-00T00:00:00";
    std::array<int, 6> parts{};
    if (!readDigits(text.substr(0, kPattern.size()), kPattern, parts)) return std::nullopt;
    std::string_view rest = text.substr(kPattern.size());
    if (rest.starts_with('.')) {
        const std::size_t end = std::min(rest.find_first_not_of("0123456789", 1), rest.size());
        if (end < 2) return std::nullopt;
        rest = rest.substr(end);
    }
    EventTime time;
    const auto day = dayStart(parts[0], parts[1], parts[2]);
    const auto clock = clockSeconds(parts[3], parts[4], parts[5]);
    if (!day || !clock || !readOffset(rest, time.offset)) return std::nullopt;
    time.local = *day + *clock;
    return time;
}

std::optional<EventTime> parseCompact(std::string_view text) {
    // A date has no separators, so it is read as one number and taken apart.
    std::array<int, 3> parts{};
    const bool allDay = readDigits(text, "00000000", parts);
    if (!allDay && !readDigits(text, "00000000T000000Z", parts)) return std::nullopt;
    const auto day = dayStart(parts[0] / 10000, parts[0] / 100 % 100, parts[0] % 100);
    const auto clock = clockSeconds(parts[1] / 10000, parts[1] / 100 % 100, parts[1] % 100);
    if (!day || !clock) return std::nullopt;
    EventTime time;
    time.allDay = allDay;
    time.local = *day + *clock;
    if (!allDay) time.offset = 0;
    return time;
}

std::string formatDate(std::int64_t local) {
    const auto date = dateOf(local);
    std::array<char, 32> text{};
    const int length =
        std::snprintf(text.data(), text.size(), "%04d-%02u-%02u", static_cast<int>(date.year()),
                      static_cast<unsigned>(date.month()), static_cast<unsigned>(date.day()));
    return {text.data(), static_cast<std::size_t>(length)};
}

std::string formatDateTime(std::int64_t utc, int offset) {
    const std::int64_t local = utc + offset;
    const auto clock = static_cast<int>(((local % kSecondsPerDay) + kSecondsPerDay) % kSecondsPerDay);
    std::array<char, 32> text{};
    std::snprintf(text.data(), text.size(), "T%02d:%02d:%02d", clock / 3600, clock / 60 % 60, clock % 60);
    std::string out = formatDate(local) + text.data();
    if (offset == 0) return out + "Z";
    const int minutes = std::abs(offset) / 60;
    std::snprintf(text.data(), text.size(), "%c%02d:%02d", offset < 0 ? '-' : '+', minutes / 60,
                  minutes % 60);
    return out + text.data();
}

std::string compactText(const EventTime& time) {
    std::string text = time.allDay ? formatDate(time.local) : formatDateTime(time.utc(), 0);
    std::erase_if(text, [](char c) { return c == '-' || c == ':'; });
    return text;
}

EventTime readTime(const Json& value, const std::string& member) {
    if (!value.is_object()) invalid(member, "must be an object");
    const bool hasDate = value.contains("date");
    if (hasDate == value.contains("dateTime")) invalid(member, "exactly one of date and dateTime is needed");
    EventTime time;
    if (hasDate) {
        const auto day = parseDate(stringOf(value.at("date"), member + ".date"));
        if (!day) invalid(member + ".date", "not a date");
        time.allDay = true;
        time.local = *day;
    } else {
        const auto parsed = parseDateTime(stringOf(value.at("dateTime"), member + ".dateTime"));
        if (!parsed) invalid(member + ".dateTime", "not an RFC 3339 time");
        time = *parsed;
    }
    if (value.contains("timeZone")) {
        time.zone = stringOf(value.at("timeZone"), member + ".timeZone");
        if (!isTimeZone(time.zone)) invalid(member + ".timeZone", "unknown time zone");
    }
    if (!time.allDay && !time.offset && time.zone.empty()) {
        invalid(member + ".dateTime", "needs an offset or a timeZone");
    }
    return time;
}

Json timeJson(const EventTime& time) {
    Json out;
    if (time.allDay) {
        out["date"] = formatDate(time.local);
        return out;
    }
    out["dateTime"] = formatDateTime(time.utc(), time.offset.value_or(0));
    // Without an offset the text is a wall time, which its zone explains.
    if (!time.offset) out["dateTime"].get_ref<std::string&>().pop_back();
    if (!time.zone.empty()) out["timeZone"] = time.zone;
    return out;
}

bool isTimeZone(const std::string& name) {
    const auto allowed = [](unsigned char c) {
        return std::isalnum(c) != 0 || c == '_' || c == '+' || c == '-' || c == '/';
    };
    if (name.empty() || name.front() == '/' || !std::all_of(name.begin(), name.end(), allowed)) return false;
    static const std::filesystem::path kZones = "/usr/share/zoneinfo";
    std::error_code ignored;
    // A machine without zone files cannot tell; then the form of the name must do.
    return !std::filesystem::is_directory(kZones, ignored) ||
           std::filesystem::is_regular_file(kZones / name, ignored);
}

}  // namespace provider
