// Merge: what PATCH does.
#pragma once

#include "Http.h"

namespace provider {

// RFC 7396, but for one thing: a time is a date or a date-time, so that naming one of them drops the other.
void mergeInto(Json& target, const Json& patch);
// The body without its null members.
void dropNulls(Json& body);

}  // namespace provider
