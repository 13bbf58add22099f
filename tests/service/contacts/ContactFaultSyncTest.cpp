// What comes between an edit and its arrival: groups that come later, refusals, changes of the other side in the middle.
#include "platform/settings.h"
#include "service/contacts/ContactSyncFixture.h"
#include "support/LogCapture.h"

using contacts_read::forEachChild;
using contacts_read::intOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

Json memberOf(const std::string& group) {
    return {{"gContact$groupMembershipInfo", {{{"href", "http://s/groups/a%40x.com/base/" + group}}}}};
}

std::vector<int> groupsOf(int contactId) {
    std::vector<int> groups;
    contacts_record_h raw = nullptr;
    if (contacts_db_get_record(_contacts_contact, contactId, &raw) != 0) return groups;
    const ContactsRecord record(raw);
    forEachChild(raw, CONTACTS_CONTACT_GROUP_RELATIONS, [&groups](contacts_record_h relation) {
        groups.push_back(intOf(relation, CONTACTS_GROUP_RELATION_GROUP_ID));
    });
    return groups;
}

int addGroup(int book, const char* name) {
    contacts_record_h raw = nullptr;
    EXPECT_EQ(contacts_record_create(_contacts_group, &raw), 0);
    const ContactsRecord record(raw);
    EXPECT_EQ(contacts_record_set_int(raw, CONTACTS_GROUP_ADDRESS_BOOK_ID, book), 0);
    EXPECT_EQ(contacts_record_set_str(raw, CONTACTS_GROUP_NAME, name), 0);
    int id = 0;
    EXPECT_EQ(contacts_db_insert_record(raw, &id), 0);
    return id;
}

}  // namespace

TEST_F(ContactSync, AMembershipSurvivesUntilItsGroupIsThere) {
    mServer.put("groups", "6",
                {{"title", {{"$t", "System"}}}, {"gContact$systemGroup", {{"id", "Contacts"}}}});
    Json early = memberOf("late");
    early["gContact$groupMembershipInfo"].push_back(memberOf("6")["gContact$groupMembershipInfo"][0]);
    mServer.put("contacts", "a", named("a", early));
    mServer.put("contacts", "b", named("b", memberOf("6")));
    sync();
    // An edit of another field does not take the membership away, neither before the group is known nor just after.
    rename(deviceContacts()["a"], "a2");
    sync();
    EXPECT_EQ(mServer.all("contacts")["a"]["gContact$groupMembershipInfo"].size(), 2U);
    mServer.put("groups", "late", {{"title", {{"$t", "Late"}}}});
    ASSERT_EQ(mDown.processGroups(), kOk);
    rename(deviceContacts()["a2"], "a3");
    ASSERT_EQ(mUp.run(), kOk);
    EXPECT_EQ(mServer.all("contacts")["a"]["gContact$groupMembershipInfo"].size(), 2U);
    sync();
    int late = 0;
    int system = 0;
    ASSERT_EQ(manager().getGroupId("late", mBook, &late), kOk);
    ASSERT_EQ(manager().getGroupId("6", mBook, &system), kOk);
    EXPECT_EQ(groupsOf(deviceContacts()["a3"]), (std::vector<int>{system, late}));
    expectQuiet();
    // A group of the server that was deleted on the device comes back with its members.
    ASSERT_EQ(contacts_db_delete_record(_contacts_group, system), 0);
    sync();
    sync();
    ASSERT_EQ(manager().getGroupId("6", mBook, &system), kOk);
    EXPECT_EQ(groupsOf(deviceContacts()["b"]), std::vector<int>{system});
    expectQuiet();
}

TEST_F(ContactSync, AGroupThatIsRenamedWhileItsPageComesKeepsNothingBack) {
    mServer.put("groups", "g1", {{"title", {{"$t", "Friends"}}}});
    sync();
    int group = 0;
    ASSERT_EQ(manager().getGroupId("g1", mBook, &group), kOk);
    mServer.put("groups", "g1", {{"title", {{"$t", "The server's"}}}});
    mServer.put("contacts", "a", named("a"));
    mServer.onGroupsRead = [&] {
        contacts_record_h raw = nullptr;
        ASSERT_EQ(contacts_db_get_record(_contacts_group, group, &raw), 0);
        const ContactsRecord record(raw);
        ASSERT_EQ(contacts_record_set_str(raw, CONTACTS_GROUP_NAME, "Mine"), 0);
        ASSERT_EQ(contacts_db_update_record(raw), 0);
    };
    ASSERT_EQ(mDown.run(), kOk);
    mServer.onGroupsRead = nullptr;
    EXPECT_EQ(deviceNames(), std::set<std::string>{"a"}) << "the contacts are not kept from coming";
    sync();
    EXPECT_EQ(mServer.all("groups").begin()->second["title"]["$t"], "Mine");
    sync();
    expectQuiet();
}

TEST_F(ContactSync, AnEditAfterTheWalkAndBeforeTheContactsWins) {
    mServer.put("contacts", "a", named("a"));
    sync();
    mServer.put("contacts", "a", named("the server's"));
    mServer.onGroupsRead = [&] {
        const auto device = deviceContacts();
        if (device.contains("a")) rename(device.at("a"), "mine");
    };
    ASSERT_EQ(mDown.run(), kOk);
    mServer.onGroupsRead = nullptr;
    EXPECT_EQ(deviceNames(), std::set<std::string>{"mine"});
    sync();
    EXPECT_EQ(serverNames(), std::set<std::string>{"mine"});
}

TEST_F(ContactSync, AContactWaitsForAGroupThatIsRefused) {
    const int group = addGroup(mBook, "Choir");
    add("member", group);
    mServer.groupWriteStatus = 400;
    EXPECT_EQ(mUp.run(), kFailed);
    ASSERT_EQ(serverNames(), std::set<std::string>{"member"}) << "its other fields go up";
    EXPECT_TRUE(manager().hasSomethingToSend(mAccount.getAccountId()));
    (void)mServer.takeWrites();
    EXPECT_EQ(mUp.run(), kOk);
    EXPECT_EQ(mServer.takeWrites(), 0) << "it is not sent over and over while it waits";
    mServer.groupWriteStatus = 0;
    mUp.forgetRefusals();  // as a client that asks for a sync does
    sync();
    EXPECT_EQ(mServer.all("contacts").begin()->second["gContact$groupMembershipInfo"].size(), 1U);
    EXPECT_EQ(groupsOf(deviceContacts()["member"]), std::vector<int>{group});
    sync();
    expectQuiet();
}

TEST_F(ContactSync, ARefusedPhotoSendsNoFieldsAgain) {
    mServer.put("contacts", "a", named("a"));
    sync();
    rename(deviceContacts()["a"], "a2");
    setImage(deviceContacts()["a2"], "mine");
    mServer.photoWriteStatus = 413;
    EXPECT_EQ(mUp.run(), kFailed);
    mServer.put("contacts", "a", named("a server"));
    mServer.putPhoto("a", "the server's");
    (void)mServer.takeWrites();
    EXPECT_EQ(mDown.run(), kOk);
    EXPECT_EQ(mUp.run(), kFailed);
    EXPECT_EQ(mServer.takeWrites(), 0);
    EXPECT_EQ(deviceNames(), std::set<std::string>{"a server"}) << "only the photo is the device's change";
    EXPECT_EQ(imageOf(deviceContacts()["a server"]), "mine");
    mServer.photoWriteStatus = 0;
    mUp.forgetRefusals();
    sync();
    EXPECT_EQ(mServer.photo("a"), "mine");
    sync();
    expectQuiet();
}

TEST_F(ContactSync, AChangeOfTheServerWhileAPhotoGoesUpComesDown) {
    mServer.put("contacts", "a", named("a"));
    sync();
    setImage(deviceContacts()["a"], "mine");
    mServer.onPhotoWritten = [&](std::map<std::string, Json>& contacts) {
        contacts["a"]["gd$name"]["gd$givenName"]["$t"] = "a server";
    };
    ASSERT_EQ(mUp.run(), kOk);
    mServer.onPhotoWritten = nullptr;
    sync();
    EXPECT_EQ(deviceNames(), std::set<std::string>{"a server"});
    EXPECT_EQ(imageOf(deviceContacts()["a server"]), "mine");
    expectQuiet();
}

TEST_F(ContactSync, AnEditWhileItsContactGoesUpIsSentToo) {
    mServer.put("contacts", "a", named("a"));
    mServer.put("contacts", "b", named("b"));
    mServer.put("contacts", "c", named("c"));
    sync();
    const auto device = deviceContacts();
    for (const char* name : {"a", "b"}) setImage(device.at(name), "first");
    rename(device.at("c"), "c edited");
    // All come after the marks; one after its contact was read, two before, of which one has no mark for its image.
    mServer.onPhotoWritten = [&](std::map<std::string, Json>&) {
        mServer.onPhotoWritten = nullptr;
        setImage(device.at("b"), "second");
        rename(device.at("b"), "b edited");
        rename(device.at("a"), "a edited");
        setImage(device.at("c"), "late");
    };
    ASSERT_EQ(mUp.run(), kOk);
    EXPECT_TRUE(manager().hasSomethingToSend(mAccount.getAccountId()))
        << "nobody has taken the edit of \"a\"";
    sync();
    EXPECT_EQ(serverNames(), (std::set<std::string>{"a edited", "b edited", "c edited"}));
    EXPECT_EQ(mServer.photo("b"), "second");
    EXPECT_EQ(mServer.photo("c"), "late");
    expectSame();
    sync();
    expectQuiet();
}

TEST_F(ContactSync, APhotoThatTheServerRemovedGoesAlthoughTheDevicesChangeWon) {
    mServer.put("contacts", "a", named("a"));
    mServer.putPhoto("a", "photo");
    sync();
    mServer.erasePhoto("a");
    rename(deviceContacts()["a"], "a edited");
    sync();
    sync();
    EXPECT_EQ(serverNames(), std::set<std::string>{"a edited"});
    EXPECT_EQ(imageOf(deviceContacts()["a edited"]), "");
    expectQuiet();
}

TEST_F(ContactSync, AnImageThatTheSyncWroteIsNoChangeOfTheUser) {
    for (const char* id : {"a", "b", "c"}) {
        mServer.put("contacts", id, named(id));
        mServer.putPhoto(id, std::string("photo of ") + id);
    }
    // The first page is written when the photo of the second is fetched.
    mServer.onPhotoRead = [&] {
        const auto device = deviceContacts();
        if (device.contains("a")) rename(device.at("a"), "a edited");
    };
    ASSERT_EQ(mDown.run(), kOk);
    mServer.onPhotoRead = nullptr;
    (void)mServer.takeWrites();
    ASSERT_EQ(mUp.run(), kOk);
    EXPECT_EQ(serverNames(), (std::set<std::string>{"a edited", "b", "c"}));
    EXPECT_EQ(mServer.takeWrites(), 1) << "the name, and no photo";
}

TEST_F(ContactSync, TextThatXmlCannotCarryKeepsNothingBack) {
    const int id = add("\x01");
    contacts_record_h raw = nullptr;
    ASSERT_EQ(contacts_db_get_record(_contacts_contact, id, &raw), 0);
    const ContactsRecord record(raw);
    contacts_record_h number = nullptr;
    ASSERT_EQ(contacts_record_create(_contacts_number, &number), 0);
    ASSERT_EQ(contacts_record_set_str(number, CONTACTS_NUMBER_NUMBER, "1\x02"), 0);
    ASSERT_EQ(contacts_record_set_str(number, CONTACTS_NUMBER_LABEL, "\x03"), 0);
    ASSERT_EQ(contacts_record_add_child_record(raw, CONTACTS_CONTACT_NUMBERS, number), 0);
    ASSERT_EQ(contacts_db_update_record(raw), 0);
    ASSERT_EQ(mUp.run(), kOk);
    const Json sent = mServer.all("contacts").begin()->second;
    EXPECT_FALSE(sent.contains("gd$name"));
    EXPECT_EQ(sent["gd$phoneNumber"][0]["$t"], "1");
    EXPECT_FALSE(sent["gd$phoneNumber"][0].contains("label"));
}
