#include "calendar/CalRecurrence.h"

#include <charconv>
#include <cstdio>
#include <string>

#include "calendar/CalMappings.h"
#include "calendar/CalTime.h"
#include "common/JsonAccess.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/calendar_read.h"

using calendar_read::intOf;
using calendar_read::textOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace cal_recurrence {

namespace {

bool setInt(calendar_record_h record, unsigned property, int value) {
    return calendar_record_set_int(record, property, value) == PLATFORM_ERROR_NONE;
}

// Nothing when the value begins with no number, or with one that an int cannot hold.
std::optional<int> numberIn(const std::string& value) {
    int number = 0;
    const bool isRead = std::from_chars(value.data(), value.data() + value.size(), number).ec == std::errc();
    return isRead ? std::optional(number) : std::nullopt;
}

bool setFrequency(calendar_record_h record, const std::string& value) {
    return setInt(record, CALENDAR_EVENT_FREQ,
                  cal_mapping::valueOf(cal_mapping::kFrequency, value).value_or(0));
}

bool setCount(calendar_record_h record, const std::string& value) {
    const std::optional<int> count = numberIn(value);
    return count && setInt(record, CALENDAR_EVENT_RANGE_TYPE, cal_mapping::kRangeCount) &&
           setInt(record, CALENDAR_EVENT_COUNT, *count);
}

bool setInterval(calendar_record_h record, const std::string& value) {
    const std::optional<int> interval = numberIn(value);
    return interval && setInt(record, CALENDAR_EVENT_INTERVAL, *interval);
}

bool setWeekStart(calendar_record_h record, const std::string& value) {
    const std::optional<int> day = cal_mapping::valueOf(cal_mapping::kWeekday, value);
    return !day || setInt(record, CALENDAR_EVENT_WKST, *day);
}

template <unsigned Property>
bool setText(calendar_record_h record, const std::string& value) {
    return calendar_record_set_str(record, Property, value.c_str()) == PLATFORM_ERROR_NONE;
}

bool setUntil(calendar_record_h record, const std::string& value) {
    constexpr size_t kDateLength = sizeof("20141231") - 1;
    cal_time::WallTime time;
    calendar_time_s until;
    if (value.size() == kDateLength) {
        if (std::sscanf(value.c_str(), "%04d%02d%02d", &time.year, &time.month, &time.day) != 3) return false;
        until.type = CALENDAR_TIME_LOCALTIME;
        until.year = time.year;
        until.month = time.month;
        until.mday = time.day;
    } else {
        const int fields = std::sscanf(value.c_str(), "%04d%02d%02dT%02d%02d%02dZ", &time.year, &time.month,
                                       &time.day, &time.hour, &time.minute, &time.second);
        const std::optional<int64_t> seconds = fields == 6 ? cal_time::toSeconds(time, "") : std::nullopt;
        if (!seconds) return false;
        until.utime = *seconds;
    }
    return cal_time::isPlausible(time) &&
           setInt(record, CALENDAR_EVENT_RANGE_TYPE, cal_mapping::kRangeUntil) &&
           calendar_record_set_caltime(record, CALENDAR_EVENT_UNTIL, until) == PLATFORM_ERROR_NONE;
}

// The first name that a part contains decides.
struct PartRule {
    std::string_view name;
    bool (*set)(calendar_record_h record, const std::string& value);
};
constexpr PartRule kParts[] = {
    {"FREQ=", setFrequency},
    {"COUNT=", setCount},
    {"INTERVAL=", setInterval},
    {"BYYEARDAY=", setText<CALENDAR_EVENT_BYYEARDAY>},
    {"BYMONTH=", setText<CALENDAR_EVENT_BYMONTH>},
    {"BYMONTHDAY=", setText<CALENDAR_EVENT_BYMONTHDAY>},
    {"BYDAY=", setText<CALENDAR_EVENT_BYDAY>},
    {"UNTIL=", setUntil},
    // An edit on the device would drop these from the server if they were not kept.
    {"BYSETPOS=", setText<CALENDAR_EVENT_BYSETPOS>},
    {"BYWEEKNO=", setText<CALENDAR_EVENT_BYWEEKNO>},
    {"WKST=", setWeekStart},
};

void parsePart(const std::string& part, calendar_record_h record) {
    for (const PartRule& rule : kParts) {
        const size_t begin = part.find(rule.name);
        if (begin == std::string::npos) continue;
        if (!rule.set(record, part.substr(begin + rule.name.size()))) SYNC_ERR("fail");
        return;
    }
}

}  // namespace

int parse(JsonArray* recurrence, calendar_record_h record) {
    if (json_array_get_length(recurrence) == 0) return kOk;
    const std::optional<std::string> rule = json_access::textIn(json_array_get_element(recurrence, 0));
    if (!rule) {
        SYNC_ERR("Error\n");
        return kFailed;
    }
    for (size_t begin = 0; begin < rule->size();) {
        const size_t end = std::min(rule->find(';', begin), rule->size());
        if (end > begin) parsePart(rule->substr(begin, end - begin), record);
        begin = end + 1;
    }
    return kOk;
}

namespace {

struct TextPart {
    const char* name;
    unsigned property;
};
constexpr TextPart kTextParts[] = {
    {";BYDAY=", CALENDAR_EVENT_BYDAY},         {";BYMONTHDAY=", CALENDAR_EVENT_BYMONTHDAY},
    {";BYYEARDAY=", CALENDAR_EVENT_BYYEARDAY}, {";BYWEEKNO=", CALENDAR_EVENT_BYWEEKNO},
    {";BYMONTH=", CALENDAR_EVENT_BYMONTH},     {";BYSETPOS=", CALENDAR_EVENT_BYSETPOS},
};

bool addRange(calendar_record_h record, std::string* rule) {
    const int range = intOf(record, CALENDAR_EVENT_RANGE_TYPE);
    if (range == cal_mapping::kRangeCount) {
        *rule += ";COUNT=" + std::to_string(intOf(record, CALENDAR_EVENT_COUNT));
        return true;
    }
    if (range != cal_mapping::kRangeUntil) return true;
    calendar_time_s until;
    if (const int code = calendar_record_get_caltime(record, CALENDAR_EVENT_UNTIL, &until);
        code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("get_caltime() fail (%x)", static_cast<unsigned>(code));
        return false;
    }
    if (until.type == CALENDAR_TIME_LOCALTIME) {
        char text[64];
        std::snprintf(text, sizeof text, "%04d%02d%02dT000000Z", until.year, until.month, until.mday);
        *rule += std::string(";UNTIL=") + text;
        return true;
    }
    const std::optional<std::string> text = cal_time::recurrenceIdText(until.utime);
    if (text) *rule += ";UNTIL=" + *text;
    return text.has_value();
}

}  // namespace

int build(calendar_record_h record, std::string* rule) {
    const std::optional<std::string_view> frequency =
        cal_mapping::nameOf(cal_mapping::kFrequency, intOf(record, CALENDAR_EVENT_FREQ));
    if (!frequency) return kOk;
    std::string text = "RRULE:FREQ=" + std::string(*frequency);
    text += ";INTERVAL=" + std::to_string(intOf(record, CALENDAR_EVENT_INTERVAL));
    for (const TextPart& part : kTextParts) {
        const std::string value = textOf(record, part.property);
        if (!value.empty()) text += part.name + value;
    }
    if (const auto day = cal_mapping::nameOf(cal_mapping::kWeekday, intOf(record, CALENDAR_EVENT_WKST)))
        text += ";WKST=" + std::string(*day);
    if (!addRange(record, &text)) return kFailed;
    *rule = std::move(text);
    return kOk;
}

}  // namespace cal_recurrence
