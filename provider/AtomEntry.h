// AtomEntry: a contact or group as clients write it.
#pragma once

#include "ContactCheck.h"
#include "Http.h"

namespace provider {

// The elements of the body as JSON, unchecked but for what makes them an entry of this kind. Throws ApiError 400 for
// what is not well formed or not such an entry, 413 and 415.
Json atomBody(const Call& call, FeedKind kind);

}  // namespace provider
