// Changes of a series' exception dates in the calendar service.
#pragma once

#include <string>
#include <utility>
#include <vector>

// For each (recurrence id, whether it is cancelled) the series' exception dates gain or lose the date. `version` receives
// the version of the write, 0 when nothing was to be written. `expectedVersion` as in record_write_options_s.
// Returns a code of platform/error.h (PLATFORM_ERROR_CONFLICT: the series has moved on).
[[nodiscard]] int changeExceptionDates(int seriesEventId,
                                       const std::vector<std::pair<std::string, bool>>& changes,
                                       int expectedVersion, int* version);
