// The daemon is no nuisance: pauses that a server asks for are kept, what it refuses for good is not sent again and again, and no edit
// is lost to a page that is on its way.
#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <thread>

#include "e2e/Eventually.h"
#include "e2e/SyncPair.h"

namespace {

// One kind of data and what an edit of it is.
struct Kind {
    const char* name;
    const char* path;  // of the requests that write items
    std::function<int(SyncPair&, const std::string& text)> add;
    const char* noun;
    const char* member;  // of the device's item, that holds the text
    const char* list;    // the requests that read items
    const char* update;  // the method of those that change one
    // The items' path for the admin services, and the member that holds the text.
    std::function<std::string(SyncPair&)> adminPath;
    std::function<Json(const std::string& text)> body;
};

void PrintTo(const Kind& kind, std::ostream* out) {
    *out << kind.name;
}

int numberOf(const CommandResult& added) {
    EXPECT_EQ(added.status, 0) << added.error;
    return std::atoi(added.output.c_str());
}

int addEvent(SyncPair& pair, const std::string& text) {
    const int book = pair.localCalendar(1, pair.wireCalendars(1).at(0).at("summary"));
    return numberOf(
        pair.device.tool({"event", "add", "--calendar", std::to_string(book), "-"},
                         Json({{"summary", text}, {"start", "2026-06-01"}, {"end", "2026-06-02"}}).dump()));
}

int addContact(SyncPair& pair, const std::string& text) {
    return numberOf(
        pair.device.tool({"contact", "add", "--account", "1", "-"}, Json({{"nickname", text}}).dump()));
}

const Kind kKinds[] = {
    {"calendar", "/events", addEvent, "event", "summary", "/events\\?", "PATCH",
     [](SyncPair& pair) { return "/calendars/" + pathText(pair.firstCalendar(1)) + "/events"; },
     [](const std::string& text) {
         return Json({{"summary", text}});
     }},
    {"contacts", "contacts/.*/full", addContact, "contact", "nickname", "contacts/.*/full\\?", "PUT",
     [](SyncPair& pair) { return pair.peoplePath(1, "contacts"); },
     [](const std::string& text) {
         return Json({{"gContact$nickname", {{"$t", text}}}});
     }}};

class Polite : public testing::TestWithParam<Kind> {
protected:
    Polite() : mPair(1, {"--seed", "sample"}, GetParam().name) {
        EXPECT_EQ(mPair.sync(1).status, 0);
        mPair.provider.admin("DELETE", "/requests");  // the token's is a POST too
    }

    int add(const std::string& text) { return GetParam().add(mPair, text); }
    void edit(int id, const std::string& text) {
        const CommandResult done =
            mPair.device.tool({GetParam().noun, "set", std::to_string(id), GetParam().member + ("=" + text)});
        EXPECT_EQ(done.status, 0) << done.error;
    }
    // The server's ids of the items with this text.
    std::vector<std::string> idsOf(const std::string& text) {
        std::vector<std::string> ids;
        const Json wanted = GetParam().body(text);
        const Json items = mPair.provider.admin("GET", GetParam().adminPath(mPair))["items"];
        for (const Json& item : items) {
            if (item.value(wanted.begin().key(), Json()) == wanted.begin().value()) ids.push_back(item["id"]);
        }
        return ids;
    }
    int posts() { return mPair.requestCounts()["POST"]; }
    int pending() {
        for (const Json& status : mPair.device.json({"status", "1"})) {
            if (status.at("kind") == GetParam().name) return status.at("pending").at("dirty");
        }
        return -1;
    }
    std::string failure() {
        for (const Json& status : mPair.device.json({"status", "1"})) {
            if (status.at("kind") == GetParam().name) return status.at("failure");
        }
        return {};
    }
    void answerPosts(int status, int count, const Json& headers = Json::object()) {
        mPair.installFault({{"method", "POST"},
                            {"path", GetParam().path},
                            {"kind", "status"},
                            {"status", status},
                            {"count", count},
                            {"headers", headers}});
    }
    static void wait(int milliseconds) {
        std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
    }

    SyncPair mPair;
};

TEST_P(Polite, APauseThatTheServerAsksForIsKept) {
    answerPosts(429, 1, {{"Retry-After", "3"}});
    const auto begin = std::chrono::steady_clock::now();
    add("first");
    ASSERT_TRUE(eventually([&] { return posts() == 1; }));
    add("second");
    wait(1000);
    const int inPause = posts();
    // On a machine that was too slow for the look to fall into the pause it says nothing.
    if (std::chrono::steady_clock::now() - begin < std::chrono::seconds(3)) {
        EXPECT_EQ(inPause, 1) << "an edit does not end the pause";
    }
    EXPECT_TRUE(eventually([&] { return pending() == 0; })) << mPair.device.daemonLog();
    EXPECT_GE(std::chrono::steady_clock::now() - begin, std::chrono::seconds(2));
    EXPECT_EQ(posts(), 3);
    // A client's own request does not wait.
    answerPosts(503, 1, {{"Retry-After", "3600"}});
    add("third");
    ASSERT_TRUE(eventually([&] { return posts() == 4; }));
    EXPECT_EQ(mPair.sync(1).status, 0) << mPair.device.daemonLog();
    EXPECT_EQ(pending(), 0);
    mPair.expectFaultsUsed();
}

// An edit on the device between the fetch of a page and its write.
TEST_P(Polite, AnEditWhileAPageIsOnItsWaySurvives) {
    const std::string path = GetParam().adminPath(mPair);
    const int id = add("mine");
    ASSERT_TRUE(eventually([&] { return idsOf("mine").size() == 1; }));
    for (const char* edited : {"edited once", "edited twice"}) {
        const std::vector<std::string> ids =
            idsOf(edited == std::string("edited once") ? "mine" : "edited once");
        ASSERT_EQ(ids.size(), 1U);
        mPair.provider.admin("PATCH", path + "/" + ids.front(), GetParam().body("the server's"));
        mPair.installFault({{"method", "GET"},
                            {"path", GetParam().list},
                            {"kind", "delay"},
                            {"delayMs", 1000},
                            {"afterHandling", true}});
        EXPECT_EQ(mPair.device.tool({"sync", "1", GetParam().name}).status, 0);
        ASSERT_TRUE(eventually([&] { return mPair.provider.admin("GET", "/faults")["faults"].empty(); }));
        edit(id, edited);
        EXPECT_TRUE(eventually([&] { return idsOf(edited).size() == 1; })) << mPair.device.daemonLog();
        EXPECT_TRUE(idsOf("the server's").empty());
        EXPECT_EQ(mPair.sync(1).status, 0);  // while the upload is on its way nobody gets another download
    }
    mPair.expectQuiet(1);
}

TEST_P(Polite, AServerInTroubleIsNotAskedAgainAtOnce) {
    answerPosts(500, 50);
    const int id = add("first");
    ASSERT_TRUE(eventually([&] { return posts() == 1; }));
    for (int i = 0; i < 5; ++i) {
        edit(id, "edit " + std::to_string(i));
        wait(200);
    }
    EXPECT_LE(posts(), 2);
    mPair.provider.admin("DELETE", "/faults");
    EXPECT_EQ(mPair.sync(1).status, 0) << mPair.device.daemonLog();
    EXPECT_EQ(pending(), 0);
}

TEST_P(Polite, WhatIsRefusedForGoodIsParkedUntilItChanges) {
    answerPosts(400, 1);
    const int refused = add("refused");
    ASSERT_TRUE(eventually([&] { return posts() == 1 && pending() == 1; }));
    for (int i = 0; i < 3; ++i) {
        add("good " + std::to_string(i));
        EXPECT_TRUE(eventually([&] { return posts() == 2 + i && pending() == 1; }))
            << posts() << ' ' << pending() << mPair.device.daemonLog();
    }
    EXPECT_NE(failure().find("waits until it is changed"), std::string::npos) << failure();
    edit(refused, "mended");
    EXPECT_TRUE(eventually([&] { return pending() == 0; })) << mPair.device.daemonLog();
    EXPECT_EQ(posts(), 5);
    // And a client that asks for a sync has it tried again.
    answerPosts(422, 1);
    add("refused again");
    ASSERT_TRUE(eventually([&] { return posts() == 6 && pending() == 1; }));
    EXPECT_EQ(mPair.sync(1).status, 0) << mPair.device.daemonLog();
    EXPECT_EQ(pending(), 0);
    EXPECT_EQ(failure(), "");
    mPair.expectQuiet(1);
}

// A network's login page says 200 to everything, and a server may miss an item once.
TEST_P(Polite, OneWrongAnswerIsNeitherSuccessNorTheEndOfAnItem) {
    const Json page = {{"kind", "status"}, {"status", 200}, {"body", "<html>log in</html>"}};
    const Json gone = {{"kind", "status"}, {"status", 404}};
    struct Row {
        std::string name;
        std::string method;
        Json fault;
    };
    for (const Row& row :
         {Row{"a page for an update", GetParam().update, page},
          Row{"gone at an update", GetParam().update, gone}, Row{"gone at a look", "GET", gone},
          Row{"a page for a deletion", "DELETE", page}, Row{"gone at a deletion", "DELETE", gone}}) {
        SCOPED_TRACE(row.name);
        const int id = add(row.name);
        ASSERT_TRUE(eventually([&] { return idsOf(row.name).size() == 1; }));
        Json fault = row.fault;
        fault.update({{"method", row.method}, {"path", std::string(GetParam().path) + "/[^?]+"}});
        mPair.installFault(fault);
        const bool isDeletion = row.method == "DELETE";
        if (isDeletion) {
            EXPECT_EQ(mPair.device.tool({GetParam().noun, "delete", std::to_string(id)}).status, 0);
        } else {
            edit(id, "edited");
        }
        (void)mPair.sync(1);
        EXPECT_EQ(mPair.sync(1).status, 0) << mPair.device.daemonLog();
        EXPECT_EQ(idsOf(row.name).size(), 0U);
        EXPECT_EQ(idsOf("edited").size(), isDeletion ? 0U : 1U);
        mPair.provider.admin("DELETE", "/faults");
        if (!isDeletion) {
            EXPECT_EQ(mPair.device.tool({GetParam().noun, "delete", std::to_string(id)}).status, 0);
        }
        EXPECT_EQ(mPair.sync(1).status, 0);
        EXPECT_EQ(idsOf("edited").size(), 0U);
    }
    mPair.expectQuiet(1);
}

// A server may keep something else than it was sent, and tells so in its answer only.
TEST_P(Polite, WhatTheServerMakesOfAnItemComesDown) {
    const auto textOf = [&](int id) {
        for (const Json& item : mPair.device.json({std::string(GetParam().noun) + "s", "list"})) {
            if (item.at("id") == id) return item.at(GetParam().member).get<std::string>();
        }
        return std::string();
    };
    const auto rewrite = [&](const char* method) {
        mPair.installFault({{"method", method},
                            {"path", GetParam().path},
                            {"kind", "rewrite"},
                            {"from", "sent"},
                            {"to", "kept"}});
    };
    rewrite("POST");
    const int id = add("sent");
    ASSERT_TRUE(eventually([&] { return idsOf("kept").size() == 1; }));
    EXPECT_EQ(mPair.sync(1).status, 0);
    EXPECT_EQ(textOf(id), "kept");
    rewrite(GetParam().update);
    edit(id, "sent again");
    ASSERT_TRUE(eventually([&] { return idsOf("kept again").size() == 1; }));
    EXPECT_EQ(mPair.sync(1).status, 0);
    EXPECT_EQ(textOf(id), "kept again");
    mPair.expectFaultsUsed();
    mPair.expectQuiet(1);
}

// What was sent is known in the list although the device's item no longer says it.
TEST_P(Polite, AnItemWhoseAnswerWasLostIsFoundAlthoughItWasEditedOrDeleted) {
    for (const bool isDeleted : {false, true}) {
        SCOPED_TRACE(isDeleted);
        const std::string sent = isDeleted ? "sent, then deleted" : "sent, then edited";
        mPair.installFault(
            {{"method", "POST"}, {"path", GetParam().path}, {"kind", "reset"}, {"afterHandling", true}});
        const int id = add(sent);
        ASSERT_TRUE(eventually([&] { return idsOf(sent).size() == 1; }));
        mPair.expectFaultsUsed();
        if (isDeleted) {
            EXPECT_EQ(mPair.device.tool({GetParam().noun, "delete", std::to_string(id)}).status, 0);
        } else {
            edit(id, "edited");
        }
        EXPECT_EQ(mPair.sync(1).status, 0) << mPair.device.daemonLog();
        EXPECT_EQ(idsOf(sent).size(), 0U);
        EXPECT_EQ(idsOf("edited").size(), 1U);
        EXPECT_EQ(mPair.sync(1).status, 0) << "lets go of what was deleted";
        mPair.expectQuiet(1);
    }
}

INSTANTIATE_TEST_SUITE_P(Kinds, Polite, testing::ValuesIn(kKinds),
                         [](const testing::TestParamInfo<Kind>& row) { return std::string(row.param.name); });

}  // namespace
