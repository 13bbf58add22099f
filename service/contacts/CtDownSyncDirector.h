// CtDownSyncDirector: brings the server's groups and contacts of one account onto the device. Groups come first, so that contacts
// find the groups they belong to. A page is written in one transaction of each store; deletions follow only a list that was read to
// its end.
// Owner: the contacts agent.   Threads: the worker's; the result is read on the main thread.
#pragma once

#include <memory>
#include <string>

#include "common/SyncDirector.h"
#include "common/SyncProgress.h"
#include "contacts/CtBulkItem.h"
#include "contacts/CtCurl.h"
#include "contacts/CtDownSyncTasks.h"

class Account;
class CtDataManager;
class CtGroupMap;

class CtDownSyncDirector : public SyncDirector, private IProgressObserver {
public:
    // Neither is owned; `stopQuery` may be NULL.
    CtDownSyncDirector(Account* account, IStopQuery* stopQuery);

    int run() override;
    [[nodiscard]] std::string lastFailure() const override { return mFailure; }

    // The stages, page by page or with the whole feed in one reply, then written entry by entry.
    [[nodiscard]] int processGroupsPageByPage() { return syncGroups(Feed::kPages); }
    [[nodiscard]] int processGroups() { return syncGroups(Feed::kWhole); }
    [[nodiscard]] int processContactsPageByPage() { return syncContacts(Feed::kPages); }
    [[nodiscard]] int processContacts() { return syncContacts(Feed::kWhole); }

private:
    enum class Feed { kPages, kWhole };

    int onProgress(double, double, double, double) override { return isStopped() ? 1 : 0; }
    [[nodiscard]] bool isStopped() const { return mpStopQuery != nullptr && mpStopQuery->isStopped(); }
    [[nodiscard]] int fail(int result, const std::string& text);
    [[nodiscard]] int fetchContacts(Feed feed, const std::string& token, CtContactPage* page);
    [[nodiscard]] int fetchGroups(Feed feed, const std::string& token, CtGroupPage* page);
    [[nodiscard]] int syncGroups(Feed feed);
    [[nodiscard]] int syncContacts(Feed feed);
    [[nodiscard]] int writeBatch(CtContactBatch* batch, Feed feed, int* inserted, int* updated);
    [[nodiscard]] int fetchPhotos(CtContactBatch* batch, const CtGroupMap& groups);
    [[nodiscard]] int fetchPhoto(BulkItem& item);
    [[nodiscard]] bool fetchProfile(BulkItem& item, bool wantsImage);
    [[nodiscard]] int getProfile(const std::string& personId, std::string* profile);
    [[nodiscard]] static std::string formerProfile(int contactId);
    [[nodiscard]] bool isHeld(const BulkItem& item, const CtGroupMap& groups) const;

    Account* const mpAccount;
    IStopQuery* const mpStopQuery;
    CtDataManager& mManager;
    CtCurl mCurl;
    CtDownSyncTask mContactTask;
    CtDownSyncGroupListTask mGroupTask;
    CtDownSyncContactPhotoTask mPhotoTask;
    SyncProgress mProgress;
    bool mHasPeople = true;  // false once the people server did not answer
    std::string mFailure;
};
