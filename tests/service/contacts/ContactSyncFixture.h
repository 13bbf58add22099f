// ContactSync: one account's contacts against a feed server in the same process. A user's edits are plain writes to the store.
#pragma once

#include <gtest/gtest.h>

#include <fstream>
#include <map>
#include <memory>
#include <set>

#include "common/Account.h"
#include "common/SyncResult.h"
#include "contacts/CtDataManager.h"
#include "contacts/CtDownSyncDirector.h"
#include "contacts/CtUpSyncDirector.h"
#include "platform/contacts_read.h"
#include "service/contacts/FeedServer.h"
#include "support/TestRoot.h"

inline Json named(const std::string& name, const Json& more = Json::object()) {
    Json entry = {{"gd$name", {{"gd$givenName", {{"$t", name}}}}}};
    entry.update(more);
    return entry;
}

// One account on the process's device, which the manager is bound to.
class ContactSync : public testing::Test {
protected:
    ContactSync() : mAccount(record()), mDown(&mAccount, nullptr), mUp(&mAccount, nullptr) {
        EXPECT_EQ(manager().prepareSync(), sync_result::kOk);
        EXPECT_EQ(manager().addAccount(mAccount.getAccountId()), sync_result::kOk);
        EXPECT_EQ(manager().getAddressBookId(mAccount.getAccountId(), &mBook), sync_result::kOk);
    }

    static CtDataManager& manager() { return CtDataManager::getInstance(); }
    static TestRoot& root() {
        static TestRoot instance;
        return instance;
    }
    vantor_pim_sync_account_s record() {
        static int accounts = 0;
        root();
        mUrl = mServer.url();
        vantor_pim_sync_account_s fields{};
        fields.account_id = ++accounts;
        fields.ctsync = true;
        fields.ctserver = mUrl.data();
        return fields;
    }

    void sync() {
        ASSERT_EQ(mDown.run(), sync_result::kOk) << mDown.lastFailure();
        ASSERT_EQ(mUp.run(), sync_result::kOk) << mUp.lastFailure();
    }
    // Nothing is left to do for either side.
    void expectQuiet() {
        (void)mServer.takeWrites();
        int before = 0;
        int after = 0;
        EXPECT_EQ(contacts_db_get_current_version(&before), 0);
        sync();
        EXPECT_EQ(contacts_db_get_current_version(&after), 0);
        EXPECT_EQ(mServer.takeWrites(), 0);
        EXPECT_EQ(before, after);
        EXPECT_FALSE(manager().hasSomethingToSend(mAccount.getAccountId()));
    }

    [[nodiscard]] std::map<std::string, int> deviceContacts() const {
        std::map<std::string, int> found;
        contacts_query_h rawQuery = nullptr;
        contacts_list_h rawList = nullptr;
        EXPECT_EQ(contacts_query_create(_contacts_contact, &rawQuery), 0);
        const ContactsQuery query(rawQuery);
        EXPECT_EQ(contacts_query_add_filter_int(rawQuery, CONTACTS_CONTACT_ADDRESS_BOOK_ID, mBook), 0);
        EXPECT_EQ(contacts_db_get_records_with_query(rawQuery, 0, 0, &rawList), 0);
        const ContactsList list(rawList);
        contacts_read::forEach(rawList, [&found](contacts_record_h record) {
            std::string name;
            contacts_read::forEachChild(record, CONTACTS_CONTACT_NAMES, [&name](contacts_record_h child) {
                name = contacts_read::textOf(child, CONTACTS_NAME_FIRST);
            });
            found.emplace(name, contacts_read::intOf(record, CONTACTS_CONTACT_ID));
        });
        return found;
    }
    [[nodiscard]] std::set<std::string> serverNames() {
        std::set<std::string> names;
        for (const auto& [id, entry] : mServer.all("contacts"))
            names.insert(entry.value("/gd$name/gd$givenName/$t"_json_pointer, "(none)"));
        return names;
    }
    [[nodiscard]] std::set<std::string> deviceNames() const {
        std::set<std::string> names;
        for (const auto& [name, id] : deviceContacts()) names.insert(name);
        return names;
    }
    void expectSame() { EXPECT_EQ(deviceNames(), serverNames()); }

    static std::string imageOf(int contactId) {
        contacts_record_h raw = nullptr;
        if (contacts_db_get_record(_contacts_contact, contactId, &raw) != 0) return "(gone)";
        const ContactsRecord record(raw);
        std::string bytes;
        contacts_read::forEachChild(raw, CONTACTS_CONTACT_IMAGES, [&bytes](contacts_record_h image) {
            std::ifstream file(root().at(contacts_read::textOf(image, CONTACTS_IMAGE_PATH)));
            bytes.assign(std::istreambuf_iterator<char>(file), {});
        });
        return bytes;
    }

    // --- what a user does
    int add(const std::string& name, int groupId = 0) {
        contacts_record_h raw = nullptr;
        EXPECT_EQ(contacts_record_create(_contacts_contact, &raw), 0);
        const ContactsRecord record(raw);
        EXPECT_EQ(contacts_record_set_int(raw, CONTACTS_CONTACT_ADDRESS_BOOK_ID, mBook), 0);
        contacts_record_h child = nullptr;
        EXPECT_EQ(contacts_record_create(_contacts_name, &child), 0);
        EXPECT_EQ(contacts_record_set_str(child, CONTACTS_NAME_FIRST, name.c_str()), 0);
        EXPECT_EQ(contacts_record_add_child_record(raw, CONTACTS_CONTACT_NAMES, child), 0);
        if (groupId != 0) {
            EXPECT_EQ(contacts_record_create(_contacts_group_relation, &child), 0);
            EXPECT_EQ(contacts_record_set_int(child, CONTACTS_GROUP_RELATION_GROUP_ID, groupId), 0);
            EXPECT_EQ(contacts_record_add_child_record(raw, CONTACTS_CONTACT_GROUP_RELATIONS, child), 0);
        }
        int id = 0;
        EXPECT_EQ(contacts_db_insert_record(raw, &id), 0);
        return id;
    }
    static void rename(int contactId, const std::string& name) {
        contacts_record_h raw = nullptr;
        ASSERT_EQ(contacts_db_get_record(_contacts_contact, contactId, &raw), 0);
        const ContactsRecord record(raw);
        contacts_read::forEachChild(raw, CONTACTS_CONTACT_NAMES, [&name](contacts_record_h child) {
            EXPECT_EQ(contacts_record_set_str(child, CONTACTS_NAME_FIRST, name.c_str()), 0);
        });
        ASSERT_EQ(contacts_db_update_record(raw), 0);
    }
    // Empty bytes: no image.
    static void setImage(int contactId, const std::string& bytes) {
        contacts_record_h raw = nullptr;
        ASSERT_EQ(contacts_db_get_record(_contacts_contact, contactId, &raw), 0);
        const ContactsRecord record(raw);
        std::vector<contacts_record_h> images;
        contacts_read::forEachChild(raw, CONTACTS_CONTACT_IMAGES,
                                    [&images](contacts_record_h image) { images.push_back(image); });
        for (const contacts_record_h image : images) {
            ASSERT_EQ(contacts_record_remove_child_record(raw, CONTACTS_CONTACT_IMAGES, image), 0);
            contacts_record_destroy(image, true);
        }
        if (!bytes.empty()) {
            std::ofstream(root().at("/tmp/mine")) << bytes;
            contacts_record_h image = nullptr;
            ASSERT_EQ(contacts_record_create(_contacts_image, &image), 0);
            ASSERT_EQ(contacts_record_set_str(image, CONTACTS_IMAGE_PATH, "/tmp/mine"), 0);
            ASSERT_EQ(contacts_record_add_child_record(raw, CONTACTS_CONTACT_IMAGES, image), 0);
        }
        ASSERT_EQ(contacts_db_update_record(raw), 0);
    }
    static void erase(int contactId) {
        ASSERT_EQ(contacts_db_delete_record(_contacts_contact, contactId), 0);
    }

    FeedServer mServer;
    std::string mUrl;
    Account mAccount;
    CtDownSyncDirector mDown;
    CtUpSyncDirector mUp;
    int mBook = 0;
};
