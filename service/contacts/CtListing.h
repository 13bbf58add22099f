// CtListing: what a feed listed, and the deletions that a complete list proves.
// Owner: one stage of a download.   Threads: one worker.   Errors: 0 or -1, logged.
#pragma once

#include <string>
#include <unordered_set>
#include <vector>

#include "contacts/CtItemWriter.h"
#include "contacts/CtSnapshot.h"

template <class Kind>
class CtListing {
public:
    using Row = typename Kind::Row;
    // Neither is owned.
    CtListing(CtMetaDataDBHelper* store, const CtSnapshot<Kind>* snapshot)
        : mpStore(store), mpSnapshot(snapshot) {}

    // Takes a page's ids; what it lists twice, or marks as deleted, goes out of its entries.
    template <class Page>
    void take(Page* page) {
        if (page->unreadable > 0) mIsProof = false;
        mListed.insert(page->idOnly.begin(), page->idOnly.end());
        std::erase_if(page->entries, [this](const auto& entry) { return !takeEntry(*entry); });
    }

    // Takes the ids of a page that is listed for the second time.
    template <class Page>
    void takeAgain(const Page& page) {
        if (page.unreadable > 0) mIsProof = false;
        mListed.insert(page.idOnly.begin(), page.idOnly.end());
        for (const auto& entry : page.entries) (entry->isDeleted ? mMarked : mListed).insert(entry->id);
    }

    // Known to the server and not listed, nor marked as deleted.
    [[nodiscard]] std::vector<Row> unlisted() const;
    // Whether so much would go (with a group its memberships) that the list is to be read once more.
    [[nodiscard]] bool needsSecondLook() const;
    // Deletes what is gone from the device and its rows. What the device has changed stays and is sent as new.
    [[nodiscard]] int deleteGone();
    [[nodiscard]] int deleted() const { return mDeleted; }

private:
    // False: nothing is to be written for it.
    bool takeEntry(const CtEntryInfo& entry);
    [[nodiscard]] int forgetOrRenew(const std::vector<Row>& rows);

    CtMetaDataDBHelper* const mpStore;
    const CtSnapshot<Kind>* const mpSnapshot;
    std::unordered_set<std::string> mListed;
    std::unordered_set<std::string> mMarked;
    bool mIsProof = true;  // false when an entry could not be read at all
    int mDeleted = 0;
};
