#include "contacts/CtUploader.h"

#include "common/JsonAccess.h"
#include "common/JsonText.h"
#include "common/SentMark.h"
#include "common/SyncLog.h"
#include "contacts/CtRecordRead.h"
#include "contacts/CtTransaction.h"
#include "contacts/GroupComposer.h"
#include "platform/contacts_read.h"

using contacts_read::forEachChild;
using contacts_read::intOf;
using contacts_read::textOf;
using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStopped;
using sync_result::kTokenFailed;

namespace {

constexpr const char* kStoreFails = "the device's stores cannot be written";

// Which version of the server's entry is kept with the contact.
std::string keptEtag(contacts_record_h contact) {
    const JsonNodePtr root = json_text::parse(ct_record::originOf(contact));
    return json_access::textOr(json_access::objectIn(root.get()), "gd$etag", "");
}

void forgetPhoto(CtContactSyncRow* row) {
    row->photo_etag.clear();
    row->image_dirty = 1;
}
void forgetPhoto(CtGroupSyncRow* /*row*/) {}

void clearMarks(CtContactSyncRow* row) {
    row->deleted = row->dirty = row->image_dirty = 0;
}
void clearMarks(CtGroupSyncRow* row) {
    row->deleted = row->dirty = 0;
}

// Whether the server's entry is to be looked at before it is tried again. One answer that it is gone is not believed either.
bool mayHaveMovedOn(const CtUpReply& reply) {
    return reply.answer == CtAnswer::kConflict || reply.answer == CtAnswer::kGone;
}

// Whether nobody but the server may delete the item. The record that said so is gone.
bool isOfServer(const CtContactSyncRow& /*row*/) {
    return false;
}
bool isOfServer(const CtGroupSyncRow& row) {
    const JsonNodePtr root = json_text::parse(row.source);
    return json_access::member(json_access::objectIn(root.get()), "gContact$systemGroup") != nullptr;
}

}  // namespace

CtUploader::CtUploader(CtMetaDataDBHelper* store, int addressBookId, CtCurl* curl, IStopQuery* stopQuery,
                       ParkedItems* parked)
    : mpStore(store),
      mAddressBookId(addressBookId),
      mTask(curl),
      mpCurl(curl),
      mpStopQuery(stopQuery),
      mParked(*parked) {}

int CtUploader::run() {
    std::vector<CtGroupSyncRow> groups;
    std::vector<CtContactSyncRow> contacts;
    const auto nameOf = [](contacts_record_h group) { return textOf(group, CONTACTS_GROUP_NAME); };
    if (mpStore->getAllGroups(mAddressBookId, &groups) != kOk ||
        markAsSent<CtGroupKind>(&groups, &mGroupRecords, nameOf) != kOk) {
        failOfStore(kStoreFails);
        return mResult;
    }
    for (CtGroupSyncRow& row : groups) {
        if (!isOver() && row.dirty != 0 && row.deleted == 0 && !isParked<CtGroupKind>(row)) sendGroup(row);
    }
    // After the groups, so that memberships name those that were just made.
    const bool isLoaded = mGroups.load(*mpStore, mAddressBookId) == kOk &&
                          mpStore->getAllContacts(mAddressBookId, &contacts) == kOk;
    mpComposer = std::make_unique<ContactComposer>(mGroups.composer(mpCurl->feedBase()));
    const auto fieldsOf = [this](contacts_record_h contact) { return mpComposer->composeFields(contact); };
    if (!isLoaded || markAsSent<CtContactKind>(&contacts, &mContactRecords, fieldsOf) != kOk) {
        failOfStore(kStoreFails);
        return mResult;
    }
    sendContacts(&contacts);
    for (CtContactSyncRow& row : contacts) {
        if (!isOver() && row.deleted != 0 && !isParked<CtContactKind>(row))
            sendDeleted<CtContactKind>(CtItemType::kContact, row);
    }
    for (CtGroupSyncRow& row : groups) {
        if (!isOver() && row.deleted != 0 && !isParked<CtGroupKind>(row))
            sendDeleted<CtGroupKind>(CtItemType::kGroup, row);
    }
    const bool groupsLearned = writeBack<CtGroupKind>(mSentGroups) == kOk;
    if (writeBack<CtContactKind>(mSentContacts) != kOk || !groupsLearned) failOfStore(kStoreFails);
    return mpStopQuery != nullptr && mpStopQuery->isStopped() ? kStopped : mResult;
}

template <class Kind>
void CtUploader::fail(const typename Kind::Row& row, const CtUpReply& reply) {
    const int id = row.*Kind::kId;
    SYNC_ERR("%s(%d, %s) could not be sent: %s", Kind::kName, id, row.uri.c_str(), reply.reason.c_str());
    if (reply.isForGood) {
        mParked.park(Kind::kName, id, versionToPark(row), reply.reason);
    } else {
        mIsInTrouble = true;
    }
    if (reply.answer == CtAnswer::kNoAnswer || mpCurl->isAskedToWait()) mIsOver = true;
    if (reply.result == kTokenFailed) mResult = kTokenFailed;
    if (mResult == kOk) mResult = kFailed;
    if (!mFailure.empty()) return;
    mFailure = reply.result == kTokenFailed ? "the account's authorisation is no longer accepted"
                                            : std::string(Kind::kName) + " " + std::to_string(id) +
                                                  " could not be sent: " + reply.reason;
}

void CtUploader::failOfStore(const char* text) {
    mIsInTrouble = true;
    if (mResult == kOk) mResult = kFailed;
    if (mFailure.empty()) mFailure = text;
}

template <class Kind, class Says>
int CtUploader::markAsSent(std::vector<typename Kind::Row>* rows, ContactsRecordsAhead* records, Says says) {
    std::vector<typename Kind::Row*> marked;
    std::vector<int> ids;
    for (auto& row : *rows) {
        if (!row.uri.empty() || row.dirty == 0 || row.deleted != 0 || isParked<Kind>(row)) continue;
        marked.push_back(&row);
        ids.push_back(row.*Kind::kId);
    }
    records->expect(std::move(ids));
    for (typename Kind::Row* row : marked) {
        ContactsRecord record;
        const bool isRead = records->take(row->*Kind::kId, &record) == PLATFORM_ERROR_NONE;
        row->etag = sent_mark::of(isRead ? says(record.get()) : std::string());
    }
    SyncTransaction transaction(mpStore->database());
    if (!transaction.begun()) return kFailed;
    for (const typename Kind::Row* row : marked) {
        if (Kind::update(*mpStore, *row) != kOk) return kFailed;
    }
    return transaction.commit();
}

template <class Kind>
void CtUploader::store(typename Kind::Row& row, const CtUpReply& reply, int version) {
    if (!reply.meta.id.empty()) row.uri = reply.meta.id;
    if (!reply.meta.etag.empty()) row.etag = reply.meta.etag;
    if (!reply.meta.updated.empty()) row.updated = reply.meta.updated;
    row.version = version;
    mParked.forget(Kind::kName, row.*Kind::kId);
    if (Kind::update(*mpStore, row) == kOk) return;
    SYNC_ERR("metaDB %s fail", std::is_same_v<Kind, CtContactKind> ? "updateContact" : "updateGroupEtag");
    failOfStore(kStoreFails);
    mIsOver = true;
}

template <class Kind>
void CtUploader::renew(typename Kind::Row& row) {
    SYNC_ERR("%s(%s) was deleted on the server and changed on the device, it is sent as new", Kind::kName,
             row.uri.c_str());
    row.uri.clear();
    row.etag = sent_mark::kNamesNothing;
    forgetPhoto(&row);
    if (Kind::update(*mpStore, row) != kOk) mIsOver = true;
}

ContactsRecord CtUploader::readRecord(ContactsRecordsAhead* records, int id) {
    ContactsRecord record;
    const int code = records->take(id, &record);
    // One that was just deleted is met as a deletion by the next look at the device's changes.
    if (code == PLATFORM_ERROR_NONE || code == PLATFORM_ERROR_NOT_FOUND) return record;
    SYNC_ERR("get fail %d", code);
    failOfStore("the device's stores cannot be read");
    return nullptr;
}

// --- groups

void CtUploader::sendGroup(CtGroupSyncRow& row) {
    const ContactsRecord record = readRecord(&mGroupRecords, row.group_id);
    contacts_record_h raw = record.get();
    if (raw == nullptr) return;
    const int version = intOf(raw, CONTACTS_GROUP_VERSION);
    if (intOf(raw, CONTACTS_GROUP_IS_READ_ONLY) != 0) {
        SYNC_ERR("group(%s) belongs to the server, the device's change is not sent", row.uri.c_str());
        row.dirty = 0;
        return store<CtGroupKind>(row, {}, version);
    }
    const std::string name = textOf(raw, CONTACTS_GROUP_NAME);
    CtUpReply reply;
    reply.reason = "the group has no name";
    reply.answer = CtAnswer::kRefused;
    reply.isForGood = name.empty();
    if (name.empty()) return fail<CtGroupKind>(row, reply);
    if (!row.uri.empty()) {
        reply = mTask.update(CtItemType::kGroup, row.uri, row.etag, GroupComposer::compose(name, row.etag));
        if (mayHaveMovedOn(reply) || row.etag.empty()) {
            reply = mTask.read(CtItemType::kGroup, row.uri);
            if (reply.isAccepted()) {
                SYNC_ERR("group(%s) has moved on, the device's change wins", row.uri.c_str());
                const std::string etag = reply.meta.etag;
                reply = mTask.update(CtItemType::kGroup, row.uri, etag, GroupComposer::compose(name, etag));
            }
        }
        if (reply.answer == CtAnswer::kGone) renew<CtGroupKind>(row);
    }
    if (row.uri.empty() && !mIsOver)
        reply = mTask.insert(CtItemType::kGroup, GroupComposer::compose(name, {}));
    if (!reply.isAccepted()) {
        if (row.uri.empty() && reply.answer == CtAnswer::kRefused) {
            row.etag.clear();
            if (CtGroupKind::update(*mpStore, row) != kOk) mIsOver = true;
        }
        return fail<CtGroupKind>(row, reply);
    }
    row.dirty = 0;
    ++mSent;
    store<CtGroupKind>(row, reply, version);
    mSentGroups.push_back({row.group_id, version, row.uri});
}

// --- contacts

void CtUploader::sendContacts(std::vector<CtContactSyncRow>* rows) {
    std::vector<CtContactSyncRow*> marked;
    std::vector<int> ids;
    for (CtContactSyncRow& row : *rows) {
        const bool waits = row.dirty != 0 || row.image_dirty != 0;
        if (!waits || row.deleted != 0 || isParked<CtContactKind>(row)) continue;
        marked.push_back(&row);
        ids.push_back(row.contact_id);
    }
    mContactRecords.expect(std::move(ids));
    for (CtContactSyncRow* row : marked) {
        if (isOver()) return;
        sendContact(*row);
    }
}

void CtUploader::sendContact(CtContactSyncRow& row) {
    const ContactsRecord record = readRecord(&mContactRecords, row.contact_id);
    if (record == nullptr) return;
    // The record may be younger than its mark: what is sent now, no later look will find.
    if (intOf(record.get(), CONTACTS_CONTACT_IMAGE_VERSION) > row.version) row.image_dirty = 1;
    const bool hasFields = row.dirty != 0 && !waitsOnlyForGroup(row, record.get());
    if (hasFields && (!sendFields(row, record.get()) || mIsOver)) return;
    const bool hasImage = row.image_dirty != 0;
    if (hasImage) {
        if (!sendPhoto(row, record.get())) return;
        row.image_dirty = 0;
        store<CtContactKind>(row, {}, row.version);
    }
    if (hasFields || hasImage) ++mSent;
}

bool CtUploader::sendFields(CtContactSyncRow& row, contacts_record_h record) {
    const int version = intOf(record, CONTACTS_CONTACT_VERSION);
    CtUpReply reply;
    if (!row.uri.empty()) {
        reply = updateContact(row, record);
        if (reply.answer == CtAnswer::kGone) renew<CtContactKind>(row);
    }
    if (row.uri.empty() && !mIsOver)
        reply = mTask.insert(CtItemType::kContact, mpComposer->compose(record, {}));
    if (!reply.isAccepted()) {
        if (row.uri.empty() && reply.answer == CtAnswer::kRefused) {
            row.etag.clear();
            if (mpStore->updateContact(row) != kOk) mIsOver = true;
        }
        fail<CtContactKind>(row, reply);
        return false;
    }
    row.dirty = waitsForGroup(record) ? 1 : 0;
    JsonObject* entry = json_access::objectIn(reply.meta.entry.get());
    if (entry != nullptr && mpComposer->composeFields(entry) != mpComposer->composeFields(record)) {
        // What the server made of it must come down: then the etag stays behind.
        SYNC_INFO("contact(%s) is not what was sent, it is compared again", reply.meta.id.c_str());
        row.etag.clear();
        reply.meta.etag.clear();
    }
    store<CtContactKind>(row, reply, version);
    if (entry != nullptr)
        mSentContacts.push_back({row.contact_id, version, json_text::textOf(reply.meta.entry.get())});
    return true;
}

bool CtUploader::waitsForGroup(contacts_record_h record) const {
    bool waits = false;
    forEachChild(record, CONTACTS_CONTACT_GROUP_RELATIONS, [&](contacts_record_h relation) {
        const int id = intOf(relation, CONTACTS_GROUP_RELATION_GROUP_ID);
        waits = waits || (id > 0 && mGroups.uriOf(id).empty());
    });
    return waits;
}

bool CtUploader::waitsOnlyForGroup(const CtContactSyncRow& row, contacts_record_h record) const {
    if (row.uri.empty() || !waitsForGroup(record)) return false;
    const JsonNodePtr root = json_text::parse(ct_record::originOf(record));
    JsonObject* kept = json_access::objectIn(root.get());
    return json_access::textOr(kept, "gd$etag", "") == row.etag &&
           mpComposer->composeFields(kept) == mpComposer->composeFields(record);
}

CtUpReply CtUploader::updateContact(const CtContactSyncRow& row, contacts_record_h record) {
    std::string etag = row.etag;
    std::string origin;
    CtUpReply reply;
    // What is carried over must be of the version that is replaced.
    const bool isStale = etag.empty() || keptEtag(record) != etag;
    for (int attempt = 0; attempt < 2; ++attempt) {
        if (attempt > 0 || isStale) {
            reply = mTask.read(CtItemType::kContact, row.uri);
            if (!reply.isAccepted()) return reply;
            etag = reply.meta.etag;
            origin = json_text::textOf(reply.meta.entry.get());
            if (attempt > 0 && mpComposer->composeFields(json_access::objectIn(reply.meta.entry.get())) !=
                                   mpComposer->composeFields(record)) {
                SYNC_ERR("contact(%s) was changed on both sides, the device's change wins", row.uri.c_str());
            }
        }
        reply = mTask.update(CtItemType::kContact, row.uri, etag, mpComposer->compose(record, etag, origin));
        if (!mayHaveMovedOn(reply)) break;
    }
    return reply;
}

bool CtUploader::sendPhoto(CtContactSyncRow& row, contacts_record_h record) {
    const std::string path = ct_record::imageOf(record);
    // The server has none, as far as is known.
    if (path.empty() && row.photo_etag.empty()) return true;
    CtUpReply reply;
    for (int attempt = 0; attempt < 2; ++attempt) {
        reply = path.empty() ? mTask.removePhoto(row.uri, row.photo_etag)
                             : mTask.upsertPhoto(row.uri, row.photo_etag, path);
        if (reply.answer != CtAnswer::kConflict || attempt > 0) break;
        const CtUpReply now = mTask.read(CtItemType::kContact, row.uri);
        if (!now.isAccepted()) break;
        SYNC_ERR("the photo of contact(%s) was changed on both sides, the device's wins", row.uri.c_str());
        row.photo_etag = now.meta.photoEtag;
        if (path.empty() && row.photo_etag.empty()) return true;
    }
    if (!reply.isAccepted()) {
        fail<CtContactKind>(row, reply);
        return false;
    }
    takePhotoReply(row, record, reply);
    if (path.empty()) row.photo_etag.clear();
    return true;
}

// The entry was read after the photo was taken. What somebody else changed meanwhile must come down: then the etag stays behind.
void CtUploader::takePhotoReply(CtContactSyncRow& row, contacts_record_h record, const CtUpReply& reply) {
    if (reply.meta.etag.empty()) return;
    row.photo_etag = reply.meta.photoEtag;
    JsonObject* entry = json_access::objectIn(reply.meta.entry.get());
    if (mpComposer->composeFields(entry) != mpComposer->composeFields(record)) {
        SYNC_INFO("contact(%s) is not what was sent, it is compared again", row.uri.c_str());
        return;
    }
    row.etag = reply.meta.etag;
    const std::string text = json_text::textOf(reply.meta.entry.get());
    if (!mSentContacts.empty() && mSentContacts.back().id == row.contact_id) {
        mSentContacts.back().text = text;
    } else {
        mSentContacts.push_back({row.contact_id, row.version, text});
    }
}

// --- deletions

template <class Kind>
void CtUploader::sendDeleted(CtItemType type, typename Kind::Row& row) {
    const int id = row.*Kind::kId;
    if (row.uri.empty()) {
        if (row.etag == sent_mark::kNamesNothing)
            SYNC_ERR("%s(%d) was deleted before the server's answer to it was known", Kind::kName, id);
        if (Kind::forget(*mpStore, id) == kOk) return;
        mIsOver = true;
        return failOfStore(kStoreFails);
    }
    if (isOfServer(row)) {
        SYNC_ERR("%s(%s) belongs to the server, the device's deletion is not sent", Kind::kName,
                 row.uri.c_str());
        clearMarks(&row);
        return store<Kind>(row, {}, row.version);
    }
    CtUpReply reply;
    for (int attempt = 0; attempt < 2; ++attempt) {
        if (attempt > 0 || row.etag.empty()) {
            reply = mTask.read(type, row.uri);
            if (!reply.isAccepted()) break;
            if (row.etag != reply.meta.etag)
                SYNC_ERR("%s(%s) has moved on, the device's deletion wins", Kind::kName, row.uri.c_str());
            row.etag = reply.meta.etag;
        }
        reply = mTask.remove(type, row.uri, row.etag);
        if (!mayHaveMovedOn(reply)) break;
    }
    if (!reply.isAccepted() && reply.answer != CtAnswer::kGone) return fail<Kind>(row, reply);
    ++mSent;
    clearMarks(&row);
    store<Kind>(row, {}, row.version);
}

// --- what the records learn

namespace {

int setServerId(CtContactKind /*kind*/, contacts_record_h record, const std::string& entry) {
    std::vector<contacts_record_h> old;
    forEachChild(record, CONTACTS_CONTACT_EXTENSIONS, [&old](contacts_record_h extension) {
        if (intOf(extension, CONTACTS_EXTENSION_DATA1) == ct_wire::kOriginExtension) old.push_back(extension);
    });
    for (const contacts_record_h extension : old) {
        if (contacts_record_remove_child_record(record, CONTACTS_CONTACT_EXTENSIONS, extension) ==
            PLATFORM_ERROR_NONE)
            contacts_record_destroy(extension, true);
    }
    contacts_record_h raw = nullptr;
    if (contacts_record_create(_contacts_extension, &raw) != PLATFORM_ERROR_NONE) return kFailed;
    ContactsRecord origin(raw);
    if (contacts_record_set_int(raw, CONTACTS_EXTENSION_DATA1, ct_wire::kOriginExtension) !=
            PLATFORM_ERROR_NONE ||
        contacts_record_set_str(raw, CONTACTS_EXTENSION_DATA2, ct_wire::kOriginName) != PLATFORM_ERROR_NONE ||
        contacts_record_set_str(raw, CONTACTS_EXTENSION_DATA3, entry.c_str()) != PLATFORM_ERROR_NONE ||
        contacts_record_add_child_record(record, CONTACTS_CONTACT_EXTENSIONS, raw) != PLATFORM_ERROR_NONE) {
        return kFailed;
    }
    (void)origin.release();
    return kOk;
}

int setServerId(CtGroupKind /*kind*/, contacts_record_h record, const std::string& uri) {
    return contacts_record_set_str(record, CONTACTS_GROUP_SYNC_DATA1, uri.c_str()) == PLATFORM_ERROR_NONE
               ? kOk
               : kFailed;
}

std::vector<unsigned> serverIdProperties(CtContactKind /*kind*/) {
    return {CONTACTS_CONTACT_ID, CONTACTS_CONTACT_ADDRESS_BOOK_ID, CONTACTS_CONTACT_EXTENSIONS};
}
std::vector<unsigned> serverIdProperties(CtGroupKind /*kind*/) {
    return {CONTACTS_GROUP_ID, CONTACTS_GROUP_ADDRESS_BOOK_ID, CONTACTS_GROUP_SYNC_DATA1};
}

}  // namespace

template <class Kind>
int CtUploader::writeBack(const std::vector<Sent>& sent) {
    if (sent.empty()) return kOk;
    std::vector<std::pair<int, int>> versions;  // by record
    {
        CtTransaction transaction;
        if (!transaction.begun()) return kFailed;
        for (const Sent& item : sent) {
            ContactsList list;
            contacts_record_h record = nullptr;
            const int code = contacts_read::readPart(Kind::kView, Kind::kIdProperty, item.id,
                                                     serverIdProperties(Kind()), &list, &record);
            if (code == PLATFORM_ERROR_NOT_FOUND) continue;
            const int expected[] = {item.version};
            const record_write_options_s options{.by_sync = true, .expected_versions = expected};
            if (code != PLATFORM_ERROR_NONE || setServerId(Kind(), record, item.text) != kOk) return kFailed;
            const int written = contacts_db_update_record(record, options);
            // What a user changed meanwhile is sent again and learns it then.
            if (written == PLATFORM_ERROR_CONFLICT || written == PLATFORM_ERROR_NOT_FOUND) continue;
            int version = 0;
            if (written != PLATFORM_ERROR_NONE ||
                contacts_db_get_last_change_version(&version) != PLATFORM_ERROR_NONE) {
                return kFailed;
            }
            versions.emplace_back(item.id, version);
        }
        if (!transaction.commit()) return kFailed;
    }
    SyncTransaction transaction(mpStore->database());
    if (!transaction.begun()) return kFailed;
    std::vector<typename Kind::Row> rows;
    if (Kind::getAll(*mpStore, mAddressBookId, &rows) != kOk) return kFailed;
    for (const auto& [id, version] : versions) {
        for (auto& row : rows) {
            if (row.*Kind::kId != id) continue;
            row.version = version;
            if (Kind::update(*mpStore, row) != kOk) return kFailed;
        }
    }
    return transaction.commit();
}
