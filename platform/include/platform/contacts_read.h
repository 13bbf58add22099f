// Short reads of contacts records, as calendar_read.h: records and lists of both services are of one type.
#pragma once

#include "platform/calendar_read.h"
#include "platform/contacts.h"

namespace contacts_read {

using calendar_read::forEach;
using calendar_read::forEachChild;
using calendar_read::intOf;
using calendar_read::textOf;

}  // namespace contacts_read
