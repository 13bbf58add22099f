#include <algorithm>

#include "AtomEntry.h"
#include "FeedJson.h"
#include "Services.h"

namespace provider {

namespace {

constexpr long long kPageEntries = 50;

constexpr const char* kContactFeed = "/m8/feeds/contacts/*/full";
constexpr const char* kGroupFeed = "/m8/feeds/groups/*/full";
constexpr const char* kPhotos = "/m8/feeds/photos/media/*/*";

void checkVersion(const Call& call) {
    if (call.header("XData-Version") != "3.0")
        throw ApiError{400, "invalidVersion", "XData-Version must be 3.0", "XData-Version"};
}

void checkAlt(const Call& call) {
    if (call.param("alt") != "json") throw ApiError{400, "invalidParameter", "alt must be json", "alt"};
}

void checkMatch(const Call& call, const std::string& etag) {
    const std::string wanted = call.header("If-Match");
    if (wanted.empty()) throw ApiError{400, "required", "Required: If-Match", "If-Match"};
    if (wanted != "*" && wanted != etag)
        throw ApiError{409, "conflict", "The entry has another etag: " + etag, "If-Match"};
}

FeedPlace placeOf(const Call& call) {
    return {call.origin, call.account};
}

Reply entryReply(const Call& call, FeedKind kind, const FeedEntry& entry, int status = 200) {
    return jsonReply(document("entry", entryJson(kind, entry, placeOf(call))), status);
}

Reply imageReply(const Image& image) {
    Reply reply;
    reply.body = image.bytes;
    reply.contentType = image.type;
    reply.headers["ETag"] = image.etag;
    return reply;
}

Reply emptyReply(const std::string& etag = "") {
    Reply reply;
    if (!etag.empty()) reply.headers["ETag"] = etag;
    return reply;
}

}  // namespace

void ContactService::addRoutes(Router& router) {
    addFeedRoutes(router, FeedKind::kContact);
    addFeedRoutes(router, FeedKind::kGroup);
    const auto add = [&](const char* method, Reply (ContactService::*serve)(const Call&)) {
        router.add(method, kPhotos, Access::kToken, [this, serve](const Call& call) {
            checkVersion(call);
            return (this->*serve)(call);
        });
    };
    add("GET", &ContactService::getPhoto);
    add("PUT", &ContactService::putPhoto);
    add("DELETE", &ContactService::deletePhoto);
}

void ContactService::addFeedRoutes(Router& router, FeedKind kind) {
    const std::string feed = kind == FeedKind::kContact ? kContactFeed : kGroupFeed;
    std::string entry = feed;
    entry += "/*";
    const auto add = [&](const char* method, const std::string& pattern,
                         Reply (ContactService::*serve)(const Call&, FeedKind)) {
        router.add(method, pattern, Access::kToken, [this, kind, serve](const Call& call) {
            checkVersion(call);
            return (this->*serve)(call, kind);
        });
    };
    add("GET", feed, &ContactService::list);
    add("POST", feed, &ContactService::insert);
    add("GET", entry, &ContactService::get);
    add("PUT", entry, &ContactService::replace);
    add("DELETE", entry, &ContactService::remove);
}

Reply ContactService::list(const Call& call, FeedKind kind) {
    call.allowOnly({"max-results", "start-index"});
    checkAlt(call);
    const auto max = static_cast<std::size_t>(call.number("max-results", kPageEntries, 1));
    auto at = static_cast<std::size_t>(call.number("start-index", 1, 1) - 1);
    const auto lock = mContext.store.guard();
    const ContactBook::Entries& entries = mContext.store.contacts(call.account).entries(kind);
    const auto isShown = [](const auto& entry) { return !entry->isDeleted || entry->isListed; };
    const FeedPlace place = placeOf(call);
    Json feed = feedHead(kind, place);
    std::string updated;
    for (const auto& entry : entries) updated = std::max(updated, entry->updated);
    feed["updated"]["$t"] = updated;
    const auto total = std::count_if(entries.begin(), entries.end(), isShown);
    feed["openSearch$totalResults"]["$t"] = std::to_string(total);
    feed["entry"] = Json::array();
    for (; at < entries.size(); ++at) {
        if (!isShown(entries[at])) continue;
        if (feed["entry"].size() == max) {
            const std::string next = place.origin + feedPath(kind, place.email, "full") +
                                     "?alt=json&start-index=" + std::to_string(at + 1) +
                                     "&max-results=" + std::to_string(max);
            feed["link"].push_back({{"rel", "next"}, {"type", "application/atom+xml"}, {"href", next}});
            break;
        }
        feed["entry"].push_back(entryJson(kind, *entries[at], place));
    }
    return jsonReply(document("feed", std::move(feed)));
}

Reply ContactService::get(const Call& call, FeedKind kind) {
    call.allowOnly({});
    checkAlt(call);
    const auto lock = mContext.store.guard();
    return entryReply(call, kind, mContext.store.contacts(call.account).get(kind, call.ids[1]));
}

Reply ContactService::insert(const Call& call, FeedKind kind) {
    call.allowOnly({});
    checkAlt(call);
    const Json fields = atomBody(call, kind);
    const auto lock = mContext.store.guard();
    return entryReply(call, kind, mContext.store.contacts(call.account).insert(kind, fields), 201);
}

Reply ContactService::replace(const Call& call, FeedKind kind) {
    call.allowOnly({});
    checkAlt(call);
    const Json fields = atomBody(call, kind);
    const auto lock = mContext.store.guard();
    ContactBook& book = mContext.store.contacts(call.account);
    checkMatch(call, book.get(kind, call.ids[1]).etag);
    return entryReply(call, kind, book.replace(kind, call.ids[1], fields));
}

Reply ContactService::remove(const Call& call, FeedKind kind) {
    call.allowOnly({});
    const auto lock = mContext.store.guard();
    ContactBook& book = mContext.store.contacts(call.account);
    checkMatch(call, book.get(kind, call.ids[1]).etag);
    book.remove(kind, call.ids[1]);
    return emptyReply();
}

Reply ContactService::getPhoto(const Call& call) {
    call.allowOnly({});
    const auto lock = mContext.store.guard();
    const FeedEntry& contact = mContext.store.contacts(call.account).get(FeedKind::kContact, call.ids[1]);
    if (!contact.photo.isThere()) throw ApiError{404, "notFound", "Photo not found", ""};
    return imageReply(contact.photo);
}

Reply ContactService::putPhoto(const Call& call) {
    call.allowOnly({});
    const std::string type = imageType(call);
    const auto lock = mContext.store.guard();
    ContactBook& book = mContext.store.contacts(call.account);
    const Image& before = book.get(FeedKind::kContact, call.ids[1]).photo;
    if (before.isThere() && !call.header("If-Match").empty()) checkMatch(call, before.etag);
    return emptyReply(book.setPhoto(call.ids[1], call.body, type).photo.etag);
}

Reply ContactService::deletePhoto(const Call& call) {
    call.allowOnly({});
    const auto lock = mContext.store.guard();
    ContactBook& book = mContext.store.contacts(call.account);
    const Image& before = book.get(FeedKind::kContact, call.ids[1]).photo;
    if (!before.isThere()) throw ApiError{404, "notFound", "Photo not found", ""};
    checkMatch(call, before.etag);
    book.setPhoto(call.ids[1], "", "");
    return emptyReply();
}

}  // namespace provider
