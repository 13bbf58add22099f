#include <algorithm>

#include "Paging.h"
#include "Services.h"

namespace provider {

namespace {

constexpr const char* kLists = "/tasks/v1/users/@me/lists";
constexpr const char* kTasks = "/tasks/v1/lists/*/tasks";
// Updates go to another version of the interface than everything else.
constexpr const char* kUpdates = "/tasks/v3/list/*/tasks/*";
constexpr long long kDefaultEntries = 20;
constexpr long long kMaxEntries = 100;

Reply taskReply(const Task& task, const Fields& fields) {
    return jsonReply(fields.apply(task.body));
}

// One page of a list of `size` places, of which `item(place)` gives what is shown, null for nothing.
template <class Item>
Reply page(const Call& call, const std::string& list, std::size_t size, Json body, Item item) {
    const Fields fields = Fields::parse(call.param("fields"));
    fields.allowOnly({"kind", "etag", "nextPageToken", "items"});
    const auto max =
        static_cast<std::size_t>(std::min(call.number("maxResults", kDefaultEntries, 1), kMaxEntries));
    std::size_t at = readPageToken(list, call.param("pageToken"));
    body["items"] = Json::array();
    for (; at < size; ++at) {
        const Json shown = item(at);
        if (shown.is_null()) continue;
        if (body["items"].size() == max) {
            body["nextPageToken"] = pageToken(list, at);
            break;
        }
        body["items"].push_back(shown);
    }
    return jsonReply(fields.apply(body));
}

}  // namespace

void TaskService::addRoutes(Router& router) {
    const auto add = [&](const char* method, const std::string& pattern,
                         Reply (TaskService::*serve)(const Call&)) {
        router.add(method, pattern, Access::kToken,
                   [this, serve](const Call& call) { return (this->*serve)(call); });
    };
    std::string task = kTasks;
    task += "/*";
    add("GET", kLists, &TaskService::listLists);
    add("GET", kTasks, &TaskService::listTasks);
    add("POST", kTasks, &TaskService::insertTask);
    add("GET", task, &TaskService::getTask);
    add("DELETE", task, &TaskService::deleteTask);
    add("PATCH", kUpdates, &TaskService::patchTask);
}

Reply TaskService::listLists(const Call& call) {
    call.allowOnly({"maxResults", "pageToken", "fields"});
    const auto lock = mContext.store.guard();
    const auto& lists = mContext.store.account(call.account).taskLists;
    return page(call, "lists " + call.account, lists.size(), {{"kind", "tasks#taskLists"}},
                [&lists](std::size_t i) { return lists[i]->entry(); });
}

Reply TaskService::listTasks(const Call& call) {
    call.allowOnly({"maxResults", "pageToken", "fields", "showCompleted", "showHidden"});
    const auto lock = mContext.store.guard();
    const TaskList& list = mContext.store.taskList(call.account, call.ids[0]);
    return page(
        call, "tasks " + list.id, list.tasks().size(), {{"kind", "tasks#tasks"}, {"etag", list.etag}},
        [&list](std::size_t i) { return list.tasks()[i]->isDeleted ? Json() : list.tasks()[i]->body; });
}

Reply TaskService::getTask(const Call& call) {
    call.allowOnly({"fields"});
    const Fields fields = Fields::parse(call.param("fields"));
    const auto lock = mContext.store.guard();
    return taskReply(mContext.store.taskList(call.account, call.ids[0]).get(call.ids[1]), fields);
}

Reply TaskService::insertTask(const Call& call) {
    call.allowOnly({"fields", "parent", "previous"});
    const Fields fields = Fields::parse(call.param("fields"));
    const Json body = jsonBody(call);
    const auto lock = mContext.store.guard();
    return taskReply(mContext.store.taskList(call.account, call.ids[0]).insert(body, false), fields);
}

Reply TaskService::patchTask(const Call& call) {
    call.allowOnly({"fields"});
    const Fields fields = Fields::parse(call.param("fields"));
    const Json body = jsonBody(call);
    const auto lock = mContext.store.guard();
    return taskReply(mContext.store.taskList(call.account, call.ids[0]).patch(call.ids[1], body), fields);
}

Reply TaskService::deleteTask(const Call& call) {
    call.allowOnly({});
    const auto lock = mContext.store.guard();
    mContext.store.taskList(call.account, call.ids[0]).remove(call.ids[1]);
    Reply reply;
    reply.status = 204;
    return reply;
}

}  // namespace provider
