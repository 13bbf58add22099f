// Recurrence: whether a line of an event's "recurrence" is one that a strict calendar service accepts.
#pragma once

#include <string>
#include <string_view>

namespace provider {

// "" when line is a well-formed RRULE, RDATE or EXDATE line, else what is wrong with it.
std::string recurrenceFault(std::string_view line);

}  // namespace provider
