#include "ListPart.h"
#include "Services.h"

namespace provider {

namespace {

ListItems listItems(const std::vector<std::unique_ptr<Task>>& tasks) {
    const auto text = [&tasks](std::size_t i, const char* name) {
        const auto found = tasks[i]->body.find(name);
        return found != tasks[i]->body.end() && found->is_string() ? found->get<std::string>() : "";
    };
    // Tasks without a due date come last.
    const auto due = [text](std::size_t i) {
        const std::string time = text(i, "due");
        return (time.empty() ? "~" : time) + text(i, "title");
    };
    return {tasks.size(), [&tasks](std::size_t i) { return !tasks[i]->isDeleted; },
            [text](std::size_t i) { return text(i, "etag"); }, due,
            [text](std::size_t i) { return text(i, "title") + "\n" + text(i, "notes"); }};
}

}  // namespace

void AdminTaskService::addRoutes(Router& router) {
    const std::string lists = "/admin/accounts/*/tasklists";
    router.add("GET", lists, Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        Json body;
        body["items"] = Json::array();
        for (const auto& list : mContext.store.account(call.ids[0]).taskLists)
            body["items"].push_back(list->entry());
        return jsonReply(body);
    });
    router.add("POST", lists, Access::kAdmin, [this](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        return jsonReply(mContext.store.addTaskList(mContext.store.account(call.ids[0]), body).entry());
    });
    router.add("PATCH", lists + "/*", Access::kAdmin, [this](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        return jsonReply(mContext.store.changeTaskList(call.ids[0], call.ids[1], body).entry());
    });
    router.add("DELETE", lists + "/*", Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        mContext.store.removeTaskList(mContext.store.account(call.ids[0]), call.ids[1]);
        return done();
    });
    addTaskRoutes(router, lists + "/*/tasks");
}

void AdminTaskService::addTaskRoutes(Router& router, const std::string& tasks) {
    router.add("GET", tasks, Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        const auto& all = mContext.store.taskList(call.ids[0], call.ids[1]).tasks();
        if (asksForPart(call)) {
            return partReply(partOf(call, listItems(all)), [&](std::size_t i) { return all[i]->body; });
        }
        Json body;
        body["items"] = Json::array();
        for (const auto& task : all) {
            if (!task->isDeleted) body["items"].push_back(task->body);
        }
        return jsonReply(body);
    });
    router.add("POST", tasks, Access::kAdmin, [this](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        return jsonReply(mContext.store.taskList(call.ids[0], call.ids[1]).insert(body, true).body);
    });
    router.add("GET", tasks + "/*", Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        return jsonReply(mContext.store.taskList(call.ids[0], call.ids[1]).get(call.ids[2]).body);
    });
    router.add("PATCH", tasks + "/*", Access::kAdmin, [this](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        TaskList& list = mContext.store.taskList(call.ids[0], call.ids[1]);
        requireMatch(call, list.get(call.ids[2]).body.value("etag", ""));
        return jsonReply(list.patch(call.ids[2], body).body);
    });
    router.add("DELETE", tasks + "/*", Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        TaskList& list = mContext.store.taskList(call.ids[0], call.ids[1]);
        requireMatch(call, list.get(call.ids[2]).body.value("etag", ""));
        list.remove(call.ids[2]);
        return done();
    });
}

}  // namespace provider
