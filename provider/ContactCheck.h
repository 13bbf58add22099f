// ContactCheck: the rules that the fields of a contact or a group follow. Errors: ApiError 400 naming the member.
#pragma once

#include <string>

#include "Http.h"

namespace provider {

enum class FeedKind { kContact, kGroup };

// Whether elements of this name stand in a list, one or many.
bool isListMember(const std::string& member);
// Takes out what the provider alone sets.
void dropOwnMembers(Json& fields);
void checkFields(FeedKind kind, const Json& fields);
// The display name that the parts of gd$name make; may be empty.
std::string titleOf(const Json& fields);

}  // namespace provider
