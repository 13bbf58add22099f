// TimeZones.h: time zones by the names that files and records use, and wall times in them.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>

#include <unicode/basictz.h>

#include "exchange/FileZone.h"

namespace exchange {

// Seconds are those since 1970; a wall time counts them as if its zone were UTC.
class TimeZone {
public:
    TimeZone(std::unique_ptr<icu::BasicTimeZone> zone, std::string name);
    TimeZone(FileZone zone, std::string name);

    // As the time zone database has it; "" for a zone of a file that is like none there. A zone of a file is only
    // read with.
    [[nodiscard]] const std::string& name() const { return mName; }
    // A wall time that is skipped counts with the offset before the gap, one that comes twice is the first.
    [[nodiscard]] int64_t toUtc(int64_t wallSec) const;
    [[nodiscard]] int64_t toWall(int64_t utcSec) const;
    // Whether the wall time means this instant alone. Readers disagree about one that comes twice.
    [[nodiscard]] bool holds(int64_t utcSec) const;
    // The zone as a component of a calendar file, for times from `sinceSec` on; "" when it cannot be written.
    [[nodiscard]] std::string component(int64_t sinceSec) const;

private:
    std::unique_ptr<icu::BasicTimeZone> mZone;  // NULL for a zone of a file
    FileZone mFileZone;
    std::string mName;
};

class TimeZones {
public:
    // `floating` is the zone of times that name none. A Misuse when nobody knows it.
    explicit TimeZones(const std::string& floating = "");

    // The text of a VTIMEZONE component.
    void define(const std::string& id, std::string component, const std::string& location);
    // The zone behind a TZID: by the database's name, by the name that another system has for it, else as the file
    // defines it. NULL for one that nobody knows.
    const TimeZone* find(const std::string& id);
    const TimeZone& floating() const { return *mpFloating; }

private:
    struct Definition {
        std::string component;
        std::string location;
    };
    std::unique_ptr<TimeZone> make(const std::string& id);

    std::map<std::string, Definition> mDefinitions;
    std::map<std::string, std::unique_ptr<TimeZone>> mZones;
    const TimeZone* mpFloating = nullptr;
};

}  // namespace exchange
