// EventCheck: the rules that an event must keep to be stored.
#pragma once

#include "Http.h"

namespace provider {

// Throws ApiError 400 naming the member at fault. Members that are not known here are not looked at.
void checkEvent(const Json& event);

}  // namespace provider
