#include "EventCheck.h"

#include <algorithm>
#include <string_view>

#include "Recurrence.h"
#include "Times.h"

namespace provider {

namespace {

struct WordMember {
    std::string_view member;
    std::initializer_list<std::string_view> words;
};

const WordMember kWordMembers[] = {
    {"status", {"confirmed", "tentative", "cancelled"}},
    {"visibility", {"default", "public", "private", "confidential"}},
    {"transparency", {"opaque", "transparent"}},
};
const WordMember kResponse = {"responseStatus", {"needsAction", "declined", "tentative", "accepted"}};
const WordMember kMethod = {"method", {"popup", "email", "sms"}};

constexpr std::string_view kTextMembers[] = {"summary", "description", "location", "iCalUID", "colorId"};
constexpr std::size_t kMaxOverrides = 5;
constexpr int kMaxReminderMinutes = 40320;

void checkWord(const Json& object, const WordMember& row, const std::string& where) {
    const auto found = object.find(std::string(row.member));
    if (found == object.end()) return;
    if (!found->is_string() ||
        std::find(row.words.begin(), row.words.end(), found->get<std::string>()) == row.words.end()) {
        invalid(where + std::string(row.member), "not one of the known values");
    }
}

void checkBoolean(const Json& object, const std::string& member, const std::string& where) {
    if (object.contains(member) && !object.at(member).is_boolean())
        invalid(where + member, "must be a boolean");
}

const Json* arrayMember(const Json& object, const std::string& member, const std::string& where) {
    const auto found = object.find(member);
    if (found == object.end()) return nullptr;
    if (!found->is_array()) invalid(where + member, "must be an array");
    return &*found;
}

void checkTimes(const Json& event) {
    for (const char* member : {"start", "end"}) {
        if (!event.contains(member)) {
            throw ApiError{400, "required", std::string("Missing ") + member + " time.", member};
        }
    }
    const EventTime start = readTime(event.at("start"), "start");
    const EventTime end = readTime(event.at("end"), "end");
    if (start.allDay != end.allDay) invalid("end", "start and end must both be dates or both be date-times");
    // Without both offsets only times of one zone can be compared.
    const bool comparable = (start.offset && end.offset) || start.allDay || start.zone == end.zone;
    const bool bothOffsets = start.offset && end.offset;
    if (comparable && (bothOffsets ? end.utc() < start.utc() : end.local < start.local)) {
        throw ApiError{400, "timeRangeEmpty", "The specified time range is empty.", "timeRange"};
    }
    if (start.allDay || !event.contains("recurrence")) return;
    for (const EventTime& time : {start, end}) {
        if (time.zone.empty() && time.offset != 0) {
            throw ApiError{400, "required", "Missing time zone definition of a recurring event.", "timeZone"};
        }
    }
}

void checkRecurrence(const Json& event) {
    const Json* lines = arrayMember(event, "recurrence", "");
    if (lines == nullptr) return;
    if (event.contains("recurringEventId")) invalid("recurrence", "an instance has none of its own");
    bool repeats = false;
    for (const Json& line : *lines) {
        if (!line.is_string()) invalid("recurrence", "must hold strings");
        const auto& text = line.get_ref<const std::string&>();
        const std::string fault = recurrenceFault(text);
        if (!fault.empty()) invalid("recurrence", fault);
        repeats = repeats || !text.starts_with("EXDATE");
    }
    if (!lines->empty() && !repeats) invalid("recurrence", "needs a rule or dates");
}

void checkAttendees(const Json& event) {
    const Json* attendees = arrayMember(event, "attendees", "");
    if (attendees == nullptr) return;
    for (const Json& attendee : *attendees) {
        if (!attendee.is_object()) invalid("attendees", "must hold objects");
        const auto email = attendee.find("email");
        if (email == attendee.end() || !email->is_string()) invalid("attendees.email", "is needed");
        const auto& text = email->get_ref<const std::string&>();
        const std::size_t at = text.find('@');
        if (at == 0 || at == std::string::npos || at + 1 == text.size() ||
            text.find(' ') != std::string::npos) {
            throw ApiError{400, "invalid", "Invalid attendee email.", "attendees.email"};
        }
        if (attendee.contains("displayName") && !attendee.at("displayName").is_string()) {
            invalid("attendees.displayName", "must be a string");
        }
        checkWord(attendee, kResponse, "attendees.");
        for (const char* flag : {"self", "organizer", "optional"}) checkBoolean(attendee, flag, "attendees.");
    }
}

void checkReminders(const Json& event) {
    const auto reminders = event.find("reminders");
    if (reminders == event.end()) return;
    if (!reminders->is_object()) invalid("reminders", "must be an object");
    checkBoolean(*reminders, "useDefault", "reminders.");
    const Json* overrides = arrayMember(*reminders, "overrides", "reminders.");
    if (overrides == nullptr) return;
    if (!overrides->empty() && reminders->value("useDefault", false)) {
        throw ApiError{400, "cannotUseDefaultRemindersAndSpecifyOverride",
                       "Cannot specify both default reminders and overrides at the same time.", "reminders"};
    }
    if (overrides->size() > kMaxOverrides) invalid("reminders.overrides", "too many");
    for (const Json& override : *overrides) {
        if (!override.is_object()) invalid("reminders.overrides", "must hold objects");
        if (!override.contains("method")) invalid("reminders.overrides.method", "is needed");
        checkWord(override, kMethod, "reminders.overrides.");
        const auto minutes = override.find("minutes");
        if (minutes == override.end() || !minutes->is_number_integer() || *minutes < 0 ||
            *minutes > kMaxReminderMinutes) {
            invalid("reminders.overrides.minutes", "must be a number from 0 to 40320");
        }
    }
}

}  // namespace

void checkEvent(const Json& event) {
    for (const std::string_view member : kTextMembers) {
        const auto found = event.find(std::string(member));
        if (found != event.end() && !found->is_string()) invalid(std::string(member), "must be a string");
    }
    for (const WordMember& row : kWordMembers) checkWord(event, row, "");
    checkTimes(event);
    checkRecurrence(event);
    checkAttendees(event);
    checkReminders(event);
    if (event.contains("originalStartTime")) readTime(event.at("originalStartTime"), "originalStartTime");
}

}  // namespace provider
