#include "Services.h"

namespace provider {

namespace {

Reply done() {
    return jsonReply(Json::object());
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
        Json body;
        body["items"] = Json::array();
        for (const auto& task : mContext.store.taskList(call.ids[0], call.ids[1]).tasks()) {
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
        return jsonReply(mContext.store.taskList(call.ids[0], call.ids[1]).patch(call.ids[2], body).body);
    });
    router.add("DELETE", tasks + "/*", Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        mContext.store.taskList(call.ids[0], call.ids[1]).remove(call.ids[2]);
        return done();
    });
}

}  // namespace provider
