// The contacts' half of SyncPair.
#include <gtest/gtest.h>

#include <fstream>
#include <sstream>

#include "e2e/ExpectedContacts.h"
#include "e2e/SyncPair.h"

namespace {

std::string textOfFile(const std::string& path) {
    std::stringstream text;
    text << std::ifstream(path, std::ios::binary).rdbuf();
    return text.str();
}

// The entries that are not marked as deleted.
std::vector<Json> listed(const Json& feed) {
    std::vector<Json> entries = feed.at("items");
    std::erase_if(entries, [](const Json& entry) { return entry.value("deleted", false); });
    return entries;
}

// How often each text is there.
using Census = std::map<std::string, int>;

void expectSameCensus(const Census& device, const Census& provider, const char* what) {
    for (const auto& [text, count] : provider) {
        const auto found = device.find(text);
        const int onDevice = found != device.end() ? found->second : 0;
        EXPECT_EQ(onDevice, count) << what << " of the provider, on the device: " << text;
    }
    for (const auto& [text, count] : device)
        EXPECT_TRUE(provider.contains(text)) << what << " of the device alone: " << text;
}

}  // namespace

std::string SyncPair::peoplePath(int account, const char* kind) {
    const std::string& email = provider.accounts().at(static_cast<size_t>(account - 1)).email;
    return "/accounts/" + pathText(email) + "/" + kind;
}

std::vector<Json> SyncPair::wireContacts(int account) {
    return listed(provider.admin("GET", peoplePath(account, "contacts")));
}

std::vector<Json> SyncPair::wireGroups(int account) {
    return listed(provider.admin("GET", peoplePath(account, "groups")));
}

void SyncPair::removeProfileLinks() {
    provider.admin("DELETE", peoplePath(1, "contacts") + "/sites");
}

void SyncPair::expectSameContacts(int account) {
    std::map<std::string, std::string> nameOfUri;
    Census wireGroupNames;
    for (const Json& group : wireGroups(account)) {
        nameOfUri[group.at("id")] = group.at("title").at("$t");
        ++wireGroupNames[nameOfUri[group.at("id")]];
    }
    std::map<int, std::string> nameOfId;
    Census localGroupNames;
    for (const Json& group : device.json({"groups", "list", "--account", std::to_string(account)})) {
        nameOfId[group.at("id")] = group.at("name");
        ++localGroupNames[group.at("name")];
    }
    expectSameCensus(localGroupNames, wireGroupNames, "a group");

    Census wire;
    for (const Json& contact : wireContacts(account)) {
        std::string photo;
        if (contact.value("photo", "") != "") {
            photo = provider.bytes("/admin" + peoplePath(account, "contacts") + "/" +
                                   contact.at("id").get<std::string>() + "/photo");
        }
        ++wire[expectedContact(contact, nameOfUri).dump() + " photo " +
               std::to_string(std::hash<std::string>()(photo))];
    }
    Census local;
    for (const Json& contact : device.json({"contacts", "list", "--account", std::to_string(account)})) {
        const std::string photo = contact.at("photo");
        const std::string bytes = photo.empty() ? std::string() : textOfFile(photo);
        ++local[comparableContact(contact, nameOfId).dump() + " photo " +
                std::to_string(std::hash<std::string>()(bytes))];
    }
    expectSameCensus(local, wire, "a contact");
}
