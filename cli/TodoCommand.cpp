// todos, todo: lists to-dos; shows, adds, changes and deletes one. What the tool writes is a user's edit.
#include "CalendarStore.h"
#include "Command.h"
#include "Failure.h"
#include "ItemCommand.h"
#include "ItemList.h"
#include "Output.h"
#include "RecordAccess.h"
#include "TodoJson.h"

namespace {

using record_access::intOf;

constexpr item_list::View kView{_calendar_todo, CALENDAR_TODO_ID, CALENDAR_TODO_BOOK_ID};

void listJson(const ListOptions& options) {
    output::JsonArray array;
    for (const CalendarList& list : item_list::find(kView, options, todo_json::projection())) {
        record_access::forEach(list,
                               [&array](calendar_record_h todo) { array.add(todo_json::compose(todo)); });
    }
    array.end();
}

void listTable(const ListOptions& options) {
    output::Table table({"ID", "CALENDAR", "DUE", "STATUS", "SUMMARY"});
    for (const CalendarList& list : item_list::find(kView, options, todo_json::projection())) {
        record_access::forEach(list, [&table](calendar_record_h record) {
            const Json todo = todo_json::compose(record);
            table.add(
                {todo["id"].dump(), todo["calendar"].dump(), todo["due"], todo["status"], todo["summary"]});
        });
    }
    table.print();
}

int addTodo(const std::string& path, int chosenCalendar) {
    const todo_json::NewTodo todo = todo_json::parse(record_json::readFile(path));
    const int calendarId = chosenCalendar > 0 ? chosenCalendar : todo.calendar.value_or(0);
    if (calendarId == 0) throw Failure("the member \"calendar\" is missing; add it or give --calendar ID");
    CalendarStore::checkWritable(calendarId, "todo");
    record_access::setInt(todo.record.get(), CALENDAR_TODO_BOOK_ID, calendarId, "calendar");
    int id = 0;
    check(calendar_db_insert_record(todo.record.get(), &id), "adding the to-do");
    return id;
}

int tryToSet(int id, const std::vector<record_json::Assignment>& assignments) {
    const FoundItem todo = CalendarStore::todo(id, todo_json::projection());
    CalendarStore::checkWritable(intOf(todo.get(), CALENDAR_TODO_BOOK_ID), "todo");
    for (const record_json::Assignment& assignment : assignments)
        record_json::setFromText(todo.get(), *assignment.field, assignment.value);
    const int version = intOf(todo.get(), CALENDAR_TODO_VERSION);
    record_write_options_s options;
    options.expected_versions = {&version, 1};
    return calendar_db_update_record(todo.get(), options);
}

void deleteTodo(int id) {
    const FoundItem todo = CalendarStore::todo(id, todo_json::projection());
    CalendarStore::checkWritable(intOf(todo.get(), CALENDAR_TODO_BOOK_ID), "todo");
    check(calendar_db_delete_record(_calendar_todo, id), "deleting the to-do " + std::to_string(id));
}

void showTodo(int id, bool isJson) {
    const Json todo = todo_json::compose(CalendarStore::todo(id, todo_json::projection()).get());
    isJson ? output::json(todo) : output::fields(todo);
}

}  // namespace

Action buildTodosList(CLI::App& app) {
    return item_list::build(app, listJson, listTable);
}

Action buildTodoShow(CLI::App& app) {
    return item_command::buildShow<CalendarStore>(app, "The to-do", showTodo);
}

Action buildTodoAdd(CLI::App& app) {
    return item_command::buildAdd<CalendarStore>(
        app,
        {"JSON as 'todo show --json' prints it; '-' reads standard input", "--calendar",
         "The calendar, instead of the file's"},
        addTodo, showTodo);
}

Action buildTodoSet(CLI::App& app) {
    auto options = std::make_shared<ItemOptions>();
    item_command::addSetOptions(app, *options, "The to-do", "summary, note, due, completed or status");
    return [options] {
        const auto assignments = record_json::readAssignments(todo_json::scalars(), options->assignments);
        const CalendarStore store;
        item_command::write("changing the to-do " + std::to_string(options->id),
                            [&] { return tryToSet(options->id, assignments); });
        return kExitDone;
    };
}

Action buildTodoDelete(CLI::App& app) {
    return item_command::buildDelete<CalendarStore>(app, "The to-do", deleteTodo);
}
