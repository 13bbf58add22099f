// The built tool on contacts, groups and photos.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "cli/ToolRoot.h"
#include "platform/contacts.h"
#include "platform/contacts_read.h"

namespace {

constexpr const char* kFull =
    R"({"name": {"first": "Mira", "middle": "Ann", "last": "Öz <&>", "prefix": "Dr.", "suffix": "Jr.",
                 "phoneticFirst": "mee-ra", "phoneticMiddle": "an", "phoneticLast": "oez"},
        "nickname": "Mi",
        "emails": [{"value": "m@example.com", "type": "home", "label": ""},
                   {"value": "n@example.com", "type": "custom", "label": "Club"},
                   {"value": "o@example.com", "type": "other", "label": ""}],
        "phones": [{"value": "+49 30 1", "type": "work_fax", "label": "", "primary": false},
                   {"value": "+49 30 2", "type": "assistant", "label": "", "primary": true}],
        "addresses": [{"street": "Am Weg 1", "pobox": "7", "extended": "Mitte", "city": "Berlin", "region": "B",
                       "postcode": "10115", "country": "DE", "type": "custom", "label": "Boat", "primary": true}],
        "companies": [{"name": "Öl AG", "title": "CTO", "department": "R&D", "description": "d", "location": "l",
                       "symbol": "OEL", "type": "work", "label": ""}],
        "messengers": [{"value": "mira", "protocol": "JABBER", "label": ""},
                       {"value": "m", "protocol": "custom", "label": "IRC"}],
        "events": [{"date": "1990-02-28", "type": "birthday", "label": ""},
                   {"date": "2015-05-01", "type": "anniversary", "label": ""},
                   {"date": "2016-05-01", "type": "custom", "label": "Met"}],
        "relations": [{"name": "Ada", "type": "assistant", "label": ""}, {"name": "Bo", "type": "custom", "label": "Pal"},
                      {"name": "Cy", "type": "domestic-partner", "label": ""}],
        "urls": [{"value": "https://m.example", "type": "work", "label": ""},
                 {"value": "https://n.example", "type": "custom", "label": "Blog"}],
        "groups": [], "note": "two\nlines", "photo": "", "fields": [{"key": "shoe", "value": "39"}]})";

std::string textOfFile(const std::string& path) {
    std::ostringstream text;
    text << std::ifstream(path, std::ios::binary).rdbuf();
    return text.str();
}

class ContactTool : public testing::Test {
protected:
    ContactTool() {
        mBook = ToolRoot::addAddressBook(7);
        ToolRoot::addAddressBook(8);
    }
    Json show(const std::string& id) { return mTool.json({"contact", "show", id, "--json"}); }
    std::string add(const std::string& object) {
        return mTool.json({"contact", "add", "--account", "7", "-", "--json"}, object)["id"].dump();
    }
    int set(const std::string& id, const std::string& assignment) {
        return mTool.run({"contact", "set", id, assignment}).status;
    }
    std::string file(const std::string& name, const std::string& bytes) {
        std::ofstream(mTool.root().at("/" + name), std::ios::binary) << bytes;
        return mTool.root().at("/" + name);
    }

    ToolRoot mTool;
    int mBook = 0;
};

TEST_F(ContactTool, ShowsWhatCanBeEditedAndPutBack) {
    const std::string group =
        mTool.json({"group", "add", "--account", "7", "-", "--json"}, R"({"name": "Choir"})")["id"].dump();
    Json wanted = Json::parse(kFull);
    wanted["groups"] = {std::stoi(group)};
    const std::string id = add(wanted.dump());
    Json shown = show(id);
    Json expected = {{"id", std::stoi(id)}, {"account", 7}};
    expected.update(wanted);
    EXPECT_EQ(shown, expected);

    Json copy = mTool.json({"contact", "add", "-", "--json"}, shown.dump());
    EXPECT_NE(copy["id"], shown["id"]);
    copy["id"] = shown["id"];
    EXPECT_EQ(copy, shown);
    EXPECT_EQ(mTool.json({"contacts", "list", "--account", "7", "--json"}).size(), 2U);
    EXPECT_EQ(mTool.json({"contacts", "list", "--json"})[0], shown);
    EXPECT_EQ(mTool.json({"contacts", "list", "--account", "8", "--json"}).size(), 0U);

    const std::vector<std::string> changes = {
        "first=Mia", "name.last=", "nickname=", "note=other", R"(emails=[{"value": "new@example.com"}])",
        "groups=[]", "phones="};
    for (const std::string& change : changes) ASSERT_EQ(set(id, change), 0) << change;
    expected["name"]["first"] = "Mia";
    expected["name"]["last"] = "";
    expected["nickname"] = "";
    expected["note"] = "other";
    expected["emails"] = Json::parse(R"([{"value": "new@example.com", "type": "other", "label": ""}])");
    expected["groups"] = expected["phones"] = Json::array();
    EXPECT_EQ(show(id), expected);
    ASSERT_EQ(mTool.run({"contact", "delete", id}).status, 0);
    EXPECT_EQ(mTool.run({"contact", "show", id}).status, 1);
}

TEST_F(ContactTool, KeepsWhatTheJsonDoesNotShow) {
    const std::string id = add(
        R"({"companies": [{"name": "A"}, {"name": "B"}], "fields": [{"key": "k", "value": "v"}], "nickname": "n"})");
    ASSERT_EQ(contacts_connect_with_flags(0), 0);
    contacts_record_h raw = nullptr;
    ASSERT_EQ(contacts_db_get_record(_contacts_contact, std::stoi(id), &raw), 0);
    const ContactsRecord contact(raw);
    contacts_read::forEachChild(raw, CONTACTS_CONTACT_COMPANIES, [](contacts_record_h company) {
        EXPECT_EQ(contacts_record_set_str(company, CONTACTS_COMPANY_PHONETIC_NAME, "yomi"), 0);
    });
    contacts_record_h origin = nullptr;
    ASSERT_EQ(contacts_record_create(_contacts_extension, &origin), 0);
    ASSERT_EQ(contacts_record_set_int(origin, CONTACTS_EXTENSION_DATA1, 100), 0);
    ASSERT_EQ(contacts_record_set_str(origin, CONTACTS_EXTENSION_DATA3, "{}"), 0);
    ASSERT_EQ(contacts_record_add_child_record(raw, CONTACTS_CONTACT_EXTENSIONS, origin), 0);
    contacts_record_h membership = nullptr;
    ASSERT_EQ(contacts_record_create(_contacts_group_relation, &membership), 0);
    ASSERT_EQ(contacts_record_add_child_record(raw, CONTACTS_CONTACT_GROUP_RELATIONS, membership), 0);
    ASSERT_EQ(contacts_db_update_record(raw), 0);

    EXPECT_EQ(show(id)["groups"], Json::array()) << "of a group that the device does not have";
    for (const char* change : {R"(companies=[{"name": "C"}, {"name": "B"}])", "fields=[]", "groups=[]"})
        ASSERT_EQ(set(id, change), 0);
    contacts_record_h rawNow = nullptr;
    ASSERT_EQ(contacts_db_get_record(_contacts_contact, std::stoi(id), &rawNow), 0);
    const ContactsRecord now(rawNow);
    std::string companies;
    contacts_read::forEachChild(rawNow, CONTACTS_CONTACT_COMPANIES, [&](contacts_record_h company) {
        companies += contacts_read::textOf(company, CONTACTS_COMPANY_NAME) +
                     contacts_read::textOf(company, CONTACTS_COMPANY_PHONETIC_NAME) + " ";
    });
    EXPECT_EQ(companies, "C Byomi ");
    unsigned extensions = 0;
    unsigned memberships = 0;
    ASSERT_EQ(contacts_record_get_child_record_count(rawNow, CONTACTS_CONTACT_EXTENSIONS, &extensions), 0);
    ASSERT_EQ(contacts_record_get_child_record_count(rawNow, CONTACTS_CONTACT_GROUP_RELATIONS, &memberships),
              0);
    EXPECT_EQ(extensions, 1U);
    EXPECT_EQ(memberships, 1U);
    contacts_disconnect();
}

TEST_F(ContactTool, PhotosGoInAndOut) {
    const std::string bytes("\x89PNG\0\r\n", 7);
    const std::string id = add(R"({"nickname": "n", "photo": ")" + file("first.png", bytes) + "\"}");
    const std::string kept = show(id)["photo"];
    EXPECT_EQ(textOfFile(kept), bytes) << kept;
    ASSERT_EQ(mTool.run({"contact", "photo", id, mTool.root().at("/out.png")}).status, 0);
    EXPECT_EQ(textOfFile(mTool.root().at("/out.png")), bytes);
    EXPECT_EQ(mTool.run({"contact", "photo", id, "-"}).output, bytes);

    ASSERT_EQ(set(id, "nickname=m"), 0);
    EXPECT_EQ(show(id)["photo"], kept);
    ASSERT_EQ(set(id, "photo=" + file("second.png", "second")), 0);
    EXPECT_EQ(textOfFile(show(id)["photo"]), "second");
    EXPECT_FALSE(std::filesystem::exists(kept));
    for (const std::string& refused :
         {file("empty", ""), std::string(mTool.root().at("/none")), std::string(mTool.root().at("/"))})
        EXPECT_EQ(set(id, "photo=" + refused), 1) << refused;
    EXPECT_EQ(textOfFile(show(id)["photo"]), "second");
    ASSERT_EQ(set(id, "photo="), 0);
    EXPECT_EQ(show(id)["photo"], "");
    EXPECT_EQ(mTool.run({"contact", "photo", id, "-"}).status, 1);
    EXPECT_TRUE(std::filesystem::is_empty(mTool.root().at("/tmp"))) << "nothing staged is left";
}

TEST_F(ContactTool, GroupsAreTheUsersUnlessTheServerDefinesThem) {
    const std::string id = std::to_string(
        std::stoi(mTool.run({"group", "add", "-"}, R"({"name": "Choir", "account": 7})").output));
    EXPECT_EQ(mTool.json({"group", "show", id, "--json"}),
              Json({{"id", std::stoi(id)}, {"account", 7}, {"name", "Choir"}, {"readOnly", false}}));
    ASSERT_EQ(mTool.run({"group", "set", id, "name=Band"}).status, 0);
    const std::string member = add(R"({"nickname": "n", "groups": [)" + id + "]}");
    EXPECT_EQ(mTool.run({"contact", "add", "--account", "8", "-"}, R"({"groups": [)" + id + "]}").status, 1)
        << "a group of another account";
    const std::string system = std::to_string(ToolRoot::addSystemGroup(mBook, "Starred"));
    Json groups = mTool.json({"groups", "list", "--account", "7", "--json"});
    ASSERT_EQ(groups.size(), 2U);
    EXPECT_EQ(groups[0]["name"], "Band");
    EXPECT_EQ(groups[1]["readOnly"], true);
    EXPECT_EQ(mTool.run({"group", "set", system, "name=x"}).status, 1);
    EXPECT_EQ(mTool.run({"group", "delete", system}).status, 1);
    EXPECT_EQ(set(member, "groups=[" + system + "]"), 0) << "membership is the user's";
    EXPECT_EQ(set(member, "groups=[" + id + "," + system + "]"), 0);
    ASSERT_EQ(mTool.run({"group", "delete", id}).status, 0);
    EXPECT_EQ(show(member)["groups"], Json({std::stoi(system)}));
    EXPECT_EQ(mTool.json({"groups", "list", "--account", "8", "--json"}).size(), 0U);
}

TEST_F(ContactTool, RefusesWhatIsNotRightAndLeavesTheRest) {
    const std::string id = add(R"({"nickname": "kept"})");
    struct Row {
        std::vector<std::string> arguments;
        const char* input;
        int status;
    };
    const Row rows[] = {
        {{"contact", "set", id, "nickname=x", "groups=[99]"}, "", 1},
        {{"contact", "set", id, "groups=7"}, "", 1},
        {{"contact", "set", id, "phones=x"}, "", 1},
        {{"contact", "set", id, R"(phones=[{"type": "home"}])"}, "", 1},
        {{"contact", "set", id, R"(phones=[{"value": "1", "type": "house"}])"}, "", 1},
        {{"contact", "set", id, R"(phones=[{"value": "1", "type": "custom"}])"}, "", 1},
        {{"contact", "set", id, R"(events=[{"date": "2014-02-30"}])"}, "", 1},
        {{"contact", "set", id, R"(events=[{"date": "2014-02-03T10:00:00Z"}])"}, "", 1},
        {{"contact", "set", id, "id=4"}, "", 2},
        {{"contact", "set", id, "name=x"}, "", 2},
        {{"contact", "set", id, "first=a", "name.first=b"}, "", 2},
        {{"contact", "set", id}, "", 2},
        {{"contact", "set", "99", "nickname=b"}, "", 1},
        {{"contact", "show", "x"}, "", 2},
        {{"contact", "delete", "99"}, "", 1},
        {{"contact", "add", "-"}, R"({"nickname": "no account"})", 1},
        {{"contact", "add", "--account", "9", "-"}, R"({"nickname": "no such account"})", 1},
        {{"contact", "add", "--account", "7", "-"}, R"({"mail": "unknown"})", 1},
        {{"contact", "add", "--account", "7", "-"}, R"({"name": {"given": "unknown"}})", 1},
        {{"contact", "add", "--account", "7", "-"}, R"({"name": "Mira"})", 1},
        {{"contact", "add", "--account", "7", "-"}, R"({"phones": [{"value": 1}]})", 1},
        {{"contact", "add", "--account", "7", "-"}, R"({"phones": [{"value": "1", "kind": "home"}]})", 1},
        {{"contact", "add", "--account", "7", "-"}, "[]", 1},
        {{"group", "add", "--account", "7", "-"}, R"({"name": ""})", 1},
        {{"group", "add", "--account", "7", "-"}, R"({"title": "x"})", 1},
        {{"group", "add", "-"}, R"({"name": "x"})", 1},
        {{"group", "show", "99"}, "", 1},
        {{"group", "set", "99", "name=x"}, "", 1},
        {{"group", "set", "1", "account=8"}, "", 2},
    };
    for (const Row& row : rows) {
        const CommandResult result = mTool.run(row.arguments, row.input);
        EXPECT_EQ(result.status, row.status) << row.arguments.back() << row.input << result.error;
        EXPECT_EQ(std::count(result.error.begin(), result.error.end(), '\n'), 1) << result.error;
    }
    const Json all = mTool.json({"contacts", "list", "--json"});
    ASSERT_EQ(all.size(), 1U);
    EXPECT_EQ(all[0]["nickname"], "kept");
}

}  // namespace
