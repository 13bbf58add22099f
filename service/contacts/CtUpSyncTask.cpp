#include "contacts/CtUpSyncTask.h"

#include <glib.h>

#include <string_view>
#include <utility>

#include "common/HttpStatus.h"
#include "common/SyncLog.h"
#include "common/UrlText.h"
#include "contacts/CtWire.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kTokenFailed;

namespace {

constexpr const char* kJson = "?alt=json";
constexpr const char* kKeepsEtag = "Can't parsing URI & ETAG! Update failed! Preserve old etag! ";

CtAnswer answerOf(long status) {
    if (http_status::isSuccess(status)) return CtAnswer::kAccepted;
    if (http_status::isGone(status)) return CtAnswer::kGone;
    if (http_status::isConflict(status)) return CtAnswer::kConflict;
    if (status == 0 || status == http_status::kUnauthorized) return CtAnswer::kNoAnswer;
    constexpr long kClientError = 400;
    return status >= kClientError && status < http_status::kServerError ? CtAnswer::kRefused
                                                                        : CtAnswer::kUnclear;
}

// Whoever answers so, as the page where a network wants a login, is not the provider, and has done nothing.
CtUpReply notOfProvider(CtUpReply reply) {
    reply.answer = CtAnswer::kUnclear;
    reply.result = kFailed;
    reply.reason = "the answer is not one of the provider's";
    return reply;
}

bool isPage(const std::string& text) {
    const size_t begin = text.find_first_not_of(" \t\r\n");
    if (begin == std::string::npos) return false;
    const auto startsWith = [&](std::string_view word) {
        return g_ascii_strncasecmp(text.c_str() + begin, word.data(), word.size()) == 0;
    };
    return startsWith("<html") || startsWith("<!doctype");
}

}  // namespace

CtUpReply CtUpSyncTask::judge(int result) const {
    CtUpReply reply;
    reply.result = result;
    reply.answer = result == kTokenFailed ? CtAnswer::kNoAnswer : answerOf(mpCurl->lastHttpStatus());
    reply.isForGood = result != kTokenFailed && http_status::isRefusedForGood(mpCurl->lastHttpStatus());
    if (reply.answer == CtAnswer::kNoAnswer) {
        reply.reason = "the server could not be reached or gave no usable answer";
    } else if (!reply.isAccepted()) {
        reply.reason = "the server answered with error " + std::to_string(mpCurl->lastHttpStatus());
    }
    return reply;
}

CtUpReply CtUpSyncTask::insert(CtItemType type, const std::string& entry) {
    std::string text;
    CtUpReply reply = judge(mpCurl->insert(type, entry, &text));
    // Where new entries go there is nothing that could be gone.
    if (reply.answer == CtAnswer::kGone || reply.answer == CtAnswer::kConflict)
        reply.answer = CtAnswer::kRefused;
    if (!reply.isAccepted()) return reply;
    if (CtEntryMetaDataParser::getMetaData(text, &reply.meta) != kOk) {
        SYNC_ERR("Can't parsing URI & ETAG !");
    } else if (reply.meta.id.empty()) {
        SYNC_ERR("Insert ERROR on URI");
    } else if (reply.meta.etag.empty()) {
        SYNC_ERR("Insert ERROR on ETAG");
    } else {
        return reply;
    }
    reply.answer = CtAnswer::kUnclear;
    reply.result = kFailed;
    reply.reason = "the server's answer does not name the new entry";
    return reply;
}

CtUpReply CtUpSyncTask::update(CtItemType type, const std::string& id, const std::string& etag,
                               const std::string& entry) {
    std::string text;
    const std::string url = CtIdUtil::makeEditHref(mpCurl->feedBase(), type, id) + kJson;
    CtUpReply reply = judge(mpCurl->update(url, etag, entry, &text));
    if (!reply.isAccepted() || CtEntryMetaDataParser::getMetaData(text, &reply.meta) == kOk) return reply;
    SYNC_ERR("%s", kKeepsEtag);
    if (!text.empty()) return notOfProvider(std::move(reply));
    CtUpReply now = read(type, id);
    // An account that may ask no longer, or a server that is away, is told as that.
    if (now.isAccepted() || now.answer == CtAnswer::kNoAnswer) return now;
    return notOfProvider(std::move(now));
}

CtUpReply CtUpSyncTask::remove(CtItemType type, const std::string& id, const std::string& etag) {
    std::string text;
    CtUpReply reply =
        judge(mpCurl->remove(CtIdUtil::makeEditHref(mpCurl->feedBase(), type, id), etag, &text));
    if (reply.isAccepted() && isPage(text)) reply = notOfProvider(std::move(reply));
    if (!reply.isAccepted() && reply.answer != CtAnswer::kGone) SYNC_ERR("fail");
    return reply;
}

std::string CtUpSyncTask::photoUrl(const std::string& contactId) const {
    return mpCurl->feedBase() + ct_wire::kPhotos + url_text::hrefSegment(contactId);
}

CtUpReply CtUpSyncTask::upsertPhoto(const std::string& contactId, const std::string& photoEtag,
                                    const std::string& path) {
    std::string text;
    CtUpReply reply = judge(mpCurl->upsertImage(photoUrl(contactId), photoEtag, path, &text));
    if (reply.isAccepted() && isPage(text)) reply = notOfProvider(std::move(reply));
    if (!mpCurl->hasAsked()) {
        // That says nothing of the server: the other items go on.
        reply.answer = CtAnswer::kRefused;
        reply.reason = "its photo cannot be read";
    }
    if (!reply.isAccepted()) {
        SYNC_ERR("Can't upsert image!");
        return reply;
    }
    CtUpReply now = read(CtItemType::kContact, contactId);
    if (now.isAccepted()) {
        reply.meta = std::move(now.meta);
    } else {
        SYNC_ERR("%s", kKeepsEtag);
    }
    return reply;
}

CtUpReply CtUpSyncTask::removePhoto(const std::string& contactId, const std::string& photoEtag) {
    std::string text;
    CtUpReply reply = judge(mpCurl->remove(photoUrl(contactId), photoEtag, &text));
    if (reply.isAccepted() && isPage(text)) return notOfProvider(std::move(reply));
    if (reply.answer == CtAnswer::kGone) reply.answer = CtAnswer::kAccepted;
    if (!reply.isAccepted()) return reply;
    if (!text.empty() && CtEntryMetaDataParser::getMetaData(text, &reply.meta) == kOk) return reply;
    CtUpReply now = read(CtItemType::kContact, contactId);
    if (now.isAccepted()) {
        reply.meta = std::move(now.meta);
    } else {
        SYNC_ERR("Can't parsing URI & ETAG! Update failed! Preserve old Contact Entry Etag! %s",
                 contactId.c_str());
    }
    return reply;
}

CtUpReply CtUpSyncTask::read(CtItemType type, const std::string& id) {
    std::string text;
    const std::string url = CtIdUtil::makeEditHref(mpCurl->feedBase(), type, id) + kJson;
    CtUpReply reply = judge(mpCurl->get(url, &text));
    // One answer that it is gone is not believed.
    if (reply.answer == CtAnswer::kGone) reply = judge(mpCurl->get(url, &text));
    if (!reply.isAccepted()) return reply;
    if (CtEntryMetaDataParser::getMetaData(text, &reply.meta) == kOk && reply.meta.id == id) return reply;
    reply.answer = CtAnswer::kUnclear;
    reply.result = kFailed;
    reply.reason = "the server's answer is not the entry that was asked for";
    return reply;
}
