#include "contacts/CtDownSyncTasks.h"

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "contacts/CtFeedParsers.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

constexpr const char* kContactPages = "/contacts/default/full?alt=json";
constexpr const char* kGroupPages = "/groups/default/full?alt=json";

void logSuspicious(const std::string& text) {
    SYNC_ERR("Server's response is suspicious. check full string");
    logReply(text);
}

int readContacts(int result, const std::string& text, CtContactPage* page) {
    if (result != kOk) {
        SYNC_ERR("Getting contacts from remote failed! %d", result);
        return result;
    }
    if (CtContactListJsonParser::parse(text, page) == kOk) return kOk;
    SYNC_ERR("JSON parsing Failed");
    logSuspicious(text);
    return kFailed;
}

int readGroups(int result, const std::string& text, CtGroupPage* page) {
    if (result != kOk) {
        SYNC_ERR("Curl Get Operation Failed! %d", result);
        return result;
    }
    if (CtGroupListJsonParser::parse(text, page) == kOk) return kOk;
    logSuspicious(text);
    return kFailed;
}

}  // namespace

int CtDownSyncTask::getEntireFeed(CtItemType type, std::string* text) {
    if (type == CtItemType::kPhoto) SYNC_ASSERT_TEXT(false, "!\"Don't take photo list!\"");
    const std::string feed = type == CtItemType::kGroup ? "groups" : "contacts";
    return mpCurl->get(mpCurl->feedBase() + "/" + feed + "/default/full?max-results=1000000000" + "&alt=json",
                       text);
}

int CtDownSyncTask::getContactPage(const std::string& url, CtContactPage* page) {
    std::string text;
    const int fetched = mpCurl->get(url.empty() ? mpCurl->feedBase() + kContactPages : url, &text);
    const int result = readContacts(fetched, text, page);
    if (result == kOk && !page->nextPageToken.empty())
        SYNC_INFO("Go next page :%s", page->nextPageToken.c_str());
    return result;
}

int CtDownSyncTask::getContacts(CtContactPage* page) {
    std::string text;
    const int result = getEntireFeed(CtItemType::kContact, &text);
    return readContacts(result, text, page);
}

int CtDownSyncGroupListTask::getListPageByPage(const std::string& url, CtGroupPage* page) {
    std::string text;
    const int result = mpCurl->get(url.empty() ? mpCurl->feedBase() + kGroupPages : url, &text);
    return readGroups(result, text, page);
}

int CtDownSyncGroupListTask::getList(CtGroupPage* page) {
    std::string text;
    const int result = getEntireFeed(CtItemType::kGroup, &text);
    return readGroups(result, text, page);
}

int CtDownSyncContactPhotoTask::get(const std::string& href, const std::string& etag,
                                    std::unique_ptr<CtStagedPhoto>* photo) {
    std::unique_ptr<CtStagedPhoto> staged = CtStagedPhoto::create(CtIdUtil::idAfterCom(href));
    if (!staged) return kFailed;
    const int result = mpCurl->getImage(href, etag, staged.get());
    if (result != kOk) {
        SYNC_ERR("Download Photo Failed!");
        return result;
    }
    *photo = std::move(staged);
    return kOk;
}

int CtDownSyncContactPhotoTask::getOfProfile(const std::string& imageUrl,
                                             std::unique_ptr<CtStagedPhoto>* photo) {
    std::unique_ptr<CtStagedPhoto> staged =
        CtStagedPhoto::create(CtIdUtil::idAfterCom(imageUrl.substr(0, imageUrl.find('?'))));
    if (!staged) return kFailed;
    const int result = mpCurl->getOrbitImage(imageUrl, staged.get());
    if (result != kOk) {
        SYNC_ERR("Download Photo Failed!");
        return result;
    }
    *photo = std::move(staged);
    return kOk;
}
