// The contacts service's views, and its store.
#pragma once

#include "Store.h"

namespace platform::records {

// One for the process, never destroyed.
Store& contactsStore();

// The items that a change feed's records are about; NULL for a view that is no feed.
const View* itemsOfFeed(const char* infoView);

}  // namespace platform::records
