#include "FeedJson.h"
#include "ListPart.h"
#include "Services.h"

namespace provider {

namespace {

// An entry's own members are plain here: the id is no address.
Json plainEntry(const FeedEntry& entry, const std::string& origin) {
    Json out = {{"id", entry.id}, {"etag", entry.etag}, {"updated", entry.updated}};
    if (entry.isDeleted) out["deleted"] = true;
    if (entry.photo.isThere()) out["photo"] = entry.photo.etag;
    for (const auto& [name, value] : entry.fields.items()) out[name] = shown(value, origin);
    return out;
}

Reply entryReply(const Call& call, const FeedEntry& entry) {
    return jsonReply(plainEntry(entry, call.origin));
}

// Every text of the fields, without the names of members and the addresses that types and groups have.
void addTexts(const Json& value, std::string& out) {
    if (value.is_string()) {
        const auto& text = value.get_ref<const std::string&>();
        if (!text.starts_with("http://") && !text.starts_with("{base}")) out += text + '\n';
        return;
    }
    if (!value.is_structured()) return;
    for (const Json& item : value) addTexts(item, out);
}

ListItems listItems(const ContactBook::Entries& entries) {
    const auto title = [&entries](std::size_t i) {
        const auto found = entries[i]->fields.find("title");
        return found == entries[i]->fields.end() ? std::string() : found->value("$t", "");
    };
    const auto texts = [&entries](std::size_t i) {
        std::string out;
        addTexts(entries[i]->fields, out);
        return out;
    };
    return {entries.size(), [&entries](std::size_t i) { return !entries[i]->isDeleted; },
            [&entries](std::size_t i) { return entries[i]->etag; }, title, texts};
}

}  // namespace

void AdminContactService::addRoutes(Router& router) {
    const std::string account = "/admin/accounts/*/";
    addFeedRoutes(router, FeedKind::kContact, account + "contacts");
    addFeedRoutes(router, FeedKind::kGroup, account + "groups");
    addPhotoRoutes(router, account + "contacts/*/photo");
    addPeopleRoutes(router);
}

void AdminContactService::addFeedRoutes(Router& router, FeedKind kind, const std::string& feed) {
    router.add("GET", feed, Access::kAdmin, [this, kind](const Call& call) {
        const auto lock = mContext.store.guard();
        const ContactBook::Entries& entries = mContext.store.contacts(call.ids[0]).entries(kind);
        if (asksForPart(call)) {
            return partReply(partOf(call, listItems(entries)),
                             [&](std::size_t i) { return plainEntry(*entries[i], call.origin); });
        }
        Json body;
        body["items"] = Json::array();
        for (const auto& entry : entries) {
            if (!entry->isDeleted || entry->isListed)
                body["items"].push_back(plainEntry(*entry, call.origin));
        }
        return jsonReply(body);
    });
    router.add("POST", feed, Access::kAdmin, [this, kind](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        return entryReply(call, mContext.store.contacts(call.ids[0]).insert(kind, body, textOf(body, "id")));
    });
    router.add("GET", feed + "/*", Access::kAdmin, [this, kind](const Call& call) {
        const auto lock = mContext.store.guard();
        return entryReply(call, mContext.store.contacts(call.ids[0]).get(kind, call.ids[1]));
    });
    router.add("PATCH", feed + "/*", Access::kAdmin, [this, kind](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        ContactBook& book = mContext.store.contacts(call.ids[0]);
        requireMatch(call, book.get(kind, call.ids[1]).etag);
        return entryReply(call, book.patch(kind, call.ids[1], body));
    });
    router.add("PUT", feed + "/*", Access::kAdmin, [this, kind](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        return entryReply(call, mContext.store.contacts(call.ids[0]).replace(kind, call.ids[1], body));
    });
    router.add("DELETE", feed + "/*", Access::kAdmin, [this, kind](const Call& call) {
        const auto lock = mContext.store.guard();
        ContactBook& book = mContext.store.contacts(call.ids[0]);
        requireMatch(call, book.get(kind, call.ids[1]).etag);
        book.remove(kind, call.ids[1], call.param("deleted") == "listed");
        return done();
    });
}

void AdminContactService::addPhotoRoutes(Router& router, const std::string& photo) {
    router.add("GET", photo, Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        const Image& image = mContext.store.contacts(call.ids[0]).get(FeedKind::kContact, call.ids[1]).photo;
        if (!image.isThere()) throw ApiError{404, "notFound", "Photo not found", ""};
        Reply reply;
        reply.body = image.bytes;
        reply.contentType = image.type;
        reply.headers["ETag"] = image.etag;
        return reply;
    });
    router.add("PUT", photo, Access::kAdmin, [this](const Call& call) {
        const std::string type = imageType(call);
        const auto lock = mContext.store.guard();
        return entryReply(call, mContext.store.contacts(call.ids[0]).setPhoto(call.ids[1], call.body, type));
    });
    router.add("DELETE", photo, Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        return entryReply(call, mContext.store.contacts(call.ids[0]).setPhoto(call.ids[1], "", ""));
    });
}

void AdminContactService::addPeopleRoutes(Router& router) {
    router.add("PUT", "/admin/people/*", Access::kAdmin, [this](const Call& call) {
        const Json profile = jsonBody(call);
        const auto lock = mContext.store.guard();
        mContext.store.putPerson(call.ids[0], profile);
        return done();
    });
    router.add("PUT", "/admin/people/*/photo", Access::kAdmin, [this](const Call& call) {
        const std::string type = imageType(call);
        const auto lock = mContext.store.guard();
        mContext.store.setPersonPhoto(call.ids[0], call.body, type);
        return done();
    });
}

}  // namespace provider
