// Short reads of contacts records, as calendar_read.h: records, lists and queries of both services are of one type.
#pragma once

#include "platform/calendar_read.h"
#include "platform/contacts.h"

namespace contacts_read {

using calendar_read::forEach;
using calendar_read::forEachChild;
using calendar_read::intOf;
using calendar_read::textOf;

template <class Use>
int forEachPart(const char* view, unsigned filtered, int value, const std::vector<unsigned>& properties,
                Use use) {
    return calendar_read::forEachPartFrom<contacts_query_create, contacts_db_for_each_record>(
        view, filtered, value, properties, std::move(use));
}

template <class Use>
int forEachChange(const char* view, int addressBookId, int since, int* current, Use use) {
    return contacts_db_for_each_change(
        view, addressBookId, since,
        [](contacts_record_h record, void* any) { (*static_cast<Use*>(any))(record); }, &use, current);
}

inline int readPart(const char* view, unsigned idProperty, int id, const std::vector<unsigned>& properties,
                    ContactsList* list, contacts_record_h* record) {
    return calendar_read::readPartFrom<contacts_query_create, contacts_db_get_records_with_query>(
        view, idProperty, id, properties, list, record);
}

}  // namespace contacts_read
