#include "contacts/CtDownSyncDirector.h"

#include "common/Account.h"
#include "common/HttpStatus.h"
#include "common/PageReader.h"
#include "common/SyncLog.h"
#include "contacts/CtDataManager.h"
#include "contacts/CtJsonOrbitPeopleConverter.h"
#include "contacts/CtListing.h"
#include "contacts/CtPagePlan.h"
#include "contacts/CtRecordRead.h"

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
      mPhotoTask(&mCurl),
      mProgress(account->getAccountId(), VANTOR_PIM_SYNC_TYPE_CONTACTS) {}

int CtDownSyncDirector::run() {
    mFailure.clear();
    mProgress.beginRun();
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
    return feed == Feed::kWhole ? mContactTask.getContacts(page) : mContactTask.getContactPage(token, page);
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
    mHasPeople = true;
    mProgress.beginPart("contacts");
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
            const size_t listed = page.entries.size();
            CtContactBatch batch = planContacts(page, snapshot, groups, composer, &sent);
            if (const int photos = fetchPhotos(&batch, groups); photos != kOk) return photos;
            mProgress.addPage(listed);
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

// --- photos and profiles

int CtDownSyncDirector::fetchPhotos(CtContactBatch* batch, const CtGroupMap& groups) {
    for (std::vector<BulkItem>* items : {&batch->inserts, &batch->updates}) {
        for (BulkItem& item : *items) {
            if (isStopped()) return kStopped;
            if (const int result = fetchPhoto(item); result != kOk) return result;
        }
    }
    std::erase_if(batch->updates, [&](const BulkItem& item) {
        return !item.photo && (item.isForPhoto || (item.row.etag.empty() && isHeld(item, groups)));
    });
    return kOk;
}

// A photo that cannot be had leaves the contact with the image it has, and is asked for again in the next run. So is a profile, or
// the image in it: without an etag the row counts as changed.
int CtDownSyncDirector::fetchPhoto(BulkItem& item) {
    const ContactInfo& entry = *item.entry;
    if (item.row.image_dirty != 0) {  // the device's image has not been sent yet, and wins
        item.keepsImage = true;
        if (!fetchProfile(item, /*wantsImage=*/false)) item.row.etag.clear();
        return kOk;
    }
    const bool hasPhoto = !entry.photoEtag.empty();
    const bool hadPhoto = !hasPhoto && !std::exchange(item.row.photo_etag, std::string()).empty();
    const bool isComplete = fetchProfile(item, /*wantsImage=*/!hasPhoto && !item.keepsImage);
    if (!isComplete) item.row.etag.clear();
    if (!hasPhoto) {
        if ((!item.profile.empty() || !isComplete) && !hadPhoto) item.keepsImage = true;
        return kOk;
    }
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

// False when there is something that could not be had.
bool CtDownSyncDirector::fetchProfile(BulkItem& item, bool wantsImage) {
    if (item.entry->websites.empty()) return true;
    const std::string base = mCurl.peopleBase();
    const std::string prefix = base + ct_wire::kProfiles;
    for (const std::string& website : item.entry->websites) {
        if (!website.starts_with(prefix) || website == prefix) continue;
        std::string profile;
        std::string url;
        const int result = getProfile(website.substr(prefix.size()), &profile);
        if (result != kOk && http_status::isGone(mCurl.lastHttpStatus())) return true;  // there is none
        if (result != kOk || CtJsonOrbitPeopleConverter::getPhotoUrl(profile, base, &url) != kOk) {
            SYNC_ERR("the profile of contact(%s, %s) cannot be had, the next sync asks for it again",
                     item.entry->id.c_str(), item.entry->title.c_str());
            item.profile = formerProfile(item.row.contact_id);
            return false;
        }
        item.profile = std::move(profile);
        if (!wantsImage || url.empty() || mPhotoTask.getOfProfile(url, &item.photo) == kOk) return true;
        SYNC_ERR("Error occurred on photo downloading!");
        return false;
    }
    return true;
}

// A people server that does not answer is not waited for again in the same run.
int CtDownSyncDirector::getProfile(const std::string& personId, std::string* profile) {
    if (!mHasPeople) return kFailed;
    const int result = mCurl.getOrbit(personId, profile);
    if (result != kOk && mCurl.lastHttpStatus() == 0) mHasPeople = false;
    return result;
}

std::string CtDownSyncDirector::formerProfile(int contactId) {
    contacts_record_h raw = nullptr;
    if (contactId == 0 || contacts_db_get_record(_contacts_contact, contactId, &raw) != PLATFORM_ERROR_NONE)
        return {};
    const ContactsRecord record(raw);
    return CtJsonOrbitPeopleConverter::formerProfile(raw);
}

// Whether the device has all that could be had for the entry: it is not written again for what could not.
bool CtDownSyncDirector::isHeld(const BulkItem& item, const CtGroupMap& groups) const {
    contacts_record_h raw = nullptr;
    if (item.rowWrite != CtRowWrite::kUpdate || !item.keepsImage ||
        contacts_db_get_record(_contacts_contact, item.row.contact_id, &raw) != PLATFORM_ERROR_NONE) {
        return false;
    }
    const ContactsRecord held(raw);
    if (ct_record::originOf(raw) != item.entry->jsonText()) return false;
    try {
        ContactsRecord wanted;
        if (groups.converter().convert(item.entry->object(), {}, &wanted, 0, /*withPhoto=*/false) != kOk)
            return false;
        if (!item.profile.empty()) (void)CtJsonOrbitPeopleConverter::convert(item.profile, wanted.get());
        const ContactComposer composer = groups.composer(mCurl.feedBase());
        return composer.composeFields(raw) == composer.composeFields(wanted.get());
    } catch (const JsonException& error) {
        SYNC_DBG("Handle this execption! (%s)", error.what());
        return false;
    }
}
