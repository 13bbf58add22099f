#include "contacts/CtUpSyncDirector.h"

#include <algorithm>

#include "common/Account.h"
#include "common/SentMark.h"
#include "common/SyncLog.h"
#include "contacts/CtDataManager.h"
#include "contacts/CtDownSyncDirector.h"
#include "contacts/CtUploader.h"

using sync_result::kFailed;
using sync_result::kOk;

CtUpSyncDirector::CtUpSyncDirector(Account* account, IStopQuery* stopQuery)
    : mpAccount(account), mpStopQuery(stopQuery), mCurl(account, this, std::make_shared<HttpShare>()) {}

// The download takes them over as it compares.
int CtUpSyncDirector::findSentItems(int addressBookId) {
    std::vector<CtContactSyncRow> contacts;
    std::vector<CtGroupSyncRow> groups;
    CtMetaDataDBHelper* store = CtDataManager::getInstance().metaData();
    if (store->getAllContacts(addressBookId, &contacts) != kOk ||
        store->getAllGroups(addressBookId, &groups) != kOk)
        return kFailed;
    const auto isUnconfirmed = [](const auto& row) { return row.uri.empty() && sent_mark::isOn(row.etag); };
    if (std::none_of(contacts.begin(), contacts.end(), isUnconfirmed) &&
        std::none_of(groups.begin(), groups.end(), isUnconfirmed)) {
        return kOk;
    }
    CtDownSyncDirector download(mpAccount, mpStopQuery);
    const int result = download.run();
    if (result != kOk) mFailure = download.lastFailure();
    return result;
}

int CtUpSyncDirector::run() {
    mFailure.clear();
    mIsInTrouble = true;
    CtDataManager& manager = CtDataManager::getInstance();
    const int accountId = mpAccount->getAccountId();
    int addressBookId = 0;
    if (manager.addAccount(accountId) != kOk || manager.setAccountChanged(accountId) != kOk ||
        manager.getAddressBookId(accountId, &addressBookId) != kOk) {
        mFailure = "the device's changes could not be read";
        return kFailed;
    }
    if (const int result = findSentItems(addressBookId); result != kOk) return result;
    CtUploader uploader(manager.metaData(), addressBookId, &mCurl, mpStopQuery, &mParked);
    const int result = uploader.run();
    mFailure = result == kOk ? mParked.summary() : uploader.failure();
    mIsInTrouble = uploader.isInTrouble();
    if (uploader.sent() == 0) return result;
    SYNC_INFO("contacts: %d changes sent", uploader.sent());
    return manager.passOwnWrites(addressBookId) == kOk || result != kOk ? result : kFailed;
}
