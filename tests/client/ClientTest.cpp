// The client library in a process of its own, against the daemon program and against a server that hangs up.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/un.h>

#include <atomic>
#include <functional>

#include "common/vantor_pim_sync.h"
#include "platform/root.h"
#include "service/common/MainLoop.h"
#include "support/Daemon.h"

namespace {

constexpr auto kCalendar = VANTOR_PIM_SYNC_TYPE_CALENDAR;
constexpr auto kContacts = VANTOR_PIM_SYNC_TYPE_CONTACTS;

struct FreeAccount {
    void operator()(vantor_pim_sync_account_s* account) const noexcept {
        vantor_pim_sync_free_account(account);
    }
};
using AccountRecord = std::unique_ptr<vantor_pim_sync_account_s, FreeAccount>;

// A calendar account whose first request needs no new token.
AccountRecord accountRecord(int id, const std::string& server) {
    AccountRecord record(
        static_cast<vantor_pim_sync_account_s*>(calloc(1, sizeof(vantor_pim_sync_account_s))));
    record->account_id = id;
    record->access_token = strdup("access");
    record->email = strdup("it's \"me\"\n");
    record->calsync = true;
    record->calserver = strdup(server.c_str());
    return record;
}

AccountRecord storedAccount(int id) {
    vantor_pim_sync_account_s* record = nullptr;
    return AccountRecord(vantor_pim_sync_get_account(id, &record) == 0 ? record : nullptr);
}

int stateOf(int id) {
    int state = -1;
    EXPECT_EQ(vantor_pim_sync_get_state(id, kCalendar, &state), 0);
    return state;
}

void count(vantor_pim_sync_type_e type, void* counter) {
    EXPECT_EQ(type, kCalendar);
    ++*static_cast<int*>(counter);
}

// Every call that asks the daemon.
struct Row {
    const char* name;
    std::function<int()> call;
    bool isRead;
};
std::vector<Row> calls() {
    const auto record = std::make_shared<AccountRecord>(accountRecord(7, "host"));
    static int number = 0;
    return {
        {"add", [=] { return vantor_pim_sync_add_account(record->get()); }, false},
        {"update", [=] { return vantor_pim_sync_update_account(record->get()); }, false},
        {"remove", [] { return vantor_pim_sync_remove_account(7); }, false},
        {"start", [] { return vantor_pim_sync_start(7, kCalendar); }, false},
        {"stop", [] { return vantor_pim_sync_stop(7, kCalendar); }, false},
        {"get", [] { return storedAccount(7) ? 0 : -1; }, true},
        {"state", [] { return vantor_pim_sync_get_state(7, kCalendar, &number); }, true},
        {"time", [] { return vantor_pim_sync_get_sync_time(7, kCalendar, &number); }, true},
    };
}

// Serves the socket, takes one request a connection and closes it without an answer.
class HangingUpServer {
public:
    HangingUpServer() : mSocket(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        const std::string path = platform::rootedPath(kServiceSocket);
        path.copy(address.sun_path, sizeof address.sun_path - 1);
        EXPECT_EQ(bind(mSocket, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
        EXPECT_EQ(listen(mSocket, 16), 0);
        mThread = std::thread([this] {
            for (int client = accept(mSocket, nullptr, nullptr); client != -1;
                 client = accept(mSocket, nullptr, nullptr)) {
                char chunk[4096];
                if (recv(client, chunk, sizeof chunk, 0) > 0) ++mRequests;
                close(client);
            }
        });
    }
    ~HangingUpServer() {
        shutdown(mSocket, SHUT_RDWR);
        mThread.join();
        close(mSocket);
    }
    HangingUpServer(const HangingUpServer&) = delete;
    HangingUpServer& operator=(const HangingUpServer&) = delete;
    int takeRequests() { return mRequests.exchange(0); }

private:
    const int mSocket;
    std::atomic<int> mRequests{0};
    std::thread mThread;
};

}  // namespace

TEST(Client, WithoutADaemonEveryCallIsRefusedQuietly) {
    const TestRoot root;
    testing::internal::CaptureStderr();
    EXPECT_EQ(vantor_pim_sync_initialize(), -1);
    for (const Row& row : calls()) EXPECT_EQ(row.call(), -1) << row.name;
    EXPECT_EQ(vantor_pim_sync_add_account(nullptr), -1);
    EXPECT_EQ(vantor_pim_sync_get_account(7, nullptr), -1);
    EXPECT_EQ(vantor_pim_sync_get_sync_time(7, kCalendar, nullptr), -1);
    EXPECT_EQ(vantor_pim_sync_get_state(7, kCalendar, nullptr), 0);
    EXPECT_EQ(vantor_pim_sync_remove_state_changed_cb(kCalendar, count, nullptr), 0) << "never added";
    EXPECT_EQ(vantor_pim_sync_finalize(), 0);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

TEST(Client, AnAccountIsAddedSyncedWatchedAndRemoved) {
    const TestRoot root;
    const SilentServer server;
    addDeviceAccount(root, 7);
    const Daemon daemon(root);
    ASSERT_TRUE(daemon.connect()) << daemon.log();
    ASSERT_EQ(vantor_pim_sync_initialize(), 0);
    AccountRecord account = accountRecord(7, server.url);
    ASSERT_EQ(vantor_pim_sync_add_account(account.get()), 0);
    EXPECT_EQ(vantor_pim_sync_add_account(account.get()), -1);
    AccountRecord stored = storedAccount(7);
    ASSERT_TRUE(stored);
    EXPECT_STREQ(stored->email, account->email);
    EXPECT_STREQ(stored->calserver, server.url.c_str());
    EXPECT_STREQ(stored->refresh_token, "token");
    EXPECT_EQ(stored->access_token, nullptr);
    EXPECT_FALSE(storedAccount(8));
    int time = -1;
    EXPECT_EQ(vantor_pim_sync_get_sync_time(7, kCalendar, &time), 0);
    EXPECT_EQ(time, 0);

    int changes = 0;
    ASSERT_EQ(vantor_pim_sync_add_state_changed_cb(kCalendar, count, &changes), 0);
    EXPECT_EQ(vantor_pim_sync_start(7, kContacts), -1);
    ASSERT_EQ(vantor_pim_sync_start(7, kCalendar), 0);
    EXPECT_TRUE(iterateUntil([&] { return changes == 1; }));
    EXPECT_EQ(stateOf(7), SYNC_AGENT_STATE_IN_PROGRESS);
    EXPECT_EQ(vantor_pim_sync_start(7, kCalendar), -1) << "one at a time";
    ASSERT_EQ(vantor_pim_sync_stop(7, kCalendar), 0);
    EXPECT_TRUE(iterateUntil([&] { return changes == 2; }));
    EXPECT_EQ(stateOf(7), SYNC_AGENT_STATE_READY);

    EXPECT_EQ(vantor_pim_sync_finalize(), 0);
    ASSERT_EQ(vantor_pim_sync_start(7, kCalendar), 0) << "connects again";
    EXPECT_TRUE(eventually([] { return stateOf(7) == SYNC_AGENT_STATE_IN_PROGRESS; }));
    iterateReady();
    EXPECT_EQ(changes, 2) << "callbacks are gone";
    free(std::exchange(account->email, nullptr));
    account->calperiod = 30;
    EXPECT_EQ(vantor_pim_sync_update_account(account.get()), 0);
    stored = storedAccount(7);
    EXPECT_STREQ(stored->email, "it's \"me\"\n") << "not named, so kept";
    EXPECT_EQ(stored->calperiod, 30);
    ASSERT_EQ(vantor_pim_sync_stop(7, kCalendar), 0);
    EXPECT_TRUE(eventually([] { return stateOf(7) == SYNC_AGENT_STATE_READY; }));
    EXPECT_EQ(vantor_pim_sync_remove_account(7), 0);
    EXPECT_FALSE(storedAccount(7));
}

TEST(Client, ARestartedDaemonIsFoundAgain) {
    const TestRoot root;
    addDeviceAccount(root, 7);
    Daemon daemon(root);
    const auto restart = [&] {
        daemon.process->kill(SIGKILL);
        EXPECT_EQ(daemon.process->wait(5000), 128 + SIGKILL);
        EXPECT_EQ(vantor_pim_sync_start(7, kCalendar), -1) << "nobody is there";
        daemon.start();
        EXPECT_TRUE(daemon.connect()) << daemon.log();
    };
    ASSERT_TRUE(daemon.connect());
    ASSERT_EQ(vantor_pim_sync_initialize(), 0);
    daemon.process->kill(SIGKILL);
    EXPECT_EQ(daemon.process->wait(5000), 128 + SIGKILL);
    daemon.start();
    ASSERT_TRUE(daemon.connect());
    EXPECT_EQ(vantor_pim_sync_add_account(accountRecord(7, "127.0.0.1").get()), 0)
        << "over a dead connection";
    restart();
    EXPECT_EQ(stateOf(7), SYNC_AGENT_STATE_READY);
    EXPECT_EQ(vantor_pim_sync_finalize(), 0);
}

TEST(Client, OnlyReadsAreAskedTwice) {
    const TestRoot root;
    HangingUpServer server;
    for (const Row& row : calls()) {
        EXPECT_EQ(vantor_pim_sync_finalize(), 0);
        EXPECT_EQ(row.call(), -1) << row.name;
        EXPECT_EQ(server.takeRequests(), row.isRead ? 2 : 1)
            << row.name << ": a call that may have been carried out is not sent again";
    }
}
