// import of files as other programs write them, and of broken ones.
#include <gmock/gmock.h>

#include "cli/ExchangeFixture.h"

namespace {

using testing::HasSubstr;

std::string calendar(const std::string& lines) {
    return "BEGIN:VCALENDAR\r\nVERSION:2.0\r\n" + lines + "END:VCALENDAR\r\n";
}

std::string event(const std::string& lines) {
    return "BEGIN:VEVENT\nUID:u\nSUMMARY:s\n" + lines + "END:VEVENT\n";
}

std::string card(const std::string& lines) {
    return "BEGIN:VCARD\nVERSION:3.0\n" + lines + "END:VCARD\n";
}

constexpr const char* kOwnZone =
    "BEGIN:VTIMEZONE\nTZID:Own\nBEGIN:STANDARD\nDTSTART:19701025T030000\nRRULE:FREQ=YEARLY;BYDAY=-1SU;"
    "BYMONTH=10\n"
    "TZOFFSETFROM:+0200\nTZOFFSETTO:+0100\nEND:STANDARD\nBEGIN:DAYLIGHT\nDTSTART:19700329T020000\n"
    "RRULE:FREQ=YEARLY;BYDAY=-1SU;BYMONTH=3\nTZOFFSETFROM:+0100\nTZOFFSETTO:+0200\nEND:DAYLIGHT\nEND:"
    "VTIMEZONE\n";

struct Sample {
    const char* name;
    std::string lines;
    std::string fields;  // that the one item must have
    Json notHeld = Json::object();
};

// Whether the item has all members of the text.
void expectFields(const Json& item, const std::string& text) {
    const Json wanted = Json::parse(text);
    for (const auto& member : wanted.items())
        EXPECT_EQ(item.at(member.key()), member.value()) << member.key();
}

const std::vector<Sample>& eventSamples() {
    static const std::vector<Sample> kSamples = {
        {"a name of the database",
         event("DTSTART;TZID=America/New_York:20260701T080000\nDTEND:20260701T130000Z\n"),
         R"({"start": "2026-07-01T12:00:00Z", "end": "2026-07-01T13:00:00Z", "timeZone": "America/New_York"})"},
        {"a name of another system",
         event("DTSTART;TZID=\"W. Europe Standard Time\":20260701T080000\nDURATION:PT1H30M\n"),
         R"({"start": "2026-07-01T06:00:00Z", "end": "2026-07-01T07:30:00Z", "timeZone": "Europe/Berlin"})"},
        {"a name at the end of a path", event("DTSTART;TZID=/x.example/2026/Asia/Tokyo:20260701T080000\n"),
         R"({"start": "2026-06-30T23:00:00Z", "end": "2026-06-30T23:00:00Z", "timeZone": "Asia/Tokyo"})"},
        {"a zone of the file, defined behind the event",
         event("DTSTART;TZID=Own:20260701T080000\n") + kOwnZone, R"({"start": "2026-07-01T06:00:00Z"})"},
        {"an unknown zone",
         event("DTSTART;TZID=Nowhere:20260701T080000\n"),
         R"({"start": "2026-07-01T06:00:00Z", "timeZone": "Europe/Berlin"})",
         {{"unknown time zones, read as Europe/Berlin", 1}}},
        {"a time without a zone, in lower case",
         "begin:vevent\nsummary:s\ndtstart:20260701t080000\nend:vevent\n",
         R"({"start": "2026-07-01T06:00:00Z", "timeZone": "Europe/Berlin"})",
         {{"times without a zone, read as those of Europe/Berlin", 1}}},
        {"a time that is skipped, and one that comes twice",
         event("DTSTART;TZID=Europe/Berlin:20260329T023000\nDTEND;TZID=Europe/Berlin:20261025T023000\n"),
         R"({"start": "2026-03-29T01:30:00Z", "end": "2026-10-25T00:30:00Z"})"},
        {"a day without an end", event("DTSTART;VALUE=DATE:20260228\n"),
         R"({"start": "2026-02-28", "end": "2026-03-01"})"},
        {"days by their number", event("DTSTART;VALUE=DATE:20260228\nDURATION:P1W\n"),
         R"({"end": "2026-03-07"})"},
        {"a day across the change of the clocks, by its length",
         event("DTSTART;TZID=Europe/Berlin:20260328T120000\nDURATION:P1DT1H\n"
               "BEGIN:VALARM\nACTION:DISPLAY\nTRIGGER;RELATED=END:-PT24H30M\nEND:VALARM\n"
               "BEGIN:VALARM\nACTION:DISPLAY\nTRIGGER:-P1D\nEND:VALARM\n"),
         R"({"start": "2026-03-28T11:00:00Z", "end": "2026-03-29T11:00:00Z", "reminders": [30, 1440]})"},
        {"hours across the change of the clocks",
         event("DTSTART;TZID=Europe/Berlin:20260328T120000\nDURATION:PT24H\n"),
         R"({"end": "2026-03-29T11:00:00Z"})"},
        {"a week across the change of the clocks in autumn",
         event("DTSTART;TZID=Europe/Berlin:20261020T120000\nDURATION:P1W\n"),
         R"({"end": "2026-10-27T11:00:00Z"})"},
        {"a day of UTC", event("DTSTART:20260328T120000Z\nDURATION:P1D\n"),
         R"({"end": "2026-03-29T12:00:00Z"})"},
        {"an alarm before an end of another zone, across the change of the clocks",
         event("DTSTART;TZID=Europe/Berlin:20260329T010000\nDTEND:20260329T020000Z\n"
               "BEGIN:VALARM\nACTION:DISPLAY\nTRIGGER;RELATED=END:-PT2H30M\nEND:VALARM\n"),
         R"({"start": "2026-03-29T00:00:00Z", "end": "2026-03-29T02:00:00Z", "reminders": [30]})"},
        {"an alarm before the end of a day without an end",
         event("DTSTART;VALUE=DATE:20260228\nBEGIN:VALARM\nACTION:DISPLAY\n"
               "TRIGGER;RELATED=END:-P1DT1H\nEND:VALARM\n"),
         R"({"reminders": [60]})"},
        {"words of all kinds",
         event("DTSTART:20260701T080000Z\nCLASS:confidential\nTRANSP:TRANSPARENT\nSTATUS:X-NEW\nSUMMARY:"
               "second\n"),
         R"({"summary": "s", "visibility": "private", "busy": false, "status": ""})",
         {{"CLASS:CONFIDENTIAL", 1}, {"STATUS:X-NEW", 1}, {"SUMMARY (a second one)", 1}}},
        {"people",
         event("DTSTART:20260701T080000Z\nORGANIZER;CN=\"Doe, J\":MAILTO:j%2Bd@example.com\n"
               "ATTENDEE;ROLE=CHAIR;PARTSTAT=DELEGATED;CUTYPE=INDIVIDUAL:mailto:a@example.com\nATTENDEE:urn:"
               "uuid:1\n"
               "ATTENDEE;EMAIL=b@example.com:urn:uuid:2\n"),
         R"({"organizer": {"name": "Doe, J", "email": "j+d@example.com"},
             "attendees": [{"name": "", "email": "a@example.com", "status": "needsAction"}, {"name": "",
             "email": "b@example.com", "status": "needsAction"}]})",
         {{"ATTENDEE (without an e-mail address)", 1}, {"ATTENDEE;PARTSTAT", 1}, {"ATTENDEE;ROLE", 1}}},
        {"alarms",
         event("DTSTART:20260701T080000Z\nDTEND:20260701T090000Z\n"
               "BEGIN:VALARM\nACTION:DISPLAY\nTRIGGER;RELATED=END:-PT1H30M\nEND:VALARM\n"
               "BEGIN:VALARM\nACTION:AUDIO\nTRIGGER;VALUE=DATE-TIME:20260701T075900Z\nEND:VALARM\n"
               "BEGIN:VALARM\nACTION:DISPLAY\nTRIGGER:-P1DT5S\nEND:VALARM\nBEGIN:VALARM\nACTION:"
               "DISPLAY\nTRIGGER:PT5M\nEND:VALARM\n"
               "BEGIN:VALARM\nACTION:EMAIL\nTRIGGER:-PT5M\nEND:VALARM\n"),
         R"({"reminders": [30, 1, 1441]})",
         {{"VALARM (EMAIL)", 1},
          {"VALARM (not before the start)", 1},
          {"VALARM (seconds)", 1},
          {"VALARM (the sound)", 1}}},
        {"a rule spelt differently",
         event("DTSTART;TZID=Europe/"
               "Berlin:20260701T080000\nRRULE:byday=+1MO;FREQ=monthly;UNTIL=20261201T080000;\n"),
         R"({"rrule": "FREQ=MONTHLY;BYDAY=1MO;UNTIL=20261201T070000Z"})"},
        {"instances named by their date",
         event("DTSTART;TZID=Europe/"
               "Berlin:20260701T080000\nRRULE:FREQ=DAILY\nEXDATE;VALUE=DATE:20260702,20261201\n"),
         R"({"exdates": ["2026-07-02T06:00:00Z", "2026-12-01T07:00:00Z"]})"},
        {"an instance without its series",
         event("DTSTART:20260701T080000Z\nRECURRENCE-ID:20260701T070000Z\n"),
         R"({"recurrenceId": ""})",
         {{"RECURRENCE-ID (without its series; taken as an event of its own)", 1}}},
        {"what is not known",
         event("DTSTART:20260701T080000Z\nX-A:1\nx-a:2\nGEO:1;2\nno "
               "line\nSEQUENCE:3\nBEGIN:X-C\nBEGIN:X-C\nEND:X-C\nEND:X-C\n"),
         R"({"summary": "s"})",
         {{"GEO", 1}, {"X-A", 2}, {"X-C", 1}, {"malformed lines", 1}}},
        {"a byte order mark within a folded text",
         event("DTSTART:20260701T080000Z\nDESCRIPTION:a\\,b\\nc \n  d\\\\n\\q\n"),
         R"({"description": "a,b\nc  d\\n\\q"})"}};
    return kSamples;
}

const std::vector<Sample>& cardSamples() {
    static const std::vector<Sample> kSamples = {
        {"3.0, as many write it",
         card("N:Doe;John;Philip,Paul;;\nFN:John Philip, Paul "
              "Doe\nTEL;TYPE=HOME,VOICE,pref:1\nTEL;TYPE=cell;TYPE=work:2\nEMAIL;TYPE=INTERNET,PREF:a@b\n"
              "ADR;TYPE=home:;;A;;;;\nADR:;;;;;;\nORG:O;D;E\nTITLE:t\nBDAY;VALUE=date:1990-02-28T00:00:"
              "00Z\nPHOTO;ENCODING=b;TYPE=JPEG:/9j/\nX-SKYPE:s\nURL:http\\://u\n"),
         R"({"name": {"first": "John", "middle": "Philip, Paul", "last": "Doe", "prefix": "", "suffix": "",
             "phoneticFirst": "", "phoneticMiddle": "", "phoneticLast": ""},
             "phones": [{"value": "1", "type": "home", "label": "", "primary": true}, {"value": "2",
             "type": "work_mobile", "label": "", "primary": false}],
             "companies": [{"name": "O", "title": "t", "department": "D, E", "description": "", "location": "",
             "symbol": "", "type": "other", "label": ""}],
             "messengers": [{"value": "s", "protocol": "SKYPE", "label": ""}], "urls": [{"value": "http://u",
             "type": "other", "label": ""}],
             "events": [{"date": "1990-02-28", "type": "birthday", "label": ""}], "photo": true})",
         {{"EMAIL;PREF", 1}}},
        {"labels of another maker",
         card("N:Doe\nitem1.TEL:1\nitem1.X-ABLabel:_$!<Work>!$_\nitem2.TEL:2\nitem2.X-ABLabel:Boat\nitem3.X-"
              "ABRELATEDNAMES:S\n"
              "item3.X-ABLabel:_$!<Sister>!$_\nitem4.X-ABDATE:2015-05-01\nitem4.X-ABLabel:_$!<Anniversary>!$_"
              "\n"
              "item5.URL:u\nitem5.X-ABLabel:_$!<HomePage>!$_\nBDAY;X-APPLE-OMIT-YEAR=1604:1604-02-03\nIMPP;X-"
              "SERVICE-TYPE=Jabber:x-apple:j@k\n"),
         R"({"phones": [{"value": "1", "type": "work", "label": "", "primary": false}, {"value": "2",
             "type": "custom", "label": "Boat", "primary": false}],
             "relations": [{"name": "S", "type": "sister", "label": ""}], "events": [{"date": "2015-05-01",
             "type": "anniversary", "label": ""}],
             "urls": [{"value": "u", "type": "custom", "label": "HomePage"}], "messengers": [{"value": "j@k",
             "protocol": "JABBER", "label": ""}]})",
         {{"BDAY (no whole date)", 1}}},
        {"2.1",
         "BEGIN:VCARD\r\nVERSION:2.1\r\nN;CHARSET=ISO-8859-1;ENCODING=QUOTED-PRINTABLE:D=F6e;J=\r\n="
         "F6\r\nTEL;WORK;FAX:1\r\nNOTE;QUOTED-PRINTABLE:a=0D=0Ab=\r\n c\r\n"
         "PHOTO;JPEG;BASE64:/9j/\r\n /9j/\r\n\r\nAGENT:\r\nBEGIN:VCARD\r\nN:In\r\nEND:VCARD\r\nEND:VCARD\r\n",
         R"({"phones": [{"value": "1", "type": "work_fax", "label": "", "primary": false}], "note": "a\nb c"})",
         {{"cards inside cards", 1}}},
        {"4.0",
         "BEGIN:VCARD\nVERSION:4.0\nFN:Full "
         "Name\nNICKNAME:a,b\nTEL;VALUE=uri;TYPE=\"video,home\":tel:+1-2\nRELATED;TYPE=colleague;VALUE=text:"
         "R\n"
         "RELATED;TYPE=friend:urn:uuid:1\nIMPP:sip:s@t\nANNIVERSARY:--0501\nPHOTO:https://p.example/"
         "x.jpg\nGENDER:F\nKIND:individual\nEND:VCARD\n",
         R"({"nickname": "a, b", "phones": [{"value": "+1-2", "type": "home", "label": "", "primary": false}],
             "relations": [{"name": "R", "type": "custom", "label": "colleague"}], "messengers": [{"value": "s@t",
             "protocol": "custom", "label": "sip"}]})",
         {{"ANNIVERSARY (no whole date)", 1},
          {"GENDER", 1},
          {"PHOTO (a link)", 1},
          {"RELATED (a link)", 1},
          {"TEL;TYPE=VIDEO", 1}}}};
    return kSamples;
}

}  // namespace

TEST_F(Exchange, TakesCalendarsAsOthersWriteThem) {
    for (const Sample& sample : eventSamples()) {
        SCOPED_TRACE(sample.name);
        const int fresh = ToolRoot::addCalendar(7, "Fresh");
        const std::string path = file("sample.ics", "\xEF\xBB\xBF" + calendar(sample.lines));
        EXPECT_EQ(importCalendar(path, fresh)["notHeld"], sample.notHeld);
        const std::vector<Json> got = events(fresh);
        ASSERT_EQ(got.size(), 1U);
        expectFields(got[0], sample.fields);
        EXPECT_EQ(importCalendar(path, fresh)["added"], 0);
    }
}

TEST_F(Exchange, TakesCardsAsOthersWriteThem) {
    int account = 20;
    for (const Sample& sample : cardSamples()) {
        SCOPED_TRACE(sample.name);
        ToolRoot::addAddressBook(++account);
        const std::string path = file("sample.vcf", sample.lines);
        const Json report = importCards(path, account);
        EXPECT_EQ(report["notHeld"], sample.notHeld);
        std::vector<Json> got = contacts(account);
        ASSERT_EQ(got.size(), 1U);
        got[0]["photo"] = got[0]["photo"] != "";
        expectFields(got[0], sample.fields);
        EXPECT_EQ(importCards(path, account)["added"], 0);
    }
}

TEST_F(Exchange, ASeriesAndItsInstancesMayStandAnywhere) {
    const std::string instance =
        "BEGIN:VEVENT\nUID:u\nSUMMARY:moved\nDTSTART:20260703T100000Z\nRECURRENCE-ID";
    const std::string lines =
        instance + ";TZID=Europe/Berlin:20260703T080000\nEND:VEVENT\n" +
        event(
            "DTSTART;TZID=Europe/Berlin:20260701T080000\nRRULE:FREQ=DAILY\nEXDATE;TZID=Europe/"
            "Berlin:20260705T080000\n") +
        instance + ";VALUE=DATE:20260704\nRRULE:FREQ=DAILY\nEND:VEVENT\n" + instance +
        ":20260705T060000Z\nEND:VEVENT\n" + instance + ":20260704T060000Z\nEND:VEVENT\n";
    const std::string path = file("series.ics", calendar(lines));
    const Json report = importCalendar(path, mCalendars[0]);
    EXPECT_EQ(report["added"], 1);
    EXPECT_EQ(report["notHeld"], Json({{"changed instances that are cancelled too", 1},
                                       {"instances that are changed twice (the later counts)", 1}}));
    std::vector<std::string> instances;
    for (const Json& got : events(mCalendars[0])) instances.push_back(got["recurrenceId"]);
    EXPECT_THAT(instances, testing::UnorderedElementsAre("", "20260703T060000Z", "20260704T060000Z"));
    EXPECT_EQ(importCalendar(path, mCalendars[0])["skipped"]["same"], 1);
}

TEST_F(Exchange, WhatIsBrokenIsToldAndTheRestTaken) {
    const std::string good = event("DTSTART:20260701T080000Z\n");
    const std::string other = "BEGIN:VEVENT\nSUMMARY:other\nDTSTART:20260701T080000Z\nEND:VEVENT\n";
    const std::string goodCard = card("N:Good\n");
    const auto timed = [](const std::string& lines) { return event("DTSTART:20260701T080000Z\n" + lines); };
    struct Row {
        const char* name;
        std::string content;
        int added;
        int unreadable;
        const char* error;
    };
    const std::string deep = hostile::repeated("BEGIN:X\n", 10'000);
    const Row rows[] = {
        {"cut in an event", "BEGIN:VCALENDAR\n" + good + "BEGIN:VEVENT\nSUMMARY:half", 1, 1,
         "ends in the middle, at line 8"},
        {"cut behind an event", "BEGIN:VCALENDAR\n" + good, 1, 0, "ends in the middle"},
        {"cut in a card", goodCard + "BEGIN:VCARD\nN:Ha", 1, 1, "skipped \"\" (line 5): it is not closed"},
        {"an event that is not closed", calendar("BEGIN:VEVENT\nSUMMARY:open\n" + good), 1, 1,
         "skipped \"open\" (line 3): it is not closed"},
        {"a calendar closed too early",
         "BEGIN:VCALENDAR\n" + good + "BEGIN:VEVENT\nEND:VCALENDAR\n" + calendar(other), 2, 1, "not closed"},
        {"nested too deep",
         calendar("BEGIN:VEVENT\nSUMMARY:deep\n" + deep + hostile::repeated("END:X\n", 10'000) +
                  "END:VEVENT\n" + good),
         1, 1, "too deep"},
        {"nested too deep and never closed", calendar("BEGIN:VEVENT\n" + deep + good), 1, 1, "too deep"},
        {"a line of 30 MB", calendar(timed("X-LONG:" + hostile::repeated("x,;\\", 7'500'000) + "\n") + other),
         2, 0, "X-LONG"},
        {"a line of 60 MB",
         calendar(timed("DESCRIPTION:" + hostile::repeated("xxxxxx", 10'000'000) + "\n") + other), 2, 0,
         "DESCRIPTION (too long)"},
        {"an item of 80 MB",
         calendar("BEGIN:VEVENT\n" + hostile::repeated("X-A:" + std::string(1000, 'x') + "\n", 80'000) +
                  "END:VEVENT\n" + good),
         1, 1, "larger than 64 MB"},
        {"a NUL", calendar(timed(std::string("DESCRIPTION:a\0b\n", 16)) + good), 1, 1, "line 7 is not UTF-8"},
        {"not UTF-8", calendar(timed("LOCATION:\xFF\n") + good), 1, 1, "line 7 is not UTF-8"},
        {"a card that is not UTF-8", card("N:\xFF\n") + goodCard, 1, 1, "line 3 is not UTF-8"},
        {"no start", calendar(event("") + good), 1, 1, "no DTSTART"},
        {"an impossible time", calendar(event("DTSTART:20260230T080000Z\n") + good), 1, 1,
         "DTSTART is no time"},
        {"an end before the start", calendar(timed("DTEND:20260701T070000Z\n") + good), 1, 1, "lies before"},
        {"a length of two million years",
         calendar(kOwnZone + event("DTSTART;TZID=Own:20260701T080000\nDURATION:P99999999W\n") + good), 1, 1,
         "DURATION cannot be read"},
        {"a length of ten thousand years",
         calendar(kOwnZone + event("DTSTART;TZID=Own:20260701T080000\nDURATION:P500000W\n") + good), 1, 1,
         ""},
        {"a day that ends at a time",
         calendar(event("DTSTART;VALUE=DATE:20260701\nDTEND:20260702T000000Z\n") + good), 1, 1,
         "must be a date"},
        {"a rule that cannot be held", calendar(timed("RRULE:FREQ=SECONDLY\n") + good), 1, 1,
         "FREQ=SECONDLY"},
        {"a rule that is none", calendar(timed("RRULE:BOGUS\n") + good), 1, 1, "cannot be read"},
        {"a rule of another calendar", calendar(timed("RRULE:RSCALE=CHINESE;FREQ=YEARLY\n") + good), 1, 1,
         "cannot be read"},
        {"two rules", calendar(timed("RRULE:FREQ=DAILY\nRRULE:FREQ=WEEKLY\n") + good), 1, 1,
         "more than one rule"},
        {"a zone without end",
         calendar("BEGIN:VTIMEZONE\nTZID:Evil\nBEGIN:STANDARD\nDTSTART:00010101T000000\nRRULE:FREQ="
                  "SECONDLY\nTZOFFSETFROM:+0000\n"
                  "TZOFFSETTO:+0100\nEND:STANDARD\nEND:VTIMEZONE\n" +
                  event("DTSTART;TZID=Evil:20260701T080000\n")),
         1, 0, "unknown time zones"},
        {"a photo of 30 MB", card("N:Big\nPHOTO;ENCODING=b:" + hostile::repeated("AAAA", 10'000'000) + "\n"),
         1, 0, ""},
        {"a photo that is too large",
         card("N:Bigger\nPHOTO;ENCODING=b:" + hostile::repeated("AAAA", 12'000'000) + "\n"), 1, 0,
         "PHOTO (larger than 32 MB)"},
        {"a photo that is none", card("N:No\nPHOTO;ENCODING=b:%%%\nPHOTO:data:,x\n"), 1, 0,
         "PHOTO (not an image)"},
        {"an empty card", card("") + goodCard, 1, 0, "it says nothing"},
        {"a list of contacts", card("KIND:group\nFN:all\n") + goodCard, 1, 0,
         "skipped \"all\" (line 1): it is a list"}};
    int account = 20;
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        const bool isCards = row.content.starts_with("BEGIN:VCARD");
        const std::string path = file("bad", row.content);
        const int fresh = isCards ? ++account : ToolRoot::addCalendar(7, "Fresh");
        if (isCards) ToolRoot::addAddressBook(fresh);
        const std::string place = std::to_string(fresh);
        std::vector<std::string> arguments = {path, isCards ? "--account" : "--calendar", place};
        const bool isWhole =
            row.unreadable == 0 && std::string(row.error).find("in the middle") == std::string::npos;
        std::string error;
        const Json report = import(arguments, isWhole ? 0 : 1, &error);
        EXPECT_EQ(report["added"], row.added);
        EXPECT_EQ(report["skipped"]["unreadable"], row.unreadable);
        EXPECT_THAT(error, HasSubstr(row.error));
        EXPECT_EQ((isCards ? contacts(fresh) : events(fresh)).size(), static_cast<size_t>(row.added));
    }
    for (const std::string& content :
         {std::string(), std::string("{}"),
          std::string("\xFF\xFE"
                      "B\0E\0",
                      6),
          std::string("BEGIN:VEVENT\n"), std::string(1000, '\0'), std::string("END:VCALENDAR\n")}) {
        const CommandResult result =
            mTool.run({"import", file("none", content), "--calendar", std::to_string(mCalendars[0])});
        EXPECT_EQ(result.status, 1);
        EXPECT_EQ(std::count(result.error.begin(), result.error.end(), '\n'), 1) << result.error;
    }
}

TEST_F(Exchange, TakesOrRefusesEveryCalendarOfTheCorpus) {
    int files = 0;
    int taken = 0;
    for (const auto& entry : std::filesystem::directory_iterator(VPS_CORPUS_DIR "/icalendar")) {
        if (entry.path().extension() != ".ics") continue;
        SCOPED_TRACE(entry.path());
        ++files;
        // Some are components without their calendar.
        const std::string content = hostile::contentOf(entry.path());
        const bool isWhole = content.find("BEGIN:VCALENDAR") != std::string::npos;
        const std::string path =
            isWhole ? entry.path().string() : file("wrapped", calendar(content + "\r\n"));
        for (const int place : {mCalendars[0], mLists[0]}) {
            const CommandResult result = mTool.run({"import", path, "--calendar", std::to_string(place),
                                                    "--time-zone", "Europe/Berlin", "--json"});
            EXPECT_TRUE(result.status == 0 || result.status == 1) << result.status << result.error;
            const Json report = Json::parse(result.output, nullptr, /*allow_exceptions=*/false);
            if (!report.is_discarded()) taken += report["added"].get<int>();
            if (!report.is_discarded()) {
                int sum = report["added"].get<int>();
                for (const auto& skipped : report["skipped"].items()) sum += skipped.value().get<int>();
                EXPECT_EQ(report["read"], sum) << "each item has come to something";
            }
        }
    }
    EXPECT_EQ(files, 150);
    EXPECT_EQ(taken, 78);
    const std::string path = exported("events", "--calendar", std::to_string(mCalendars[0]));
    importCalendar(path, mCalendars[1]);
    EXPECT_EQ(events(mCalendars[1]), events(mCalendars[0]));
    importCalendar(exported("todos", "--calendar", std::to_string(mLists[0])), mLists[1]);
    EXPECT_EQ(todos(mLists[1]), todos(mLists[0]));
}
