// CalJsonParser's conversions of one event.
#include <string>

#include "calendar/CalJsonParser.h"
#include "calendar/CalMappings.h"
#include "calendar/CalRecurrence.h"
#include "calendar/CalTime.h"
#include "common/JsonAccess.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

bool setText(calendar_record_h record, unsigned property, const std::string& value) {
    return calendar_record_set_str(record, property, value.c_str()) == PLATFORM_ERROR_NONE;
}

bool setInt(calendar_record_h record, unsigned property, int value) {
    return calendar_record_set_int(record, property, value) == PLATFORM_ERROR_NONE;
}

template <size_t N>
bool setTexts(JsonObject* item, const cal_mapping::TextMember (&members)[N], calendar_record_h record) {
    for (const cal_mapping::TextMember& member : members) {
        const std::optional<std::string> value = json_access::text(item, member.name);
        if (value && !setText(record, member.property, *value)) return false;
    }
    return true;
}

// "start" and "end" write the same zone field, so the end's zone stays.
bool parseTime(JsonObject* event, const char* name, unsigned property, calendar_record_h record) {
    JsonObject* time = json_access::object(event, name);
    if (time == nullptr) return false;
    if (const std::optional<std::string> zone = json_access::text(time, "timeZone")) {
        if (!setText(record, CALENDAR_EVENT_START_TZID, *zone)) SYNC_ERR("fail");
    }
    const std::optional<calendar_time_s> value = cal_time::parse(time);
    return value && calendar_record_set_caltime(record, property, *value) == PLATFORM_ERROR_NONE;
}

bool setStates(JsonObject* event, calendar_record_h record) {
    const std::string status = json_access::textOr(event, "status", "").substr(0, cal_mapping::kStatusLength);
    const std::string visibility = json_access::textOr(event, "visibility", "default");
    const std::string transparency = json_access::textOr(event, "transparency", "opaque");
    const std::optional<int> sensitivity = cal_mapping::valueOf(cal_mapping::kVisibility, visibility);
    return setInt(record, CALENDAR_EVENT_STATUS,
                  cal_mapping::valueOf(cal_mapping::kStatus, status).value_or(cal_mapping::kStatusNone)) &&
           (!sensitivity || setInt(record, CALENDAR_EVENT_SENSITIVITY, *sensitivity)) &&
           setInt(record, CALENDAR_EVENT_BUSY_STATUS,
                  cal_mapping::valueOf(cal_mapping::kTransparency, transparency).value_or(0));
}

bool setOrganizer(JsonObject* event, calendar_record_h record) {
    JsonObject* organizer = json_access::object(event, "organizer");
    const std::string name = json_access::textOr(organizer, "displayName", "");
    const std::string email = json_access::textOr(organizer, "email", "");
    const bool own = json_access::isTrue(organizer, "self");
    return (name.empty() || setText(record, CALENDAR_EVENT_ORGANIZER_NAME, name)) &&
           (email.empty() || setText(record, CALENDAR_EVENT_ORGANIZER_EMAIL, email)) &&
           setInt(record, CALENDAR_EVENT_MEETING_STATUS,
                  own ? cal_mapping::kMeetingOwn : cal_mapping::kMeetingOther);
}

// Makes a child record of `view`, lets `fill` set it, and hands it to the event.
template <class Fill>
bool addChild(const char* view, unsigned property, calendar_record_h event, Fill fill) {
    calendar_record_h raw = nullptr;
    if (calendar_record_create(view, &raw) != PLATFORM_ERROR_NONE) return false;
    CalendarRecord child(raw);
    if (!fill(raw) || calendar_record_add_child_record(event, property, raw) != PLATFORM_ERROR_NONE)
        return false;
    (void)child.release();  // the event owns it now
    return true;
}

int parseAttendees(JsonArray* attendees, calendar_record_h record, bool* selfDeclined) {
    for (guint i = 0; i < json_array_get_length(attendees); ++i) {
        JsonObject* attendee = json_access::objectIn(json_array_get_element(attendees, i));
        if (attendee == nullptr) continue;
        const std::string response = json_access::textOr(attendee, "responseStatus", "");
        const std::optional<int> status = cal_mapping::valueOf(cal_mapping::kResponseStatus, response);
        const bool added =
            addChild(_calendar_attendee, CALENDAR_EVENT_ATTENDEES, record, [&](calendar_record_h child) {
                const std::string email = json_access::textOr(attendee, "email", "");
                const std::string name = json_access::textOr(attendee, "displayName", "");
                return (email.empty() || (setText(child, CALENDAR_ATTENDEE_EMAIL, email) &&
                                          setText(child, CALENDAR_ATTENDEE_NAME, email))) &&
                       (name.empty() || setText(child, CALENDAR_ATTENDEE_NAME, name)) &&
                       (!json_access::isTrue(attendee, "organizer") ||
                        setInt(child, CALENDAR_ATTENDEE_ROLE, cal_mapping::kAttendeeOrganizer)) &&
                       (!status || setInt(child, CALENDAR_ATTENDEE_STATUS, *status));
            });
        if (!added) {
            SYNC_ERR("calendar record create fail");
            return kFailed;
        }
        if (response == "declined" && json_access::isTrue(attendee, "self")) *selfDeclined = true;
    }
    return kOk;
}

int parseReminders(JsonArray* overrides, calendar_record_h record) {
    for (guint i = 0; i < json_array_get_length(overrides); ++i) {
        JsonObject* reminder = json_access::objectIn(json_array_get_element(overrides, i));
        const std::optional<int> minutes = json_access::number(reminder, "minutes");
        if (!minutes || *minutes < 0) {
            SYNC_ERR("get minutes fail");
            continue;
        }
        const bool added =
            addChild(_calendar_alarm, CALENDAR_EVENT_ALARMS, record, [&](calendar_record_h child) {
                return setInt(child, CALENDAR_ALARM_TICK, *minutes) &&
                       setInt(child, CALENDAR_ALARM_TICK_UNIT, cal_mapping::kTickUnitMinutes);
            });
        if (!added) {
            SYNC_ERR("calendar record create fail");
            return kFailed;
        }
    }
    return kOk;
}

}  // namespace

int CalJsonParser::convertEvent(JsonObject* event, CalendarRecord* out) {
    calendar_record_h raw = nullptr;
    if (event == nullptr || calendar_record_create(_calendar_event, &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("calendar record create fail");
        return kFailed;
    }
    CalendarRecord record(raw);
    if (!setTexts(event, cal_mapping::kEventTexts, raw) || !setStates(event, raw) ||
        !parseTime(event, "start", CALENDAR_EVENT_START, raw) ||
        !parseTime(event, "end", CALENDAR_EVENT_END, raw) || !setOrganizer(event, raw)) {
        SYNC_ERR("fail");
        return kFailed;
    }
    JsonArray* recurrence = json_access::array(event, "recurrence");
    if (recurrence != nullptr && cal_recurrence::parse(recurrence, raw) != kOk) return kFailed;
    bool selfDeclined = false;
    JsonArray* attendees = json_access::array(event, "attendees");
    if (attendees != nullptr && parseAttendees(attendees, raw, &selfDeclined) != kOk) return kFailed;
    JsonArray* overrides = json_access::array(json_access::object(event, "reminders"), "overrides");
    if (overrides != nullptr && parseReminders(overrides, raw) != kOk) return kFailed;
    if (!setText(raw, CALENDAR_EVENT_SYNC_DATA1, selfDeclined ? "declined" : "not_declined")) {
        SYNC_ERR("fail");
        return kFailed;
    }
    *out = std::move(record);
    return kOk;
}

int CalJsonParser::convertTodo(JsonObject* task, CalendarRecord* out) {
    calendar_record_h raw = nullptr;
    if (task == nullptr || calendar_record_create(_calendar_todo, &raw) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("calendar record create fail");
        return kFailed;
    }
    CalendarRecord record(raw);
    bool set = setTexts(task, cal_mapping::kTodoTexts, raw);
    const std::string status = json_access::textOr(task, "status", "");
    set = set &&
          setInt(
              raw, CALENDAR_TODO_STATUS,
              cal_mapping::valueOf(cal_mapping::kTodoStatus, status).value_or(cal_mapping::kTodoNeedsAction));
    if (const std::optional<std::string> due = json_access::text(task, "due")) {
        const std::optional<calendar_time_s> time = cal_time::parseDateTime(*due, "");
        set = set && time && setInt(raw, CALENDAR_TODO_HAS_DUE, 1) &&
              setText(raw, CALENDAR_TODO_SYNC_DATA1, std::string(cal_mapping::kServerHasDue)) &&
              calendar_record_set_caltime(raw, CALENDAR_TODO_DUE, *time) == PLATFORM_ERROR_NONE;
    }
    if (const std::optional<std::string> completed = json_access::text(task, "completed")) {
        const std::optional<calendar_time_s> time = cal_time::parseDateTime(*completed, "");
        set = set && time &&
              calendar_record_set_lli(raw, CALENDAR_TODO_COMPLETED_TIME, time->utime) == PLATFORM_ERROR_NONE;
    }
    if (!set) {
        SYNC_ERR("fail");
        return kFailed;
    }
    *out = std::move(record);
    return kOk;
}

int CalJsonParser::checkException(JsonObject* event, ExceptionInfo* out) {
    if (json_access::member(event, "originalStartTime") == nullptr) {
        *out = ExceptionInfo{};
        return kOk;
    }
    ExceptionInfo info;
    if (cal_time::appendRecurrenceId(json_access::object(event, "originalStartTime"), &info.recurrenceId) !=
        kOk) {
        return kFailed;
    }
    info.kind = json_access::textOr(event, "status", "") == "cancelled" ? ExceptionKind::kCancelled
                                                                        : ExceptionKind::kModified;
    info.seriesUri = json_access::textOr(event, "recurringEventId", "");
    info.sequence = json_access::number(event, "sequence").value_or(0);
    *out = std::move(info);
    return kOk;
}
