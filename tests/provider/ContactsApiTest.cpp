// The contacts service: strict about what it takes, the same after a dump, and true to what it is told.
#include <set>

#include "ProviderFixture.h"
#include "Seed.h"

namespace provider {
namespace {

constexpr const char* kContacts = "/m8/feeds/contacts/default/full";
constexpr const char* kGroups = "/m8/feeds/groups/default/full";
constexpr const char* kJson = "?alt=json";
constexpr const char* kHead =
    R"(<atom:entry xmlns:atom="http://www.w3.org/2005/Atom" xmlns:gd="http://schemas.provider.example/g/2005")"
    R"( xmlns:gContact="http://schemas.provider.example/contact/2008"><atom:category)"
    R"( scheme="http://schemas.provider.example/g/2005#kind" term="http://schemas.provider.example/contact/2008#)";

// An entry of the kind with these elements.
std::string atom(const std::string& inner, const std::string& kind = "contact") {
    return kHead + kind + "\"/>" + inner + "</atom:entry>";
}

class Contacts : public ProviderFixture {
protected:
    Answer write(const std::string& method, const std::string& path, const std::string& body,
                 const std::string& match = "", const std::string& type = "application/atom+xml") {
        httplib::Headers headers = {{"XData-Version", "3.0"}};
        if (!body.empty()) headers.emplace("Content-Type", type);
        if (!match.empty()) headers.emplace("If-Match", match);
        return send(method, path, body, headers);
    }
    Answer read(const std::string& path) { return write("GET", path, ""); }
    // The entry that these elements make.
    Json add(const std::string& inner, const char* feed = kContacts) {
        const char* kind = feed == kContacts ? "contact" : "group";
        const Answer answer = write("POST", std::string(feed) + kJson, atom(inner, kind));
        EXPECT_EQ(answer.status, 201) << answer.text;
        return answer.body["entry"];
    }
    static std::string idOf(const Json& entry) {
        const std::string address = entry["id"]["$t"];
        return address.substr(address.rfind('/') + 1);
    }
    Json entry(const std::string& id) { return read(path(id)).body["entry"]; }
    static std::string path(const std::string& id, const char* feed = kContacts) {
        return std::string(feed) + "/" + id + kJson;
    }
    static std::string photo(const std::string& id) { return "/m8/feeds/photos/media/default/" + id; }
    static std::string membership(const std::string& group, const char* deleted = "false") {
        return "<gContact:groupMembershipInfo href=\"http://any.example/m8/feeds/groups/a%40x.example/base/" +
               group + "\" deleted=\"" + deleted + "\"/>";
    }
};

}  // namespace

TEST_F(Contacts, ElementsBecomeMembers) {
    const Json made = add(
        R"(<id>mine</id><gd:name><gd:givenName yomi="x">A &amp; B</gd:givenName><gd:familyName>C</gd:familyName></gd:name>)"
        R"(<gd:email rel="w" address="a@b"/><gd:email label="l" address="c@d"/><atom:content>n&#10;m</atom:content>)"
        R"(<gContact:event rel="anniversary"><gd:when startTime="2001-02-03"/></gContact:event>)" +
        membership("6") + membership("starred", "true"));
    const Json parts = Json::parse(R"json({
        "title": {"$t": "A & B C"}, "content": {"$t": "n\nm"},
        "gd$name": {"gd$givenName": {"yomi": "x", "$t": "A & B"}, "gd$familyName": {"$t": "C"}},
        "gd$email": [{"rel": "w", "address": "a@b"}, {"label": "l", "address": "c@d"}],
        "gContact$event": [{"rel": "anniversary", "gd$when": {"startTime": "2001-02-03"}}]})json");
    for (const auto& [name, value] : parts.items()) EXPECT_EQ(made[name], value) << name;
    const std::string base = mServer.url() + "/m8/feeds/";
    const std::string id = idOf(made);
    EXPECT_EQ(made["id"]["$t"], base + "contacts/a%40x.example/base/" + id);
    ASSERT_EQ(made["gContact$groupMembershipInfo"].size(), 1U);
    EXPECT_EQ(made["gContact$groupMembershipInfo"][0]["href"], base + "groups/a%40x.example/base/6");
    EXPECT_EQ(made["link"][0]["href"], base + "photos/media/a%40x.example/" + id);
    EXPECT_FALSE(made["link"][0].contains("gd$etag"));
    EXPECT_EQ(made["link"][2]["href"], base + "contacts/a%40x.example/full/" + id);
    EXPECT_EQ(entry(id), made);
    // The same with the prefixes that another writer would choose.
    const std::string other =
        R"(<entry xmlns="http://www.w3.org/2005/Atom"><category scheme="http://schemas.provider.example/g/2005#kind")"
        R"( term="http://schemas.provider.example/contact/2008#contact"/><title>T</title><n:nickname)"
        R"( xmlns:n="http://schemas.provider.example/contact/2008"><![CDATA[<&>]]></n:nickname></entry>)";
    const Answer answer = write("POST", std::string(kContacts) + kJson, other);
    EXPECT_EQ(answer.body["entry"]["gContact$nickname"]["$t"], "<&>") << answer.text;
    EXPECT_EQ(answer.body["entry"]["title"]["$t"], "T");
}

TEST_F(Contacts, BadEntriesAreRefused) {
    const std::string declared = atom("");
    const std::string bad[] = {
        " ",
        "<a",
        "<a></b>",
        "<entry/>",
        declared + declared,
        "<!DOCTYPE a>" + declared,
        "text" + declared,
        atom("<gd:name>&nbsp;</gd:name>"),
        atom("<atom:content>&#0;</atom:content>"),
        atom("<atom:content>&#xD800;</atom:content>"),
        atom("<atom:content>&#x110000;</atom:content>"),
        atom("<atom:content>&#4294967297;</atom:content>"),
        atom("<atom:content>a & b</atom:content>"),
        atom("<atom:content>\x01</atom:content>"),
        atom("<atom:content>\xff</atom:content>"),
        atom("<x:name xmlns:x=\"http://elsewhere.example\"/>"),
        atom("<y:name/>"),
        atom("<name/>"),
        atom("<gd:name y:yomi=\"a\"/>"),
        atom("<gd:name/><gd:name/>"),
        atom("", "group"),
        atom("<gd:email address=\"a@b\"/>"),
        atom("<gd:email rel=\"r\" label=\"l\" address=\"a@b\"/>"),
        atom("<gd:email rel=\"r\"/>"),
        atom("<gd:phoneNumber rel=\"r\"/>"),
        atom("<gd:phoneNumber>1</gd:phoneNumber>"),
        atom("<gd:im address=\"a\"/>"),
        atom("<gd:im protocol=\"p\"/>"),
        atom("<gd:organization/>"),
        atom("<gd:structuredPostalAddress/>"),
        atom("<gContact:relation>a</gContact:relation>"),
        atom("<gContact:website href=\"a\"/>"),
        atom("<gContact:website rel=\"r\"/>"),
        atom("<gContact:birthday when=\"1 May\"/>"),
        atom("<gContact:birthday when=\"2001-02-30\"/>"),
        atom("<gContact:event rel=\"r\"/>"),
        atom("<gContact:event rel=\"r\"><gd:when startTime=\"--02-03\"/></gContact:event>"),
        atom(membership("none")),
        atom("<gContact:groupMembershipInfo href=\"6\"/>"),
        atom("<gContact:groupMembershipInfo href=\"/m8/feeds/groups/b%40x.example/base/6\"/>"),
    };
    for (const std::string& body : bad) {
        const Answer answer = write("POST", std::string(kContacts) + kJson, body);
        EXPECT_EQ(answer.status, 400) << body << "\n" << answer.text;
    }
    EXPECT_EQ(read(std::string(kContacts) + kJson).body["feed"]["entry"].size(), 0U);
    for (const char* good : {"<gContact:birthday when=\"--02-29\"/>", "<gd:im protocol=\"p\" address=\"a\"/>",
                             "<gd:im rel=\"r\" protocol=\"p\" address=\"a\"/>", "", "<!-- & -->"}) {
        EXPECT_EQ(write("POST", std::string(kContacts) + kJson, atom(good)).status, 201) << good;
    }
}

TEST_F(Contacts, RequestsAreHeldToTheRules) {
    const Json made = add("<atom:title>a</atom:title>");
    const std::string id = idOf(made);
    const std::string etag = made["gd$etag"];
    const std::string system = path("6", kGroups);
    struct Row {
        const char* method;
        std::string path;
        std::string body;
        std::string match;
        int status;
    };
    const Row rows[] = {
        {"GET", kContacts, "", "", 400},  // no alt
        {"GET", std::string(kContacts) + kJson + "&q=a", "", "", 400},
        {"GET", std::string(kContacts) + kJson + "&max-results=0", "", "", 400},
        {"GET", std::string(kContacts) + kJson + "&start-index=0", "", "", 400},
        {"GET", path("none"), "", "", 404},
        {"GET", path(id, kGroups), "", "", 404},
        {"PUT", path(id), atom(""), "", 400},
        {"PUT", path(id), atom(""), "\"1\"", 409},
        {"PUT", path("none"), atom(""), "*", 404},
        {"DELETE", path(id), "", "", 400},
        {"DELETE", path(id), "", "\"1\"", 409},
        {"PUT", system, atom("<atom:title>b</atom:title>", "group"), "*", 403},
        {"DELETE", system, "", "*", 403},
        {"POST", std::string(kGroups) + kJson, atom("", "group"), "", 400},  // no title
    };
    for (const Row& row : rows) {
        const Answer answer = write(row.method, row.path, row.body, row.match);
        EXPECT_EQ(answer.status, row.status) << row.method << " " << row.path << " " << answer.text;
    }
    EXPECT_EQ(get(std::string(kContacts) + kJson).status, 400) << "without its version";
    EXPECT_EQ(write("POST", std::string(kContacts) + kJson, atom(""), "", "application/json").status, 415);
    EXPECT_EQ(entry(id)["gd$etag"], etag) << "nothing has changed";

    const Answer put = write("PUT", path(id), atom("<gContact:nickname>n</gContact:nickname>"), etag);
    ASSERT_EQ(put.status, 200) << put.text;
    EXPECT_EQ(put.body["entry"]["title"]["$t"], "") << "what is not sent is gone";
    EXPECT_NE(put.body["entry"]["gd$etag"], etag);
    EXPECT_GT(put.body["entry"]["updated"]["$t"], made["updated"]["$t"]);
    EXPECT_EQ(write("DELETE", path(id), "", etag).status, 409);
    const Answer removed = write("DELETE", path(id), "", "*");
    EXPECT_EQ(removed.status, 200);
    EXPECT_EQ(removed.text, "");
    EXPECT_EQ(read(path(id)).status, 404);
}

TEST_F(Contacts, AreListedInPages) {
    for (int i = 0; i < 60; ++i) add("<atom:title>" + std::to_string(i) + "</atom:title>");
    const std::string removed = idOf(read(std::string(kContacts) + kJson).body["feed"]["entry"][0]);
    write("DELETE", path(removed), "", "*");
    struct Row {
        const char* query;
        std::vector<std::size_t> sizes;
    };
    const Row rows[] = {{"", {50, 9}},
                        {"&max-results=59", {59}},
                        {"&max-results=20", {20, 20, 19}},
                        {"&start-index=61", {0}}};
    for (const Row& row : rows) {
        std::string next = std::string(kContacts) + kJson + row.query;
        std::set<std::string> seen;
        std::size_t total = 0;
        for (const std::size_t size : row.sizes) {
            ASSERT_FALSE(next.empty()) << row.query;
            const Json feed = read(next).body["feed"];
            EXPECT_EQ(feed["entry"].size(), size) << row.query;
            EXPECT_EQ(feed["openSearch$totalResults"]["$t"], "59");
            for (const Json& item : feed["entry"]) seen.insert(idOf(item));
            total += size;
            next.clear();
            for (const Json& link : feed["link"]) {
                if (link["rel"] != "next") continue;
                const std::string href = link["href"];
                ASSERT_TRUE(href.starts_with(mServer.url() + "/m8/feeds/contacts/a%40x.example/full?"));
                next = href.substr(mServer.url().size());
            }
        }
        EXPECT_EQ(next, "") << row.query;
        EXPECT_EQ(seen.size(), total) << row.query;
    }
}

TEST_F(Contacts, LeaveAGroupThatIsRemoved) {
    const std::string group = idOf(add("<atom:title>G</atom:title>", kGroups));
    const Json in = add(membership(group) + membership("6"));
    const Json out = add(membership("6"));
    const Json groups = read(std::string(kGroups) + kJson).body["feed"]["entry"];
    ASSERT_EQ(groups.size(), 3U);
    EXPECT_EQ(groups[0]["gContact$systemGroup"]["id"], "Contacts");
    EXPECT_EQ(groups[1]["title"]["$t"], "Starred in Merrow");
    EXPECT_EQ(write("DELETE", path(group, kGroups), "", "*").status, 200);
    const Json left = entry(idOf(in));
    EXPECT_NE(left["gd$etag"], in["gd$etag"]);
    EXPECT_EQ(left["gContact$groupMembershipInfo"], out["gContact$groupMembershipInfo"]);
    EXPECT_EQ(entry(idOf(out)), out);
    EXPECT_EQ(write("POST", std::string(kContacts) + kJson, atom(membership(group))).status, 400);
}

TEST_F(Contacts, PhotosMoveTheEtags) {
    const Json made = add("<atom:title>a</atom:title>");
    const std::string id = idOf(made);
    const std::string bytes("\x89PNG\0\xff", 6);
    EXPECT_EQ(read(photo(id)).status, 404);
    const Answer first = write("PUT", photo(id), bytes, "\"any\"", "image/png");
    ASSERT_EQ(first.status, 200) << first.text;
    EXPECT_EQ(first.text, "");
    const Json with = entry(id);
    const std::string etag = with["link"][0]["gd$etag"];
    EXPECT_NE(with["gd$etag"], made["gd$etag"]);
    EXPECT_GT(with["updated"]["$t"], made["updated"]["$t"]);
    const Answer shownPhoto = write("GET", photo(id), "", "*");
    EXPECT_EQ(shownPhoto.text, bytes);
    EXPECT_EQ(shownPhoto.headers.find("Content-Type")->second, "image/png");
    struct Row {
        const char* method;
        std::string body;
        std::string match;
        const char* type;
        int status;
    };
    const Row rows[] = {
        {"PUT", bytes, "\"1\"", "image/png", 409},
        {"PUT", bytes, etag, "text/plain", 415},
        {"PUT", std::string((10U << 20U) + 1, 'x'), etag, "image/png", 413},
        {"DELETE", "", "", "", 400},
        {"DELETE", "", "\"1\"", "", 409},
        {"PUT", "more", etag, "image/jpeg", 200},
        {"DELETE", "", etag, "", 409},
        {"DELETE", "", "*", "", 200},
        {"DELETE", "", "*", "", 404},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(write(row.method, photo(id), row.body, row.match, row.type).status, row.status)
            << row.method << " " << row.match << " " << row.type;
    }
    EXPECT_EQ(write("PUT", photo("none"), bytes, "", "image/png").status, 404);
    EXPECT_FALSE(entry(id)["link"][0].contains("gd$etag"));
    EXPECT_NE(entry(id)["gd$etag"], with["gd$etag"]);
}

TEST_F(Contacts, AreChangedFromOutside) {
    const std::string admin = "/admin/accounts/a@x.example/";
    const std::string contacts = admin + "contacts";
    EXPECT_EQ(send("POST", admin + "groups", R"({"id":"g","title":{"$t":"G"}})").body["id"], "g");
    const char* body =
        R"({"id":"c","gd$name":{"gd$givenName":{"$t":"A"}},"gContact$groupMembershipInfo":
            [{"href":"/m8/feeds/groups/default/base/g"}]})";
    EXPECT_EQ(send("POST", contacts, body).body["title"]["$t"], "A");
    EXPECT_EQ(send("POST", contacts, body).status, 409);
    EXPECT_EQ(send("POST", contacts, R"({"gd$email":[{"address":"a@b"}]})").status, 400);
    EXPECT_EQ(send("POST", contacts, R"({"gd$email":{"rel":"r","address":"a@b"}})").status, 400);
    EXPECT_EQ(send("PATCH", contacts + "/c", R"({"gd$name":{"gd$familyName":{"$t":"B"}}})").status, 200);
    EXPECT_EQ(entry("c")["title"]["$t"], "A B");
    EXPECT_EQ(send("GET", contacts + "/c/photo").status, 404);
    EXPECT_EQ(send("PUT", contacts + "/c/photo", "bytes", {{"Content-Type", "image/png"}}).status, 200);
    EXPECT_EQ(read(photo("c")).text, "bytes");
    const Json dump = get("/admin/dump").body;
    Store loaded;
    loaded.load(dump);
    EXPECT_EQ(loaded.dump(), dump);
    EXPECT_EQ(loaded.contacts("a@x.example").get(FeedKind::kContact, "c").photo.bytes, "bytes");
    for (const char* bad :
         {R"([])", R"({"contacts":[{"fields":{"gContact$birthday":{}}}]})",
          R"({"contacts":[{"fields":{},"photo":{"bytes":"*"}}]})",
          R"({"groups":[{"id":"x","etag":"1","fields":{}},{"id":"x","etag":"1","fields":{}}]})"}) {
        Json state = {{"accounts", {{{"email", "b@x.example"}}}}};
        state["accounts"][0]["contacts"] = Json::parse(bad);
        EXPECT_THROW(loaded.load(state), ApiError) << bad;
        EXPECT_EQ(loaded.dump(), dump) << bad;
    }
    EXPECT_EQ(send("DELETE", contacts + "/c/photo").status, 200);
    EXPECT_EQ(send("PUT", contacts + "/c", R"({"title":{"$t":"T"}})").status, 200);
    EXPECT_FALSE(entry("c").contains("gd$name"));
    EXPECT_EQ(send("DELETE", contacts + "/c?deleted=listed").status, 200);
    const Json listed = read(std::string(kContacts) + kJson).body["feed"]["entry"];
    ASSERT_EQ(listed.size(), 1U);
    EXPECT_TRUE(listed[0].contains("gd$deleted") && listed[0].contains("deleted"));
    loaded.load(get("/admin/dump").body);
    EXPECT_TRUE(loaded.contacts("a@x.example").entries(FeedKind::kContact).at(0)->isDeleted);
    EXPECT_EQ(read(path("c")).status, 404);
    EXPECT_EQ(send("DELETE", admin + "groups/g").status, 200);
    EXPECT_EQ(send("GET", admin + "groups").body["items"].size(), 2U);
}

TEST_F(Contacts, PeopleShowThemselvesToAnybody) {
    const httplib::Headers open = {{"Authorization", ""}};
    const std::string person = "/orbit/v1/people/p?key=k";
    EXPECT_EQ(send("GET", person, "", open).status, 404);
    const char* profile = R"({"id":"q","name":{"givenName":"A","familyName":"B"},"nickname":"N"})";
    EXPECT_EQ(send("PUT", "/admin/people/p", profile).status, 200);
    EXPECT_EQ(send("GET", "/orbit/v1/people/p", "", open).status, 400);
    const Json plain = send("GET", person, "", open).body;
    EXPECT_EQ(plain["id"], "p");
    EXPECT_EQ(plain["name"]["familyName"], "B");
    EXPECT_EQ(plain["image"]["isDefault"], true);
    EXPECT_EQ(send("GET", "/img/default?sz=720", "", open).text.substr(1, 3), "PNG");
    EXPECT_EQ(send("PUT", "/admin/people/p/photo", "bytes", {{"Content-Type", "image/jpeg"}}).status, 200);
    const Json image = send("GET", person, "", open).body["image"];
    EXPECT_EQ(image["isDefault"], false);
    EXPECT_EQ(image["url"], mServer.url() + "/img/p");
    EXPECT_EQ(send("GET", "/img/p?sz=720", "", open).text, "bytes");
    EXPECT_EQ(send("GET", "/img/p?sz=x", "", open).status, 400);
    EXPECT_EQ(send("GET", "/img/none", "", open).status, 404);
}

TEST_F(Contacts, SeedsUseWhatAClientMayUse) {
    seedContacts(mServer.store(), "a@x.example");
    addBulkContacts(mServer.store().contacts("a@x.example"), 5);
    const Json feed = read(std::string(kContacts) + kJson).body["feed"];
    EXPECT_EQ(feed["entry"].size(), 17U);
    std::size_t photos = 0;
    for (const Json& item : feed["entry"]) {
        if (!item["link"][0].contains("gd$etag")) continue;
        ++photos;
        EXPECT_EQ(read(photo(idOf(item))).text.substr(1, 3), "PNG");
    }
    EXPECT_EQ(photos, 3U);
    const std::size_t bytes = feed["entry"].back().dump().size();
    EXPECT_GT(bytes, 900U);
    EXPECT_LT(bytes, 1300U);
    EXPECT_EQ(entry("sites")["gContact$website"][0]["href"], mServer.url() + "/profiles/p100");
    EXPECT_EQ(get("/orbit/v1/people/p100?key=k").body["nickname"], "Hiro");
}

}  // namespace provider
