#include "exchange/ICalendarWriter.h"

#include <algorithm>
#include <ctime>

#include "TimeText.h"
#include "exchange/ICalendarMapping.h"
#include "exchange/ICalendarValues.h"

namespace exchange {

namespace {

std::string now() {
    calendar_time_s time;
    time.utime = std::time(nullptr);
    return time_text::composeCompact(time);
}

const std::string& textOf(const Json& item, std::string_view member) {
    static const std::string kNone;
    const auto found = item.find(std::string(member));
    return found != item.end() && found->is_string() ? found->get_ref<const std::string&>() : kNone;
}

}  // namespace

std::string ICalendarWriter::header() {
    return "BEGIN:VCALENDAR\r\nVERSION:2.0\r\nPRODID:-//vantor-pim-sync//vantor-pim-syncctl//EN\r\n";
}

void ICalendarWriter::noteZone(const Json& event) {
    const std::string& name = textOf(event, "timeZone");
    const auto start = time_text::parseRfc3339(textOf(event, "start"));
    if (name.empty() || !start || time_text::isDate(*start) || mZones.find(name) == nullptr) return;
    const auto [place, isNew] = mZoneStarts.try_emplace(name, start->utime);
    if (!isNew) place->second = std::min(place->second, start->utime);
}

std::string ICalendarWriter::zones() const {
    std::string text;
    for (const auto& [name, start] : mZoneStarts) text += mZones.find(name)->component(start);
    return text;
}

void ICalendarWriter::addText(const std::string& name, const std::string& text) {
    if (text.empty()) return;
    if (content_line::losesControls(text)) mLosses.add("control characters in texts");
    std::string value = content_line::escape(text);
    if (!value.empty()) add({"", name, {}, std::move(value)});
}

bool ICalendarWriter::addTime(const char* name, const std::string& time, const std::string& zone) {
    const auto parsed = time_text::parseRfc3339(time);
    if (!parsed) return false;
    const std::string compact = time_text::composeCompact(*parsed);
    if (time_text::isDate(*parsed)) {
        add({"", name, {{"VALUE", {"DATE"}}}, compact});
    } else if (zone.empty()) {
        add({"", name, {}, compact});
    } else {
        calendar_time_s wall = *parsed;
        wall.utime = mZones.find(zone)->toWall(parsed->utime);
        std::string text = time_text::composeCompact(wall);
        text.pop_back();  // the Z
        add({"", name, {{"TZID", {zone}}}, text});
    }
    return true;
}

std::string ICalendarWriter::zoneFor(const Json& event) {
    const std::string& name = textOf(event, "timeZone");
    const TimeZone* zone = name.empty() ? nullptr : mZones.find(name);
    if (zone == nullptr) return {};
    for (const char* member : {"start", "end"}) {
        const auto time = time_text::parseRfc3339(textOf(event, member));
        if (!time || time_text::isDate(*time) || !zone->holds(time->utime)) return {};
    }
    return name;
}

void ICalendarWriter::addShared(const Json& item, const std::string& uid, bool isTodo) {
    addText("UID", uid);
    add({"", "DTSTAMP", {}, now()});
    const std::span<const TextProperty> texts =
        isTodo ? std::span<const TextProperty>(kTodoTexts) : kEventTexts;
    for (const TextProperty& text : texts) addText(std::string(text.property), textOf(item, text.member));
    const std::span<const WordProperty> words =
        isTodo ? std::span<const WordProperty>(kTodoWords) : kEventWords;
    for (const WordProperty& word : words) {
        const auto found = item.find(std::string(word.member));
        if (found == item.end()) continue;
        const std::string value = found->is_string() ? found->get<std::string>() : found->dump();
        const WordRow* row = rowOfValue(word.rows, value);
        if (row != nullptr) add({"", std::string(word.property), {}, std::string(row->word)});
    }
}

void ICalendarWriter::addPerson(const char* name, const Json& person) {
    const std::string& called = textOf(person, "name");
    const std::string& email = textOf(person, "email");
    if (called.empty() && email.empty()) return;
    ContentLine line{"", name, {}, ical_values::addressOf(email)};
    if (!called.empty()) line.parameters.push_back({"CN", {called}});
    if (content_line::losesControls(called)) mLosses.add("control characters in texts");
    const WordRow* row = rowOfValue(kPartStatRows, textOf(person, "status"));
    if (row != nullptr) line.parameters.push_back({"PARTSTAT", {std::string(row->word)}});
    add(line);
}

void ICalendarWriter::addExdates(const Json& event) {
    for (const Json& date : event.value("exdates", Json::array())) {
        if (!addTime("EXDATE", date.get<std::string>(), "")) mLosses.add("exdates that are no times");
    }
}

void ICalendarWriter::addAlarms(const Json& event) {
    for (const Json& minutes : event.value("reminders", Json::array())) {
        mText += "BEGIN:VALARM\r\nACTION:DISPLAY\r\nDESCRIPTION:Reminder\r\n";
        add({"", "TRIGGER", {}, ical_values::beforeStart(minutes.get<int64_t>())});
        mText += "END:VALARM\r\n";
    }
}

std::string ICalendarWriter::event(const Json& event, const std::string& uid, const SeriesPlace* series) {
    mText = "BEGIN:VEVENT\r\n";
    addShared(event, series != nullptr ? series->uid : uid, /*isTodo=*/false);
    const std::string zone = zoneFor(event);
    if (!addTime("DTSTART", textOf(event, "start"), zone) || !addTime("DTEND", textOf(event, "end"), zone))
        return {};
    const std::string& named = textOf(event, "timeZone");
    if (zone != named) addText(std::string(kZoneProperty), named);
    const std::string& recurrence = textOf(event, "recurrenceId");
    if (series != nullptr) {
        const auto instance = time_text::parseCompact(recurrence);
        // Named in the zone of the series, as readers compare it with the instances that they make of the rule.
        const TimeZone* ofSeries = series->zone.empty() ? nullptr : mZones.find(series->zone);
        const bool isNamed = instance && ofSeries != nullptr && !time_text::isDate(*instance) &&
                             ofSeries->holds(instance->utime);
        if (!instance ||
            !addTime("RECURRENCE-ID", time_text::composeRfc3339(*instance), isNamed ? series->zone : ""))
            return {};
    }
    const std::string& rule = textOf(event, "rrule");
    if (!rule.empty()) add({"", "RRULE", {}, rule});
    addExdates(event);
    const auto organizer = event.find("organizer");
    if (organizer != event.end() && organizer->is_object()) addPerson("ORGANIZER", *organizer);
    for (const Json& attendee : event.value("attendees", Json::array())) addPerson("ATTENDEE", attendee);
    addAlarms(event);
    return mText + "END:VEVENT\r\n";
}

std::string ICalendarWriter::todo(const Json& todo, const std::string& uid) {
    mText = "BEGIN:VTODO\r\n";
    addShared(todo, uid, /*isTodo=*/true);
    for (const auto& [name, member] : {std::pair{"DUE", "due"}, std::pair{"COMPLETED", "completed"}}) {
        const std::string& time = textOf(todo, member);
        if (!time.empty() && !addTime(name, time, "")) return {};
    }
    return mText + "END:VTODO\r\n";
}

}  // namespace exchange
