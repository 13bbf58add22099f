// ZoneComponent.h: a zone of the time zone database as the VTIMEZONE of a calendar file.
#pragma once

#include <cstdint>
#include <string>

namespace exchange::zone_component {

// For times from `firstSec` (since 1970) on, whose wall time in the zone is `firstWallSec`. "" when it cannot be
// written.
std::string compose(const std::string& name, int64_t firstSec, int64_t firstWallSec);

}  // namespace exchange::zone_component
