// Seed: content to start with. The same words give the same content, whatever the day.
#pragma once

#include <cstddef>

#include "Store.h"

namespace provider {

// Two accounts with four calendars, one of them shared, and several hundred events of all kinds.
void seedSample(Store& store);
// One account with one calendar of so many events.
void seedBulk(Store& store, std::size_t events);
// Events of about 1 kB, every tenth recurring.
void addBulkEvents(Calendar& calendar, std::size_t events);

}  // namespace provider
