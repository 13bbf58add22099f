// ICalendarWriter.h: events and to-dos as the components of a calendar file (RFC 5545).
#pragma once

#include <map>
#include <string>

#include "Output.h"
#include "exchange/ContentLine.h"
#include "exchange/NotHeld.h"
#include "exchange/TimeZones.h"

namespace exchange {

// What an instance needs of its series.
struct SeriesPlace {
    std::string uid;
    std::string zone;
};

class ICalendarWriter {
public:
    ICalendarWriter(TimeZones& zones, NotHeld& losses) : mZones(zones), mLosses(losses) {}

    static std::string header();
    static std::string footer() { return "END:VCALENDAR\r\n"; }

    // Tells of an event before the zones are written.
    void noteZone(const Json& event);
    // The zones of all events that were told of.
    [[nodiscard]] std::string zones() const;

    // `series` is NULL but for a changed instance. "" when a time of it has no spelling (a year beyond 9999).
    std::string event(const Json& event, const std::string& uid, const SeriesPlace* series);
    std::string todo(const Json& todo, const std::string& uid);

private:
    void add(const ContentLine& line) { mText += content_line::compose(line); }
    void addText(const std::string& name, const std::string& text);
    void addPerson(const char* name, const Json& person);
    void addExdates(const Json& event);
    // False when it has no spelling. The zone is "" for UTC.
    [[nodiscard]] bool addTime(const char* name, const std::string& time, const std::string& zone);
    // The event's zone when all its times can be named in it, else "".
    [[nodiscard]] std::string zoneFor(const Json& event);
    void addShared(const Json& item, const std::string& uid, bool isTodo);
    void addAlarms(const Json& event);

    TimeZones& mZones;
    NotHeld& mLosses;
    std::map<std::string, int64_t> mZoneStarts;  // the earliest time in each zone
    std::string mText;                           // of the component that is being written
};

}  // namespace exchange
