// Both directions of the contacts sync against a feed server in the same process.
#include "platform/settings.h"
#include "service/contacts/ContactSyncFixture.h"
#include "support/LogCapture.h"

using sync_result::kFailed;
using sync_result::kOk;

TEST_F(ContactSync, EverythingTravelsBothWaysOnce) {
    mServer.put("groups", "6",
                {{"title", {{"$t", "System"}}}, {"gContact$systemGroup", {{"id", "Contacts"}}}});
    mServer.put("groups", "g1", {{"title", {{"$t", "Friends"}}}});
    for (const char* id : {"a", "b", "c", "d", "e"}) mServer.put("contacts", id, named(id));
    mServer.put(
        "contacts", "f",
        named("f", {{"gContact$gender", {{"value", "x"}}},
                    {"gContact$groupMembershipInfo", {{{"href", "http://s/groups/a%40x.com/base/g1"}}}}}));
    sync();
    expectSame();
    expectQuiet();
    int group = 0;
    ASSERT_EQ(manager().getGroupId("g1", mBook, &group), kOk);
    auto device = deviceContacts();
    rename(device["f"], "f edited");
    erase(device["a"]);
    mServer.erase("contacts", "b");
    mServer.put("contacts", "c", named("c moved"));
    add("fresh", group);
    sync();
    expectSame();
    EXPECT_EQ(serverNames(), (std::set<std::string>{"c moved", "d", "e", "f edited", "fresh"}));
    EXPECT_EQ(mServer.all("contacts")["f"]["gContact$gender"]["value"], "x");
    for (const auto& [id, entry] : mServer.all("contacts")) {
        if (id[0] != 'n') continue;
        EXPECT_NE(entry["gContact$groupMembershipInfo"][0]["href"].get<std::string>().find("/base/g1"),
                  std::string::npos);
    }
    sync();
    expectQuiet();
}

TEST_F(ContactSync, GroupsOfTheDeviceGoUpButNotThoseOfTheServer) {
    mServer.put("groups", "6",
                {{"title", {{"$t", "System"}}}, {"gContact$systemGroup", {{"id", "Contacts"}}}});
    sync();
    contacts_record_h raw = nullptr;
    ASSERT_EQ(contacts_record_create(_contacts_group, &raw), 0);
    const ContactsRecord record(raw);
    ASSERT_EQ(contacts_record_set_int(raw, CONTACTS_GROUP_ADDRESS_BOOK_ID, mBook), 0);
    ASSERT_EQ(contacts_record_set_str(raw, CONTACTS_GROUP_NAME, "Mine & <yours>"), 0);
    int mine = 0;
    int system = 0;
    ASSERT_EQ(contacts_db_insert_record(raw, &mine), 0);
    ASSERT_EQ(manager().getGroupId("6", mBook, &system), kOk);
    ASSERT_EQ(contacts_db_delete_record(_contacts_group, system), 0);
    add("member", mine);
    sync();
    const auto groups = mServer.all("groups");
    ASSERT_EQ(groups.size(), 2U);
    EXPECT_EQ(groups.rbegin()->second["title"]["$t"], "Mine & <yours>");
    const auto contacts = mServer.all("contacts");
    ASSERT_EQ(contacts.size(), 1U);
    EXPECT_NE(contacts.begin()->second["gContact$groupMembershipInfo"][0]["href"].get<std::string>().find(
                  groups.rbegin()->first),
              std::string::npos);
    sync();
    EXPECT_EQ(manager().getGroupId("6", mBook, &system), kOk) << "the server's group comes back";
    expectQuiet();
    ASSERT_EQ(contacts_db_delete_record(_contacts_group, mine), 0);
    sync();
    EXPECT_EQ(mServer.all("groups").size(), 1U);
}

TEST_F(ContactSync, IdsThatAreEncodedInHrefsAreFoundAgain) {
    const std::vector<std::string> ids = {"c:1 @x", "c%2Fb", "c\xC3\xA9"};
    mServer.put("groups", "g:1 %", {{"title", {{"$t", "Friends"}}}});
    for (const std::string& id : ids) mServer.put("contacts", id, named(id));
    sync();
    expectSame();
    int group = 0;
    ASSERT_EQ(manager().getGroupId("g%3A1%20%25", mBook, &group), kOk);
    add("member", group);
    for (const std::string& id : ids) rename(deviceContacts()[id], id + " edited");
    setImage(deviceContacts()[ids[0] + " edited"], "mine");
    sync();
    ASSERT_EQ(mServer.all("contacts").size(), 4U) << "nothing is doubled";
    for (const std::string& id : ids)
        EXPECT_EQ(mServer.all("contacts")[id]["gd$name"]["gd$givenName"]["$t"], id + " edited");
    EXPECT_EQ(mServer.photo(ids[0]), "mine");
    const Json member = mServer.all("contacts").rbegin()->second;
    EXPECT_TRUE(
        member["gContact$groupMembershipInfo"][0]["href"].get<std::string>().ends_with("/base/g%3A1%20%25"))
        << member;
    sync();
    expectQuiet();
    for (const std::string& id : ids) erase(deviceContacts()[id + " edited"]);
    ASSERT_EQ(contacts_db_delete_record(_contacts_group, group), 0);
    sync();
    EXPECT_EQ(serverNames(), std::set<std::string>{"member"});
    EXPECT_TRUE(mServer.all("groups").empty());
    expectSame();
}

TEST_F(ContactSync, PhotosGoBothWays) {
    mServer.put("contacts", "a", named("a"));
    mServer.putPhoto("a", "first photo");
    mServer.put("contacts", "b", named("b"));
    sync();
    EXPECT_EQ(imageOf(deviceContacts()["a"]), "first photo");
    expectQuiet();
    mServer.put("contacts", "a", named("a2"));
    sync();
    EXPECT_EQ(imageOf(deviceContacts()["a2"]), "first photo") << "an edit of another field keeps it";
    setImage(deviceContacts()["a2"], "mine");
    setImage(deviceContacts()["b"], "mine too");
    sync();
    EXPECT_EQ(mServer.photo("a"), "mine");
    EXPECT_EQ(mServer.photo("b"), "mine too");
    expectQuiet();
    setImage(deviceContacts()["b"], "");
    sync();
    EXPECT_EQ(mServer.photo("b"), "");
    expectQuiet();
    mServer.photoStatus = 404;
    mServer.putPhoto("a", "newer");
    sync();
    EXPECT_EQ(imageOf(deviceContacts()["a2"]), "mine") << "what cannot be had leaves what is there";
    int before = 0;
    int after = 0;
    EXPECT_EQ(contacts_db_get_current_version(&before), 0);
    sync();
    EXPECT_EQ(contacts_db_get_current_version(&after), 0);
    EXPECT_EQ(before, after) << "a contact is not written again for a photo that cannot be had";
    mServer.photoStatus = 200;
    sync();
    EXPECT_EQ(imageOf(deviceContacts()["a2"]), "newer") << "and is asked for again";
    expectQuiet();
    EXPECT_TRUE(std::filesystem::is_empty(root().at("/tmp")) ||
                !std::filesystem::exists(root().at("/tmp/a")));
}

TEST_F(ContactSync, AProfileFillsWhatIsOpen) {
    const Json website = {{{"href", mServer.url() + "/profiles/p1"}, {"rel", "home"}}};
    mServer.put("contacts", "a", {{"gContact$website", website}});
    mServer.put("contacts", "b", named("Own", {{"gContact$website", website}}));
    mServer.putPhoto("b", "own photo");
    sync();
    EXPECT_EQ(imageOf(deviceContacts()["Public"]), "profile image 720");
    EXPECT_EQ(imageOf(deviceContacts()["Own"]), "own photo");
    expectQuiet();
}

TEST_F(ContactSync, AProfileThatCannotBeHadTakesNothingAndIsAskedForAgain) {
    const Json website = {{{"href", mServer.url() + "/profiles/p1"}, {"rel", "home"}}};
    mServer.put("contacts", "a", {{"gContact$website", website}});
    sync();
    // Neither the fields nor the image go with an answer that says nothing; the rest of the entry comes down.
    mServer.profileStatus = 500;
    mServer.put("contacts", "a", {{"gContact$website", website}, {"content", {{"$t", "edited"}}}});
    mServer.put("contacts", "b", named("New", {{"gContact$website", website}}));
    sync();
    EXPECT_EQ(deviceNames(), (std::set<std::string>{"Public", "New"}));
    EXPECT_EQ(imageOf(deviceContacts()["Public"]), "profile image 720");
    CtContactData data;
    ASSERT_EQ(manager().getContactData(deviceContacts()["Public"], mServer.url(), &data), kOk);
    const Json shown = readAtom(data.entry);
    EXPECT_EQ(shown["content"]["$t"], "edited");
    EXPECT_EQ(shown["gContact$birthday"]["when"], "1985-03-07");
    expectQuiet();
    mServer.profileStatus = 200;
    mServer.profileImageStatus = 404;
    sync();
    EXPECT_EQ(imageOf(deviceContacts()["New"]), "");
    EXPECT_EQ(imageOf(deviceContacts()["Public"]), "profile image 720");
    expectQuiet();
    mServer.profileImageStatus = 200;
    sync();
    EXPECT_EQ(imageOf(deviceContacts()["New"]), "profile image 720");
    const LogCapture log;
    mServer.profileStatus = 500;
    expectQuiet();
    EXPECT_EQ(log.count("cannot be had"), 0) << "what was had is not asked for again";
    // A person who is not there any more gives nothing.
    mServer.profileStatus = 404;
    mServer.put("contacts", "a", {{"gContact$website", website}});
    sync();
    EXPECT_EQ(deviceNames(), (std::set<std::string>{"", "New"}));
    EXPECT_EQ(imageOf(deviceContacts()[""]), "");
    expectQuiet();
}

TEST_F(ContactSync, APeopleServerThatDoesNotAnswerIsAskedOnce) {
    const char* const base = "http://127.0.0.1:1";
    ASSERT_EQ(vconf_set_str("db/vantor-pim-sync/people_server", base), 0);
    for (const char* id : {"a", "b", "c"})
        mServer.put("contacts", id,
                    named(id, {{"gContact$website", {{{"href", std::string(base) + "/profiles/p1"}}}}}));
    {
        const LogCapture log;
        sync();
        EXPECT_EQ(log.count("cannot be had"), 3);
        EXPECT_EQ(log.count("Getting XML from server Failed!"), 1);
    }
    expectSame();
    expectQuiet();
    ASSERT_EQ(vconf_unset("db/vantor-pim-sync/people_server"), 0);
}

TEST_F(ContactSync, WhenBothSidesChangedTheDeviceWins) {
    for (const char* id : {"a", "b", "c"}) mServer.put("contacts", id, named(id));
    sync();
    const auto device = deviceContacts();
    rename(device.at("a"), "a device");
    mServer.put("contacts", "a", named("a server", {{"gContact$gender", {{"value", "new"}}}}));
    rename(device.at("b"), "b device");
    mServer.erase("contacts", "b");
    erase(device.at("c"));
    mServer.put("contacts", "c", named("c server"));
    ASSERT_EQ(mUp.run(), kOk);  // the upload finds out by itself
    sync();
    EXPECT_EQ(serverNames(), (std::set<std::string>{"a device", "b device"}));
    EXPECT_EQ(mServer.all("contacts")["a"]["gContact$gender"]["value"], "new")
        << "what only the server knows stays";
    expectSame();
    // The same when the download sees it first.
    rename(deviceContacts()["a device"], "a again");
    mServer.put("contacts", "a", named("a server", {{"gContact$gender", {{"value", "newer"}}}}));
    rename(deviceContacts()["b device"], "b again");
    for (const auto& [id, entry] : mServer.all("contacts")) {
        if (id != "a") mServer.erase("contacts", id);
    }
    sync();
    EXPECT_EQ(serverNames(), (std::set<std::string>{"a again", "b again"}));
    EXPECT_EQ(mServer.all("contacts")["a"]["gContact$gender"]["value"], "newer");
    expectSame();
    sync();
    expectQuiet();
}

TEST_F(ContactSync, ALostAnswerDoublesNothing) {
    for (int round = 0; round < 2; ++round) {
        add("lost " + std::to_string(round));
        mServer.failNextWrites = 1;
        EXPECT_EQ(mUp.run(), kFailed);
        mServer.failNextWrites = 0;
        if (round == 0) {
            ASSERT_EQ(mUp.run(), kOk) << "the upload looks first";
        }
        sync();
        EXPECT_EQ(mServer.all("contacts").size(), static_cast<size_t>(round) + 1);
    }
    expectSame();
    rename(deviceContacts()["lost 0"], "edited");
    mServer.failNextWrites = 1;
    EXPECT_EQ(mUp.run(), kFailed);
    mServer.failNextWrites = 0;
    sync();
    EXPECT_EQ(serverNames(), (std::set<std::string>{"edited", "lost 1"}));
    sync();
    expectQuiet();
}

TEST_F(ContactSync, OnlyACompleteListDeletes) {
    for (int i = 0; i < 30; ++i)
        mServer.put("contacts", "c" + std::to_string(10 + i), named("n" + std::to_string(i)));
    sync();
    mServer.erase("contacts", "c10");
    mServer.endsEarly = true;
    EXPECT_EQ(mDown.run(), kFailed);
    EXPECT_EQ(deviceNames().size(), 30U);
    mServer.endsEarly = false;
    sync();
    EXPECT_EQ(deviceNames().size(), 29U);
    mServer.emptyLists = 1;
    sync();
    EXPECT_EQ(deviceNames().size(), 29U) << "an empty list is not believed at once";
    mServer.put("contacts", "", named("without id"));
    mServer.erase("contacts", "c11");
    sync();
    EXPECT_EQ(deviceNames().size(), 29U) << "a list that cannot be read whole deletes nothing";
    mServer.erase("contacts", "");
    mServer.emptyLists = 2;
    sync();
    EXPECT_EQ(deviceNames().size(), 0U) << "a side that stays empty is believed";
    sync();
    expectSame();
    expectQuiet();
}

TEST_F(ContactSync, AGroupIsMissedTwiceBeforeItsManyMembershipsGo) {
    const Json membership = {{{"href", "http://s/groups/a%40x.com/base/big"}}};
    for (const char* id : {"big", "g1", "g2"}) mServer.put("groups", id, {{"title", {{"$t", id}}}});
    for (int i = 0; i < 12; ++i)
        mServer.put("contacts", "c" + std::to_string(i),
                    named("n" + std::to_string(i), {{"gContact$groupMembershipInfo", membership}}));
    sync();
    int before = 0;
    int after = 0;
    ASSERT_EQ(manager().getGroupId("big", mBook, &before), kOk);
    const LogCapture log;
    mServer.hiddenGroup = "big";
    mServer.hiddenLists = 1;
    sync();
    ASSERT_EQ(manager().getGroupId("big", mBook, &after), kOk);
    EXPECT_EQ(before, after);
    EXPECT_EQ(log.count("is listed twice"), 0) << "the second look is no second entry";
    expectQuiet();
    mServer.hiddenGroup = "g1";
    mServer.hiddenLists = 1;
    sync();
    EXPECT_EQ(manager().getGroupId("g1", mBook, &after), kFailed) << "little is believed at once";
    mServer.hiddenGroup = "big";
    mServer.hiddenLists = 2;
    sync();
    EXPECT_EQ(manager().getGroupId("big", mBook, &after), kFailed);
}

TEST_F(ContactSync, TheWholeFeedAtOnceSaysTheSame) {
    mServer.put("groups", "g1", {{"title", {{"$t", "Friends"}}}});
    for (const char* id : {"a", "b", "c", "d", "e"}) mServer.put("contacts", id, named(id));
    ASSERT_EQ(mDown.processGroups(), kOk);
    ASSERT_EQ(mDown.processContacts(), kOk);
    expectSame();
    mServer.put("contacts", "b", named("b2"));
    mServer.erase("contacts", "c");
    ASSERT_EQ(mDown.processContacts(), kOk);
    expectSame();
    expectQuiet();
}

TEST_F(ContactSync, AListThatCannotBeReadIsTold) {
    struct Case {
        int status;
        const char* text;
        const char* line;
    };
    for (const Case& row : {Case{503, "busy", "Getting contacts from remote failed! -1"},
                            Case{200, "<html>busy</html>", "JSON parsing Failed"},
                            Case{200, "{}", "Server's response is suspicious. check full string"}}) {
        const LogCapture log;
        mServer.listStatus = row.status;
        mServer.listText = row.text;
        EXPECT_EQ(mDown.processContactsPageByPage(), kFailed);
        EXPECT_EQ(log.count(row.line), 1) << row.line;
        EXPECT_EQ(mDown.processContacts(), kFailed);
        EXPECT_EQ(log.count(row.line), 2) << row.line << ", the whole feed";
    }
}

TEST_F(ContactSync, RowsThatWereCutOffAreTakenOver) {
    for (const char* id : {"a", "b", "c"}) mServer.put("contacts", id, named(id));
    mServer.put("groups", "g1", {{"title", {{"$t", "Friends"}}}});
    sync();
    add("mine");
    sync();
    rename(deviceContacts()["b"], "b edited");
    for (const auto& [name, id] : deviceContacts()) ASSERT_EQ(manager().metaData()->forgetContact(id), kOk);
    int group = 0;
    ASSERT_EQ(manager().getGroupId("g1", mBook, &group), kOk);
    ASSERT_EQ(manager().metaData()->forgetGroup(group), kOk);
    sync();
    EXPECT_EQ(serverNames(), (std::set<std::string>{"a", "b edited", "c", "mine"}));
    EXPECT_EQ(mServer.all("contacts").size(), 4U);
    expectSame();
    EXPECT_EQ(deviceContacts().size(), 4U);
    sync();
    expectQuiet();
    // Records that are gone although nobody deleted them are made again.
    ASSERT_EQ(contacts_db_delete_record(_contacts_contact, deviceContacts()["a"], {.by_sync = true}), 0);
    ASSERT_EQ(contacts_db_delete_record(_contacts_address_book, mBook), 0);
    sync();
    ASSERT_EQ(manager().getAddressBookId(mAccount.getAccountId(), &mBook), kOk);
    expectSame();
}
