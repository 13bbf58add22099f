#include "contacts/CtDownSyncDirector.h"

#include "common/Account.h"
#include "common/PageReader.h"
#include "common/SyncLog.h"
#include "contacts/CtDataManager.h"
#include "contacts/CtFeedParsers.h"
#include "contacts/CtJsonOrbitPeopleConverter.h"
#include "contacts/CtListing.h"
#include "contacts/CtPagePlan.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStopped;
using sync_result::kTokenFailed;

namespace {

constexpr const char* kStoresUnreadable = "the device's stores cannot be read";
constexpr const char* kStoresUnwritable = "not everything could be written to the device";

}  // namespace

CtDownSyncDirector::CtDownSyncDirector(Account* account, IStopQuery* stopQuery)
    : mpAccount(account),
      mpStopQuery(stopQuery),
      mManager(CtDataManager::getInstance()),
      mCurl(account, this, std::make_shared<HttpShare>()),
      mContactTask(&mCurl),
      mGroupTask(&mCurl),
      mPhotoTask(&mCurl) {}

int CtDownSyncDirector::run() {
    mFailure.clear();
    if (isStopped()) return kStopped;
    const int accountId = mpAccount->getAccountId();
    // The device's changes are marked before anything is compared, so that no write of ours can hide one.
    if (mManager.addAccount(accountId) != kOk || mManager.setAccountChanged(accountId) != kOk)
        return fail(kFailed, kStoresUnreadable);
    if (const int result = processGroupsPageByPage(); result != kOk) return result;
    if (isStopped()) return kStopped;
    return processContactsPageByPage();
}

int CtDownSyncDirector::fail(int result, const std::string& text) {
    if (isStopped()) return kStopped;  // a transfer that the stop cut off is no failure
    if (mFailure.empty())
        mFailure = result == kTokenFailed ? "the account's authorisation is no longer accepted" : text;
    return result;
}

// --- groups

int CtDownSyncDirector::fetchGroups(Feed feed, const std::string& token, CtGroupPage* page) {
    return feed == Feed::kWhole ? mGroupTask.getList(page) : mGroupTask.getListPageByPage(token, page);
}

int CtDownSyncDirector::syncGroups(Feed feed) {
    CtMetaDataDBHelper* store = mManager.metaData();
    int addressBookId = 0;
    CtSnapshot<CtGroupKind> snapshot;
    if (store == nullptr || mManager.getAddressBookId(mpAccount->getAccountId(), &addressBookId) != kOk ||
        snapshot.load(*store, addressBookId) != kOk) {
        return fail(kFailed, kStoresUnreadable);
    }
    CtListing<CtGroupKind> listing(store, &snapshot);
    CtSentRows<CtGroupKind> sent = readSentGroups(snapshot);
    size_t written = 0;
    const auto fetch = [&](const std::string& token, CtGroupPage* page) {
        return fetchGroups(feed, token, page);
    };
    const auto stopped = [this] { return isStopped(); };
    int result = readPages<CtGroupPage>(
        fetch,
        [&](CtGroupPage& page) {
            listing.take(&page);
            std::vector<CtGroupItem> items = planGroups(page, snapshot, &sent);
            written += items.size();
            return CtItemWriter(store, addressBookId).writeGroups(&items);
        },
        stopped);
    if (result == kOk && listing.needsSecondLook()) {
        SYNC_INFO("%zu groups are no longer listed, the list is fetched again", listing.unlisted().size());
        result = readPages<CtGroupPage>(
            fetch,
            [&listing](const CtGroupPage& page) {
                listing.takeAgain(page);
                return kOk;
            },
            stopped);
    }
    if (result != kOk) {
        if (result != kStopped) SYNC_ERR("Getting groups from remote failed!");
        return fail(result, "the groups could not be read from the server");
    }
    if (listing.deleteGone() != kOk) return fail(kFailed, kStoresUnwritable);
    // What the sync wrote itself is examined now, so that no later look goes through it again.
    if (written + static_cast<size_t>(listing.deleted()) > 0 &&
        mManager.markGroupChanged(addressBookId) != kOk)
        return fail(kFailed, kStoresUnwritable);
    SYNC_INFO("groups: %zu written, %d deleted", written, listing.deleted());
    return kOk;
}

// --- contacts

int CtDownSyncDirector::fetchContacts(Feed feed, const std::string& token, CtContactPage* page) {
    if (feed == Feed::kPages) return mContactTask.getContactPage(token, page);
    std::string text;
    const int result = mContactTask.getEntireFeed(CtItemType::kContact, &text);
    return result == kOk ? CtContactListJsonParser::parse(text, page) : result;
}

int CtDownSyncDirector::syncContacts(Feed feed) {
    CtMetaDataDBHelper* store = mManager.metaData();
    int addressBookId = 0;
    CtSnapshot<CtContactKind> snapshot;
    CtGroupMap groups;
    if (store == nullptr || mManager.getAddressBookId(mpAccount->getAccountId(), &addressBookId) != kOk ||
        snapshot.load(*store, addressBookId) != kOk || groups.load(*store, addressBookId) != kOk) {
        return fail(kFailed, kStoresUnreadable);
    }
    const ContactComposer composer = groups.composer(mCurl.feedBase());
    CtListing<CtContactKind> listing(store, &snapshot);
    CtSentRows<CtContactKind> sent = readSentContacts(snapshot, composer);
    int inserted = 0;
    int updated = 0;
    int written = kOk;
    const auto fetch = [&](const std::string& token, CtContactPage* page) {
        return fetchContacts(feed, token, page);
    };
    const auto stopped = [this] { return isStopped(); };
    int result = readPages<CtContactPage>(
        fetch,
        [&](CtContactPage& page) {
            listing.take(&page);
            CtContactBatch batch = planContacts(page, snapshot, composer, &sent);
            if (const int photos = fetchPhotos(&batch); photos != kOk) return photos;
            if (writeBatch(&batch, feed, &inserted, &updated) != kOk) written = kFailed;
            return kOk;
        },
        stopped);
    if (result == kOk && listing.needsSecondLook()) {
        SYNC_INFO("%zu contacts are no longer listed, the list is fetched again", listing.unlisted().size());
        result = readPages<CtContactPage>(
            fetch,
            [&listing](const CtContactPage& page) {
                listing.takeAgain(page);
                return kOk;
            },
            stopped);
    }
    if (result != kOk) return fail(result, "the contacts could not be read from the server");
    if (listing.deleteGone() != kOk) written = kFailed;
    if (inserted + updated + listing.deleted() > 0 && mManager.markContactChanged(addressBookId) != kOk)
        written = kFailed;
    SYNC_INFO("contacts: %d inserted, %d updated, %d deleted", inserted, updated, listing.deleted());
    return written == kOk ? kOk : fail(kFailed, kStoresUnwritable);
}

int CtDownSyncDirector::writeBatch(CtContactBatch* batch, Feed feed, int* inserted, int* updated) {
    const int accountId = mpAccount->getAccountId();
    if (feed == Feed::kPages) {
        const int result = mManager.writeContacts(accountId, batch);
        *inserted += static_cast<int>(batch->inserts.size());
        *updated += static_cast<int>(batch->updates.size());
        return result;
    }
    int first = kOk;
    const auto write = [&](std::vector<BulkItem>& items, std::vector<BulkItem> CtContactBatch::*where,
                           int* count) {
        for (BulkItem& item : items) {
            CtContactBatch single;
            (single.*where).push_back(std::move(item));
            if (mManager.writeContacts(accountId, &single) != kOk) first = kFailed;
            *count += static_cast<int>((single.*where).size());
        }
    };
    write(batch->updates, &CtContactBatch::updates, updated);
    write(batch->inserts, &CtContactBatch::inserts, inserted);
    CtContactBatch rows;
    rows.rows = std::move(batch->rows);
    return mManager.writeContacts(accountId, &rows) == kOk ? first : kFailed;
}

// --- photos

int CtDownSyncDirector::fetchPhotos(CtContactBatch* batch) {
    for (std::vector<BulkItem>* items : {&batch->inserts, &batch->updates}) {
        for (BulkItem& item : *items) {
            if (isStopped()) return kStopped;
            if (const int result = fetchPhoto(item); result != kOk) return result;
        }
    }
    std::erase_if(batch->updates, [](const BulkItem& item) { return item.isForPhoto && !item.photo; });
    return kOk;
}

// A photo that cannot be had leaves the contact with the image it has, and is asked for again in the next run.
int CtDownSyncDirector::fetchPhoto(BulkItem& item) {
    const ContactInfo& entry = *item.entry;
    if (entry.photoEtag.empty()) {
        const bool hadPhoto = !std::exchange(item.row.photo_etag, std::string()).empty();
        fetchProfile(item, /*wantsImage=*/!item.keepsImage);
        if (!item.profile.empty() && !hadPhoto) item.keepsImage = true;
        return kOk;
    }
    fetchProfile(item, /*wantsImage=*/false);
    if (entry.photoEtag == item.row.photo_etag) {
        item.keepsImage = true;
        return kOk;
    }
    const int result = mPhotoTask.get(entry.photoHref, entry.photoEtag, &item.photo);
    if (result == kOk) {
        item.row.photo_etag = entry.photoEtag;
        return kOk;
    }
    SYNC_ERR("Error occurred on photo downloading!");
    item.keepsImage = true;
    return result == kTokenFailed ? result : kOk;
}

void CtDownSyncDirector::fetchProfile(BulkItem& item, bool wantsImage) {
    if (item.entry->websites.empty()) return;
    const std::string base = mCurl.peopleBase();
    const std::string prefix = base + ct_wire::kProfiles;
    for (const std::string& website : item.entry->websites) {
        if (!website.starts_with(prefix)) continue;
        std::string profile;
        std::string url;
        if (mCurl.getOrbit(website.substr(prefix.size()), &profile) != kOk ||
            CtJsonOrbitPeopleConverter::getPhotoUrl(profile, base, &url) != kOk) {
            return;
        }
        item.profile = std::move(profile);
        if (wantsImage && !url.empty() && mPhotoTask.getOfProfile(url, &item.photo) != kOk)
            SYNC_ERR("Error occurred on photo downloading!");
        return;
    }
}
