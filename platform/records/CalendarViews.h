// The calendar service's views, and its store.
#pragma once

#include "Store.h"

namespace platform::records {

// One for the process, never destroyed.
Store& calendarStore();

}  // namespace platform::records
