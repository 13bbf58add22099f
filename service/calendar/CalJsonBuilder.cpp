#include "calendar/CalJsonBuilder.h"

#include <cstdio>
#include <optional>

#include "calendar/CalMappings.h"
#include "calendar/CalRecurrence.h"
#include "calendar/CalTime.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/calendar_read.h"

using calendar_read::intOf;
using calendar_read::textOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

template <size_t N>
void addTexts(calendar_record_h record, const cal_mapping::TextMember (&members)[N], CalJsonObject& object) {
    for (const cal_mapping::TextMember& member : members) {
        if (member.isSent) object.addStringMember(member.name, textOf(record, member.property));
    }
}

// The word of a value; the fallback for a value that no row has.
template <size_t N>
std::string wordOf(const cal_mapping::NameOf (&table)[N], int value, std::string_view fallback) {
    return std::string(cal_mapping::nameOf(table, value).value_or(fallback));
}

// Calls `use` with each child; false when one cannot be read.
template <class Use>
bool forEachChild(calendar_record_h record, unsigned property, Use use) {
    unsigned count = 0;
    if (calendar_record_get_child_record_count(record, property, &count) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("calendar_record_get_int() failed");
        return false;
    }
    for (unsigned i = 0; i < count; ++i) {
        calendar_record_h child = nullptr;
        if (calendar_record_get_child_record_at_p(record, property, i, &child) != PLATFORM_ERROR_NONE) {
            SYNC_ERR("calendar_record_get_child_record_at_p() failed");
            return false;
        }
        if (!use(child)) return false;
    }
    return true;
}

template <class Add>
int compose(CalJsonObject* body, Add add) {
    CalJsonBuilder builder;
    if (add(builder) != kOk) return kFailed;
    *body = builder.takeObject();
    return kOk;
}

// NULL when it cannot be read.
const char* emailOf(calendar_record_h attendee) {
    const char* email = nullptr;
    if (calendar_record_get_str_p(attendee, CALENDAR_ATTENDEE_EMAIL, &email) == PLATFORM_ERROR_NONE)
        return email;
    SYNC_ERR("calendar_record_get_str_p() faield");
    return nullptr;
}

}  // namespace

int CalJsonBuilder::begin(calendar_record_h record) {
    if (record == nullptr) {
        SYNC_ERR("record is null");
        return kFailed;
    }
    if (mObject.initialize() != kOk) {
        SYNC_ERR("CalJsonObject new fail");
        return kFailed;
    }
    return kOk;
}

int CalJsonBuilder::addEvent(calendar_record_h record) {
    if (begin(record) != kOk) return kFailed;
    addTexts(record, cal_mapping::kEventTexts, mObject);
    if (setTime(record, "start", CALENDAR_EVENT_START) != kOk ||
        setTime(record, "end", CALENDAR_EVENT_END) != kOk)
        return kFailed;
    mObject.addStringMember("transparency", wordOf(cal_mapping::kTransparency,
                                                   intOf(record, CALENDAR_EVENT_BUSY_STATUS), "opaque"));
    mObject.addStringMember("visibility",
                            wordOf(cal_mapping::kVisibility, intOf(record, CALENDAR_EVENT_SENSITIVITY),
                                   cal_mapping::kVisibilityOther));
    if (setRecurrence(record) != kOk || setAttendees(record) != kOk || setReminders(record) != kOk) {
        SYNC_ERR("fail");
        return kFailed;
    }
    return kOk;
}

int CalJsonBuilder::setTime(calendar_record_h record, const char* name, unsigned property) {
    calendar_time_s time;
    if (const int code = calendar_record_get_caltime(record, property, &time); code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("get_caltime() fail (%x)", static_cast<unsigned>(code));
        return kFailed;
    }
    CalJsonObject object;
    if (object.initialize() != kOk) return kFailed;
    if (time.type == CALENDAR_TIME_LOCALTIME) {
        object.addStringMember("date", cal_time::dateText(time));
    } else {
        const std::optional<std::string> text = cal_time::minuteText(time.utime);
        if (!text) {
            SYNC_ERR("fail");
            return kFailed;
        }
        object.addStringMember("dateTime", *text);
        const std::string zone = textOf(record, CALENDAR_EVENT_START_TZID);
        if (!zone.empty()) object.addStringMember("timeZone", zone);
    }
    mObject.addObjectMember(name, object);
    return kOk;
}

int CalJsonBuilder::setRecurrence(calendar_record_h record) {
    std::string rule;
    if (cal_recurrence::build(record, &rule) != kOk) return kFailed;
    if (!rule.empty()) mObject.addArrayMember("recurrence", std::vector<std::string>{rule});
    return kOk;
}

int CalJsonBuilder::setAttendees(calendar_record_h record) {
    std::vector<CalJsonObject> attendees;
    const bool read = forEachChild(record, CALENDAR_EVENT_ATTENDEES, [&attendees](calendar_record_h child) {
        const char* email = emailOf(child);
        CalJsonObject attendee;
        if (email == nullptr || attendee.initialize() != kOk) return false;
        if (*email != '\0') attendee.addStringMember("email", email);
        attendee.addStringMember(
            "responseStatus",
            wordOf(cal_mapping::kResponseStatus, intOf(child, CALENDAR_ATTENDEE_STATUS), "needsAction"));
        attendees.push_back(std::move(attendee));
        return true;
    });
    if (!read) return kFailed;
    mObject.addArrayMember("attendees", attendees);
    return kOk;
}

int CalJsonBuilder::setReminders(calendar_record_h record) {
    std::vector<CalJsonObject> overrides;
    const bool read = forEachChild(record, CALENDAR_EVENT_ALARMS, [&overrides](calendar_record_h child) {
        CalJsonObject reminder;
        if (reminder.initialize() != kOk) return false;
        const int64_t seconds =
            int64_t{intOf(child, CALENDAR_ALARM_TICK)} * intOf(child, CALENDAR_ALARM_TICK_UNIT);
        reminder.addStringMember("method", "popup");
        reminder.addIntegerMember("minutes", seconds / cal_mapping::kTickUnitMinutes);
        overrides.push_back(std::move(reminder));
        return true;
    });
    CalJsonObject reminders;
    if (!read || reminders.initialize() != kOk) return kFailed;
    reminders.addBooleanMember("useDefault", false);
    reminders.addArrayMember("overrides", overrides);
    mObject.addObjectMember("reminders", reminders);
    return kOk;
}

int CalJsonBuilder::addException(calendar_record_h record, const std::string& seriesUri) {
    if (addEvent(record) != kOk) return kFailed;
    CalJsonObject original;
    const std::optional<cal_time::OriginalStart> start =
        cal_time::originalStart(textOf(record, CALENDAR_EVENT_RECURRENCE_ID));
    if (!start || original.initialize() != kOk) {
        SYNC_ERR("fail");
        return kFailed;
    }
    original.addStringMember(start->member, start->text);
    mObject.addStringMember("recurringEventId", seriesUri);
    mObject.addObjectMember("originalStartTime", original);
    return kOk;
}

int CalJsonBuilder::addTodo(calendar_record_h record) {
    if (begin(record) != kOk) return kFailed;
    addTexts(record, cal_mapping::kTodoTexts, mObject);
    const int status = intOf(record, CALENDAR_TODO_STATUS);
    mObject.addStringMember("status",
                            wordOf(cal_mapping::kTodoStatus, status, cal_mapping::kTodoStatusOther));
    if (setDue(record) != kOk) return kFailed;
    int64_t completed = 0;
    if (const int code = calendar_record_get_lli(record, CALENDAR_TODO_COMPLETED_TIME, &completed);
        code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("get_lli() fail (%x)", static_cast<unsigned>(code));
        return kFailed;
    }
    const std::optional<std::string> text = cal_time::minuteText(completed);
    if (status == cal_mapping::kTodoCompleted && completed != 0 && text)
        mObject.addStringMember("completed", *text);
    return kOk;
}

int CalJsonBuilder::setDue(calendar_record_h record) {
    if (intOf(record, CALENDAR_TODO_HAS_DUE) == 0) {
        // Only a server that has a due time is told to drop it.
        if (textOf(record, CALENDAR_TODO_SYNC_DATA1) == cal_mapping::kServerHasDue)
            mObject.addNullMember("due");
        return kOk;
    }
    calendar_time_s due;
    if (const int code = calendar_record_get_caltime(record, CALENDAR_TODO_DUE, &due);
        code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("get_caltime() fail (%x)", static_cast<unsigned>(code));
        return kFailed;
    }
    const std::optional<int64_t> seconds = cal_time::toUtc(due);
    const std::optional<std::string> text = seconds ? cal_time::minuteText(*seconds) : std::nullopt;
    if (!text) {
        SYNC_ERR("fail");
        return kFailed;
    }
    mObject.addStringMember("due", *text);
    return kOk;
}

namespace cal_json {

int composeEvent(calendar_record_h record, CalJsonObject* body) {
    return compose(body, [record](CalJsonBuilder& builder) { return builder.addEvent(record); });
}

int composeTodo(calendar_record_h record, CalJsonObject* body) {
    return compose(body, [record](CalJsonBuilder& builder) { return builder.addTodo(record); });
}

int composeComparableEvent(calendar_record_h record, CalJsonObject* body) {
    const int code = calendar_record_set_str(record, CALENDAR_EVENT_START_TZID, "");
    return code == PLATFORM_ERROR_NONE ? composeEvent(record, body) : kFailed;
}

std::string convertException2Json(calendar_record_h record, const std::string& seriesUri) {
    CalJsonObject body;
    const int result =
        compose(&body, [&](CalJsonBuilder& builder) { return builder.addException(record, seriesUri); });
    return result == kOk ? body.getJsonString() : std::string();
}

}  // namespace cal_json
