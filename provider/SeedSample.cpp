#include <array>
#include <string_view>

#include "Seed.h"

namespace provider {

namespace {

// Series, and instances that were moved or cancelled, by hand: what they are for is in their summaries.
constexpr std::string_view kPersonalSeries = R"json([
{"id":"daily10","summary":"Ten days of stretching","start":{"dateTime":"2026-01-05T07:00:00Z"},
 "end":{"dateTime":"2026-01-05T07:15:00Z"},"recurrence":["RRULE:FREQ=DAILY;COUNT=10"]},
{"recurringEventId":"daily10","originalStartTime":{"dateTime":"2026-01-07T07:00:00Z"},"status":"cancelled"},
{"recurringEventId":"daily10","originalStartTime":{"dateTime":"2026-01-08T07:00:00Z"},
 "summary":"Stretching, later","start":{"dateTime":"2026-01-08T09:30:00Z"},"end":{"dateTime":"2026-01-08T09:45:00Z"}},
{"id":"gym00","summary":"Gym","location":"Sporthalle","start":{"dateTime":"2026-01-05T18:00:00+01:00","timeZone":"Europe/Berlin"},
 "end":{"dateTime":"2026-01-05T19:30:00+01:00","timeZone":"Europe/Berlin"},
 "recurrence":["RRULE:FREQ=WEEKLY;UNTIL=20260630T160000Z;BYDAY=MO,WE,FR"]},
{"recurringEventId":"gym00","originalStartTime":{"dateTime":"2026-01-14T18:00:00+01:00","timeZone":"Europe/Berlin"},
 "status":"cancelled"},
{"recurringEventId":"gym00","originalStartTime":{"dateTime":"2026-01-16T18:00:00+01:00","timeZone":"Europe/Berlin"},
 "location":"Stadtbad","description":"Swimming instead"},
{"id":"seoul1","summary":"통화 · call with Seoul","start":{"dateTime":"2026-01-06T10:00:00+09:00","timeZone":"Asia/Seoul"},
 "end":{"dateTime":"2026-01-06T11:00:00+09:00","timeZone":"Asia/Seoul"},
 "recurrence":["RRULE:FREQ=WEEKLY;INTERVAL=2;BYDAY=TU"],"visibility":"private"},
{"recurringEventId":"seoul1","originalStartTime":{"dateTime":"2026-02-03T10:00:00+09:00","timeZone":"Asia/Seoul"},
 "start":{"dateTime":"2026-02-04T10:00:00+09:00","timeZone":"Asia/Seoul"},
 "end":{"dateTime":"2026-02-04T11:00:00+09:00","timeZone":"Asia/Seoul"}},
{"id":"rent000","summary":"Pay the rent","start":{"date":"2026-01-15"},"end":{"date":"2026-01-16"},
 "recurrence":["RRULE:FREQ=MONTHLY;COUNT=12;BYMONTHDAY=15"],"transparency":"transparent"},
{"recurringEventId":"rent000","originalStartTime":{"date":"2026-03-15"},"summary":"Pay the rent and the deposit",
 "start":{"date":"2026-03-14"},"end":{"date":"2026-03-15"}},
{"recurringEventId":"rent000","originalStartTime":{"date":"2026-05-15"},"status":"cancelled"},
{"id":"lastfri","summary":"Last Friday dinner","start":{"dateTime":"2026-01-30T19:00:00-07:00","timeZone":"America/Phoenix"},
 "end":{"dateTime":"2026-01-30T22:00:00-07:00","timeZone":"America/Phoenix"},
 "recurrence":["RRULE:FREQ=MONTHLY;BYDAY=-1FR"]},
{"id":"bday00","summary":"Geburtstag von Zoë 🎂","start":{"date":"2026-04-09"},"end":{"date":"2026-04-10"},
 "recurrence":["RRULE:FREQ=YEARLY"],"reminders":{"useDefault":false,"overrides":[{"method":"popup","minutes":1440}]}},
{"id":"thanks0","summary":"Thanksgiving dinner","start":{"dateTime":"2026-11-26T17:00:00-05:00","timeZone":"America/New_York"},
 "end":{"dateTime":"2026-11-26T21:00:00-05:00","timeZone":"America/New_York"},
 "recurrence":["RRULE:FREQ=YEARLY;COUNT=5;BYMONTH=11;BYDAY=4TH"]},
{"id":"plants0","summary":"Water the plants","start":{"date":"2026-01-02"},"end":{"date":"2026-01-03"},
 "recurrence":["RRULE:FREQ=DAILY;INTERVAL=3;UNTIL=20260331"]},
{"recurringEventId":"plants0","originalStartTime":{"date":"2026-01-08"},"status":"cancelled"},
{"recurringEventId":"plants0","originalStartTime":{"date":"2026-01-11"},"status":"cancelled"},
{"recurringEventId":"plants0","originalStartTime":{"date":"2026-01-14"},"description":"With fertiliser"},
{"id":"course0","summary":"Course in Kolkata time","start":{"dateTime":"2026-02-02T18:30:00+05:30","timeZone":"Asia/Kolkata"},
 "end":{"dateTime":"2026-02-02T20:00:00+05:30","timeZone":"Asia/Kolkata"},
 "recurrence":["RRULE:FREQ=WEEKLY;COUNT=6;BYDAY=MO","EXDATE:20260209T130000Z"]}
])json";

constexpr std::string_view kTeamSeries = R"json([
{"id":"standup","summary":"Stand-up","start":{"dateTime":"2026-01-05T09:15:00+01:00","timeZone":"Europe/Berlin"},
 "end":{"dateTime":"2026-01-05T09:30:00+01:00","timeZone":"Europe/Berlin"},
 "recurrence":["RRULE:FREQ=WEEKLY;BYDAY=MO,TU,WE,TH,FR"],
 "attendees":[{"email":"first@provider.example","displayName":"First","self":true,"responseStatus":"accepted"},
  {"email":"second@provider.example","displayName":"Second","responseStatus":"tentative"}]},
{"recurringEventId":"standup","originalStartTime":{"dateTime":"2026-01-06T09:15:00+01:00","timeZone":"Europe/Berlin"},
 "status":"cancelled"},
{"recurringEventId":"standup","originalStartTime":{"dateTime":"2026-01-09T09:15:00+01:00","timeZone":"Europe/Berlin"},
 "summary":"Stand-up and demo","start":{"dateTime":"2026-01-09T14:00:00+01:00","timeZone":"Europe/Berlin"},
 "end":{"dateTime":"2026-01-09T15:00:00+01:00","timeZone":"Europe/Berlin"}},
{"recurringEventId":"standup","originalStartTime":{"dateTime":"2026-07-01T09:15:00+02:00","timeZone":"Europe/Berlin"},
 "location":"Terrace"},
{"id":"retro00","summary":"Retrospective","start":{"dateTime":"2026-01-08T13:00:00Z","timeZone":"UTC"},
 "end":{"dateTime":"2026-01-08T14:00:00Z","timeZone":"UTC"},"recurrence":["RRULE:FREQ=WEEKLY;INTERVAL=2;COUNT=20;BYDAY=TH"]},
{"id":"closing","summary":"Month end closing","start":{"date":"2026-01-31"},"end":{"date":"2026-02-01"},
 "recurrence":["RRULE:FREQ=MONTHLY;BYMONTHDAY=-1;COUNT=12"],"visibility":"confidential"},
{"id":"board00","summary":"Board meeting","start":{"dateTime":"2026-01-14T15:00:00Z"},"end":{"dateTime":"2026-01-14T17:00:00Z"},
 "recurrence":["RRULE:FREQ=MONTHLY;INTERVAL=3;BYDAY=WE;BYSETPOS=2;COUNT=4"],
 "organizer":{"email":"chair@provider.example","displayName":"The Chair"},
 "attendees":[{"email":"chair@provider.example","organizer":true,"responseStatus":"accepted"},
  {"email":"first@provider.example","self":true,"responseStatus":"declined"}]}
])json";

struct Holiday {
    std::string_view date;
    std::string_view next;
    std::string_view name;
    std::string_view rule;
};
constexpr Holiday kHolidays[] = {
    {"2026-01-01", "2026-01-02", "New Year's Day", "RRULE:FREQ=YEARLY"},
    {"2026-01-06", "2026-01-07", "Heilige Drei Könige", ""},
    {"2026-02-17", "2026-02-18", "설날", ""},
    {"2026-04-03", "2026-04-04", "Good Friday", ""},
    {"2026-04-05", "2026-04-07", "Easter", ""},
    {"2026-05-01", "2026-05-02", "Tag der Arbeit", "RRULE:FREQ=YEARLY"},
    {"2026-05-25", "2026-05-26", "Memorial Day", "RRULE:FREQ=YEARLY;BYMONTH=5;BYDAY=-1MO"},
    {"2026-07-14", "2026-07-15", "Fête nationale", "RRULE:FREQ=YEARLY;UNTIL=20400714"},
    {"2026-10-03", "2026-10-04", "Tag der Deutschen Einheit", "RRULE:FREQ=YEARLY"},
    {"2026-12-25", "2026-12-27", "Weihnachten", "RRULE:FREQ=YEARLY"},
};

constexpr std::array<std::string_view, 16> kTitles = {"Dentist",
                                                      "Coffee with Ana",
                                                      "Planning",
                                                      "Flight to Lisbon",
                                                      "Naïve café reading",
                                                      "Überprüfung",
                                                      "会議",
                                                      "Встреча",
                                                      "Doctor",
                                                      "Concert 🎻",
                                                      "Parents' evening",
                                                      "Code \"review\"",
                                                      "Tax papers",
                                                      "Yoga",
                                                      "שיחה עם ההנהלה",
                                                      "Moving day"};
constexpr std::array<std::string_view, 6> kPlaces = {"",       "Room 4.12", "Café Zürich",
                                                     "Online", "東京駅",    "12 Long Street, Apartment 3"};

// Zones without summer time, so that an offset is right on every date.
struct Zone {
    std::string_view name;
    int offset;
};
constexpr std::array<Zone, 6> kZones = {{{"UTC", 0},
                                         {"Asia/Seoul", 32400},
                                         {"America/Phoenix", -25200},
                                         {"Africa/Lagos", 3600},
                                         {"Asia/Kolkata", 19800},
                                         {"Asia/Tokyo", 32400}}};

// The same numbers from every standard library, which its distributions do not promise.
class Numbers {
public:
    explicit Numbers(std::uint32_t seed) : mState(seed) {}
    std::uint32_t below(std::uint32_t limit) {
        mState = mState * 1664525U + 1013904223U;
        return (mState >> 8U) % limit;
    }
    bool oneIn(std::uint32_t n) { return below(n) == 0; }
    template <class T, std::size_t N>
    const T& pick(const std::array<T, N>& from) {
        return from[below(N)];
    }

private:
    std::uint32_t mState;
};

void addTimes(Json& body, Numbers& numbers) {
    constexpr std::int64_t kYearStart = 1767225600;  // 2026-01-01
    const std::int64_t day = kYearStart + numbers.below(365) * kSecondsPerDay;
    if (numbers.oneIn(4)) {
        body["start"]["date"] = formatDate(day);
        body["end"]["date"] = formatDate(day + (1 + numbers.below(3)) * kSecondsPerDay);
        return;
    }
    const Zone& zone = numbers.pick(kZones);
    const std::int64_t start = day + numbers.below(96) * 900;
    const std::int64_t end = start + (1 + numbers.below(12)) * 900;
    for (const auto& [name, time] : {std::pair("start", start), std::pair("end", end)}) {
        body[name]["dateTime"] = formatDateTime(time, zone.offset);
        if (!numbers.oneIn(5)) body[name]["timeZone"] = zone.name;
    }
}

void addAttendees(Json& body, Numbers& numbers) {
    constexpr std::array<std::string_view, 4> kAnswers = {"needsAction", "accepted", "declined", "tentative"};
    constexpr std::array<std::string_view, 3> kGuests = {"ana@provider.example", "bo@provider.example",
                                                         "zoë.müller@provider.example"};
    for (const std::string_view guest : kGuests) {
        if (numbers.oneIn(2)) continue;
        Json attendee;
        attendee["email"] = guest;
        if (numbers.oneIn(2)) attendee["displayName"] = "Guest " + std::to_string(numbers.below(90));
        attendee["responseStatus"] = numbers.pick(kAnswers);
        body["attendees"].push_back(attendee);
    }
}

void addReminders(Json& body, Numbers& numbers) {
    constexpr std::array<int, 4> kMinutes = {0, 10, 60, 1440};
    body["reminders"]["useDefault"] = false;
    body["reminders"]["overrides"] = Json::array();
    for (std::uint32_t i = numbers.below(3); i > 0; --i) {
        Json reminder;
        reminder["method"] = numbers.oneIn(3) ? "email" : "popup";
        reminder["minutes"] = numbers.pick(kMinutes);
        body["reminders"]["overrides"].push_back(reminder);
    }
}

void addSingles(Calendar& calendar, int count, std::uint32_t seed) {
    constexpr std::array<std::string_view, 4> kVisibility = {"default", "public", "private", "confidential"};
    Numbers numbers(seed);
    for (int i = 0; i < count; ++i) {
        Json body;
        body["summary"] = std::string(numbers.pick(kTitles)) + " " + std::to_string(i + 1);
        const std::string_view place = numbers.pick(kPlaces);
        if (!place.empty()) body["location"] = place;
        if (numbers.oneIn(3))
            body["description"] = "Bring the papers.\nSecond line, with \"quotes\" and a tab\t.";
        if (numbers.oneIn(25)) {
            std::string text;
            for (int line = 0; line < 120; ++line)
                text += "Line " + std::to_string(line) + " of a long agenda – ✓\n";
            body["description"] = text;
        }
        addTimes(body, numbers);
        if (numbers.oneIn(3)) addAttendees(body, numbers);
        if (numbers.oneIn(3)) addReminders(body, numbers);
        if (numbers.oneIn(4)) body["visibility"] = numbers.pick(kVisibility);
        if (numbers.oneIn(4)) body["transparency"] = numbers.oneIn(2) ? "transparent" : "opaque";
        if (numbers.oneIn(8)) body["status"] = "tentative";
        calendar.insert(body);
    }
}

void addAll(Calendar& calendar, std::string_view events) {
    for (const Json& event : Json::parse(events)) calendar.insert(event, {"", true});
}

Calendar& addCalendar(Store& store, Account& account, const char* calendarId, const char* summary,
                      const char* color, const char* role) {
    Json members;
    members["id"] = calendarId;
    members["summary"] = summary;
    members["backgroundColor"] = color;
    members["accessRole"] = role;
    return store.addCalendar(account, members);
}

}  // namespace

namespace {

struct SampleTask {
    const char* title;
    const char* notes;
    const char* due;
    const char* completed;
};
constexpr SampleTask kHomeTasks[] = {
    {"Buy stamps", "", "2026-03-02T00:00:00Z", ""},
    {"Call the dentist", "Ask for a\nMonday", "2026-03-03T00:00:00Z", ""},
    {"Water the plants", "", "", ""},
    {"Renew the \"season\" ticket", "It's due soon", "2026-03-31T00:00:00Z", ""},
    {"Return library books", "", "2026-02-20T00:00:00Z", "2026-02-19T17:30:00Z"},
    {"Plan the trip \xF0\x9F\x9A\x86", "Trains, then a hotel", "", ""},
    {"", "A task without a title", "", ""},
    {"Sort photographs", "", "", "2026-01-11T09:00:00Z"},
};
constexpr SampleTask kWorkTasks[] = {
    {"Write the report", "Figures from last quarter", "2026-03-06T00:00:00Z", ""},
    {"Book the meeting room", "", "2026-03-04T00:00:00Z", ""},
    {"Review the design", "", "", "2026-02-27T14:00:00Z"},
    {"Ligne d'attente \xC3\xA9t\xC3\xA9", "", "2026-06-01T00:00:00Z", ""},
    {"Order a keyboard", "Quiet one", "", ""},
    {"Clean up the shared folder", "", "2026-04-01T00:00:00Z", ""},
};

template <std::size_t N>
void addTasks(Store& store, Account& account, const char* id, const char* title,
              const SampleTask (&rows)[N]) {
    TaskList& list = store.addTaskList(account, {{"id", id}, {"title", title}});
    for (const SampleTask& row : rows) {
        Json body = {{"title", row.title}};
        if (*row.notes != '\0') body["notes"] = row.notes;
        if (*row.due != '\0') body["due"] = row.due;
        if (*row.completed != '\0') {
            body["status"] = "completed";
            body["completed"] = row.completed;
        }
        list.insert(body, false);
    }
}

}  // namespace

void seedSample(Store& store) {
    Account& first = store.addAccount("first@provider.example", "First Person");
    Account& second = store.addAccount("second@provider.example", "Second Person");

    Calendar& personal = addCalendar(store, first, "first@provider.example", "Personal", "#9fe1e7", "owner");
    addAll(personal, kPersonalSeries);
    addSingles(personal, 180, 11);

    Calendar& team = addCalendar(store, first, "team@group.provider.example", "Team", "#f83a22", "owner");
    addAll(team, kTeamSeries);
    addSingles(team, 110, 12);
    store.share(second, team.id, "writer");

    Calendar& holidays =
        addCalendar(store, first, "holidays@group.provider.example", "Holidays", "#16a765", "reader");
    for (const Holiday& row : kHolidays) {
        Json body;
        body["summary"] = row.name;
        body["start"]["date"] = row.date;
        body["end"]["date"] = row.next;
        body["transparency"] = "transparent";
        if (!row.rule.empty()) body["recurrence"].push_back(row.rule);
        holidays.insert(body);
    }

    Calendar& other =
        addCalendar(store, second, "second@provider.example", "Second's own", "#ac725e", "owner");
    addSingles(other, 60, 13);

    addTasks(store, first, "first-home", "Home", kHomeTasks);
    addTasks(store, first, "first-work", "Work", kWorkTasks);
    addTasks(store, second, "second-home", "Second's list", kHomeTasks);
    seedContacts(store, first.email);
}

}  // namespace provider
