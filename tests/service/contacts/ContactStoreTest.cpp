// The contacts side's stores: bookkeeping, feed pages on their way into an address book, and what a user changes there.
#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>

#include "common/SyncResult.h"
#include "contacts/CtDataManager.h"
#include "contacts/CtFeedParsers.h"
#include "contacts/CtItemWriter.h"
#include "contacts/CtSnapshot.h"
#include "platform/contacts_read.h"
#include "service/contacts/AtomReader.h"
#include "support/FullDisk.h"
#include "support/LogCapture.h"
#include "support/TestRoot.h"

using contacts_read::intOf;
using contacts_read::textOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

constexpr int kAccount = 7;

Json contact(const std::string& id, const std::string& etag, const std::string& name,
             const Json& more = Json::object()) {
    Json entry = {{"id", {{"$t", "http://s/contacts/a%40x.com/base/" + id}}},
                  {"gd$etag", etag},
                  {"updated", {{"$t", "2026-03-01T10:00:00.000Z"}}},
                  {"title", {{"$t", name}}},
                  {"gd$name", {{"gd$givenName", {{"$t", name}}}}}};
    entry.update(more);
    return entry;
}

std::string feed(const std::vector<Json>& entries) {
    return Json{{"feed", {{"entry", entries}}}}.dump();
}

class ContactStore : public testing::Test {
protected:
    ContactStore() {
        EXPECT_EQ(mManager.prepareSync(), kOk);
        EXPECT_EQ(mManager.addAccount(kAccount), kOk);
        EXPECT_EQ(mManager.getAddressBookId(kAccount, &mBook), kOk);
    }

    static std::vector<BulkItem> items(const std::vector<Json>& entries) {
        CtContactPage page;
        EXPECT_EQ(CtContactListJsonParser::parse(feed(entries), &page), kOk);
        std::vector<BulkItem> result;
        for (std::shared_ptr<ContactInfo>& entry : page.entries) {
            BulkItem& item = result.emplace_back();
            item.entry = entry;
            item.row.uri = entry->id;
            item.row.etag = entry->etag;
            item.row.updated = entry->updated;
        }
        return result;
    }

    CtContactSyncRow row(const std::string& uri) {
        CtContactSyncRow found;
        EXPECT_EQ(mManager.metaData()->getContactId(uri, &found.contact_id), kOk) << uri;
        EXPECT_EQ(mManager.metaData()->getContact(found.contact_id, &found), kOk) << uri;
        return found;
    }

    static std::string firstName(int contactId) {
        contacts_record_h raw = nullptr;
        if (contacts_db_get_record(_contacts_contact, contactId, &raw) != 0) return "(gone)";
        const ContactsRecord record(raw);
        std::string name;
        contacts_read::forEachChild(raw, CONTACTS_CONTACT_NAMES, [&name](contacts_record_h child) {
            name = textOf(child, CONTACTS_NAME_FIRST);
        });
        return name;
    }

    // A user's plain write of one child list.
    static void userWrites(int contactId, unsigned children, const char* view, unsigned property,
                           const std::string& value) {
        contacts_record_h raw = nullptr;
        ASSERT_EQ(contacts_db_get_record(_contacts_contact, contactId, &raw), 0);
        const ContactsRecord record(raw);
        contacts_record_h child = nullptr;
        ASSERT_EQ(contacts_record_create(view, &child), 0);
        ASSERT_EQ(contacts_record_set_str(child, property, value.c_str()), 0);
        ASSERT_EQ(contacts_record_add_child_record(raw, children, child), 0);
        ASSERT_EQ(contacts_db_update_record(raw), 0);
    }

    int userAdds() {
        contacts_record_h raw = nullptr;
        EXPECT_EQ(contacts_record_create(_contacts_contact, &raw), 0);
        const ContactsRecord record(raw);
        EXPECT_EQ(contacts_record_set_int(raw, CONTACTS_CONTACT_ADDRESS_BOOK_ID, mBook), 0);
        int id = 0;
        EXPECT_EQ(contacts_db_insert_record(raw, &id), 0);
        return id;
    }

    TestRoot mRoot;
    CtDataManager mManager;
    int mBook = 0;
};

}  // namespace

TEST_F(ContactStore, AnAddressBookIsReusedAndGoesWithItsAccount) {
    int again = 0;
    ASSERT_EQ(mManager.addAccount(kAccount), kOk);
    ASSERT_EQ(mManager.getAddressBookId(kAccount, &again), kOk);
    EXPECT_EQ(again, mBook);
    std::vector<BulkItem> page = items({contact("c1", "e", "Ada")});
    ASSERT_EQ(mManager.insertContacts(kAccount, &page), kOk);
    ASSERT_EQ(mManager.insertGroup(kAccount, "Starred in Merrow", "e", "", "g1", "{}", "Starred", true), kOk);
    ASSERT_EQ(mManager.insertGroup(kAccount, "Starred in Merrow 2", "e", "", "g2", "{}", "", false), kOk);
    int starred = 0;
    int first = 0;
    ASSERT_EQ(mManager.getGroupStarredInMerrow(mBook, &starred), kOk);
    ASSERT_EQ(mManager.getGroupId("g1", mBook, &first), kOk);
    EXPECT_EQ(starred, first);
    // A user deletes the book: the next look makes it anew, with no row of the old one.
    ASSERT_EQ(contacts_db_delete_record(_contacts_address_book, mBook), 0);
    ASSERT_EQ(mManager.addAccount(kAccount), kOk);
    CtDataManager::UriMap uris;
    ASSERT_EQ(mManager.getAllContactUri(kAccount, &uris), kOk);
    ASSERT_EQ(mManager.getAllGroupUri(kAccount, &uris), kOk);
    EXPECT_TRUE(uris.empty());
    ASSERT_EQ(mManager.deleteAccount(kAccount), kOk);
    EXPECT_EQ(mManager.getAddressBookId(kAccount, &again), kFailed);
    EXPECT_EQ(mManager.deleteAccount(kAccount), kFailed);
}

TEST_F(ContactStore, ThePageIsWrittenButForWhatCannotBeRead) {
    std::vector<BulkItem> page = items(
        {contact("c1", "e1", "Ada"), contact("bad", "e1", "Bad", {{"gd$phoneNumber", {{{"rel", "#home"}}}}}),
         contact("c2", "e1", "Bob's \"'; DROP TABLE x")});
    ASSERT_EQ(mManager.insertContacts(kAccount, &page), kOk);
    EXPECT_EQ(page.size(), 2U);
    EXPECT_EQ(firstName(row("c2").contact_id), "Bob's \"'; DROP TABLE x");
    std::vector<BulkItem> update = items({contact("c1", "e2", "Ada King")});
    ASSERT_EQ(mManager.updateContacts(kAccount, &update), kOk);
    EXPECT_EQ(firstName(row("c1").contact_id), "Ada King");
    EXPECT_EQ(row("c1").etag, "e2");
    std::vector<BulkItem> unknown = items({contact("c9", "e2", "Nobody")});
    EXPECT_EQ(mManager.updateContacts(kAccount, &unknown), kFailed);
    // The sync's own writes are nobody's changes.
    EXPECT_FALSE(mManager.setContactChanged(mBook));
    EXPECT_EQ(mManager.setAccountChanged(kAccount), kOk);
    EXPECT_FALSE(mManager.hasSomethingToSend(kAccount));
    ASSERT_EQ(mManager.deleteContact(kAccount, "c1"), kOk);
    EXPECT_EQ(mManager.deleteContact(kAccount, "c1"), kFailed);
    EXPECT_FALSE(mManager.hasSomethingToSend(kAccount)) << "nor is a deletion that came from the server";
}

TEST_F(ContactStore, AUsersChangesAreMarked) {
    std::vector<BulkItem> page =
        items({contact("c1", "e", "Ada"), contact("c2", "e", "Bob"), contact("c3", "e", "Cy")});
    ASSERT_EQ(mManager.insertContacts(kAccount, &page), kOk);
    std::ofstream(mRoot.at("/tmp/image")) << "image";
    userWrites(row("c1").contact_id, CONTACTS_CONTACT_IMAGES, _contacts_image, CONTACTS_IMAGE_PATH,
               "/tmp/image");
    userWrites(row("c2").contact_id, CONTACTS_CONTACT_NOTES, _contacts_note, CONTACTS_NOTE_NOTE, "n");
    ASSERT_EQ(contacts_db_delete_record(_contacts_contact, row("c3").contact_id), 0);
    const int added = userAdds();
    EXPECT_TRUE(mManager.setContactChanged(mBook));
    ASSERT_EQ(mManager.setAccountChanged(kAccount), kOk);
    EXPECT_FALSE(mManager.setContactChanged(mBook));
    EXPECT_EQ(row("c1").dirty, 1);
    EXPECT_EQ(row("c1").image_dirty, 1);
    EXPECT_EQ(row("c2").dirty, 1);
    EXPECT_EQ(row("c2").image_dirty, 0);
    EXPECT_EQ(row("c3").deleted, 1);
    CtContactSyncRow fresh;
    ASSERT_EQ(mManager.metaData()->getContact(added, &fresh), kOk);
    EXPECT_EQ(fresh.dirty, 1);
    EXPECT_EQ(fresh.uri, "");
    int dirty = 0;
    int deleted = 0;
    ASSERT_EQ(mManager.countPending(kAccount, &dirty, &deleted), kOk);
    EXPECT_EQ(dirty, 3);
    EXPECT_EQ(deleted, 1);
    // A later change that is not about the image does not take its mark away.
    userWrites(row("c1").contact_id, CONTACTS_CONTACT_NOTES, _contacts_note, CONTACTS_NOTE_NOTE, "n");
    ASSERT_EQ(mManager.setAccountChanged(kAccount), kOk);
    EXPECT_EQ(row("c1").image_dirty, 1);
    ASSERT_EQ(mManager.clearDirtyContact(row("c1").contact_id), kOk);
    EXPECT_EQ(row("c1").dirty + row("c1").image_dirty, 0);
}

TEST_F(ContactStore, AChangeThatCannotBeMarkedIsSeenAgain) {
    std::vector<BulkItem> page =
        items({contact("c1", "e", "Ada"), contact("c2", "e", "Bob"), contact("c3", "e", "Cy")});
    ASSERT_EQ(mManager.insertContacts(kAccount, &page), kOk);
    ASSERT_EQ(mManager.setAccountChanged(kAccount), kOk);
    const int edited = row("c1").contact_id;
    userWrites(row("c2").contact_id, CONTACTS_CONTACT_NOTES, _contacts_note, CONTACTS_NOTE_NOTE, "n");
    userWrites(edited, CONTACTS_CONTACT_NOTES, _contacts_note, CONTACTS_NOTE_NOTE, "n");
    ASSERT_EQ(contacts_db_delete_record(_contacts_contact, row("c3").contact_id), 0);
    (void)userAdds();
    SyncDatabase& database = mManager.metaData()->database();
    const std::string when[] = {
        "UPDATE ON contact_sync_table WHEN new.contact_id = " + std::to_string(edited),
        "UPDATE ON contact_sync_table WHEN new.deleted = 1", "INSERT ON contact_sync_table"};
    for (const std::string& refused : when) {
        ASSERT_EQ(
            database.write(
                "CREATE TRIGGER refuse BEFORE " + refused + " BEGIN SELECT RAISE(ABORT, 'refused'); END", {}),
            kOk);
        EXPECT_EQ(mManager.setAccountChanged(kAccount), kFailed) << refused;
        EXPECT_EQ(row("c2").dirty, 0) << "all or nothing";
        EXPECT_TRUE(mManager.setContactChanged(mBook)) << refused;
        ASSERT_EQ(database.write("DROP TRIGGER refuse", {}), kOk);
    }
    ASSERT_EQ(mManager.setAccountChanged(kAccount), kOk);
    EXPECT_EQ(row("c1").dirty + row("c2").dirty + row("c3").deleted, 3);
}

TEST_F(ContactStore, ANewEtagLeavesTheRestOfTheRow) {
    const char* const time = "2026-03-01T10:00:00.000Z";
    std::vector<BulkItem> page = items({contact("c1", "e1", "Ada")});
    page[0].row.photo_etag = "p";
    ASSERT_EQ(mManager.insertContacts(kAccount, &page), kOk);
    ASSERT_EQ(mManager.insertGroup(kAccount, "Friends", "e1", time, "g1", "{}", "", false), kOk);
    int group = 0;
    ASSERT_EQ(mManager.getGroupId("g1", mBook, &group), kOk);
    ASSERT_EQ(mManager.updateContactEtag("c1", "e2"), kOk);
    ASSERT_EQ(mManager.updateGroupEtag(group, "e2"), kOk);
    std::vector<CtContactSyncRow> contacts;
    std::vector<CtGroupSyncRow> groups;
    ASSERT_EQ(mManager.metaData()->getAllContacts(mBook, &contacts), kOk);
    ASSERT_EQ(mManager.metaData()->getAllGroups(mBook, &groups), kOk);
    EXPECT_EQ(contacts.at(0).etag + contacts.at(0).photo_etag + contacts.at(0).updated,
              std::string("e2p") + time);
    EXPECT_EQ(groups.at(0).etag + groups.at(0).uri + groups.at(0).updated, std::string("e2g1") + time);
}

TEST_F(ContactStore, AContactChangedMeanwhileIsNotOverwritten) {
    std::vector<BulkItem> page = items({contact("c1", "e1", "Ada"), contact("c2", "e1", "Bob")});
    ASSERT_EQ(mManager.insertContacts(kAccount, &page), kOk);
    const CtContactSyncRow known = row("c1");
    userWrites(known.contact_id, CONTACTS_CONTACT_NOTES, _contacts_note, CONTACTS_NOTE_NOTE, "mine");
    std::vector<BulkItem> update = items({contact("c1", "e2", "Server"), contact("c2", "e2", "Server")});
    for (BulkItem& item : update) item.expectedVersion = known.version;
    ASSERT_EQ(mManager.updateContacts(kAccount, &update), kOk);
    EXPECT_EQ(firstName(known.contact_id), "Ada");
    EXPECT_EQ(row("c1").etag, "e1");
    EXPECT_EQ(firstName(row("c2").contact_id), "Server");
    int removed = 0;
    CtItemWriter writer(mManager.metaData(), mBook);
    ASSERT_EQ(writer.remove<CtContactKind>({known, row("c2")}, {known.version, row("c2").version}, &removed),
              kOk);
    EXPECT_EQ(removed, 1);
    EXPECT_EQ(firstName(known.contact_id), "Ada");
}

TEST_F(ContactStore, AnUpdateKeepsTheImageAndWhatWasCutOffIsRecognised) {
    std::vector<BulkItem> page = items({contact("c1", "e1", "Ada"), contact("c2", "e1", "Bob")});
    page[0].photo = CtStagedPhoto::create("p1");
    ASSERT_NE(page[0].photo, nullptr);
    fputs("image", page[0].photo->file());
    ASSERT_TRUE(page[0].photo->finish("image/png"));
    ASSERT_EQ(mManager.insertContacts(kAccount, &page), kOk);
    page.clear();
    std::vector<BulkItem> update = items({contact("c1", "e2", "Ada")});
    update[0].keepsImage = true;
    ASSERT_EQ(mManager.updateContacts(kAccount, &update), kOk);
    CtContactData data;
    ASSERT_EQ(mManager.getContactData("c1", "http://s/m8/feeds", &data), kOk);
    std::ifstream image(mRoot.at(data.photoPath));
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(image), {}), "image");
    EXPECT_EQ(readAtom(data.entry)["gd$etag"], "e2");

    // The bookkeeping of c1 was cut off, the record of c2 is gone though nobody deleted it.
    const CtContactSyncRow cut = row("c1");
    const int lost = row("c2").contact_id;
    ASSERT_EQ(mManager.metaData()->forgetContact(cut.contact_id), kOk);
    ASSERT_EQ(contacts_db_delete_record(_contacts_contact, lost, {.by_sync = true}), 0);
    CtSnapshot<CtContactKind> snapshot;
    ASSERT_EQ(snapshot.load(*mManager.metaData(), mBook), kOk);
    ASSERT_NE(snapshot.orphan("c1"), nullptr);
    EXPECT_EQ(snapshot.orphan("c1")->id, cut.contact_id);
    EXPECT_EQ(snapshot.orphan("c1")->etag, "e2");
    ASSERT_NE(snapshot.rowByUri("c2"), nullptr);
    EXPECT_TRUE(snapshot.isLost(*snapshot.rowByUri("c2")));
}

TEST_F(ContactStore, WhatFeedsAndRepliesSay) {
    CtContactPage page;
    const Json linked = contact(
        "c4", "e", "D",
        {{"link",
          {{{"rel", "http://ns/contact/2008/rel#photo"}, {"href", "http://s/a%40x.com/c4"}, {"gd$etag", "p"}},
           {{"rel", "edit"}, {"href", "http://s/contacts/a%40x.com/full/c4"}}}}});
    Json withoutEtag = contact("c2", "", "B");
    withoutEtag.erase("gd$etag");
    Json withoutId = contact("c3", "e", "C");
    withoutId.erase("id");
    Json text = Json::parse(feed({contact("c1", "e", "A"), withoutEtag, withoutId, linked,
                                  contact("c5", "e", "E", {{"deleted", Json::object()}})}));
    text["feed"]["link"] = {{{"rel", "next"}, {"href", "http://s/next"}}};
    ASSERT_EQ(CtContactListJsonParser::parse(text.dump(), &page), kOk);
    EXPECT_EQ(page.entries.size(), 3U);
    EXPECT_EQ(page.idOnly, std::vector<std::string>{"c2"});
    EXPECT_EQ(page.unreadable, 1U);
    EXPECT_EQ(page.nextPageToken, "http://s/next");
    EXPECT_EQ(page.entries[1]->photoEtag, "p");
    EXPECT_EQ(page.entries[1]->editId, "c4");
    EXPECT_TRUE(page.entries[2]->isDeleted);
    for (const char* bad :
         {"", "{}", "[]", R"({"feed":1})", R"({"feed":{"entry":{}}})", R"({"error":{}})", "{\"feed\":{}}x"})
        EXPECT_EQ(CtContactListJsonParser::parse(bad, &page), kFailed) << bad;
    CtEntryMetaData meta;
    ASSERT_EQ(CtEntryMetaDataParser::getMetaData(Json{{"entry", linked}}.dump(), &meta), kOk);
    EXPECT_EQ(meta.id + meta.etag + meta.photoEtag + meta.editId, "c4epc4");
    for (const Json& bad : {withoutEtag, withoutId, contact("c", "e", "x", {{"link", {{{"href", "h"}}}}})})
        EXPECT_EQ(CtEntryMetaDataParser::getMetaData(Json{{"entry", bad}}.dump(), &meta), kFailed) << bad;
}

TEST_F(ContactStore, TheLogNamesWhatIsMissing) {
    const LogCapture log;
    std::string text;
    int id = 0;
    int version = 0;
    EXPECT_EQ(mManager.getContactUri(91, &text), kFailed);
    EXPECT_EQ(mManager.getGroupUri(92, &text), kFailed);
    EXPECT_EQ(mManager.getGroupStarredInMerrow(93, &id), kFailed);
    EXPECT_EQ(mManager.getGroupData(94, &text, &text, &version), kFailed);
    for (const char* line : {"get fail 91", "get fail 92", "get fail 93", "get fail 94"})
        EXPECT_EQ(log.count(line), 1) << line;
    EXPECT_EQ(mManager.getContactId("nobody", &id), kFailed);
    EXPECT_EQ(log.count("get fail\033"), 1);
    ContactsRecord record;
    EXPECT_EQ(mManager.parseJson2Record("[]", mBook, &record), kFailed);
    EXPECT_EQ(log.count("* parsing error"), 1);
}

TEST(CtMetaDataDBHelper, AFileThatCannotBeMadeIsNamedInTheLog) {
    const TestRoot root;
    const LogCapture log;
    const FullDisk disk;
    EXPECT_NE(CtMetaDataDBHelper().openDb(), kOk);
    EXPECT_EQ(log.count("remake contact DB file is Failed : "), 1);
}
