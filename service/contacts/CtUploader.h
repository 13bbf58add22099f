// CtUploader: sends the marked groups and contacts of one account.
// Owner: an upload run.   Threads: one worker.
//
// A mark is cleared when the server took the change, or no longer has what was to be deleted; whatever else happens it stays for the
// next run. A contact's fields and its photo have a mark each. A new item is marked as sent before it goes out, in the store: should
// its answer be lost, the next run looks for it in the server's list before it is sent again.
#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "common/ParkedItems.h"
#include "common/RecordsAhead.h"
#include "common/SyncDirector.h"
#include "contacts/CtGroupMap.h"
#include "contacts/CtItemKind.h"
#include "contacts/CtUpSyncTask.h"

class CtUploader {
public:
    // Nothing is owned; `stopQuery` may be NULL.
    CtUploader(CtMetaDataDBHelper* store, int addressBookId, CtCurl* curl, IStopQuery* stopQuery,
               ParkedItems* parked);

    // 0, 1 when stopped, -5, or -1 with failure(). What could be sent was sent.
    [[nodiscard]] int run();

    [[nodiscard]] const std::string& failure() const { return mFailure; }
    [[nodiscard]] int sent() const { return mSent; }
    // Whether a failure was the server's, the network's or the device's, not that of single items.
    [[nodiscard]] bool isInTrouble() const { return mIsInTrouble; }

private:
    // What the record learns of the server's answer.
    struct Sent {
        int id = 0;
        int version = 0;   // that was sent
        std::string text;  // the entry of a contact, the id of a group
    };

    [[nodiscard]] bool isOver() const {
        return mIsOver || (mpStopQuery != nullptr && mpStopQuery->isStopped());
    }
    template <class Kind>
    [[nodiscard]] bool isParked(const typename Kind::Row& row) const {
        return mParked.isParked(Kind::kName, row.*Kind::kId, versionToPark(row));
    }
    // A deletion is a change of its own, also of an item whose last edit was refused.
    template <class Row>
    [[nodiscard]] static int versionToPark(const Row& row) {
        return row.deleted != 0 ? -1 - row.version : row.version;
    }
    template <class Kind>
    void fail(const typename Kind::Row& row, const CtUpReply& reply);
    void failOfStore(const char* text);
    template <class Kind>
    void store(typename Kind::Row& row, const CtUpReply& reply, int version);
    template <class Kind, class Says>
    [[nodiscard]] int markAsSent(std::vector<typename Kind::Row>* rows, ContactsRecordsAhead* records,
                                 Says says);
    template <class Kind>
    void sendDeleted(CtItemType type, typename Kind::Row& row);
    // Forgets what the server knew of the item: it is sent as new.
    template <class Kind>
    void renew(typename Kind::Row& row);
    template <class Kind>
    [[nodiscard]] int writeBack(const std::vector<Sent>& sent);

    // NULL when the device has the record no more, or (then the run fails) it cannot be read.
    [[nodiscard]] ContactsRecord readRecord(ContactsRecordsAhead* records, int id);
    void sendGroup(CtGroupSyncRow& row);
    void sendContacts(std::vector<CtContactSyncRow>* rows);
    void sendContact(CtContactSyncRow& row);
    // Takes the entry into `row`; false when the contact's fields were not taken.
    [[nodiscard]] bool sendFields(CtContactSyncRow& row, contacts_record_h record);
    [[nodiscard]] CtUpReply updateContact(const CtContactSyncRow& row, contacts_record_h record);
    [[nodiscard]] bool sendPhoto(CtContactSyncRow& row, contacts_record_h record);
    void takePhotoReply(CtContactSyncRow& row, contacts_record_h record, const CtUpReply& reply);
    // Whether the contact is in a group that the server does not have yet.
    [[nodiscard]] bool waitsForGroup(contacts_record_h record) const;
    // Likewise, and whether the server has all the rest of it.
    [[nodiscard]] bool waitsOnlyForGroup(const CtContactSyncRow& row, contacts_record_h record) const;

    CtMetaDataDBHelper* const mpStore;
    const int mAddressBookId;
    CtUpSyncTask mTask;
    CtCurl* const mpCurl;
    IStopQuery* const mpStopQuery;
    ParkedItems& mParked;
    CtGroupMap mGroups;
    std::unique_ptr<ContactComposer> mpComposer;  // once the groups are sent

    ContactsRecordsAhead mGroupRecords{_contacts_group};
    ContactsRecordsAhead mContactRecords{_contacts_contact};
    std::vector<Sent> mSentContacts;
    std::vector<Sent> mSentGroups;
    bool mIsOver = false;
    bool mIsInTrouble = false;
    int mResult = sync_result::kOk;
    int mSent = 0;
    std::string mFailure;
};
