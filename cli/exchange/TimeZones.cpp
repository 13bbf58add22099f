#include "exchange/TimeZones.h"

#include <unicode/strenum.h>
#include <unicode/ucal.h>

#include <vector>

#include "EventFields.h"
#include "Failure.h"
#include "exchange/ZoneComponent.h"

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
    offsets.reserve(kDays);
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
    const int64_t first = sinceSec - kYearSec;
    return zone_component::compose(mName, first, toWall(first));
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
    if (definition == mDefinitions.end()) return nullptr;
    FileZone zone(definition->second.component);
    if (!zone) return nullptr;
    std::string name = nameLike(zone);
    return std::make_unique<TimeZone>(std::move(zone), std::move(name));
}

const TimeZone* TimeZones::find(const std::string& id) {
    const auto known = mZones.find(id);
    // One that was not known may have been defined since; what is known stays as it is.
    if (known != mZones.end() && (known->second != nullptr || !mDefinitions.contains(id)))
        return known->second.get();
    return (mZones[id] = make(id)).get();
}

}  // namespace exchange
