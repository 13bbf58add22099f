// Contacts, groups and photos between a provider and a device that is driven through the tool, in both directions.
#include <gtest/gtest.h>
#include <signal.h>

#include <fstream>
#include <sstream>

#include "e2e/Eventually.h"
#include "e2e/SyncPair.h"

namespace {

class Contacts : public testing::Test {
protected:
    Contacts() : mPair(1, {"--seed", "sample"}, "contacts") {
        mPair.removeProfileLinks();
        EXPECT_EQ(mPair.sync(1).status, 0);
    }
    std::string add(const Json& contact) {
        const CommandResult added =
            mPair.device.tool({"contact", "add", "--account", "1", "-"}, contact.dump());
        EXPECT_EQ(added.status, 0) << added.error;
        return std::to_string(std::atoi(added.output.c_str()));
    }
    void run(std::vector<std::string> arguments) {
        const CommandResult result = mPair.device.tool(std::move(arguments));
        EXPECT_EQ(result.status, 0) << result.error;
    }
    std::vector<Json> contactsNamed(const std::string& first) {
        std::vector<Json> found = mPair.wireContacts(1);
        std::erase_if(found, [&](const Json& contact) {
            const Json name = contact.value("gd$name", Json::object());
            return name.value("gd$givenName", Json::object()).value("$t", "") != first;
        });
        return found;
    }
    void expectSameAndQuiet() {
        ASSERT_EQ(mPair.sync(1).status, 0) << mPair.device.daemonLog();
        mPair.expectSameContacts(1);
        mPair.expectQuiet(1);
    }

    SyncPair mPair;
};

TEST_F(Contacts, AFirstSyncBringsEverythingAndASecondNothing) {
    EXPECT_EQ(mPair.device.json({"contacts", "list"}).size(), mPair.wireContacts(1).size());
    expectSameAndQuiet();
}

TEST_F(Contacts, WhatIsEditedOnTheDeviceArrivesByItself) {
    const std::string photo = mPair.device.root().at("/photo.png");
    std::ofstream(photo, std::ios::binary) << "\x89PNG\r\n\x1a\n photo";
    const std::string id = add({{"name", {{"first", "Xenia"}}}, {"photo", photo}, {"note", "new"}});
    EXPECT_TRUE(eventually([&] {
        const std::vector<Json> found = contactsNamed("Xenia");
        return found.size() == 1 && found[0].value("photo", "") != "";
    })) << mPair.device.daemonLog();
    run({"contact", "set", id, "note=edited", "photo="});
    EXPECT_TRUE(eventually([&] {
        const std::vector<Json> found = contactsNamed("Xenia");
        return found.size() == 1 && found[0].value("photo", "").empty() &&
               found[0].at("content").at("$t") == "edited";
    })) << mPair.device.daemonLog();
    run({"contact", "delete", id});
    EXPECT_TRUE(eventually([&] { return contactsNamed("Xenia").empty(); })) << mPair.device.daemonLog();
    expectSameAndQuiet();
}

TEST_F(Contacts, EveryOddTextGoesBothWaysUnchanged) {
    std::ifstream file(VPS_CORPUS_DIR "/strings/naughty-strings.json");
    const Json strings = Json::parse(file);
    ASSERT_EQ(strings.size(), 515U);
    run({"daemon", "stop"});
    // Many strings a contact, each in a field that can hold any text. What XML cannot carry must not keep the rest from the provider.
    const std::string odd = add({{"note", "\x01\x1b"}, {"phones", {{{"value", "\x07"}, {"label", "\x07"}}}}});
    Json contact;
    int number = 0;
    const auto flush = [&] {
        if (!contact.is_null()) add(contact);
        contact = nullptr;
    };
    for (const Json& string : strings) {
        std::string text = string;
        std::erase_if(text, [](char c) { return c >= 0 && c < ' ' && c != '\t' && c != '\n' && c != '\r'; });
        if (text == "\xEF\xBF\xBE" || text.empty() || text.find('\0') != std::string::npos) continue;
        if (contact.is_null())
            contact = {{"name", {{"first", text}, {"phoneticLast", text}}}, {"note", text}};
        contact["phones"].push_back({{"value", text}, {"type", "custom"}, {"label", text}});
        contact["fields"].push_back({{"key", text}, {"value", text}});
        if (++number % 40 == 0) flush();
    }
    flush();
    EXPECT_GT(number, 500);
    run({"daemon", "start"});
    EXPECT_TRUE(eventually([&] { return mPair.sync(1).status == 0; })) << mPair.device.daemonLog();
    run({"contact", "delete", odd});
    ASSERT_EQ(mPair.sync(1).status, 0);
    mPair.expectSameContacts(1);
    // And down again, onto a device that never saw them.
    SyncPair other(0);
    other.device.setClient(mPair.provider.clientId(), mPair.provider.clientSecret());
    const Provider::Account& account = mPair.provider.accounts().at(0);
    ASSERT_EQ(other.device
                  .addAccount(1, account.email, mPair.provider.url(), account.refreshToken, {"--no-calendar"})
                  .status,
              0);
    ASSERT_EQ(other.device.sync(1, "contacts").status, 0);
    const auto notes = [](Device& device) {
        std::multiset<std::string> found;
        for (Json listed : device.json({"contacts", "list"})) {
            for (const char* own : {"id", "photo", "groups"}) listed.erase(own);
            found.insert(listed.dump());
        }
        return found;
    };
    EXPECT_EQ(notes(other.device), notes(mPair.device));
}

TEST_F(Contacts, AKilledDaemonSendsNothingTwice) {
    mPair.provider.admin("POST", "/faults",
                         {{"method", "POST"},
                          {"path", "contacts/.*/full"},
                          {"kind", "delay"},
                          {"delayMs", 3000},
                          {"afterHandling", true},
                          {"count", 3}});
    add({{"name", {{"first", "Xenia"}}}});
    EXPECT_TRUE(eventually([&] { return contactsNamed("Xenia").size() == 1; })) << mPair.device.daemonLog();
    ASSERT_EQ(kill(mPair.device.daemonPid(), SIGKILL), 0);
    mPair.provider.admin("DELETE", "/faults");
    run({"daemon", "start"});
    EXPECT_TRUE(eventually([&] { return mPair.isNoted("POST /m8/feeds/contacts"); }));
    expectSameAndQuiet();
    EXPECT_EQ(contactsNamed("Xenia").size(), 1U);
}

TEST_F(Contacts, AccountsWithTheSameSystemGroupsStayApart) {
    const Provider::Account& second = mPair.provider.accounts().at(1);
    ASSERT_EQ(
        mPair.device.addAccount(2, second.email, mPair.provider.url(), second.refreshToken, {"--no-calendar"})
            .status,
        0);
    ASSERT_EQ(mPair.sync(2).status, 0);
    mPair.provider.admin(
        "POST", mPair.peoplePath(2, "contacts"),
        {{"gd$name", {{"gd$givenName", {{"$t", "Zoe"}}}}},
         {"gContact$groupMembershipInfo", {{{"href", "/m8/feeds/groups/default/base/starred"}}}}});
    ASSERT_EQ(mPair.sync(2).status, 0);
    mPair.expectSameContacts(2);
    mPair.expectQuiet(1);
    run({"account", "remove", "2"});
    EXPECT_EQ(mPair.device.json({"contacts", "list", "--account", "2"}).size(), 0U);
    expectSameAndQuiet();
}

}  // namespace
