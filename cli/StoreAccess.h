// StoreAccess.h: queries of a record store, written once for the calendar and the contacts service.
#pragma once

#include <span>
#include <string>
#include <vector>

#include "Failure.h"
#include "platform/calendar.h"

namespace store_access {

struct Filter {
    unsigned property;
    int value;
};

// What the calls of one service are.
template <auto CreateQuery, auto GetRecords, class ListType>
struct Service {
    using List = ListType;
    static constexpr auto kCreateQuery = CreateQuery;
    static constexpr auto kGetRecords = GetRecords;
};

// The records of `view` that meet all filters, by ascending `sortBy`. An empty projection reads everything.
// `name` names the store in a Failure.
template <class Service>
typename Service::List find(const std::string& name, const char* view, const std::vector<Filter>& filters,
                            unsigned sortBy, std::span<const unsigned> projection) {
    calendar_query_h raw = nullptr;
    check(Service::kCreateQuery(view, &raw), name);
    const CalendarQuery query(raw);
    for (const Filter& filter : filters)
        check(calendar_query_add_filter_int(raw, filter.property, filter.value), name);
    if (!projection.empty())
        check(calendar_query_set_projection(raw, projection.data(), projection.size()), name);
    check(calendar_query_set_sort(raw, sortBy, /*ascending=*/true), name);
    calendar_list_h list = nullptr;
    check(Service::kGetRecords(raw, 0, 0, &list), "reading " + name);
    return typename Service::List(list);
}

// One record of a store; the list that it came in owns it.
template <class List>
class Found {
public:
    Found(List list, calendar_record_h record) : mList(std::move(list)), mpRecord(record) {}
    [[nodiscard]] calendar_record_h get() const { return mpRecord; }

private:
    List mList;
    calendar_record_h mpRecord;
};

// The first record of the list; a Failure when it is empty. `noun` is the command that lists such records, without its "s".
template <class List>
Found<List> one(List list, const std::string& noun, int id) {
    calendar_record_h found = nullptr;
    if (calendar_list_first(list.get()) != PLATFORM_ERROR_NONE ||
        calendar_list_get_current_record_p(list.get(), &found) != PLATFORM_ERROR_NONE) {
        throw Failure("there is no " + noun + " " + std::to_string(id) + "; see: vantor-pim-syncctl " + noun +
                      "s list");
    }
    return {std::move(list), found};
}

}  // namespace store_access
