// ContactBook: the contacts and groups of one account and what may be done to them.
// Owner: the account, in the store, whose mutex guards it. Errors: ApiError; nothing has changed then.
#pragma once

#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#include "ContactCheck.h"
#include "Http.h"
#include "Revisions.h"

namespace provider {

struct Image {
    std::string bytes;  // empty: there is none
    std::string type;
    std::string etag;

    [[nodiscard]] bool isThere() const { return !bytes.empty(); }
    [[nodiscard]] Json dump() const;
    static Image load(const Json& state);
};

// FeedEntry: a contact or a group.
struct FeedEntry {
    explicit FeedEntry(std::string entryId) : id(std::move(entryId)) {}

    std::string id;
    Json fields = Json::object();  // elements as JSON, hosts as a placeholder
    std::string etag;
    std::string updated;
    Image photo;
    bool isDeleted = false;
    bool isListed = true;  // a deleted one may go on being listed, marked as deleted

    [[nodiscard]] bool isSystem() const { return fields.contains("gContact$systemGroup"); }
};

class ContactBook {
public:
    // With the groups that every account has.
    ContactBook(std::string accountEmail, Revisions& revisions);

    using Entries = std::vector<std::unique_ptr<FeedEntry>>;
    // In order of creation, deleted ones included; a place never changes.
    [[nodiscard]] const Entries& entries(FeedKind kind) const { return shelf(kind).entries; }
    [[nodiscard]] const FeedEntry& get(FeedKind kind, const std::string& id) const;

    // id empty: one is made.
    const FeedEntry& insert(FeedKind kind, const Json& fields, const std::string& id = "");
    const FeedEntry& replace(FeedKind kind, const std::string& id, const Json& fields);
    // Merges; null removes a member.
    const FeedEntry& patch(FeedKind kind, const std::string& id, const Json& fields);
    void remove(FeedKind kind, const std::string& id, bool isListed = false);
    // Without bytes the photo is taken away.
    const FeedEntry& setPhoto(const std::string& contactId, const std::string& bytes,
                              const std::string& type);

    [[nodiscard]] Json dump() const;
    // Entries without etag are checked and completed, others taken as they are.
    void load(const Json& state);

    const std::string email;

private:
    struct Shelf {
        Entries entries;
        std::unordered_map<std::string, FeedEntry*> byId;
    };
    [[nodiscard]] const Shelf& shelf(FeedKind kind) const {
        return kind == FeedKind::kContact ? mContacts : mGroups;
    }
    Shelf& shelf(FeedKind kind) { return kind == FeedKind::kContact ? mContacts : mGroups; }
    FeedEntry& place(FeedKind kind, const std::string& id);
    FeedEntry& find(FeedKind kind, const std::string& id);
    FeedEntry& changeable(FeedKind kind, const std::string& id);
    // The fields as they are kept.
    [[nodiscard]] Json checked(FeedKind kind, const Json& fields) const;
    void checkMemberships(Json& fields) const;
    void touch(FeedEntry& entry);
    void leaveGroup(const std::string& groupId);
    void loadEntry(FeedKind kind, const Json& state);
    [[nodiscard]] std::string groupHref(const std::string& groupId) const;

    Shelf mContacts;
    Shelf mGroups;
    Revisions& mRevisions;
};

}  // namespace provider
