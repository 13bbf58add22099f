// The built tool with the daemon beside it, and a server that takes connections and never answers: what the tool starts,
// asks, waits for and ends.
#include <arpa/inet.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <set>
#include <thread>

#include "AccountService.h"
#include "DaemonProcess.h"
#include "Device.h"
#include "SyncState.h"
#include "TokenFile.h"
#include "cli/ToolRoot.h"

namespace {

using testing::HasSubstr;

constexpr int kLimitMs = 20'000;

// Listens on a loopback port; with isOpen false the port is one that refuses.
class SilentServer {
public:
    explicit SilentServer(bool isOpen = true) : mSocket(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof address;
        auto* generic = reinterpret_cast<sockaddr*>(&address);
        EXPECT_EQ(bind(mSocket, generic, size), 0);
        EXPECT_EQ(getsockname(mSocket, generic, &size), 0);
        EXPECT_TRUE(!isOpen || listen(mSocket, 16) == 0);
        mUrl = "http://127.0.0.1:" + std::to_string(ntohs(address.sin_port));
    }
    ~SilentServer() { close(mSocket); }
    SilentServer(const SilentServer&) = delete;
    SilentServer& operator=(const SilentServer&) = delete;
    [[nodiscard]] const std::string& url() const { return mUrl; }

private:
    int mSocket;
    std::string mUrl;
};

class DaemonTool : public testing::Test {
protected:
    ~DaemonTool() override { mTool.run({"daemon", "stop"}); }

    CommandResult add(const std::string& url, int id = 7) {
        for (const char* key : {"vantor.tovik.client.id", "vantor.tovik.client.secret"}) {
            EXPECT_EQ(mTool.run({"key", "set", key}, "value").status, 0);
        }
        return mTool.run({"account", "add", "--id", std::to_string(id), "--email", "me@example.com",
                          "--server", url, "--refresh-token-file", "-"},
                         "token-" + std::to_string(id) + "\n");
    }
    std::string stateOf(int account) {
        return mTool.json({"status", std::to_string(account), "--json"})[0]["state"].get<std::string>();
    }
    int pid() { return mTool.json({"daemon", "status", "--json"})["pid"].get<int>(); }
    // Until the account's calendar run has begun.
    static void waitForRun(int account, int run) {
        const SyncState state(account, VANTOR_PIM_SYNC_TYPE_CALENDAR);
        const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(kLimitMs);
        while (state.run() < run && std::chrono::steady_clock::now() < deadline) std::this_thread::yield();
        ASSERT_GE(state.run(), run);
    }

    static std::string binary() { return std::string(VPS_BIN_DIR) + "/vantor-pim-syncctl"; }

    ToolRoot mTool;
};

TEST_F(DaemonTool, StartsDetachedAndStopsForGood) {
    CommandResult result = mTool.run({"daemon", "start"});
    EXPECT_EQ(result.status, 1);
    EXPECT_THAT(result.error, HasSubstr("account add"));

    account_service::insert(7, "me@example.com");
    const std::string log = mTool.root().at(DaemonProcess::kLog);
    constexpr uintmax_t kLarge = 11 * 1024 * 1024;
    std::filesystem::resize_file(log, kLarge);
    // Would not come back before the daemon ends if that held the pipes that runCommand reads.
    ASSERT_EQ(mTool.run({"daemon", "start"}).status, 0);
    EXPECT_EQ(mTool.run({"daemon", "start"}).status, 0);
    const int daemon = pid();
    EXPECT_EQ(std::filesystem::file_size(log + ".1"), kLarge);
    EXPECT_LT(std::filesystem::file_size(log), kLarge);
    // The daemon keeps what belongs to its memory from everybody but the superuser.
    std::error_code refused;
    const auto input = std::filesystem::read_symlink("/proc/" + std::to_string(daemon) + "/fd/0", refused);
    EXPECT_TRUE(geteuid() == 0 ? input == "/dev/null" : refused == std::errc::permission_denied);
    EXPECT_NE(getsid(daemon), getsid(0));

    EXPECT_EQ(mTool.run({"daemon", "stop"}).status, 0);
    EXPECT_EQ(mTool.run({"daemon", "stop"}).status, 0);
    EXPECT_EQ(mTool.run({"daemon", "status"}).status, 1);
}

TEST_F(DaemonTool, AnAccountIsAddedChangedAndRemoved) {
    ASSERT_EQ(add("http://127.0.0.1:9/base").status, 0);
    EXPECT_EQ(token_file::read(7), "token-7");
    struct stat info {};
    ASSERT_EQ(stat(mTool.root()
                       .at("/opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted/7_file")
                       .c_str(),
                   &info),
              0);
    EXPECT_EQ(info.st_mode & 07777, 0600U);
    EXPECT_EQ(add("http://127.0.0.1:9").status, 1) << "exists already";

    Json expected = mTool.json({"account", "show", "7", "--json"});
    EXPECT_EQ(
        expected.dump(),
        R"({"id":7,"email":"me@example.com","registered":true,"configured":true,"calendar":{"enabled":true,)"
        R"("server":"http://127.0.0.1:9/base","port":null,"period":0},"contacts":{"enabled":true,)"
        R"("server":"http://127.0.0.1:9/base","port":null,"period":0},"ssl":false,"roaming":false})");
    ASSERT_EQ(mTool
                  .run({"account", "update", "7", "--calendar-period", "30", "--roaming", "--calendar-server",
                        "pim.example", "--refresh-token-file", "-"},
                       "renewed")
                  .status,
              0);
    expected["calendar"]["period"] = 30;
    expected["calendar"]["server"] = "pim.example";
    expected["roaming"] = true;
    expected["ssl"] = true;
    EXPECT_EQ(mTool.json({"account", "show", "7", "--json"}).dump(), expected.dump());
    EXPECT_EQ(token_file::read(7), "renewed");

    ASSERT_EQ(mTool.run({"account", "update", "7", "--no-calendar", "--no-contacts"}).status, 0);
    EXPECT_THAT(mTool.run({"sync", "7"}).error, HasSubstr("account update 7 --calendar"));
    EXPECT_THAT(mTool.run({"sync", "7", "contacts"}).error, HasSubstr("account update 7 --contacts"));
    EXPECT_THAT(mTool.run({"sync", "8"}).error, HasSubstr("account 8"));

    ASSERT_EQ(mTool.run({"account", "remove", "7"}).status, 0);
    EXPECT_EQ(mTool.run({"account", "list", "--json"}).output, "[]\n");
    EXPECT_EQ(token_file::read(7), std::nullopt);
}

TEST_F(DaemonTool, RemovalCleansWhateverIsLeft) {
    struct LeftRow {
        const char* name;
        bool isRegistered;
        bool hasToken;
    };
    for (const LeftRow& row :
         {LeftRow{"all", true, true}, LeftRow{"no token", true, false},
          LeftRow{"not registered", false, true}, LeftRow{"store alone", false, false}}) {
        SCOPED_TRACE(row.name);
        ASSERT_EQ(add("http://127.0.0.1:9").status, 0);
        ASSERT_EQ(mTool.run({"daemon", "stop"}).status, 0);
        if (!row.isRegistered) account_service::remove(7);
        if (!row.hasToken) token_file::remove(7);
        const CommandResult result = mTool.run({"account", "remove", "7"});
        EXPECT_EQ(result.status, 0) << result.error;
        EXPECT_EQ(mTool.run({"account", "list", "--json"}).output, "[]\n");
        EXPECT_EQ(token_file::read(7), std::nullopt);
        EXPECT_EQ(mTool.run({"daemon", "status"}).status, 1) << "it did not run before";
    }
}

TEST_F(DaemonTool, AWaitTellsThatTheSyncFailed) {
    const SilentServer refusing(/*isOpen=*/false);
    ASSERT_EQ(add(refusing.url()).status, 0);
    for (int round = 0; round < 2; ++round) {
        const CommandResult result = mTool.run({"sync", "7", "--wait"});
        EXPECT_EQ(result.status, 1);
        EXPECT_THAT(result.error, HasSubstr("calendar: "));
    }
    EXPECT_NE(mTool.json({"status", "7", "--json"})[0]["failure"], "");
}

TEST_F(DaemonTool, TheLogShowsWhatTheDaemonWroteOfAnAccount) {
    const SilentServer refusing(/*isOpen=*/false);
    ASSERT_EQ(add(refusing.url()).status, 0);
    ASSERT_EQ(add(refusing.url(), 8).status, 0);
    EXPECT_EQ(mTool.run({"sync", "7", "--wait"}).status, 1);
    EXPECT_THAT(mTool.run({"log", "7"}).output,
                testing::AllOf(HasSubstr("[7 calendar] "), HasSubstr("[7 contacts] ")));
    EXPECT_THAT(mTool.run({"log", "8"}).output, testing::Not(HasSubstr("[7 ")));
    EXPECT_EQ(mTool.json({"log", "7", "--lines", "2", "--json"}).size(), 2U);
    EXPECT_THAT(mTool.run({"log"}).output, testing::Not(HasSubstr("token-7")));
}

TEST_F(DaemonTool, AWatchTellsOfEachChangeUntilItIsEnded) {
    const SilentServer silent;
    ASSERT_EQ(add(silent.url()).status, 0);
    Process watch({binary(), "watch", "7", "--json"}, {});
    const auto nextState = [&watch] {
        const auto line = watch.readLine(kLimitMs);
        return line ? Json::parse(*line)[0]["state"].get<std::string>() : "nothing";
    };
    EXPECT_EQ(nextState(), "ready");
    ASSERT_EQ(mTool.run({"sync", "7", "calendar"}).status, 0);
    EXPECT_EQ(nextState(), "in progress");
    ASSERT_EQ(mTool.run({"daemon", "stop"}).status, 0);
    std::string state = nextState();
    while (state == "in progress" || state == "ready")
        state = nextState();  // what its end leaves behind on the way
    EXPECT_EQ(state, "none");
    watch.kill(SIGINT);
    EXPECT_EQ(watch.wait(kLimitMs), 0);
}

TEST_F(DaemonTool, TheDoctorFindsWhatIsBroken) {
    const SilentServer refusing(/*isOpen=*/false);
    ASSERT_EQ(add(refusing.url()).status, 0);
    const auto write = [this](const char* path, const char* text) {
        std::ofstream(mTool.root().at(path), std::ios::trunc) << text;
    };
    constexpr const char* kTrusted = "/opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted";
    constexpr const char* kNotification = "/opt/usr/data/vantor-pim-sync/.notificationPathCalendar";
    const std::string token = std::string(kTrusted) + "/7_file";
    std::set<std::string> found;
    const auto look = [&] {
        const CommandResult result = mTool.run({"doctor", "--json"});
        EXPECT_EQ(result.status, 1);
        EXPECT_THAT(result.output + result.error, testing::Not(HasSubstr("token-7")));
        found.clear();
        for (const Json& finding : Json::parse(result.output)) {
            if (finding["health"] != "problem") continue;
            found.insert(finding["check"]);
            EXPECT_NE(finding["advice"], "") << finding["text"];
        }
    };
    look();
    EXPECT_EQ(found, (std::set<std::string>{"folders", "servers"})) << "the test's root is open to everybody";
    for (const device::Folder& folder : device::folders())
        chmod(mTool.root().at(folder.path).c_str(), folder.mode);
    look();
    EXPECT_EQ(found, (std::set<std::string>{"servers"}));

    chmod(mTool.root().at(token.c_str()).c_str(), 0644);
    chmod(mTool.root().at("/opt/usr/data/key-storage/vantor.tovik.client.secret").c_str(), 0644);
    std::filesystem::remove(mTool.root().at(kNotification));
    ASSERT_EQ(mTool.run({"daemon", "stop"}).status, 0);
    write("/opt/usr/dbspace/.vantor_pim_sync_todo.db", "no database");
    look();
    EXPECT_EQ(found, (std::set<std::string>{"daemon", "folders", "keys", "servers", "stores", "tokens"}));
    // A link where a file should be is not followed.
    std::filesystem::remove(mTool.root().at(token.c_str()));
    std::filesystem::create_symlink("/etc/hostname", mTool.root().at(token.c_str()));
    look();
    EXPECT_TRUE(found.contains("tokens"));
}

TEST_F(DaemonTool, AWaitJoinsTheSyncThatIsGoingOnAndEndsWithIt) {
    const SilentServer silent;
    ASSERT_EQ(add(silent.url()).status, 0);
    Process first({binary(), "sync", "7", "--wait"}, {});
    waitForRun(7, 1);
    EXPECT_EQ(mTool.run({"sync", "7"}).status, 0);
    EXPECT_EQ(SyncState(7, VANTOR_PIM_SYNC_TYPE_CALENDAR).run(), 1) << "nobody started a second one";
    EXPECT_EQ(stateOf(7), "in progress");
    Process second({binary(), "sync", "7", "calendar", "--wait"}, {});
    ASSERT_EQ(mTool.run({"stop", "7"}).status, 0);
    EXPECT_EQ(first.wait(kLimitMs), 1);
    // The second may have come after the stop, and then waits for a sync of its own.
    constexpr int kPauseMs = 200;
    std::optional<int> status = second.wait(kPauseMs);
    for (int tries = 0; !status && tries < kLimitMs / kPauseMs; ++tries) {
        mTool.run({"stop", "7"});
        status = second.wait(kPauseMs);
    }
    EXPECT_EQ(status, 1);
    EXPECT_EQ(mTool.run({"stop", "7"}).status, 0) << "what does not run is stopped";
}

TEST_F(DaemonTool, AWaitEndsWhenTheDaemonGoesAway) {
    const SilentServer silent;
    ASSERT_EQ(add(silent.url()).status, 0);
    Process waiting({binary(), "sync", "7", "--wait"}, {});
    waitForRun(7, 1);
    ASSERT_EQ(kill(pid(), SIGKILL), 0);
    EXPECT_EQ(waiting.wait(kLimitMs), 1);
    EXPECT_EQ(stateOf(7), "none");
}

TEST_F(DaemonTool, RemovalStopsASyncThatIsGoingOn) {
    const SilentServer silent;
    ASSERT_EQ(add(silent.url()).status, 0);
    ASSERT_EQ(add(silent.url(), 8).status, 0);
    ASSERT_EQ(mTool.run({"sync", "7"}).status, 0);
    waitForRun(7, 1);
    EXPECT_EQ(mTool.run({"account", "remove", "7"}).status, 0);
    const Json left = mTool.json({"account", "list", "--json"});
    ASSERT_EQ(left.size(), 1U);
    EXPECT_EQ(left[0]["id"], 8);
}

}  // namespace
