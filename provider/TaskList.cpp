#include "TaskList.h"

#include <algorithm>

#include "Merge.h"
#include "Times.h"

namespace provider {

namespace {

// Set by the provider alone; what a client sends for them is not taken.
constexpr const char* kTaskOwnMembers[] = {"kind", "id", "etag", "updated", "selfLink", "position"};
constexpr const char* kTextMembers[] = {"title", "notes"};
constexpr const char* kTimeMembers[] = {"due", "completed"};

[[noreturn]] void notFound() {
    throw ApiError{404, "notFound", "Task not found.", ""};
}

void checkTask(const Json& task) {
    for (const char* member : kTextMembers) {
        if (task.contains(member) && !task.at(member).is_string()) invalid(member, "must be a string");
    }
    for (const char* member : kTimeMembers) {
        if (!task.contains(member)) continue;
        if (!task.at(member).is_string()) invalid(member, "must be a string");
        const std::optional<EventTime> time = parseDateTime(task.at(member).get<std::string>());
        if (!time || !time->offset) invalid(member, "must be an RFC 3339 time");
    }
    const Json& status = task.at("status");
    if (status != "needsAction" && status != "completed") invalid("status", "not one of the known values");
}

}  // namespace

Json TaskList::entry() const {
    return {{"kind", "tasks#taskList"}, {"id", id}, {"etag", etag}, {"title", title}};
}

Task* TaskList::find(const std::string& taskId) const {
    const auto found =
        std::find_if(mTasks.begin(), mTasks.end(), [&](const auto& task) { return task->id == taskId; });
    return found == mTasks.end() ? nullptr : found->get();
}

void TaskList::store(Task& task, Json body) {
    dropNulls(body);
    for (const char* member : kTaskOwnMembers) body.erase(member);
    if (!body.contains("title")) body["title"] = "";
    if (!body.contains("status")) body["status"] = "needsAction";
    checkTask(body);
    const std::uint64_t revision = mRevisions.next();
    if (body["status"] != "completed") {
        body.erase("completed");
    } else if (!body.contains("completed")) {
        body["completed"] = stampOf(revision);
    }
    body["kind"] = "tasks#task";
    body["id"] = task.id;
    body["etag"] = etagOf(revision);
    body["updated"] = stampOf(revision);
    task.body = std::move(body);
}

const Task& TaskList::insert(const Json& body, bool canName) {
    std::string taskId = "task" + std::to_string(mRevisions.last() + 1);
    if (canName && body.contains("id")) {
        if (!body["id"].is_string() || body["id"].get<std::string>().empty())
            invalid("id", "must be a string");
        taskId = body["id"].get<std::string>();
    }
    if (find(taskId) != nullptr)
        throw ApiError{409, "duplicate", "The requested identifier already exists.", "id"};
    auto task = std::make_unique<Task>(taskId);
    store(*task, body);
    return *mTasks.emplace_back(std::move(task));
}

const Task& TaskList::patch(const std::string& taskId, const Json& body) {
    Task* task = find(taskId);
    if (task == nullptr || task->isDeleted) notFound();
    Json merged = task->body;
    mergeInto(merged, body);
    store(*task, std::move(merged));
    return *task;
}

void TaskList::remove(const std::string& taskId) {
    Task* task = find(taskId);
    if (task == nullptr || task->isDeleted) notFound();
    mRevisions.next();
    task->isDeleted = true;
}

const Task& TaskList::get(const std::string& taskId) const {
    const Task* task = find(taskId);
    if (task == nullptr || task->isDeleted) notFound();
    return *task;
}

void TaskList::put(const Json& body) {
    if (!body.contains("id") || !body["id"].is_string()) invalid("id", "must be a string");
    auto task = std::make_unique<Task>(body["id"].get<std::string>());
    task->body = body;
    if (!task->body.contains("etag")) store(*task, body);
    mTasks.push_back(std::move(task));
}

}  // namespace provider
