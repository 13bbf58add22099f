#include "exchange/FileZone.h"

#include <libical/ical.h>

#include <array>

#include "exchange/ContentLine.h"

namespace exchange {

namespace {

constexpr size_t kMostZoneBytes = 65536;

struct ComponentDeleter {
    void operator()(icalcomponent* component) const noexcept { icalcomponent_free(component); }
};
using Component = std::unique_ptr<icalcomponent, ComponentDeleter>;

// A zone changes some times a year. The library goes through every change since the rule began, so that a rule by the
// second would keep it busy for hours.
bool isRuleOfZone(icalproperty* property) {
    const icalrecurrencetype rule = icalproperty_get_rrule(property);
    if (rule.freq != ICAL_YEARLY_RECURRENCE || rule.interval < 1) return false;
    const std::array<short, 3> first = {rule.by_second[0], rule.by_minute[0], rule.by_hour[0]};
    for (const short value : first) {
        if (value != ICAL_RECURRENCE_ARRAY_MAX) return false;
    }
    return true;
}

// Both offsets, a start, and only rules of a zone.
bool isHalfOfZone(icalcomponent* half) {
    for (icalproperty* rule = icalcomponent_get_first_property(half, ICAL_RRULE_PROPERTY); rule != nullptr;
         rule = icalcomponent_get_next_property(half, ICAL_RRULE_PROPERTY)) {
        if (!isRuleOfZone(rule)) return false;
    }
    for (const icalproperty_kind kind :
         {ICAL_DTSTART_PROPERTY, ICAL_TZOFFSETFROM_PROPERTY, ICAL_TZOFFSETTO_PROPERTY}) {
        if (icalcomponent_get_first_property(half, kind) == nullptr) return false;
    }
    return true;
}

bool isZone(icalcomponent* zone) {
    if (zone == nullptr || icalcomponent_isa(zone) != ICAL_VTIMEZONE_COMPONENT) return false;
    bool hasHalf = false;
    for (icalcomponent* half = icalcomponent_get_first_component(zone, ICAL_ANY_COMPONENT); half != nullptr;
         half = icalcomponent_get_next_component(zone, ICAL_ANY_COMPONENT)) {
        if (!isHalfOfZone(half)) return false;
        hasHalf = true;
    }
    return hasHalf;
}

icaltimetype timeOf(int64_t seconds) {
    return icaltime_from_timet_with_zone(seconds, /*is_date=*/0, icaltimezone_get_utc_timezone());
}

}  // namespace

void FileZone::Deleter::operator()(_icaltimezone* zone) const noexcept {
    icaltimezone_free(zone, /*free_struct=*/1);
}

FileZone::FileZone(const std::string& component) {
    if (component.size() > kMostZoneBytes) return;
    icalerror_set_errors_are_fatal(0);
    Component parsed(icalparser_parse_string(component.c_str()));
    if (!isZone(parsed.get())) return;
    mZone.reset(icaltimezone_new());
    if (mZone == nullptr || icaltimezone_set_component(mZone.get(), parsed.get()) == 0) {
        mZone.reset();
        return;
    }
    static_cast<void>(parsed.release());  // the zone has it now
}

int FileZone::offsetOfWall(int64_t wallSec) const {
    icaltimetype time = timeOf(wallSec);
    return icaltimezone_get_utc_offset(mZone.get(), &time, nullptr);
}

int FileZone::offsetOfUtc(int64_t utcSec) const {
    icaltimetype time = timeOf(utcSec);
    return icaltimezone_get_utc_offset_of_utc_time(mZone.get(), &time, nullptr);
}

}  // namespace exchange
