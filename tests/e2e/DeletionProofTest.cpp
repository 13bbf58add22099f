// Lists that say that items are gone, each kind of list with each way to be wrong: nothing goes that the server still has, and a
// list that stays empty is believed.
#include <gtest/gtest.h>

#include <functional>

#include "e2e/SyncPair.h"

namespace {

std::string firstBook(SyncPair& pair, bool isTaskList) {
    const Json first = isTaskList ? pair.wireTaskLists(1).at(0) : pair.wireCalendars(1).at(0);
    return std::to_string(pair.localCalendar(1, first.at(isTaskList ? "title" : "summary")));
}

size_t books(SyncPair& pair, const char* kind) {
    const Json all = pair.device.json({"calendars", "list", "--account", "1"});
    return static_cast<size_t>(
        std::count_if(all.begin(), all.end(), [&](const Json& book) { return book.at("kind") == kind; }));
}

struct List {
    const char* name;
    const char* data;
    std::function<std::string(SyncPair&)> path;  // of the first page
    std::function<size_t(SyncPair&)> held;       // so many the device has
};

void PrintTo(const List& list, std::ostream* out) {
    *out << list.name;
}

const List kLists[] = {
    {"Calendars", "calendar", [](SyncPair&) { return "/calendar/v3/users/me/calendarList"; },
     [](SyncPair& pair) { return books(pair, "event"); }},
    {"Events", "calendar",
     [](SyncPair& pair) { return "/calendar/v3/calendars/" + pathText(pair.firstCalendar(1)) + "/events"; },
     [](SyncPair& pair) {
         return pair.device.json({"events", "list", "--calendar", firstBook(pair, false)}).size();
     }},
    {"TaskLists", "calendar", [](SyncPair&) { return "/tasks/v1/users/@me/lists"; },
     [](SyncPair& pair) { return books(pair, "todo"); }},
    {"Tasks", "calendar",
     [](SyncPair& pair) {
         return "/tasks/v1/lists/" + pair.wireTaskLists(1).at(0).at("id").get<std::string>() + "/tasks";
     },
     [](SyncPair& pair) {
         return pair.device.json({"todos", "list", "--calendar", firstBook(pair, true)}).size();
     }},
    {"Groups", "contacts", [](SyncPair&) { return "/m8/feeds/groups/default/full?alt=json"; },
     [](SyncPair& pair) {
         return pair.device.json({"groups", "list"}).size();
     }},
    {"Contacts", "contacts", [](SyncPair&) { return "/m8/feeds/contacts/default/full?alt=json"; },
     [](SyncPair& pair) {
         return pair.device.json({"contacts", "list"}).size();
     }}};

class DeletionProof : public testing::TestWithParam<List> {
protected:
    DeletionProof() : mPair(1, {"--seed", "sample"}, GetParam().data) {
        for (int i = 0; i < 12; ++i) {
            const std::string name = "of many " + std::to_string(i);
            mPair.provider.admin("POST", mPair.tasksPath(1, mPair.wireTaskLists(1).at(0).at("id")),
                                 {{"title", name}});
            mPair.provider.admin("POST", mPair.peoplePath(1, "groups"), {{"title", {{"$t", name}}}});
            mPair.provider.admin("POST", mPair.peoplePath(1, "contacts"),
                                 {{"gContact$nickname", {{"$t", name}}}});
        }
        mPair.removeProfileLinks();
        EXPECT_EQ(mPair.sync(1).status, 0);
        mPath = GetParam().path(mPair);
        mReply = mPair.provider.read(mPath);
    }

    // The first page with its last `count` items, and a next page when there is a token.
    Json page(size_t count, const std::string& token = "") {
        Json reply = mReply;
        const bool isFeed = reply.contains("feed");
        Json& items = itemsOf(reply);
        EXPECT_GT(items.size(), count);
        items.erase(items.begin(), items.end() - static_cast<int>(count));
        reply.erase("nextPageToken");
        if (isFeed) reply["feed"]["link"] = Json::array();
        if (!token.empty() && isFeed)
            reply["feed"]["link"].push_back(
                {{"rel", "next"}, {"href", mPair.provider.url() + mPath + "&start-index=" + token}});
        if (!token.empty() && !isFeed) reply["nextPageToken"] = token;
        return reply;
    }
    static Json& itemsOf(Json& reply) {
        return reply.contains("feed") ? reply["feed"]["entry"] : reply["items"];
    }
    // The next reads of the list are answered so; or, with a token, those of the page that it stands for.
    void answer(const std::string& token, const Json& body, int count = 1) {
        std::string path = mPath.substr(0, mPath.find('?'));
        for (size_t at = 0; (at = path.find('.', at)) != std::string::npos; at += 2) path.insert(at, "\\");
        path += token.empty() ? "(\\?|$)" : "\\?.*(pageToken|start-index)=" + token;
        Json fault = {{"method", "GET"}, {"path", path}, {"count", count}, {"kind", "body"}, {"body", body}};
        if (body.is_null()) fault["kind"] = "status";
        mPair.installFault(fault);
    }
    void expectSame() {
        GetParam().data == std::string("contacts") ? mPair.expectSameContacts(1) : mPair.expectSame(1);
    }

    SyncPair mPair;
    std::string mPath;
    Json mReply;
};

}  // namespace

TEST_P(DeletionProof, OnlyAListThatWasReadToItsEndOrTwiceDeletes) {
    const size_t before = GetParam().held(mPair);
    struct Row {
        const char* name;
        std::function<void()> spoil;
        int status;
    };
    const Row rows[] = {{"empty once", [&] { answer("", page(0)); }, 0},
                        {"shrunken once", [&] { answer("", page(1)); }, 0},
                        {"one item cannot be read",
                         [&] {
                             Json reply = mReply;
                             itemsOf(reply).back() = Json::object();
                             answer("", reply);
                         },
                         0},
                        {"an item of the second look cannot be read",
                         [&] {
                             Json reply = page(0);
                             itemsOf(reply).push_back(Json::object());
                             answer("", page(1));
                             answer("", reply);
                         },
                         0},
                        {"the second look fails",
                         [&] {
                             answer("", page(1));
                             answer("", nullptr);
                         },
                         1},
                        {"the next page fails",
                         [&] {
                             answer("77", nullptr);
                             answer("", page(1, "77"));
                         },
                         1},
                        {"the same page twice, and no more",
                         [&] {
                             answer("77", page(1));
                             answer("", page(1, "77"));
                         },
                         0},
                        {"the same page without end",
                         [&] {
                             answer("77", page(1, "77"));
                             answer("", page(1, "77"));
                         },
                         1}};
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        row.spoil();
        EXPECT_EQ(mPair.sync(1).status, row.status);
        mPair.expectFaultsUsed();
        expectSame();
    }
    answer("", page(0), 1000);
    EXPECT_EQ(mPair.sync(1).status, 0) << mPair.device.daemonLog();
    EXPECT_EQ(GetParam().held(mPair), 0U) << "what stays empty is believed";
    EXPECT_EQ(mPair.sync(1).status, 0) << "and is no trouble";
    mPair.provider.admin("DELETE", "/faults");
    for (int i = 0; i < 2; ++i) EXPECT_EQ(mPair.sync(1).status, 0);
    EXPECT_EQ(GetParam().held(mPair), before);
    expectSame();
}

INSTANTIATE_TEST_SUITE_P(Lists, DeletionProof, testing::ValuesIn(kLists),
                         [](const auto& list) { return list.param.name; });
