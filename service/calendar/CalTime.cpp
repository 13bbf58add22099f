#include "calendar/CalTime.h"

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <unordered_map>

#include "common/Handles.h"
#include "common/JsonAccess.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace cal_time {

namespace {

constexpr double kMsPerSecond = 1000.0;
// The years 1 to 9999: texts have four digits for one.
constexpr int64_t kFirstSecond = -62'135'596'800;
constexpr int64_t kLastSecond = 253'402'300'799;
constexpr const char* kUnknownZone = "Etc/Unknown";

// An ICU calendar for `zone`, opened once per thread. Opening one is far dearer than a conversion.
UCalendar* calendarOf(const std::string& zone) {
    constexpr size_t kMaxKept = 64;  // zone names come from the server
    thread_local std::unordered_map<std::string, IcuCalendar> kept;
    if (const auto known = kept.find(zone); known != kept.end()) return known->second.get();
    if (kept.size() >= kMaxKept) kept.clear();
    std::u16string id(zone.begin(), zone.end());
    UErrorCode error = U_ZERO_ERROR;
    IcuCalendar calendar(
        ucal_open(id.data(), static_cast<int32_t>(id.size()), "en_US", UCAL_DEFAULT, &error));
    if (U_FAILURE(error)) {
        SYNC_ERR("ucal_open failed (%s)", u_errorName(error));
        return nullptr;
    }
    return kept.emplace(zone, std::move(calendar)).first->second.get();
}

// Fractions of a second and what follows in "10:00:00.123+09:00" would be read as the offset.
std::string withoutFraction(const std::string& text) {
    const size_t point = text.find('.');
    if (point == std::string::npos) return text;
    const size_t end = text.find_first_not_of("0123456789", point + 1);
    return text.substr(0, point) + (end == std::string::npos ? std::string() : text.substr(end));
}

std::string offsetZone(char sign, int hours) {
    return std::string("Etc/GMT") + sign + std::to_string(hours);
}

std::optional<calendar_time_s> instant(const WallTime& time, const std::string& zone) {
    const std::optional<int64_t> seconds = toSeconds(time, zone.c_str());
    if (!seconds) return std::nullopt;
    calendar_time_s result;
    result.type = CALENDAR_TIME_UTIME;
    result.utime = *seconds;
    return result;
}

}  // namespace

bool isPlausible(const WallTime& time) {
    const auto within = [](int value, int low, int high) { return value >= low && value <= high; };
    if (!within(time.year, 0, 9999) || !within(time.month, 1, 12) || !within(time.day, 1, 31)) return false;
    const std::chrono::year_month_day date{std::chrono::year(time.year),
                                           std::chrono::month(static_cast<unsigned>(time.month)),
                                           std::chrono::day(static_cast<unsigned>(time.day))};
    return date.ok() && within(time.hour, 0, 24) && within(time.minute, 0, 59) && within(time.second, 0, 60);
}

std::optional<calendar_time_s> parseDateTime(const std::string& text, const std::string& timeZone) {
    WallTime time;
    char sign = '\0';
    int offsetHours = 0;
    int offsetMinutes = 0;
    const int fields = std::sscanf(withoutFraction(text).c_str(), "%04d-%02d-%02dT%02d:%02d:%02d%c%02d:%02d",
                                   &time.year, &time.month, &time.day, &time.hour, &time.minute, &time.second,
                                   &sign, &offsetHours, &offsetMinutes);
    constexpr int kWithoutOffset = 6;
    if (fields < kWithoutOffset || !isPlausible(time)) return std::nullopt;
    // A time without an offset is a wall time of its zone.
    if (fields == kWithoutOffset) return instant(time, timeZone);
    if (offsetHours == 0) return instant(time, "");
    return instant(time, offsetZone(sign == '-' ? '+' : '-', offsetHours));
}

std::optional<int64_t> toSeconds(const WallTime& time, const char* zone, int firstDayOfWeek) {
    if (zone == nullptr) {
        SYNC_ERR("tzid is NULL so set gmt");
        zone = kUnknownZone;
    }
    UCalendar* calendar = calendarOf(*zone != '\0' ? zone : "Etc/GMT");
    if (calendar == nullptr) return std::nullopt;
    ucal_clear(calendar);
    if (firstDayOfWeek >= 1 && firstDayOfWeek <= 7) {
        ucal_setAttribute(calendar, UCAL_FIRST_DAY_OF_WEEK, firstDayOfWeek);
    }
    UErrorCode error = U_ZERO_ERROR;
    ucal_setDateTime(calendar, time.year, time.month - 1, time.day, time.hour, time.minute, time.second,
                     &error);
    const UDate milliseconds = ucal_getMillis(calendar, &error);
    if (U_FAILURE(error)) return std::nullopt;
    const auto seconds = static_cast<int64_t>(milliseconds / kMsPerSecond);
    if (seconds < kFirstSecond || seconds > kLastSecond) return std::nullopt;
    return seconds;
}

// The wall time of an instant in GMT.
static std::optional<WallTime> wallTime(int64_t seconds) {
    UCalendar* calendar = calendarOf("Etc/GMT");
    if (calendar == nullptr) return std::nullopt;
    UErrorCode error = U_ZERO_ERROR;
    ucal_setMillis(calendar, static_cast<double>(seconds) * kMsPerSecond, &error);
    const auto field = [&](UCalendarDateFields name) { return ucal_get(calendar, name, &error); };
    const WallTime time = {.year = field(UCAL_YEAR),
                           .month = field(UCAL_MONTH) + 1,
                           .day = field(UCAL_DATE),
                           .hour = field(UCAL_HOUR_OF_DAY),
                           .minute = field(UCAL_MINUTE),
                           .second = field(UCAL_SECOND)};
    if (U_FAILURE(error)) return std::nullopt;
    return time;
}

std::optional<std::string> recurrenceIdText(int64_t seconds) {
    const std::optional<WallTime> time = wallTime(seconds);
    if (!time) return std::nullopt;
    char text[64];
    std::snprintf(text, sizeof text, "%04d%02d%02dT%02d%02d%02dZ", time->year, time->month, time->day,
                  time->hour, time->minute, time->second);
    return text;
}

std::optional<std::string> minuteText(int64_t seconds) {
    const std::optional<WallTime> time = wallTime(seconds);
    if (!time) return std::nullopt;
    char text[64];
    std::snprintf(text, sizeof text, "%04d-%02d-%02dT%02d:%02d:00Z", time->year, time->month, time->day,
                  time->hour, time->minute);
    return text;
}

std::string dateText(const calendar_time_s& time) {
    char text[64];
    std::snprintf(text, sizeof text, "%04d-%02d-%02d", time.year, time.month, time.mday);
    return text;
}

std::optional<int64_t> toUtc(const calendar_time_s& time) {
    if (time.type == CALENDAR_TIME_UTIME) return time.utime;
    return toSeconds({time.year, time.month, time.mday, time.hour, time.minute, time.second}, "");
}

std::optional<OriginalStart> originalStart(const std::string& recurrenceId) {
    WallTime time;
    char zone = '\0';
    const int fields = std::sscanf(recurrenceId.c_str(), "%4d%2d%2dT%2d%2d%2d%c", &time.year, &time.month,
                                   &time.day, &time.hour, &time.minute, &time.second, &zone);
    constexpr int kDate = 3;
    constexpr int kDateTime = 7;
    if ((fields != kDate && fields != kDateTime) || !isPlausible(time)) return std::nullopt;
    char text[64];
    if (fields == kDate) {
        std::snprintf(text, sizeof text, "%04d-%02d-%02d", time.year, time.month, time.day);
        return OriginalStart{"date", text};
    }
    std::snprintf(text, sizeof text, "%04d-%02d-%02dT%02d:%02d:%02dZ", time.year, time.month, time.day,
                  time.hour, time.minute, time.second);
    return OriginalStart{"dateTime", text};
}

std::optional<calendar_time_s> parse(JsonObject* time) {
    if (const std::optional<std::string> date = json_access::text(time, "date")) {
        WallTime day;
        if (std::sscanf(date->c_str(), "%04d-%02d-%02d", &day.year, &day.month, &day.day) != 3 ||
            !isPlausible(day)) {
            return std::nullopt;
        }
        calendar_time_s result;
        result.type = CALENDAR_TIME_LOCALTIME;
        result.year = day.year;
        result.month = day.month;
        result.mday = day.day;
        return result;
    }
    const std::optional<std::string> text = json_access::text(time, "dateTime");
    if (!text) return std::nullopt;
    return parseDateTime(*text, json_access::textOr(time, "timeZone", ""));
}

int appendRecurrenceId(JsonObject* time, std::string* target) {
    std::string id;
    WallTime start;
    if (const std::optional<std::string> date = json_access::text(time, "date")) {
        if (std::sscanf(date->c_str(), "%04d-%02d-%02d", &start.year, &start.month, &start.day) != 3 ||
            !isPlausible(start)) {
            return kFailed;
        }
        char text[64];
        std::snprintf(text, sizeof text, "%04d%02d%02d", start.year, start.month, start.day);
        id = text;
    } else if (const std::optional<std::string> dateTime = json_access::text(time, "dateTime")) {
        int hours = 0;
        int minutes = 0;
        // The sign is part of the pattern: a negative offset is not read and counts as zero.
        const int fields = std::sscanf(
            withoutFraction(*dateTime).c_str(), "%04d-%02d-%02dT%02d:%02d:%02d+%02d:%02d", &start.year,
            &start.month, &start.day, &start.hour, &start.minute, &start.second, &hours, &minutes);
        if (fields < 6 || !isPlausible(start)) return kFailed;
        std::string zone = "Etc/GMT";
        if (hours != 0 || minutes != 0) zone = offsetZone(hours < 1 ? '+' : '-', hours);
        const std::optional<int64_t> seconds = toSeconds(start, zone.c_str());
        const std::optional<std::string> text = seconds ? recurrenceIdText(*seconds) : std::nullopt;
        if (!text) return kFailed;
        id = *text;
    } else {
        return kFailed;
    }
    *target = target->empty() ? id : *target + "," + id;
    return kOk;
}

}  // namespace cal_time
