#include "ContactBook.h"

#include <algorithm>

#include "Base64.h"
#include "FeedJson.h"
#include "FeedNames.h"
#include "Merge.h"

namespace provider {

namespace {

constexpr const char* kMemberships = "gContact$groupMembershipInfo";

struct SystemGroup {
    const char* id;
    const char* title;
    const char* system;
};
constexpr SystemGroup kSystemGroups[] = {{"6", "System Group: My Contacts", "Contacts"},
                                         {"starred", "Starred in Merrow", "Starred"}};

// The id at the end of a group's address, whatever the host; empty for another text.
std::string groupOf(const std::string& href, const std::string& email) {
    const std::string feed = std::string(kFeeds) + "groups/";
    const std::size_t begin = href.find(feed);
    if (begin == std::string::npos) return "";
    const std::vector<std::string> parts = splitText(std::string_view(href).substr(begin + feed.size()), '/');
    if (parts.size() != 3 || (parts[1] != "base" && parts[1] != "full")) return "";
    if (parts[0] != "default" && decodeSegment(parts[0]) != email) return "";
    return decodeSegment(parts[2]);
}

Json dumpEntry(const FeedEntry& entry) {
    Json item = {
        {"id", entry.id}, {"etag", entry.etag}, {"updated", entry.updated}, {"fields", entry.fields}};
    if (entry.photo.isThere()) item["photo"] = entry.photo.dump();
    if (entry.isDeleted) item["deleted"] = true;
    return item;
}

Json dumpEntries(const ContactBook::Entries& entries) {
    Json items = Json::array();
    for (const auto& entry : entries) {
        if (!entry->isDeleted || entry->isListed) items.push_back(dumpEntry(*entry));
    }
    return items;
}

}  // namespace

Json Image::dump() const {
    return {{"type", type}, {"etag", etag}, {"bytes", toBase64(bytes)}};
}

Image Image::load(const Json& state) {
    if (!state.is_object()) invalid("photo", "must be an object");
    const std::optional<std::string> bytes = fromBase64(textOf(state, "bytes"));
    if (!bytes) invalid("photo.bytes", "must be base64");
    return {*bytes, textOf(state, "type"), textOf(state, "etag")};
}

ContactBook::ContactBook(std::string accountEmail, Revisions& revisions)
    : email(std::move(accountEmail)), mRevisions(revisions) {
    for (const SystemGroup& row : kSystemGroups) {
        FeedEntry& group = place(FeedKind::kGroup, row.id);
        group.fields = {{"title", {{"$t", row.title}}},
                        {"content", {{"$t", row.title}}},
                        {"gContact$systemGroup", {{"id", row.system}}}};
        group.etag = etagOf(0);
        group.updated = stampOf(0);
    }
}

FeedEntry& ContactBook::place(FeedKind kind, const std::string& id) {
    Shelf& to = shelf(kind);
    FeedEntry& entry = *to.entries.emplace_back(std::make_unique<FeedEntry>(id));
    to.byId[id] = &entry;
    return entry;
}

FeedEntry& ContactBook::find(FeedKind kind, const std::string& id) {
    const auto found = shelf(kind).byId.find(id);
    if (found == shelf(kind).byId.end() || found->second->isDeleted)
        throw ApiError{404, "notFound",
                       kind == FeedKind::kContact ? "Contact not found." : "Group not found.", ""};
    return *found->second;
}

const FeedEntry& ContactBook::get(FeedKind kind, const std::string& id) const {
    return const_cast<ContactBook*>(this)->find(kind, id);
}

FeedEntry& ContactBook::changeable(FeedKind kind, const std::string& id) {
    FeedEntry& entry = find(kind, id);
    if (entry.isSystem()) throw ApiError{403, "forbidden", "System groups cannot be changed.", ""};
    return entry;
}

std::string ContactBook::groupHref(const std::string& groupId) const {
    return kBasePlace + feedPath(FeedKind::kGroup, email, "base", groupId);
}

void ContactBook::checkMemberships(Json& fields) const {
    const auto memberships = fields.find(kMemberships);
    if (memberships == fields.end()) return;
    Json kept = Json::array();
    for (const Json& membership : *memberships) {
        if (membership.contains("deleted") && membership.at("deleted") == "true") continue;
        const std::string groupId = groupOf(textOf(membership, "href"), email);
        const auto group = mGroups.byId.find(groupId);
        if (group == mGroups.byId.end() || group->second->isDeleted) invalid(kMemberships, "no such group");
        const Json whole = {{"href", groupHref(groupId)}, {"deleted", "false"}};
        if (std::find(kept.begin(), kept.end(), whole) == kept.end()) kept.push_back(whole);
    }
    if (kept.empty()) {
        fields.erase(kMemberships);
    } else {
        *memberships = std::move(kept);
    }
}

Json ContactBook::checked(FeedKind kind, const Json& fields) const {
    Json kept = fields;
    dropNulls(kept);
    dropOwnMembers(kept);
    checkFields(kind, kept);
    checkMemberships(kept);
    if (!kept.contains("title")) kept["title"]["$t"] = titleOf(kept);
    return kept;
}

void ContactBook::touch(FeedEntry& entry) {
    const std::uint64_t revision = mRevisions.next();
    entry.etag = etagOf(revision);
    entry.updated = stampOf(revision);
}

const FeedEntry& ContactBook::insert(FeedKind kind, const Json& fields, const std::string& id) {
    const char* prefix = kind == FeedKind::kContact ? "c" : "g";
    const std::string entryId = id.empty() ? prefix + std::to_string(mRevisions.last() + 1) : id;
    if (entryId.find('/') != std::string::npos) invalid("id", "must be one segment");
    if (shelf(kind).byId.count(entryId) != 0)
        throw ApiError{409, "duplicate", "The requested identifier already exists.", "id"};
    Json kept = checked(kind, fields);
    FeedEntry& entry = place(kind, entryId);
    entry.fields = std::move(kept);
    touch(entry);
    return entry;
}

const FeedEntry& ContactBook::replace(FeedKind kind, const std::string& id, const Json& fields) {
    FeedEntry& entry = changeable(kind, id);
    entry.fields = checked(kind, fields);
    touch(entry);
    return entry;
}

const FeedEntry& ContactBook::patch(FeedKind kind, const std::string& id, const Json& fields) {
    FeedEntry& entry = changeable(kind, id);
    Json merged = entry.fields;
    if (fields.contains("gd$name")) merged.erase("title");
    mergeInto(merged, fields);
    entry.fields = checked(kind, merged);
    touch(entry);
    return entry;
}

void ContactBook::leaveGroup(const std::string& groupId) {
    const std::string href = groupHref(groupId);
    for (const auto& contact : mContacts.entries) {
        const auto memberships = contact->fields.find(kMemberships);
        if (contact->isDeleted || memberships == contact->fields.end()) continue;
        Json kept = Json::array();
        for (const Json& membership : *memberships) {
            if (membership.at("href") != href) kept.push_back(membership);
        }
        if (kept.size() == memberships->size()) continue;
        if (kept.empty()) {
            contact->fields.erase(kMemberships);
        } else {
            *memberships = std::move(kept);
        }
        touch(*contact);
    }
}

void ContactBook::remove(FeedKind kind, const std::string& id, bool isListed) {
    FeedEntry& entry = changeable(kind, id);
    entry.isDeleted = true;
    entry.isListed = isListed;
    entry.photo = {};
    touch(entry);
    if (kind == FeedKind::kGroup) leaveGroup(id);
}

const FeedEntry& ContactBook::setPhoto(const std::string& contactId, const std::string& bytes,
                                       const std::string& type) {
    FeedEntry& contact = find(FeedKind::kContact, contactId);
    contact.photo = {};
    if (!bytes.empty()) contact.photo = {bytes, type, etagOf(mRevisions.next())};
    touch(contact);
    return contact;
}

Json ContactBook::dump() const {
    return {{"groups", dumpEntries(mGroups.entries)}, {"contacts", dumpEntries(mContacts.entries)}};
}

void ContactBook::load(const Json& state) {
    if (!state.is_object()) invalid("contacts", "must be an object");
    struct Row {
        const char* member;
        FeedKind kind;
    };
    // Groups first: memberships name them.
    constexpr Row kRows[] = {{"groups", FeedKind::kGroup}, {"contacts", FeedKind::kContact}};
    for (const Row& row : kRows) {
        const auto items = state.find(row.member);
        if (items == state.end()) continue;
        if (!items->is_array()) invalid(row.member, "must be a list");
        for (const Json& item : *items) loadEntry(row.kind, item);
    }
}

void ContactBook::loadEntry(FeedKind kind, const Json& state) {
    if (!state.is_object()) invalid("contacts", "entries must be objects");
    const auto fields = state.find("fields");
    if (fields == state.end() || !fields->is_object()) invalid("contacts.fields", "must be an object");
    const std::string id = textOf(state, "id");
    const std::string etag = textOf(state, "etag");
    if (etag.empty()) {
        insert(kind, *fields, id);
    } else {
        if (id.empty()) invalid("contacts.id", "must be there");
        const auto known = shelf(kind).byId.find(id);
        const bool isKnown = known != shelf(kind).byId.end();
        if (isKnown && !known->second->isSystem()) invalid("contacts.id", "is there twice");
        FeedEntry& entry = isKnown ? *known->second : place(kind, id);
        entry.fields = *fields;
        if (!entry.fields.contains("title")) entry.fields["title"]["$t"] = titleOf(*fields);
        entry.etag = etag;
        entry.updated = textOf(state, "updated");
        entry.isDeleted = state.contains("deleted");
    }
    if (kind == FeedKind::kContact && state.contains("photo"))
        mContacts.entries.back()->photo = Image::load(state.at("photo"));
}

}  // namespace provider
