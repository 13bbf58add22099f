// Random edits of contacts, groups, memberships and photos on both sides with syncs in between: after each, both sides hold the same,
// once each.
#include <fstream>

#include "e2e/RandomEdits.h"

namespace {

constexpr int kSteps = 300;
constexpr int kStepsBetweenSyncs = 10;
constexpr int kAccounts = 2;
constexpr const char* kKind = "http://schemas.provider.example/g/2005#";

std::string idOf(const Json& record) {
    return std::to_string(record.at("id").get<int>());
}

class RandomContactEdits : private RandomEdits {
public:
    explicit RandomContactEdits(unsigned seed)
        : RandomEdits(seed, kAccounts, {"--seed", "sample"}, "contacts"),
          mPhoto(mPair.device.root().at("/photo.png")) {
        mPair.removeProfileLinks();
        syncAll({1, 2});
    }

    using RandomEdits::tellWhatHappened;

    void step(int number) {
        mName = "step " + std::to_string(number);
        static constexpr void (RandomContactEdits::*kEdits[])() = {
            &RandomContactEdits::addOnDevice,      &RandomContactEdits::editOnDevice,
            &RandomContactEdits::editOnDevice,     &RandomContactEdits::photoOnDevice,
            &RandomContactEdits::memberOnDevice,   &RandomContactEdits::deleteOnDevice,
            &RandomContactEdits::groupOnDevice,    &RandomContactEdits::addOnProvider,
            &RandomContactEdits::editOnProvider,   &RandomContactEdits::editOnProvider,
            &RandomContactEdits::photoOnProvider,  &RandomContactEdits::memberOnProvider,
            &RandomContactEdits::deleteOnProvider, &RandomContactEdits::groupOnProvider};
        (this->*kEdits[below(std::size(kEdits))])();
    }
    void syncAndCompare() {
        syncAll({1, 2, 1, 2});
        for (int account = 1; account <= kAccounts; ++account) mPair.expectSameContacts(account);
    }
    void expectQuiet() {
        for (int account = 1; account <= kAccounts; ++account) mPair.expectQuiet(account);
    }

private:
    int anAccount() { return static_cast<int>(below(kAccounts)) + 1; }
    std::string photoFile() {
        std::ofstream(mPhoto, std::ios::binary) << "\x89PNG\r\n\x1a\n" << mName;
        return mPhoto;
    }

    // --- the device
    std::vector<Json> deviceContacts() { return mPair.device.json({"contacts", "list"}); }
    std::vector<Json> deviceGroups(int account) {
        return mPair.device.json({"groups", "list", "--account", std::to_string(account)});
    }
    std::vector<int> someGroups(int account) {
        std::vector<int> ids;
        for (const Json& group : deviceGroups(account)) {
            if (chance()) ids.push_back(group["id"]);
        }
        return ids;
    }
    void addOnDevice() {
        const int account = anAccount();
        Json contact = {
            {"name", {{"first", mName}, {"last", "<\xC3\x96z> & \"Co\""}, {"phoneticFirst", "f"}}},
            {"note", "a\n\xF0\x9F\x98\x80"},
            {"phones", {{{"value", "+49 " + mName}, {"type", chance() ? "mobile" : "work_fax"}}}},
            {"groups", someGroups(account)}};
        if (chance()) contact["photo"] = photoFile();
        if (chance()) contact["events"] = {{{"date", "1999-01-31"}, {"type", "birthday"}}};
        if (chance()) contact["fields"] = {{{"key", "k"}, {"value", mName}}};
        run({"contact", "add", "--account", std::to_string(account), "-"}, contact.dump());
    }
    void editOnDevice() {
        const std::vector<Json> contacts = deviceContacts();
        const Json* contact = pick(contacts);
        if (contact == nullptr) return;
        const std::vector<std::string> changes[] = {
            {"note=" + mName, "nickname="},
            {"name.last=" + mName, R"(emails=[{"value": "a@example.com", "type": "custom", "label": "L"}])"},
            {R"(addresses=[{"city": ")" + mName + R"(", "type": "home", "primary": true}])"},
            {R"(phones=[{"value": "1"}, {"value": "2", "type": "pager"}])", "urls="}};
        std::vector<std::string> arguments = {"contact", "set", idOf(*contact)};
        const auto& chosen = changes[below(std::size(changes))];
        arguments.insert(arguments.end(), chosen.begin(), chosen.end());
        run(arguments);
    }
    void photoOnDevice() {
        const std::vector<Json> contacts = deviceContacts();
        if (const Json* contact = pick(contacts))
            run({"contact", "set", idOf(*contact), chance() ? "photo=" + photoFile() : "photo="});
    }
    void memberOnDevice() {
        const std::vector<Json> contacts = deviceContacts();
        if (const Json* contact = pick(contacts))
            run({"contact", "set", idOf(*contact),
                 "groups=" + Json(someGroups((*contact)["account"])).dump()});
    }
    void deleteOnDevice() {
        const std::vector<Json> contacts = deviceContacts();
        if (const Json* contact = pick(contacts)) run({"contact", "delete", idOf(*contact)});
    }
    void groupOnDevice() {
        const int account = anAccount();
        std::vector<Json> groups = deviceGroups(account);
        std::erase_if(groups, [](const Json& group) { return group["readOnly"] == true; });
        const Json* group = pick(groups);
        if (group == nullptr || below(3) == 0) {
            run({"group", "add", "--account", std::to_string(account), "-"}, Json({{"name", mName}}).dump());
        } else if (chance()) {
            run({"group", "delete", idOf(*group)});
        } else {
            run({"group", "set", idOf(*group), "name=" + mName});
        }
    }

    // --- the provider
    struct Target {
        std::string path;  // empty: there is none
        int account = 0;
    };
    Target aContact() {
        const int account = anAccount();
        const std::vector<Json> contacts = mPair.wireContacts(account);
        const Json* contact = pick(contacts);
        if (contact == nullptr) return {};
        return {mPair.peoplePath(account, "contacts") + "/" + contact->at("id").get<std::string>(), account};
    }
    Json someMemberships(int account) {
        Json memberships = Json::array();
        for (const Json& group : mPair.wireGroups(account)) {
            if (chance())
                memberships.push_back(
                    {{"href", "/m8/feeds/groups/default/base/" + group["id"].get<std::string>()}});
        }
        return memberships;
    }
    void addOnProvider() {
        const int account = anAccount();
        Json contact = {{"gd$name", {{"gd$givenName", {{"$t", mName}}}}},
                        {"gd$email", {{{"rel", std::string(kKind) + "home"}, {"address", "p@example.com"}}}},
                        {"gContact$groupMembershipInfo", someMemberships(account)}};
        if (chance()) contact["gContact$occupation"] = {{"$t", mName}};
        onProvider("POST", mPair.peoplePath(account, "contacts"), contact);
    }
    void editOnProvider() {
        const Target target = aContact();
        if (target.path.empty()) return;
        mPair.provider.admin(
            "PATCH", target.path,
            chance() ? Json({{"content", {{"$t", mName}}}})
                     : Json({{"gContact$nickname", {{"$t", mName}}},
                             {"gd$phoneNumber", {{{"rel", std::string(kKind) + "isdn"}, {"$t", mName}}}}}));
    }
    void photoOnProvider() {
        const Target target = aContact();
        if (target.path.empty()) return;
        if (chance()) {
            note("provider", "photo of " + target.path);
            mPair.provider.putBytes("/admin" + target.path + "/photo", "\x89PNG\r\n\x1a\n server " + mName,
                                    "image/png");
        } else {
            onProvider("DELETE", target.path + "/photo");
        }
    }
    void memberOnProvider() {
        const Target target = aContact();
        if (!target.path.empty())
            onProvider("PATCH", target.path,
                       {{"gContact$groupMembershipInfo", someMemberships(target.account)}});
    }
    void deleteOnProvider() {
        const Target target = aContact();
        if (!target.path.empty()) onProvider("DELETE", target.path + (chance() ? "?deleted=listed" : ""));
    }
    void groupOnProvider() {
        const int account = anAccount();
        const std::string path = mPair.peoplePath(account, "groups");
        std::vector<Json> groups = mPair.wireGroups(account);
        std::erase_if(groups, [](const Json& group) { return group.contains("gContact$systemGroup"); });
        const Json* group = pick(groups);
        if (group == nullptr || below(3) == 0) {
            onProvider("POST", path, {{"title", {{"$t", mName}}}});
        } else if (chance()) {
            onProvider("DELETE", path + "/" + (*group)["id"].get<std::string>());
        } else {
            onProvider("PATCH", path + "/" + (*group)["id"].get<std::string>(), {{"title", {{"$t", mName}}}});
        }
    }

    const std::string mPhoto;
};

}  // namespace

TEST(RandomSync, ContactsOfBothSidesAreTheSameAfterEverySync) {
    runRandomEdits<RandomContactEdits>(20261126, kSteps, kStepsBetweenSyncs);
}
