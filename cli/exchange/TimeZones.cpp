#include "exchange/TimeZones.h"

#include <unicode/strenum.h>
#include <unicode/ucal.h>
#include <unicode/vtzone.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <vector>

#include "EventFields.h"
#include "Failure.h"
#include "TimeText.h"

namespace exchange {

namespace {

constexpr double kMsPerSecond = 1000;
constexpr int64_t kYearSec = int64_t{366} * 86400;
constexpr size_t kMostDefinitions = 1000;
constexpr size_t kMostDefinitionBytes = 65536;

std::string utf8(const icu::UnicodeString& text) {
    std::string out;
    return text.toUTF8String(out);
}

std::unique_ptr<TimeZone> ofDatabase(const std::string& name) {
    if (!event_fields::isTimeZone(name)) return nullptr;
    std::unique_ptr<icu::TimeZone> zone(icu::TimeZone::createTimeZone(icu::UnicodeString::fromUTF8(name)));
    auto* basic = dynamic_cast<icu::BasicTimeZone*>(zone.get());
    if (basic == nullptr || *zone == icu::TimeZone::getUnknown()) return nullptr;
    static_cast<void>(zone.release());  // the same object
    return std::make_unique<TimeZone>(std::unique_ptr<icu::BasicTimeZone>(basic), name);
}

// "W. Europe Standard Time" and the like.
std::string databaseNameOf(const std::string& id) {
    UErrorCode error = U_ZERO_ERROR;
    icu::UnicodeString name;
    icu::TimeZone::getIDForWindowsID(icu::UnicodeString::fromUTF8(id), nullptr, name, error);
    return U_SUCCESS(error) ? utf8(name) : std::string();
}

// "/example.org/Tzfile/Europe/Berlin": the longest end that is a name.
std::unique_ptr<TimeZone> fromPath(const std::string& id) {
    for (size_t slash = id.find('/'); slash != std::string::npos; slash = id.find('/', slash + 1)) {
        const std::string end = id.substr(slash + 1);
        if (end.find('/') == std::string::npos) return nullptr;
        if (auto zone = ofDatabase(end)) return zone;
    }
    return nullptr;
}

// A zone of the database that has the same offset on every day around now, so that a series goes on with it.
std::string nameLike(const FileZone& wanted) {
    constexpr int64_t kDaySec = 86400;
    constexpr int kDays = 2 * 366;
    const int64_t first = static_cast<int64_t>(ucal_getNow() / kMsPerSecond) - kDays / 2 * kDaySec;
    std::vector<int> offsets;
    for (int day = 0; day < kDays; ++day) offsets.push_back(wanted.offsetOfUtc(first + day * kDaySec));
    UErrorCode error = U_ZERO_ERROR;
    const std::unique_ptr<icu::StringEnumeration> names(icu::TimeZone::createTimeZoneIDEnumeration(
        UCAL_ZONE_TYPE_CANONICAL_LOCATION, nullptr, nullptr, error));
    while (U_SUCCESS(error)) {
        const icu::UnicodeString* name = names->snext(error);
        if (name == nullptr) break;
        const std::unique_ptr<TimeZone> zone = ofDatabase(utf8(*name));
        bool isLike = zone != nullptr;
        for (int day = 0; isLike && day < kDays; ++day) {
            const int64_t at = first + day * kDaySec;
            isLike = zone->toWall(at) - at == offsets[static_cast<size_t>(day)];
        }
        if (isLike) return utf8(*name);
    }
    return {};
}

std::unique_ptr<TimeZone> ofFile(const std::string& component) {
    FileZone zone(component);
    if (!zone) return nullptr;
    std::string name = nameLike(zone);
    return std::make_unique<TimeZone>(std::move(zone), std::move(name));
}

// Seconds of "+0130" or "+013000".
int64_t offsetSec(const std::string& text) {
    const std::string digits = text.substr(std::min<size_t>(1, text.size())) + "00";
    const auto pair = [&digits](size_t at) { return std::strtol(digits.substr(at, 2).c_str(), nullptr, 10); };
    const int64_t seconds = pair(0) * 3600 + pair(2) * 60 + pair(4);
    return text.starts_with('-') ? -seconds : seconds;
}

std::string offsetText(int64_t seconds) {
    std::array<char, 32> text{};
    const int64_t size = std::abs(seconds);
    std::snprintf(text.data(), text.size(), size % 60 != 0 ? "%c%02d%02d%02d" : "%c%02d%02d",
                  seconds < 0 ? '-' : '+', static_cast<int>(size / 3600), static_cast<int>(size / 60 % 60),
                  static_cast<int>(size % 60));
    return text.data();
}

// As the ICU library writes a zone, but as readers want it: the end of a rule is an instant, an offset has seconds
// only where it needs them, and nothing is the library's own.
std::string asReadersWantIt(const std::string& component) {
    constexpr std::string_view kUntil = "UNTIL=";
    constexpr size_t kWallTimeBytes = 15;
    std::string out;
    int64_t from = 0;
    for (size_t at = 0; at < component.size();) {
        const size_t end = std::min(component.find("\r\n", at), component.size());
        std::string line = component.substr(at, end - at);
        at = end + 2;
        if (line.starts_with("X-TZINFO") || line.find(':') == std::string::npos) continue;
        const bool isOffset = line.starts_with("TZOFFSET");
        constexpr size_t kLongOffsetBytes = 7;
        const bool isLong = isOffset && line.size() - line.find(':') - 1 == kLongOffsetBytes;
        if (isLong && line.ends_with("00")) line.resize(line.size() - 2);
        if (line.starts_with("TZOFFSETFROM:")) from = offsetSec(line.substr(line.find(':') + 1));
        const size_t until = line.find(kUntil);
        if (until != std::string::npos) {
            const size_t start = until + kUntil.size();
            auto time = time_text::parseCompact(line.substr(start, kWallTimeBytes) + "Z");
            if (time && line.compare(start + kWallTimeBytes, 1, "Z") != 0) {
                time->utime -= from;
                line.replace(start, kWallTimeBytes, time_text::composeCompact(*time));
            }
        }
        out += line + "\r\n";
    }
    return out;
}

int64_t offsetOfWall(const icu::BasicTimeZone& zone, int64_t wallSec, UTimeZoneLocalOption option) {
    int32_t raw = 0;
    int32_t saving = 0;
    UErrorCode error = U_ZERO_ERROR;
    zone.getOffsetFromLocal(static_cast<double>(wallSec) * kMsPerSecond, option, option, raw, saving, error);
    return U_SUCCESS(error) ? (raw + saving) / static_cast<int>(kMsPerSecond) : 0;
}

std::string machineZone() {
    const std::unique_ptr<icu::TimeZone> zone(icu::TimeZone::createDefault());
    icu::UnicodeString id;
    return utf8(zone->getID(id));
}

}  // namespace

TimeZone::TimeZone(std::unique_ptr<icu::BasicTimeZone> zone, std::string name)
    : mZone(std::move(zone)), mName(std::move(name)) {}

TimeZone::TimeZone(FileZone zone, std::string name) : mFileZone(std::move(zone)), mName(std::move(name)) {}

int64_t TimeZone::toUtc(int64_t wallSec) const {
    if (mFileZone) return wallSec - mFileZone.offsetOfWall(wallSec);
    return wallSec - offsetOfWall(*mZone, wallSec, UCAL_TZ_LOCAL_FORMER);
}

bool TimeZone::holds(int64_t utcSec) const {
    const int64_t wallSec = toWall(utcSec);
    const bool isOnce = mFileZone || offsetOfWall(*mZone, wallSec, UCAL_TZ_LOCAL_FORMER) ==
                                         offsetOfWall(*mZone, wallSec, UCAL_TZ_LOCAL_LATTER);
    return isOnce && toUtc(wallSec) == utcSec;
}

int64_t TimeZone::toWall(int64_t utcSec) const {
    if (mFileZone) return utcSec + mFileZone.offsetOfUtc(utcSec);
    int32_t raw = 0;
    int32_t saving = 0;
    UErrorCode error = U_ZERO_ERROR;
    mZone->getOffset(static_cast<double>(utcSec) * kMsPerSecond, /*local=*/0, raw, saving, error);
    return U_SUCCESS(error) ? utcSec + (raw + saving) / static_cast<int>(kMsPerSecond) : utcSec;
}

std::string TimeZone::component(int64_t sinceSec) const {
    const std::unique_ptr<icu::VTimeZone> zone(
        icu::VTimeZone::createVTimeZoneByID(icu::UnicodeString::fromUTF8(mName)));
    if (zone == nullptr) return {};
    const int64_t first = sinceSec - kYearSec;
    UErrorCode error = U_ZERO_ERROR;
    icu::UnicodeString text;
    zone->write(static_cast<double>(first) * kMsPerSecond, text, error);
    if (U_FAILURE(error)) return {};
    std::string component = asReadersWantIt(utf8(text));
    // The library begins with the first change; what holds until then stands before it.
    calendar_time_s start;
    start.utime = toWall(first);
    std::string startText = time_text::composeCompact(start);
    startText.pop_back();  // the Z
    const std::string offset = offsetText(start.utime - first);
    const std::string initial = "BEGIN:STANDARD\r\nTZOFFSETTO:" + offset + "\r\nTZOFFSETFROM:" + offset +
                                "\r\nDTSTART:" + startText + "\r\nEND:STANDARD\r\n";
    const size_t place = component.find("BEGIN:", 1);
    return place == std::string::npos ? std::string() : component.insert(place, initial);
}

TimeZones::TimeZones(const std::string& floating) {
    mpFloating = find(floating.empty() ? machineZone() : floating);
    if (mpFloating == nullptr && !floating.empty())
        throw Misuse("\"" + floating + "\" is no time zone as Europe/Berlin");
    if (mpFloating == nullptr) mpFloating = find("UTC");
    if (mpFloating == nullptr) throw Failure("the time zone database cannot be read; check the ICU library");
}

void TimeZones::define(const std::string& id, std::string component, const std::string& location) {
    if (mDefinitions.size() >= kMostDefinitions || component.size() > kMostDefinitionBytes) return;
    mDefinitions[id] = {std::move(component), location};
}

std::unique_ptr<TimeZone> TimeZones::make(const std::string& id) {
    if (auto zone = ofDatabase(id)) return zone;
    if (auto zone = ofDatabase(databaseNameOf(id))) return zone;
    const auto definition = mDefinitions.find(id);
    if (definition != mDefinitions.end()) {
        if (auto zone = ofDatabase(definition->second.location)) return zone;
    }
    if (auto zone = fromPath(id)) return zone;
    return definition != mDefinitions.end() ? ofFile(definition->second.component) : nullptr;
}

const TimeZone* TimeZones::find(const std::string& id) {
    const auto known = mZones.find(id);
    // One that was not known may have been defined since; what is known stays as it is.
    if (known != mZones.end() && (known->second != nullptr || !mDefinitions.contains(id)))
        return known->second.get();
    return (mZones[id] = make(id)).get();
}

}  // namespace exchange
