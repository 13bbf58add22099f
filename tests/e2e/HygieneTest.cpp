// Secrets: nothing that a whole run leaves behind, shows or logs holds one, at any threshold, but the files that keep them.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>

#include "e2e/SyncPair.h"

namespace {

std::string contentOf(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

// The files that are made to keep a secret.
bool isKeeper(const std::string& path) {
    return path.find("/shared/trusted/") != std::string::npos ||
           path.find("/key-storage/") != std::string::npos;
}

struct DebugLog {
    DebugLog() { setenv("VANTOR_PIM_SYNC_LOG", "debug", 1); }
    ~DebugLog() { unsetenv("VANTOR_PIM_SYNC_LOG"); }
};

TEST(Hygiene, NothingThatARunLeavesBehindHoldsASecret) {
    const DebugLog debug;
    SyncPair pair(2);
    Device& device = pair.device;
    std::vector<std::string> secrets{pair.provider.clientSecret(), "access."};
    for (const Provider::Account& account : pair.provider.accounts()) secrets.push_back(account.refreshToken);
    // A first sync, a renewed access token, an upload, and an authorisation that ends.
    EXPECT_EQ(device.sync(1, "all").status, 0);
    EXPECT_EQ(device.tool({"account", "update", "1", "--contacts"}).status, 0);
    pair.provider.admin("POST", "/tokens/expire", Json::object());
    const Json event = {
        {"summary", "Secret"}, {"start", "2026-12-01T10:00:00Z"}, {"end", "2026-12-01T11:00:00Z"}};
    EXPECT_EQ(
        device
            .tool({"event", "add", "--calendar", std::to_string(pair.localCalendar(1, "Personal")), "-"},
                  event.dump())
            .status,
        0);
    EXPECT_EQ(device.sync(1, "all").status, 0);
    pair.provider.admin("POST", "/tokens/expire", Json::object());
    pair.provider.admin("POST", "/tokens/revoke", {{"email", pair.provider.accounts()[1].email}});
    EXPECT_EQ(device.sync(2).status, 1);

    std::map<std::string, std::string> places;
    for (const std::vector<std::string>& command :
         std::vector<std::vector<std::string>>{{"status"},
                                               {"status", "--json"},
                                               {"doctor"},
                                               {"log"},
                                               {"account", "list", "--json"},
                                               {"account", "show", "1"},
                                               {"sync", "2", "--wait"}}) {
        const CommandResult result = device.tool(command);
        places["the tool's " + command[0]] += result.output + result.error;
    }
    const std::string process = "/proc/" + std::to_string(device.daemonPid());
    for (const char* name : {"/cmdline", "/environ"}) places[process + name] = contentOf(process + name);
    EXPECT_EQ(device.tool({"daemon", "stop"}).status, 0);
    size_t keepers = 0;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(device.root().at("/"))) {
        if (!entry.is_regular_file()) continue;
        const std::string path = entry.path();
        if (!isKeeper(path)) {
            places[path] = contentOf(entry.path());
            continue;
        }
        ++keepers;
        EXPECT_EQ(entry.status().permissions(), std::filesystem::perms(0600)) << path;
    }
    EXPECT_EQ(keepers, 4U) << "two tokens and two keys";
    EXPECT_THAT(device.daemonLog(), testing::HasSubstr("D/"))
        << "debug lines are among what is looked through";
    for (const auto& [place, content] : places) {
        for (const std::string& secret : secrets)
            EXPECT_EQ(content.find(secret), std::string::npos) << place << " holds \"" << secret << '"';
    }
}

}  // namespace
