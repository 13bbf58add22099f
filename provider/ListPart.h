// ListPart: the part of a long list that a person looks at.
//   limit=N      (1 to 500) asks for a part; without it a list is answered whole, in order of creation
//   offset=N     how many to leave out before
//   q=WORDS      only items that have all of the words, whatever the case
//   order=place  in their natural order (time, due date, name) instead of the newest change first
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "Http.h"

namespace provider {

// How the items of a list are looked at, each by its index; only what the question needs is asked for.
struct ListItems {
    std::size_t count = 0;
    std::function<bool(std::size_t)> isThere;
    std::function<std::string(std::size_t)> etag;
    std::function<std::string(std::size_t)> place;  // texts in natural order
    std::function<std::string(std::size_t)> text;   // what q looks in
};

struct ListPart {
    std::size_t total = 0;     // items that are there
    std::size_t matching = 0;  // of them those that q finds
    std::vector<std::size_t> indexes;
};

bool asksForPart(const Call& call);
// Throws ApiError 400 for a bad parameter.
ListPart partOf(const Call& call, const ListItems& items);
// {"total","matching","items"}, each item made by json(index).
Reply partReply(const ListPart& part, const std::function<Json(std::size_t)>& json);

// Throws 412 when the call has an If-Match that names another etag than this.
void requireMatch(const Call& call, const std::string& etag);

}  // namespace provider
