// The request tasks of the contacts download. Owner: a director.   Threads: one worker.
// Errors: SyncResult.h codes, each failure logged; outputs are filled on success only.
#pragma once

#include <memory>
#include <string>

#include "contacts/CtCurl.h"
#include "contacts/CtEntryInfo.h"

// A feed's pages, or all of it in one reply.
class CtDownSyncTask {
public:
    explicit CtDownSyncTask(CtCurl* curl) : mpCurl(curl) {}
    // Asked for photos it ends the process: there is no such list.
    [[nodiscard]] int getEntireFeed(CtItemType type, std::string* text);
    // An empty URL asks for the first page.
    [[nodiscard]] int getContactPage(const std::string& url, CtContactPage* page);
    // All in one page.
    [[nodiscard]] int getContacts(CtContactPage* page);

protected:
    CtCurl* const mpCurl;
};

class CtDownSyncGroupListTask : public CtDownSyncTask {
public:
    using CtDownSyncTask::CtDownSyncTask;
    [[nodiscard]] int getListPageByPage(const std::string& url, CtGroupPage* page);
    [[nodiscard]] int getList(CtGroupPage* page);
};

class CtDownSyncContactPhotoTask {
public:
    explicit CtDownSyncContactPhotoTask(CtCurl* curl) : mpCurl(curl) {}
    [[nodiscard]] int get(const std::string& href, const std::string& etag,
                          std::unique_ptr<CtStagedPhoto>* photo);
    // The image of a public profile.
    [[nodiscard]] int getOfProfile(const std::string& imageUrl, std::unique_ptr<CtStagedPhoto>* photo);

private:
    CtCurl* const mpCurl;
};
