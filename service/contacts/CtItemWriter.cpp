#include "contacts/CtItemWriter.h"

#include <algorithm>
#include <unordered_set>

#include "common/SyncLog.h"
#include "contacts/CtJsonOrbitPeopleConverter.h"
#include "contacts/CtRecordRead.h"
#include "contacts/CtTransaction.h"
#include "platform/contacts_read.h"

using contacts_read::forEachChild;
using contacts_read::intOf;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

// The image on the device, which a write without it would take away.
std::string imageOf(int contactId) {
    ContactsList list;
    contacts_record_h record = nullptr;
    const int code = contacts_read::readPart(_contacts_contact, CONTACTS_CONTACT_ID, contactId,
                                             {CONTACTS_CONTACT_IMAGES}, &list, &record);
    if (code == PLATFORM_ERROR_NONE) return ct_record::imageOf(record);
    if (code == PLATFORM_ERROR_NOT_FOUND) return {};
    SYNC_ERR("get fail %d", code);
    throw JsonException("get fail");
}

void setImage(contacts_record_h contact, const std::string& path) {
    std::vector<contacts_record_h> images;
    forEachChild(contact, CONTACTS_CONTACT_IMAGES,
                 [&images](contacts_record_h image) { images.push_back(image); });
    for (const contacts_record_h image : images) {
        if (contacts_record_remove_child_record(contact, CONTACTS_CONTACT_IMAGES, image) ==
            PLATFORM_ERROR_NONE)
            contacts_record_destroy(image, true);
    }
    if (path.empty()) return;
    contacts_record_h raw = nullptr;
    if (contacts_record_create(_contacts_image, &raw) != PLATFORM_ERROR_NONE)
        throw JsonException("create fail");
    ContactsRecord image(raw);
    if (contacts_record_set_str(raw, CONTACTS_IMAGE_PATH, path.c_str()) != PLATFORM_ERROR_NONE)
        throw JsonException("add child fail");
    addChild(contact, CONTACTS_CONTACT_IMAGES, std::move(image));
}

}  // namespace

// --- contacts

bool CtItemWriter::convert(BulkItem& item, const CtJsonEntryConverter& converter, ContactsRecord* out) const {
    try {
        const ContactInfo& entry = *item.entry;
        ContactsRecord record;
        if (converter.convert(entry.object(), entry.jsonText(), &record, mAddressBookId,
                              /*withPhoto=*/false) != kOk)
            return false;
        if (!item.profile.empty()) (void)CtJsonOrbitPeopleConverter::convert(item.profile, record.get());
        std::string image = item.photo ? item.photo->path() : std::string();
        if (image.empty() && item.keepsImage && item.row.contact_id != 0)
            image = imageOf(item.row.contact_id);
        setImage(record.get(), image);
        *out = std::move(record);
        return true;
    } catch (const JsonException& error) {
        SYNC_ERR("Handle this execption! (%s)", error.what());
        SYNC_ERR("contact(%s, %s) is left out", item.entry->id.c_str(), item.entry->title.c_str());
        return false;
    }
}

int CtItemWriter::prepare(std::vector<BulkItem> items, const CtJsonEntryConverter& converter,
                          Bulk* out) const {
    contacts_list_h rawList = nullptr;
    if (contacts_list_create(&rawList) != PLATFORM_ERROR_NONE) return kFailed;
    out->list.reset(rawList);
    for (BulkItem& item : items) {
        ContactsRecord record;
        if (!convert(item, converter, &record)) {
            SYNC_ERR("convert fail");
            continue;
        }
        if (contacts_list_add(rawList, record.get()) != PLATFORM_ERROR_NONE) return kFailed;
        out->records.push_back(record.release());
        out->ids.push_back(item.row.contact_id);
        out->expected.push_back(item.expectedVersion);
        out->items.push_back(std::move(item));
    }
    return kOk;
}

int CtItemWriter::writeBulk(Bulk* bulk, bool isNew, std::vector<BulkItem>* written) {
    if (bulk->items.empty()) return kOk;
    std::vector<size_t> skipped;
    const record_write_options_s options{
        .by_sync = true, .expected_versions = bulk->expected, .skipped = &skipped};
    contacts_list_h list = bulk->list.get();
    const int code = isNew ? contacts_db_insert_records(list, options)
                           : contacts_db_replace_records(list, bulk->ids.data(), bulk->ids.size(), options);
    if (code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("%s", isNew ? "insert records fail" : "replace records fail");
        return kFailed;
    }
    if (isNew && !skipped.empty()) {
        SYNC_ERR("Insert failed! (list count %zu)", bulk->items.size());
        return kFailed;
    }
    int version = 0;
    if (contacts_db_get_last_change_version(&version) != PLATFORM_ERROR_NONE) return kFailed;
    const std::unordered_set<size_t> left(skipped.begin(), skipped.end());
    for (size_t i = 0; i < bulk->items.size(); ++i) {
        BulkItem& item = bulk->items[i];
        if (left.contains(i)) {
            SYNC_ERR("contact(%s, %s) was changed on the device meanwhile, it is left for the next sync",
                     item.entry->id.c_str(), item.entry->title.c_str());
            continue;
        }
        if (isNew) item.row.contact_id = intOf(bulk->records[i], CONTACTS_CONTACT_ID);
        item.row.version = version;
        written->push_back(std::move(item));
    }
    return kOk;
}

int CtItemWriter::writeContacts(CtContactBatch* batch) {
    if (batch->empty()) return kOk;
    CtGroupMap groups;
    if (groups.load(*mpStore, mAddressBookId) != kOk) return kFailed;
    const CtJsonEntryConverter converter = groups.converter();
    Bulk updates;
    Bulk inserts;
    if (prepare(std::move(batch->updates), converter, &updates) != kOk ||
        prepare(std::move(batch->inserts), converter, &inserts) != kOk) {
        return kFailed;
    }
    batch->updates.clear();
    batch->inserts.clear();
    if (!updates.items.empty() || !inserts.items.empty()) {
        CtTransaction transaction;
        if (!transaction.begun()) {
            SYNC_ERR("the contacts service takes no transaction");
            return kFailed;
        }
        if (writeBulk(&updates, /*isNew=*/false, &batch->updates) != kOk ||
            writeBulk(&inserts, /*isNew=*/true, &batch->inserts) != kOk || !transaction.commit()) {
            return kFailed;
        }
    }
    return writeRows(*batch);
}

int CtItemWriter::writeRows(const CtContactBatch& batch) {
    SyncTransaction transaction(mpStore->database());
    if (!transaction.begun()) return kFailed;
    const auto writeRow = [this](const CtContactSyncRow& row, CtRowWrite rowWrite) {
        const bool isUpdate = rowWrite == CtRowWrite::kUpdate;
        if ((isUpdate ? mpStore->updateContact(row) : mpStore->insertContact(row)) == kOk) return true;
        SYNC_ERR_AS("writeRows", "metaDB %s fail", isUpdate ? "updateContact" : "insertContact");
        return false;
    };
    for (const std::vector<BulkItem>* items : {&batch.updates, &batch.inserts}) {
        for (const BulkItem& item : *items) {
            if (item.lostId != 0 && mpStore->forgetContact(item.lostId) != kOk) return kFailed;
            if (!writeRow(item.row, item.rowWrite)) return kFailed;
        }
    }
    for (const CtRowChange& change : batch.rows) {
        if (!writeRow(change.row, change.rowWrite)) return kFailed;
    }
    return transaction.commit();
}

// --- groups

int CtItemWriter::writeGroupRecord(CtGroupItem& item, bool* isWritten) const {
    contacts_record_h raw = nullptr;
    if (contacts_record_create(_contacts_group, &raw) != PLATFORM_ERROR_NONE) return kFailed;
    const ContactsRecord record(raw);
    const GroupInfo& entry = *item.entry;
    const GChars systemId(g_utf8_strdown(entry.systemId.c_str(), -1));
    if (contacts_record_set_int(raw, CONTACTS_GROUP_ADDRESS_BOOK_ID, mAddressBookId) != PLATFORM_ERROR_NONE ||
        contacts_record_set_str(raw, CONTACTS_GROUP_NAME, entry.title.c_str()) != PLATFORM_ERROR_NONE ||
        contacts_record_set_int(raw, CONTACTS_GROUP_IS_READ_ONLY, entry.isSystem ? 1 : 0) !=
            PLATFORM_ERROR_NONE ||
        contacts_record_set_str(raw, CONTACTS_GROUP_SYNC_DATA1, entry.id.c_str()) != PLATFORM_ERROR_NONE ||
        (!entry.systemId.empty() &&
         contacts_record_set_str(raw, CONTACTS_GROUP_SYSTEM_ID, systemId.get()) != PLATFORM_ERROR_NONE)) {
        return kFailed;
    }
    const int expected[] = {item.expectedVersion};
    const bool isNew = item.row.group_id == 0;
    record_write_options_s options{.by_sync = true};
    if (!isNew) options.expected_versions = expected;
    const int code = isNew ? contacts_db_insert_record(raw, &item.row.group_id, options)
                           : contacts_db_replace_record(raw, item.row.group_id, options);
    *isWritten = code == PLATFORM_ERROR_NONE;
    const bool isLeft = code == PLATFORM_ERROR_CONFLICT || code == PLATFORM_ERROR_NOT_FOUND;
    if (!*isWritten && (isNew || !isLeft)) {
        SYNC_ERR("%s", isNew ? "insert records fail" : "replace records fail");
        return kFailed;
    }
    return contacts_db_get_last_change_version(&item.row.version) == PLATFORM_ERROR_NONE ? kOk : kFailed;
}

int CtItemWriter::writeGroups(std::vector<CtGroupItem>* items) {
    if (items->empty()) return kOk;
    std::unordered_set<const CtGroupItem*> left;
    CtTransaction transaction;
    if (!transaction.begun()) return kFailed;
    for (CtGroupItem& item : *items) {
        bool isWritten = true;
        if (!item.isRowOnly && writeGroupRecord(item, &isWritten) != kOk) return kFailed;
        if (isWritten) continue;
        SYNC_ERR("group(%s, %s) was changed on the device meanwhile, it is left for the next sync",
                 item.entry->id.c_str(), item.entry->title.c_str());
        left.insert(&item);
    }
    if (!transaction.commit()) return kFailed;

    SyncTransaction rows(mpStore->database());
    if (!rows.begun()) return kFailed;
    for (const CtGroupItem& item : *items) {
        if (left.contains(&item)) continue;
        if (item.lostId != 0 && mpStore->forgetGroup(item.lostId) != kOk) return kFailed;
        const bool isUpdate = item.rowWrite == CtRowWrite::kUpdate;
        if ((isUpdate ? mpStore->updateGroup(item.row) : mpStore->insertGroup(item.row)) == kOk) continue;
        SYNC_ERR("metaDB %s fail", isUpdate ? "updateGroup" : "insertGroup");
        return kFailed;
    }
    return rows.commit();
}

// --- deletions

template <class Kind>
int CtItemWriter::remove(const std::vector<typename Kind::Row>& rows, const std::vector<int>& versions,
                         int* removed) {
    *removed = 0;
    if (rows.empty()) return kOk;
    std::vector<int> ids;
    ids.reserve(rows.size());
    for (const auto& row : rows) ids.push_back(row.*Kind::kId);
    std::vector<size_t> skipped;
    const record_write_options_s options{.by_sync = true, .expected_versions = versions, .skipped = &skipped};
    if (contacts_db_delete_records(Kind::kView, ids.data(), ids.size(), options) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("db_delete_records fail");
        return kFailed;
    }
    // What is not there any more need not be deleted; what is, was changed meanwhile.
    std::unordered_set<size_t> left;
    for (const size_t i : skipped) {
        contacts_record_h raw = nullptr;
        if (contacts_db_get_record(Kind::kView, ids[i], &raw) != PLATFORM_ERROR_NONE) continue;
        const ContactsRecord record(raw);
        SYNC_ERR("%s(%s) was changed on the device meanwhile, it is left for the next sync", Kind::kName,
                 rows[i].uri.c_str());
        left.insert(i);
    }
    SyncTransaction transaction(mpStore->database());
    if (!transaction.begun()) return kFailed;
    for (size_t i = 0; i < rows.size(); ++i) {
        if (left.contains(i)) continue;
        if (Kind::forget(*mpStore, ids[i]) != kOk) return kFailed;
        ++*removed;
    }
    return transaction.commit();
}

template int CtItemWriter::remove<CtContactKind>(const std::vector<CtContactSyncRow>&,
                                                 const std::vector<int>&, int*);
template int CtItemWriter::remove<CtGroupKind>(const std::vector<CtGroupSyncRow>&, const std::vector<int>&,
                                               int*);
