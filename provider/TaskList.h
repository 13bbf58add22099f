// TaskList: the tasks of one list and what may be done to them.
// Owner: the account, in the store, whose mutex guards it. Errors: ApiError; nothing has changed then.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "Http.h"
#include "Revisions.h"

namespace provider {

struct Task {
    explicit Task(std::string taskId) : id(std::move(taskId)) {}

    std::string id;
    Json body;  // as it is shown
    bool isDeleted = false;
};

class TaskList {
public:
    TaskList(std::string listId, Revisions& revisions) : id(std::move(listId)), mRevisions(revisions) {}

    const std::string id;
    std::string title;
    std::string etag;

    // The list as an item of the account's lists.
    [[nodiscard]] Json entry() const;

    // `canName`: the body may choose the id.
    const Task& insert(const Json& body, bool canName);
    // Merges the body into the task; null removes a member.
    const Task& patch(const std::string& taskId, const Json& body);
    void remove(const std::string& taskId);
    [[nodiscard]] const Task& get(const std::string& taskId) const;
    // For loading: takes the task as it is.
    void put(const Json& body);

    // Tasks in order of creation, deleted ones included; a place never changes.
    [[nodiscard]] const std::vector<std::unique_ptr<Task>>& tasks() const { return mTasks; }

private:
    [[nodiscard]] Task* find(const std::string& taskId) const;
    // Checks and completes a body and gives it a new etag.
    void store(Task& task, Json body);

    std::vector<std::unique_ptr<Task>> mTasks;
    Revisions& mRevisions;
};

}  // namespace provider
