// TodoJson.h: a to-do record as the JSON that scripts rely on, and back. What compose() gives, parse() takes.
#pragma once

#include <optional>
#include <span>

#include "Output.h"
#include "RecordJson.h"
#include "platform/calendar.h"

namespace todo_json {

std::span<const record_json::ScalarField> scalars();

Json compose(calendar_record_h todo);
// What compose() reads and `todo set` writes.
std::span<const unsigned> projection();

// A to-do of a file; id and uid of the file are not used.
struct NewTodo {
    CalendarRecord record;
    std::optional<int> calendar;
};
// Onto a record that is there, when one is given.
NewTodo parse(const Json& object, CalendarRecord onto = nullptr);

}  // namespace todo_json
