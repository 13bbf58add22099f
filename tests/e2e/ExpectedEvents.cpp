#include "e2e/ExpectedEvents.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <set>
#include <sstream>

namespace {

std::string utcText(long long seconds) {
    const std::chrono::sys_seconds point{std::chrono::seconds(seconds)};
    const auto day = std::chrono::floor<std::chrono::days>(point);
    const std::chrono::year_month_day date(day);
    const std::chrono::hh_mm_ss time(point - day);
    char text[40];
    std::snprintf(text, sizeof text, "%04d-%02u-%02uT%02ld:%02ld:%02ldZ", static_cast<int>(date.year()),
                  static_cast<unsigned>(date.month()), static_cast<unsigned>(date.day()),
                  time.hours().count(), time.minutes().count(), time.seconds().count());
    return text;
}

// Offsets count with their hours only; of an original start a negative one does not count at all.
std::string timeText(const Json& time, bool original) {
    if (time.contains("date")) return time["date"];
    const std::string text = time["dateTime"];
    int y = 0, mo = 0, d = 0, h = 0, mi = 0, s = 0, hours = 0, minutes = 0;
    char sign = '+';
    std::sscanf(text.c_str(), "%d-%d-%dT%d:%d:%d%c%d:%d", &y, &mo, &d, &h, &mi, &s, &sign, &hours, &minutes);
    const std::chrono::sys_days day{std::chrono::year(y) / mo / d};
    long long seconds = std::chrono::duration_cast<std::chrono::seconds>(day.time_since_epoch()).count() +
                        h * 3600LL + mi * 60LL + s;
    if (sign == 'Z') hours = 0;
    if (sign == '+') seconds -= hours * 3600LL;
    if (sign == '-' && !original) seconds += hours * 3600LL;
    return utcText(seconds);
}

std::string idText(std::string time) {
    std::erase_if(time, [](char c) { return c == '-' || c == ':'; });
    return time;
}

// A rule as the set of its parts: their order is no part of its meaning.
Json ruleParts(std::string rule) {
    if (rule.starts_with("RRULE:")) rule = rule.substr(6);
    std::set<std::string> parts;
    std::stringstream stream(rule);
    for (std::string part; std::getline(stream, part, ';');) {
        if (part != "INTERVAL=1" && part != "WKST=MO") parts.insert(part);
    }
    return parts;
}

Json personOf(const Json& person) {
    const std::string email = person.value("email", "");
    return {{"email", email},
            {"name", person.value("displayName", email)},
            {"status", person.value("responseStatus", "needsAction")}};
}

Json expectedEvent(const Json& wire) {
    Json organizer = wire.value("organizer", Json::object());
    Json event = {{"summary", wire.value("summary", "")},
                  {"description", wire.value("description", "")},
                  {"location", wire.value("location", "")},
                  {"start", timeText(wire["start"], false)},
                  {"end", timeText(wire["end"], false)},
                  {"timeZone", wire["end"].value("timeZone", wire["start"].value("timeZone", ""))},
                  {"status", wire.value("status", "")},
                  {"busy", wire.value("transparency", "opaque") == "opaque"},
                  {"organizer",
                   {{"name", organizer.value("displayName", "")}, {"email", organizer.value("email", "")}}},
                  {"attendees", Json::array()},
                  {"reminders", Json::array()},
                  {"exdates", Json::array()},
                  {"rrule", Json::array()},
                  {"originalEvent", nullptr},
                  {"recurrenceId", ""}};
    const std::string visibility = wire.value("visibility", "default");
    event["visibility"] = visibility == "private" ? "private" : "default";
    for (const Json& attendee : wire.value("attendees", Json::array()))
        event["attendees"].push_back(personOf(attendee));
    for (const Json& reminder : wire.value("reminders", Json::object()).value("overrides", Json::array())) {
        event["reminders"].push_back(reminder["minutes"]);
    }
    const Json recurrence = wire.value("recurrence", Json::array());
    if (!recurrence.empty()) event["rrule"] = ruleParts(recurrence[0]);
    return event;
}

}  // namespace

std::map<std::string, Json> expectedEvents(const std::vector<Json>& wire) {
    std::map<std::string, Json> events;
    for (const Json& item : wire) {
        if (!item.contains("originalStartTime")) events[item["id"]] = expectedEvent(item);
    }
    for (const Json& item : wire) {
        if (!item.contains("originalStartTime") || !events.contains(item["recurringEventId"])) continue;
        const std::string start = timeText(item["originalStartTime"], true);
        if (item.value("status", "") == "cancelled") {
            events[item["recurringEventId"]]["exdates"].push_back(start);
            continue;
        }
        Json exception = expectedEvent(item);
        exception["originalEvent"] = item["recurringEventId"];
        exception["recurrenceId"] = idText(start);
        events[item["id"]] = exception;
    }
    for (auto& [uid, event] : events) std::sort(event["exdates"].begin(), event["exdates"].end());
    return events;
}

Json comparable(const Json& listed, const std::map<int, std::string>& uidOf) {
    Json event;
    for (const char* field :
         {"summary", "description", "location", "start", "end", "timeZone", "status", "visibility", "busy",
          "organizer", "attendees", "reminders", "exdates", "recurrenceId"}) {
        event[field] = listed.at(field);
    }
    std::sort(event["exdates"].begin(), event["exdates"].end());
    event["rrule"] =
        listed.at("rrule").get<std::string>().empty() ? Json::array() : ruleParts(listed.at("rrule"));
    const Json& original = listed.at("originalEvent");
    event["originalEvent"] = original.is_number() && original != 0 ? Json(uidOf.at(original)) : Json(nullptr);
    return event;
}

Json expectedTodo(const Json& wire) {
    std::string completed = wire.value("completed", "");
    // Milliseconds are spelt out by the provider.
    if (const size_t fraction = completed.find(".000Z"); fraction != std::string::npos)
        completed.replace(fraction, 5, "Z");
    return {{"summary", wire.value("title", "")},
            {"note", wire.value("notes", "")},
            {"due", wire.value("due", "")},
            {"completed", completed},
            {"status", wire.value("status", "needsAction")}};
}

Json comparableTodo(const Json& listed) {
    Json todo;
    for (const char* field : {"summary", "note", "due", "completed", "status"})
        todo[field] = listed.at(field);
    return todo;
}
