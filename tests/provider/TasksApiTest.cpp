// The tasks service: strict about what it takes, and the same after a dump.
#include "ProviderFixture.h"

namespace provider {
namespace {

constexpr const char* kTasks = "/tasks/v1/lists/errands/tasks";
constexpr const char* kUpdate = "/tasks/v3/list/errands/tasks/";

class Tasks : public ProviderFixture {
protected:
    Tasks() {
        const auto lock = mServer.store().guard();
        mServer.store().addTaskList(mServer.store().account("a@x.example"),
                                    {{"id", "errands"}, {"title", "Work"}});
    }
    Json add(const Json& body) {
        const Answer answer = send("POST", kTasks, body.dump());
        EXPECT_EQ(answer.status, 200) << answer.text;
        return answer.body;
    }
    Json patch(const std::string& id, const Json& body) {
        return send("PATCH", kUpdate + id, body.dump()).body;
    }
};

}  // namespace

TEST_F(Tasks, AreListedInPagesAndParts) {
    EXPECT_EQ(get("/tasks/v1/users/@me/lists").body["items"][0]["title"], "Work");
    for (int i = 0; i < 3; ++i) add({{"title", "task " + std::to_string(i)}});
    const std::string page =
        std::string(kTasks) + "?fields=items(etag%2Cid%2Ctitle)%2CnextPageToken&maxResults=2";
    const Json first = get(page).body;
    ASSERT_EQ(first["items"].size(), 2U);
    EXPECT_EQ(first["items"][0].size(), 3U) << "id, etag and title, nothing else";
    const Json second = get(page + "&pageToken=" + first["nextPageToken"].get<std::string>()).body;
    ASSERT_EQ(second["items"].size(), 1U);
    EXPECT_EQ(second["items"][0]["title"], "task 2");
    EXPECT_FALSE(second.contains("nextPageToken"));
    send("DELETE", std::string(kTasks) + "/" + second["items"][0]["id"].get<std::string>());
    EXPECT_FALSE(get(page).body.contains("nextPageToken")) << "a deleted task makes no page";
}

TEST_F(Tasks, PatchMergesAndMovesTheEtag) {
    const Json task = add({{"title", "a"}, {"notes", "n"}, {"due", "2026-03-01T00:00:00Z"}});
    const std::string id = task["id"];
    EXPECT_EQ(task["status"], "needsAction");
    const Json done = patch(id, {{"status", "completed"}});
    EXPECT_EQ(done["notes"], "n");
    EXPECT_TRUE(done.contains("completed"));
    EXPECT_NE(done["etag"], task["etag"]);
    EXPECT_EQ(patch(id, {{"completed", "2026-03-02T08:00:00Z"}})["completed"], "2026-03-02T08:00:00Z");
    const Json open =
        patch(id, {{"status", "needsAction"}, {"due", nullptr}, {"id", "other"}, {"etag", "mine"}});
    EXPECT_FALSE(open.contains("completed"));
    EXPECT_FALSE(open.contains("due"));
    EXPECT_EQ(open["id"], id);
    const Json part = get(std::string(kTasks) + "/" + id + "?fields=etag%2Cid").body;
    EXPECT_EQ(part["etag"], open["etag"]);
    EXPECT_EQ(part.size(), 2U);
}

TEST_F(Tasks, MalformedRequestsFailLoudly) {
    const std::string id = add({{"title", "a"}})["id"];
    const std::string task = std::string(kTasks) + "/" + id;
    struct Row {
        const char* method;
        std::string path;
        const char* body;
        int status;
    };
    const Row rows[] = {
        {"POST", kTasks, R"({"title": 1})", 400},
        {"POST", kTasks, R"({"title": "a", "status": "done"})", 400},
        {"POST", kTasks, R"({"title": "a", "due": "soon"})", 400},
        {"POST", kTasks, R"({"title": "a", "due": "2026-03-01"})", 400},
        {"POST", kTasks, "[]", 400},
        {"POST", "/tasks/v1/lists/none/tasks", R"({"title": "a"})", 404},
        {"PATCH", task, R"({"title": "b"})", 405},  // updates have a path of their own
        {"PATCH", "/tasks/v3/lists/errands/tasks/" + id, R"({"title": "b"})", 404},
        {"PATCH", kUpdate + id, R"({"status": null, "notes": 1})", 400},
        {"PATCH", std::string(kUpdate) + "none", R"({"title": "b"})", 404},
        {"GET", std::string(kTasks) + "/none", "", 404},
        {"GET", std::string(kTasks) + "?maxResults=0", "", 400},
        {"GET", std::string(kTasks) + "?fields=tasks", "", 400},
        {"GET", std::string(kTasks) + "?q=a", "", 400},
        {"DELETE", std::string(kTasks) + "/none", "", 404},
    };
    for (const Row& row : rows) {
        const Answer answer = send(row.method, row.path, row.body);
        EXPECT_EQ(answer.status, row.status) << row.method << " " << row.path << " " << row.body;
        EXPECT_EQ(answer.body.value("/error/code"_json_pointer, 0), row.status) << answer.text;
    }
    EXPECT_EQ(send("GET", kTasks, "", {{"Authorization", "Bearer none"}}).status, 401);
    EXPECT_EQ(send("DELETE", task).status, 204);
    EXPECT_EQ(send("DELETE", task).status, 404);
    EXPECT_TRUE(get(kTasks).body["items"].empty());
}

TEST_F(Tasks, AreChangedFromOutside) {
    const std::string lists = "/admin/accounts/a@x.example/tasklists";
    EXPECT_EQ(send("POST", lists, R"({"id": "home", "title": "Home"})").status, 200);
    EXPECT_EQ(send("POST", lists, R"({"id": "home"})").status, 409);
    EXPECT_EQ(send("PATCH", lists + "/home", R"({"title": "House"})").body["title"], "House");
    EXPECT_EQ(send("POST", lists + "/home/tasks", R"({"id": "t", "title": "a"})").body["id"], "t");
    EXPECT_EQ(send("PATCH", lists + "/home/tasks/t", R"({"title": "b"})").status, 200);
    EXPECT_EQ(get("/tasks/v1/lists/home/tasks").body["items"][0]["title"], "b");
    const Json dump = get("/admin/dump").body;
    Store loaded;
    loaded.load(dump);
    EXPECT_EQ(loaded.dump(), dump);
    EXPECT_EQ(send("DELETE", lists + "/home/tasks/t").status, 200);
    EXPECT_EQ(send("DELETE", lists + "/home").status, 200);
    EXPECT_EQ(get(lists).body["items"].size(), 1U);
}

}  // namespace provider
