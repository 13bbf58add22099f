#include "exchange/ICalendarReader.h"

#include <glib.h>

#include <algorithm>

#include "EventFields.h"
#include "Failure.h"
#include "TimeText.h"
#include "exchange/ICalendarMapping.h"
#include "exchange/ICalendarValues.h"

namespace exchange {

namespace {

constexpr int64_t kDaySec = 86400;

bool isSilent(std::string_view name) {
    return std::find(std::begin(kSilent), std::end(kSilent), name) != std::end(kSilent);
}

std::string trimmed(std::string_view text) {
    const size_t start = text.find_first_not_of(" \t");
    if (start == std::string_view::npos) return {};
    return std::string(text.substr(start, text.find_last_not_of(" \t") - start + 1));
}

// "END:NAME" of a component that is left out; components of one name may lie in each other.
size_t skipComponent(const std::vector<TextLine>& lines, size_t at) {
    int depth = 0;
    for (; at < lines.size(); ++at) {
        const std::string word = content_line::upper(lines[at].text.substr(0, 6));
        depth += word.starts_with("BEGIN:") ? 1 : 0;
        depth -= word.starts_with("END:") ? 1 : 0;
        if (depth == 0) break;
    }
    return at;
}

}  // namespace

// What a VEVENT says before it is put together.
struct ICalendarReader::Frame {
    std::optional<When> start;
    std::optional<When> end;
    std::optional<ical_values::Duration> duration;
    calendar_time_s ends{};  // whichever of the two says it
    std::string zoneName;
    const ContentLine* rule = nullptr;
    std::vector<const ContentLine*> exdates;
};

calendar_time_s instanceOf(const CalendarItem& series, const calendar_time_s& named) {
    const bool isOfDays = series.fields["start"].get_ref<const std::string&>().find('T') == std::string::npos;
    if (isOfDays == time_text::isDate(named)) return named;
    calendar_time_s instance;
    if (isOfDays) return *time_text::parseCompact(time_text::composeCompact(named).substr(0, 8));
    const int64_t wall = ical_values::wallOf(named) + series.wallTimeOfDay;
    instance.utime = series.zone != nullptr ? series.zone->toUtc(wall) : wall;
    return instance;
}

void ICalendarReader::defineZone(const RawItem& timezone) {
    std::string text = "BEGIN:VTIMEZONE\r\n";
    std::string id;
    std::string location;
    for (const TextLine& line : timezone.lines) {
        const auto parsed = content_line::parse(line.text);
        if (parsed && parsed->name == "TZID") id = content_line::unescape(trimmed(parsed->value));
        if (parsed && parsed->name == "X-LIC-LOCATION") location = trimmed(parsed->value);
        text += line.text + "\r\n";
    }
    if (!id.empty() && timezone.problem.empty()) mZones.define(id, text + "END:VTIMEZONE\r\n", location);
}

ICalendarReader::Parts ICalendarReader::partsOf(const RawItem& raw) {
    Parts parts;
    std::vector<ContentLine>* into = &parts.properties;
    for (size_t at = 0; at < raw.lines.size(); ++at) {
        const TextLine& line = raw.lines[at];
        if (g_utf8_validate(line.text.data(), static_cast<gssize>(line.text.size()), nullptr) == FALSE) {
            throw Failure("line " + std::to_string(line.number) + " is not UTF-8 or holds a NUL character");
        }
        auto parsed = content_line::parse(line.text);
        if (!parsed) {
            if (!trimmed(line.text).empty()) mpLosses->add("malformed lines");
            continue;
        }
        const std::string component = content_line::upper(trimmed(parsed->value));
        if (parsed->name == "BEGIN" && component == "VALARM" && into == &parts.properties) {
            into = &parts.alarms.emplace_back();
        } else if (parsed->name == "END" && component == "VALARM") {
            into = &parts.properties;
        } else if (parsed->name == "BEGIN") {
            mpLosses->add(content_line::isName(component) ? component : "components");
            at = skipComponent(raw.lines, at);
        } else if (line.isTooLong) {
            mpLosses->add(parsed->name + " (too long)");
        } else {
            into->push_back(std::move(*parsed));
        }
    }
    return parts;
}

CalendarItem ICalendarReader::read(const RawItem& raw, NotHeld& losses) {
    if (!raw.problem.empty()) throw Failure(raw.problem);
    mpLosses = &losses;
    mMissedZone = false;
    CalendarItem item;
    item.isTodo = raw.name == "VTODO";
    item.line = raw.firstLine;
    const Parts parts = partsOf(raw);
    for (const ContentLine& line : parts.properties) {
        if (line.name == "UID") item.uid = content_line::unescape(line.value);
    }
    item.isTodo ? readTodo(parts, item) : readEvent(parts, item);
    return item;
}

void ICalendarReader::noteOther(const ContentLine& line) {
    if (!isSilent(line.name)) mpLosses->add(line.name);
}

// --- what events and to-dos share -------------------------------------------------------------------------------

bool ICalendarReader::readShared(const ContentLine& line, CalendarItem& item) {
    const std::span<const TextProperty> texts =
        item.isTodo ? std::span<const TextProperty>(kTodoTexts) : kEventTexts;
    for (const TextProperty& text : texts) {
        if (text.property != line.name) continue;
        const std::string member(text.member);
        if (item.fields.contains(member)) mpLosses->add(line.name + " (a second one)");
        if (!item.fields.contains(member)) item.fields[member] = content_line::unescape(line.value);
        return true;
    }
    const std::span<const WordProperty> words =
        item.isTodo ? std::span<const WordProperty>(kTodoWords) : kEventWords;
    for (const WordProperty& word : words) {
        if (word.property != line.name) continue;
        const std::string said = content_line::upper(trimmed(line.value));
        const WordRow* row = rowOfWord(word.rows, said);
        if (row == nullptr || row->isLoss)
            mpLosses->add(content_line::isName(said) ? line.name + ":" + said : line.name);
        if (row != nullptr) item.fields[std::string(word.member)] = std::string(row->value);
        return true;
    }
    return false;
}

ICalendarReader::When ICalendarReader::readTime(const ContentLine& line, std::string_view value) {
    const std::string text = content_line::upper(trimmed(value));
    const bool isWall = text.size() > 8 && !text.ends_with('Z');
    const auto time = time_text::parseCompact(isWall ? text + "Z" : text);
    if (!time) throw Failure("its " + line.name + " is no time");
    When when{*time, ical_values::wallOf(*time), nullptr};
    if (!isWall) return when;
    const std::string id = line.parameter("TZID");
    when.zone = id.empty() ? &mZones.floating() : mZones.find(id);
    if (id.empty()) mpLosses->add("times without a zone, read as those of " + mZones.floating().name());
    if (when.zone == nullptr) {
        mMissedZone = true;
        mpLosses->add("unknown time zones, read as " + mZones.floating().name());
        when.zone = &mZones.floating();
    }
    when.time.utime = when.zone->toUtc(when.wallSec);
    return when;
}

// --- to-dos -----------------------------------------------------------------------------------------------------

void ICalendarReader::readTodo(const Parts& parts, CalendarItem& item) {
    for (const ContentLine& line : parts.properties) {
        if (line.name == "DUE") {
            item.fields["due"] = time_text::composeRfc3339(readTime(line, line.value).time);
        } else if (line.name == "COMPLETED") {
            item.fields["completed"] = time_text::composeRfc3339(instantOf(readTime(line, line.value).time));
        } else if (!readShared(line, item)) {
            noteOther(line);
        }
    }
    if (!parts.alarms.empty()) mpLosses->add("VALARM", static_cast<int>(parts.alarms.size()));
    if (item.fields.contains("completed") && !item.fields.contains("status"))
        item.fields["status"] = "completed";
}

// --- events -----------------------------------------------------------------------------------------------------

void ICalendarReader::readEvent(const Parts& parts, CalendarItem& item) {
    Frame frame;
    for (const ContentLine& line : parts.properties) {
        if (!readEventLine(line, frame, item) && !readShared(line, item)) noteOther(line);
    }
    if (!frame.start) throw Failure("it has no DTSTART");
    setTimes(frame, item);
    if (frame.rule != nullptr) readRule(*frame.rule, frame, item);
    readExdates(frame, item);
    Json reminders = Json::array();
    for (const auto& alarm : parts.alarms) readAlarm(alarm, frame, reminders);
    item.fields["reminders"] = reminders;
    if (item.fields.contains("busy")) item.fields["busy"] = item.fields["busy"] == "true";
}

bool ICalendarReader::readEventLine(const ContentLine& line, Frame& frame, CalendarItem& item) {
    struct Row {
        std::string_view property;
        void (*read)(ICalendarReader& self, const ContentLine& line, Frame& frame, CalendarItem& item);
    };
    using Self = ICalendarReader;
    using Line = ContentLine;
    static constexpr Row kRows[] = {
        {"DTSTART", [](Self& self, const Line& text, Frame& to,
                       CalendarItem&) { to.start = self.readTime(text, text.value); }},
        {"DTEND", [](Self& self, const Line& text, Frame& to,
                     CalendarItem&) { to.end = self.readTime(text, text.value); }},
        {"DURATION",
         [](Self&, const Line& text, Frame& to, CalendarItem&) {
             to.duration = ical_values::durationOf(text.value);
             if (!to.duration) throw Failure("its DURATION cannot be read");
         }},
        {"RRULE",
         [](Self&, const Line& text, Frame& to, CalendarItem&) {
             if (to.rule != nullptr) throw Failure("it has more than one rule (RRULE); a series holds one");
             to.rule = &text;
         }},
        {"EXDATE", [](Self&, const Line& text, Frame& to, CalendarItem&) { to.exdates.push_back(&text); }},
        {"RECURRENCE-ID",
         [](Self& self, const Line& text, Frame&, CalendarItem& to) {
             if (!text.parameter("RANGE").empty())
                 self.mpLosses->add("RECURRENCE-ID;RANGE (only the one instance is changed)");
             to.recurrence = self.readTime(text, text.value).time;
         }},
        {"ORGANIZER",
         [](Self&, const Line& text, Frame&, CalendarItem& to) {
             to.fields["organizer"] = {{"name", text.parameter("CN")}, {"email", ical_values::emailOf(text)}};
         }},
        {"ATTENDEE",
         [](Self& self, const Line& text, Frame&, CalendarItem& to) { self.readAttendee(text, to); }},
        {kZoneProperty, [](Self&, const Line& text, Frame& to,
                           CalendarItem&) { to.zoneName = content_line::unescape(text.value); }},
    };
    for (const Row& row : kRows) {
        if (row.property != line.name) continue;
        row.read(*this, line, frame, item);
        return true;
    }
    return false;
}

int64_t ICalendarReader::instantOf(const calendar_time_s& time) const {
    return time_text::isDate(time) ? mZones.floating().toUtc(ical_values::wallOf(time)) : time.utime;
}

calendar_time_s ICalendarReader::endOf(const Frame& frame) {
    if (frame.end) return frame.end->time;
    const When& start = *frame.start;
    if (time_text::isDate(start.time)) {
        const auto length = frame.duration.value_or(ical_values::Duration{.days = 1});
        const int64_t days = length.days + (length.seconds + kDaySec - 1) / kDaySec;
        return ical_values::dateOf(start.wallSec + days * kDaySec);
    }
    const auto length = frame.duration.value_or(ical_values::Duration{});
    const int64_t wallSec = start.wallSec + length.days * kDaySec;
    calendar_time_s end = start.time;
    end.utime = (start.zone != nullptr ? start.zone->toUtc(wallSec) : wallSec) + length.seconds;
    return end;
}

void ICalendarReader::setTimes(Frame& frame, CalendarItem& item) {
    const When& start = *frame.start;
    frame.ends = endOf(frame);
    item.fields["start"] = time_text::composeRfc3339(start.time);
    item.fields["end"] = time_text::composeRfc3339(frame.ends);
    item.zone = start.zone;
    item.wallTimeOfDay = ((start.wallSec % kDaySec) + kDaySec) % kDaySec;
    const std::string zone = start.zone != nullptr ? start.zone->name() : std::string();
    if (start.zone != nullptr && zone.empty()) mpLosses->add("time zones that only the file knows");
    if (frame.end && frame.end->zone != nullptr && frame.end->zone != start.zone)
        mpLosses->add("DTEND;TZID (another zone than the start's)");
    const bool isNamed = !frame.zoneName.empty() && event_fields::isTimeZone(frame.zoneName);
    item.fields["timeZone"] = isNamed ? frame.zoneName : zone;
}

void ICalendarReader::readRule(const ContentLine& line, const Frame& frame, CalendarItem& item) {
    const auto toUtc = [&frame](int64_t wallSec) {
        return frame.start->zone != nullptr ? frame.start->zone->toUtc(wallSec) : wallSec;
    };
    item.fields["rrule"] = ical_values::ruleOf(line.value, toUtc);
}

void ICalendarReader::readExdates(const Frame& frame, CalendarItem& item) {
    Json dates = Json::array();
    for (const ContentLine* line : frame.exdates) {
        for (const std::string_view value : content_line::split(line->value, ',')) {
            if (trimmed(value).empty()) continue;
            dates.push_back(time_text::composeRfc3339(instanceOf(item, readTime(*line, value).time)));
        }
    }
    const bool isSeries = item.fields.contains("rrule");
    if (isSeries) item.fields["exdates"] = dates;
    if (!isSeries && !dates.empty()) mpLosses->add("EXDATE (without a rule)", static_cast<int>(dates.size()));
}

void ICalendarReader::readAttendee(const ContentLine& line, CalendarItem& item) {
    const std::string email = ical_values::emailOf(line);
    if (email.empty()) {
        mpLosses->add("ATTENDEE (without an e-mail address)");
        return;
    }
    const std::string said = content_line::upper(line.parameter("PARTSTAT"));
    const WordRow* row = rowOfWord(kPartStatRows, said.empty() ? kPartStatRows[0].word : said);
    if (row == nullptr || row->isLoss) mpLosses->add("ATTENDEE;PARTSTAT");
    constexpr std::string_view kKept[] = {"CN", "PARTSTAT", "EMAIL"};
    for (const Parameter& parameter : line.parameters) {
        const std::string value =
            parameter.values.empty() ? "" : content_line::upper(parameter.values.front());
        const bool isPlain = value == "REQ-PARTICIPANT" || value == "INDIVIDUAL";
        if (!isPlain && std::find(std::begin(kKept), std::end(kKept), parameter.name) == std::end(kKept))
            mpLosses->add("ATTENDEE;" + parameter.name);
    }
    if (!item.fields.contains("attendees")) item.fields["attendees"] = Json::array();
    item.fields["attendees"].push_back(
        {{"name", line.parameter("CN")},
         {"email", email},
         {"status", row != nullptr ? std::string(row->value) : "needsAction"}});
}

void ICalendarReader::readAlarm(const std::vector<ContentLine>& alarm, const Frame& frame, Json& reminders) {
    std::string action;
    const ContentLine* trigger = nullptr;
    for (const ContentLine& line : alarm) {
        if (line.name == "ACTION") action = content_line::upper(trimmed(line.value));
        if (line.name == "TRIGGER") trigger = &line;
    }
    if (trigger == nullptr || (action != "DISPLAY" && action != "AUDIO")) {
        mpLosses->add("VALARM (" + (content_line::isName(action) ? action : "malformed") + ")");
        return;
    }
    if (action == "AUDIO") mpLosses->add("VALARM (the sound)");
    const int64_t startSec = instantOf(frame.start->time);
    std::optional<int64_t> before;
    if (content_line::upper(trigger->parameter("VALUE")) == "DATE-TIME") {
        before = startSec - instantOf(readTime(*trigger, trigger->value).time);
    } else if (const auto after = ical_values::durationOf(trigger->value)) {
        // A day of a reminder has 24 hours: the store counts minutes, and 1440 of them are written as a day.
        before = -(after->days * kDaySec + after->seconds);
        const bool isFromEnd = content_line::upper(trigger->parameter("RELATED")) == "END";
        if (isFromEnd) *before -= instantOf(frame.ends) - startSec;
    }
    constexpr int64_t kMinuteSec = 60;
    constexpr int64_t kMostMinutes = int64_t{366} * 24 * 60;
    if (!before || *before < 0 || *before > kMostMinutes * kMinuteSec) {
        mpLosses->add("VALARM (not before the start)");
        return;
    }
    if (*before % kMinuteSec != 0) mpLosses->add("VALARM (seconds)");
    reminders.push_back((*before + kMinuteSec - 1) / kMinuteSec);
}

}  // namespace exchange
