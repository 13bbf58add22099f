// Short reads of contacts records, as calendar_read.h: records, lists and queries of both services are of one type.
#pragma once

#include "platform/calendar_read.h"
#include "platform/contacts.h"

namespace contacts_read {

using calendar_read::forEach;
using calendar_read::forEachChild;
using calendar_read::intOf;
using calendar_read::textOf;

inline int readPart(const char* view, unsigned idProperty, int id, const std::vector<unsigned>& properties,
                    ContactsList* list, contacts_record_h* record) {
    return calendar_read::readPartFrom<contacts_query_create, contacts_db_get_records_with_query>(
        view, idProperty, id, properties, list, record);
}

}  // namespace contacts_read
