// CtItemKind: what contacts and groups differ in, so that the change walk, the comparison and the upload are written once.
#pragma once

#include <vector>

#include "contacts/CtMetaDataDBHelper.h"
#include "platform/contacts.h"

struct CtContactKind {
    using Row = CtContactSyncRow;
    static constexpr int Row::*kId = &Row::contact_id;
    static constexpr const char* kName = "contact";
    static constexpr const char* kView = _contacts_contact;
    static constexpr const char* kFeed = _contacts_contact_updated_info;
    static constexpr unsigned kIdProperty = CONTACTS_CONTACT_ID;
    static constexpr unsigned kBookProperty = CONTACTS_CONTACT_ADDRESS_BOOK_ID;
    static constexpr unsigned kVersionProperty = CONTACTS_CONTACT_VERSION;
    static constexpr unsigned kSyncedProperty = CONTACTS_CONTACT_SYNCED_VERSION;

    static int getAll(CtMetaDataDBHelper& store, int book, std::vector<Row>* rows) {
        return store.getAllContacts(book, rows);
    }
    static int insert(CtMetaDataDBHelper& store, const Row& row) { return store.insertContact(row); }
    static int update(CtMetaDataDBHelper& store, const Row& row) { return store.updateContact(row); }
    static int forget(CtMetaDataDBHelper& store, int id) { return store.forgetContact(id); }
    static int markDeleted(CtMetaDataDBHelper& store, int id) { return store.updateContactDeleted(id, 1); }
    static int getLatest(CtMetaDataDBHelper& store, int book, int* version) {
        return store.getLatestContactVersion(book, version);
    }
    static int updateLatest(CtMetaDataDBHelper& store, int book, int version) {
        return store.updateLatestContactVersion(book, version);
    }
    static void noteImage(Row* row, bool changed) {
        row->image_dirty = row->image_dirty != 0 || changed ? 1 : 0;
    }
};

struct CtGroupKind {
    using Row = CtGroupSyncRow;
    static constexpr int Row::*kId = &Row::group_id;
    static constexpr const char* kName = "group";
    static constexpr const char* kView = _contacts_group;
    static constexpr const char* kFeed = _contacts_group_updated_info;
    static constexpr unsigned kIdProperty = CONTACTS_GROUP_ID;
    static constexpr unsigned kBookProperty = CONTACTS_GROUP_ADDRESS_BOOK_ID;
    static constexpr unsigned kVersionProperty = CONTACTS_GROUP_VERSION;
    static constexpr unsigned kSyncedProperty = CONTACTS_GROUP_SYNCED_VERSION;

    static int getAll(CtMetaDataDBHelper& store, int book, std::vector<Row>* rows) {
        return store.getAllGroups(book, rows);
    }
    static int insert(CtMetaDataDBHelper& store, const Row& row) { return store.insertGroup(row); }
    static int update(CtMetaDataDBHelper& store, const Row& row) { return store.updateGroup(row); }
    static int forget(CtMetaDataDBHelper& store, int id) { return store.forgetGroup(id); }
    static int markDeleted(CtMetaDataDBHelper& store, int id) { return store.updateGroupDeleted(id, 1); }
    static int getLatest(CtMetaDataDBHelper& store, int book, int* version) {
        return store.getLatestGroupVersion(book, version);
    }
    static int updateLatest(CtMetaDataDBHelper& store, int book, int version) {
        return store.updateLatestGroupVersion(book, version);
    }
    static void noteImage(Row* /*row*/, bool /*changed*/) {}
};
