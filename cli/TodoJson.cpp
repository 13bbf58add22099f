#include "TodoJson.h"

#include "RecordAccess.h"

namespace todo_json {

namespace {

using record_access::intOf;
using record_access::textOf;
using record_json::FieldKind;
using record_json::ScalarField;

// In the order of the documentation.
constexpr ScalarField kScalars[] = {
    {"summary", FieldKind::kText, CALENDAR_TODO_SUMMARY, {}},
    {"note", FieldKind::kText, CALENDAR_TODO_NOTE, {}},
    {"due", FieldKind::kOptionalTime, CALENDAR_TODO_DUE, {}, CALENDAR_TODO_HAS_DUE},
    {"completed", FieldKind::kInstant, CALENDAR_TODO_COMPLETED_TIME, {}},
    {"status", FieldKind::kWord, CALENDAR_TODO_STATUS, kTodoStatus},
};

constexpr unsigned kProjection[] = {
    CALENDAR_TODO_ID,      CALENDAR_TODO_BOOK_ID,       CALENDAR_TODO_UID,     CALENDAR_TODO_VERSION,
    CALENDAR_TODO_SUMMARY, CALENDAR_TODO_NOTE,          CALENDAR_TODO_HAS_DUE, CALENDAR_TODO_DUE,
    CALENDAR_TODO_STATUS,  CALENDAR_TODO_COMPLETED_TIME};

}  // namespace

std::span<const ScalarField> scalars() {
    return kScalars;
}

std::span<const unsigned> projection() {
    return kProjection;
}

Json compose(calendar_record_h todo) {
    Json object = {{"id", intOf(todo, CALENDAR_TODO_ID)},
                   {"calendar", intOf(todo, CALENDAR_TODO_BOOK_ID)},
                   {"uid", textOf(todo, CALENDAR_TODO_UID)}};
    for (const ScalarField& field : kScalars)
        object[std::string(field.name)] = record_json::scalarOf(todo, field);
    return object;
}

NewTodo parse(const Json& object, CalendarRecord onto) {
    if (!object.is_object()) throw Failure("the file must hold one to-do as a JSON object");
    NewTodo todo;
    todo.record = onto != nullptr ? std::move(onto) : record_access::create(_calendar_todo);
    for (const auto& member : object.items()) {
        if (const ScalarField* field = record_json::findScalar(kScalars, member.key())) {
            record_json::setFromJson(todo.record.get(), *field, member.value());
        } else if (member.key() == "calendar") {
            todo.calendar = record_json::idFrom(member.value(), member.key());
        } else if (member.key() == "id") {
            static_cast<void>(record_json::idFrom(member.value(), member.key()));
        } else if (member.key() == "uid") {
            static_cast<void>(record_json::textFrom(member.value(), member.key()));
        } else {
            record_json::refuse(member.key(), "is not known");
        }
    }
    return todo;
}

}  // namespace todo_json
