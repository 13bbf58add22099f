// CtUpSyncTask: the five writing operations of the contacts upload, and what their answers mean.
// Owner: a director.   Threads: one worker.
#pragma once

#include <string>

#include "common/SyncResult.h"
#include "contacts/CtCurl.h"
#include "contacts/CtFeedParsers.h"

enum class CtAnswer {
    kAccepted,
    kGone,      // the server has the item no more
    kConflict,  // it has another version of it
    kRefused,   // it was not done
    kUnclear,   // it may have been done
    kNoAnswer,  // no answer, or nobody may ask any more: `result` tells
};

struct CtUpReply {
    CtAnswer answer = CtAnswer::kNoAnswer;
    int result = sync_result::kFailed;  // SyncResult.h
    CtEntryMetaData meta;    // of the entry as the server has it now; empty where the answer did not tell
    std::string reason;      // for people, of what was not accepted
    bool isForGood = false;  // a refusal that holds as long as the item stays as it is

    [[nodiscard]] bool isAccepted() const { return answer == CtAnswer::kAccepted; }
};

class CtUpSyncTask {
public:
    explicit CtUpSyncTask(CtCurl* curl) : mpCurl(curl) {}

    // An answer that does not name the new entry is unclear.
    [[nodiscard]] CtUpReply insert(CtItemType type, const std::string& entry);
    [[nodiscard]] CtUpReply update(CtItemType type, const std::string& id, const std::string& etag,
                                   const std::string& entry);
    [[nodiscard]] CtUpReply remove(CtItemType type, const std::string& id, const std::string& etag);
    // Both read the entry again for its new etags.
    [[nodiscard]] CtUpReply upsertPhoto(const std::string& contactId, const std::string& photoEtag,
                                        const std::string& path);
    [[nodiscard]] CtUpReply removePhoto(const std::string& contactId, const std::string& photoEtag);
    // The entry as it is now.
    [[nodiscard]] CtUpReply read(CtItemType type, const std::string& id);

private:
    [[nodiscard]] CtUpReply judge(int result) const;
    [[nodiscard]] std::string photoUrl(const std::string& contactId) const;

    CtCurl* const mpCurl;
};
