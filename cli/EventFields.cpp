#include "EventFields.h"

#include <unicode/ucal.h>
#include <unicode/ustring.h>

#include <algorithm>
#include <array>

#include "Names.h"
#include "RecordAccess.h"

namespace event_fields {

namespace {

using record_access::intOf;
using record_access::setInt;
using record_access::setText;
using record_access::setTime;

constexpr const char* kField = "rrule";
constexpr std::string_view kJoint = ", ";

struct TextPart {
    unsigned property;
    std::string RruleFields::*member;
};
constexpr TextPart kTextParts[] = {
    {CALENDAR_EVENT_BYDAY, &RruleFields::byDay},
    {CALENDAR_EVENT_BYMONTHDAY, &RruleFields::byMonthDay},
    {CALENDAR_EVENT_BYYEARDAY, &RruleFields::byYearDay},
    {CALENDAR_EVENT_BYWEEKNO, &RruleFields::byWeekNo},
    {CALENDAR_EVENT_BYMONTH, &RruleFields::byMonth},
    {CALENDAR_EVENT_BYSETPOS, &RruleFields::bySetPos},
};
struct NumberPart {
    unsigned property;
    int RruleFields::*member;
};
constexpr NumberPart kNumberParts[] = {
    {CALENDAR_EVENT_FREQ, &RruleFields::frequency}, {CALENDAR_EVENT_RANGE_TYPE, &RruleFields::rangeType},
    {CALENDAR_EVENT_COUNT, &RruleFields::count},    {CALENDAR_EVENT_INTERVAL, &RruleFields::interval},
    {CALENDAR_EVENT_WKST, &RruleFields::weekStart},
};

}  // namespace

RruleFields ruleOf(calendar_record_h event) {
    RruleFields rule;
    for (const NumberPart& part : kNumberParts) rule.*part.member = intOf(event, part.property);
    for (const TextPart& part : kTextParts) rule.*part.member = record_access::textOf(event, part.property);
    rule.until = record_access::timeOf(event, CALENDAR_EVENT_UNTIL);
    return rule;
}

void setRule(calendar_record_h event, const RruleFields& rule) {
    for (const NumberPart& part : kNumberParts) setInt(event, part.property, rule.*part.member, kField);
    for (const TextPart& part : kTextParts) setText(event, part.property, rule.*part.member, kField);
    setTime(event, CALENDAR_EVENT_UNTIL, rule.until, kField);
}

std::vector<std::string> splitDates(const std::string& dates) {
    std::vector<std::string> parts;
    for (size_t at = 0; at < dates.size();) {
        const size_t end = std::min(dates.find(',', at), dates.size());
        std::string part = dates.substr(at, end - at);
        part.erase(0, part.find_first_not_of(' '));
        part.erase(part.find_last_not_of(' ') + 1);
        if (!part.empty()) parts.push_back(std::move(part));
        at = end + 1;
    }
    return parts;
}

std::string withDate(const std::string& dates, const std::string& date) {
    const std::vector<std::string> known = splitDates(dates);
    if (std::find(known.begin(), known.end(), date) != known.end()) return dates;
    return dates.empty() ? date : dates + std::string(kJoint) + date;
}

bool isTimeZone(const std::string& name) {
    constexpr size_t kLongestName = 128;
    if (name.size() >= kLongestName) return false;
    std::array<UChar, kLongestName> wide{};
    std::array<UChar, kLongestName> canonical{};
    UErrorCode error = U_ZERO_ERROR;
    u_strFromUTF8(wide.data(), kLongestName, nullptr, name.data(), static_cast<int32_t>(name.size()), &error);
    ucal_getCanonicalTimeZoneID(wide.data(), -1, canonical.data(), kLongestName, nullptr, &error);
    return U_SUCCESS(error);
}

}  // namespace event_fields
