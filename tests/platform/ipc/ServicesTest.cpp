// Accounts, alarms and the opening of the service socket. (The wire itself is tested through the daemon.)
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/stat.h>

#include <csignal>
#include <filesystem>
#include <fstream>

#include "../../../platform/alarm/AlarmTime.h"
#include "platform/account.h"
#include "platform/alarm.h"
#include "platform/error.h"
#include "platform/ipc.h"
#include "platform/root.h"
#include "platform/support.h"
#include "service/common/MainLoop.h"
#include "support/TestRoot.h"

namespace {

constexpr uid_t kOwner = 4711;

// A process of `user` that serves the socket while the object lives.
class OtherUser {
public:
    OtherUser(uid_t user, const char* path) : mSocket(platform::rootedPath(path)) {
        int ready[2];
        EXPECT_EQ(pipe(ready), 0);
        mPid = inOtherProcess([&] {
            if (setuid(user) != 0 || pims_ipc_svc_init(path, user, 0666) != 0) return 1;
            close(ready[0]);
            close(ready[1]);
            pause();
            return 0;
        });
        close(ready[1]);
        char byte = 0;
        EXPECT_EQ(read(ready[0], &byte, 1), 0) << "until the other end is closed";
        close(ready[0]);
    }
    ~OtherUser() {
        kill(mPid, SIGKILL);
        (void)statusOf(mPid);
        std::filesystem::remove(mSocket);
    }
    OtherUser(const OtherUser&) = delete;
    OtherUser& operator=(const OtherUser&) = delete;

private:
    const std::string mSocket;
    pid_t mPid = 0;
};

}  // namespace

TEST(Accounts, EventsReachEveryProcessTheWriterIncluded) {
    const TestRoot root;
    const auto ignore = [](account_h, void*) { return true; };
    EXPECT_EQ(account_query_account_by_package_name(ignore, "p", nullptr), PLATFORM_ERROR_NOT_FOUND);
    std::vector<std::string> events;
    account_subscribe_h subscription = nullptr;
    ASSERT_EQ(account_subscribe_create(&subscription), 0);
    ASSERT_EQ(account_subscribe_notification(
                  subscription,
                  [](const char* type, int id, void* data) {
                      static_cast<std::vector<std::string>*>(data)->push_back(type + std::to_string(id));
                      return true;
                  },
                  &events),
              0);
    ASSERT_EQ(account_insert(7, "p", "me@x"), 0);
    EXPECT_NE(account_insert(7, "p", ""), 0) << "taken";
    EXPECT_TRUE(events.empty()) << "never from inside the call";
    ASSERT_TRUE(iterateUntil([&] { return events.size() == 1; }));
    ASSERT_EQ(account_update_sync_status_by_id(7, ACCOUNT_SYNC_STATUS_RUNNING), 0);
    EXPECT_EQ(account_update_sync_status_by_id(8, ACCOUNT_SYNC_STATUS_IDLE), PLATFORM_ERROR_NOT_FOUND);
    EXPECT_NE(account_update_sync_status_by_id(7, 99), 0);
    ASSERT_TRUE(iterateUntil([&] { return events.size() == 2; }));
    int found = 0;
    ASSERT_EQ(account_query_account_by_package_name(
                  [](account_h account, void* id) {
                      return account_get_account_id(account, static_cast<int*>(id)) == 0;
                  },
                  "p", &found),
              0);
    EXPECT_EQ(found, 7);
    ASSERT_EQ(account_delete(7), 0);
    ASSERT_TRUE(iterateUntil([&] { return events.size() == 3; }));
    EXPECT_THAT(events, testing::ElementsAre("insert7", "sync_update7", "delete7"));
    EXPECT_EQ(account_unsubscribe_notification(subscription), 0);
}

TEST(Accounts, AMarkIsThereWhileAPackageHasAccounts) {
    const TestRoot root;
    const auto mark = root.at("/opt/usr/data/accounts/packages/p");
    ASSERT_EQ(account_connect(), 0);
    EXPECT_FALSE(std::filesystem::exists(mark));
    ASSERT_EQ(account_insert(1, "p", ""), 0);
    ASSERT_EQ(account_insert(2, "../p", ""), 0) << "a name that is none of a file has no mark";
    std::filesystem::remove(mark);
    ASSERT_EQ(account_connect(), 0);
    EXPECT_TRUE(std::filesystem::exists(mark)) << "what a killed process left undone";

    const auto before = std::filesystem::file_time_type::clock::now() - std::chrono::hours(1);
    std::filesystem::last_write_time(mark, before);
    ASSERT_EQ(account_insert(3, "p", ""), 0);
    EXPECT_GT(std::filesystem::last_write_time(mark), before) << "each registration is news";
    ASSERT_EQ(account_delete(1), 0);
    EXPECT_TRUE(std::filesystem::exists(mark)) << "one is left";
    ASSERT_EQ(account_delete(3), 0);
    EXPECT_FALSE(std::filesystem::exists(mark));
}

TEST(Alarms, KeepTheirPhase) {
    struct Row {
        int64_t due, interval, now, next;
    };
    for (const Row& row : {Row{100, 10, 50, 100}, Row{100, 10, 100, 110}, Row{100, 10, 109, 110},
                           Row{100, 10, 110, 120}, Row{100, 10, 1234, 1240}}) {
        EXPECT_EQ(platform::alarm::nextExpiry(row.due, row.interval, row.now), row.next);
    }
}

namespace {

struct Alarms {
    std::vector<alarm_id_t> calls;
    bool removesItself = false;
};

int onAlarm(alarm_id_t id, void* data) {
    auto* alarms = static_cast<Alarms*>(data);
    alarms->calls.push_back(id);
    if (alarms->removesItself) {
        EXPECT_EQ(alarmmgr_remove_alarm(id), 0);
    }
    return 0;
}

void execute(const TestRoot& root, const char* sql) {
    sqlite3* store = nullptr;
    EXPECT_EQ(sqlite3_open(root.at("/opt/usr/data/alarms/alarms.db").c_str(), &store), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(store, sql, nullptr, nullptr, nullptr), SQLITE_OK) << sqlite3_errmsg(store);
    sqlite3_close(store);
}

std::vector<alarm_id_t> listed() {
    std::vector<alarm_id_t> ids;
    EXPECT_EQ(alarmmgr_enum_alarm_ids(
                  [](alarm_id_t id, void* list) {
                      static_cast<std::vector<alarm_id_t>*>(list)->push_back(id);
                      return 0;
                  },
                  &ids),
              0);
    return ids;
}

}  // namespace

TEST(Alarms, ComeOnceAfterALongSleepAndAreListedUntilRemoved) {
    const TestRoot root;
    // An earlier run of the application left one behind.
    EXPECT_EQ(statusOf(inOtherProcess([] {
                  alarm_id_t id = 0;
                  return alarmmgr_init("app") + alarmmgr_add_alarm(0, 3600, 3600, nullptr, &id) +
                         (id > 0 ? 0 : 1);
              })),
              0);
    Alarms alarms;
    ASSERT_EQ(alarmmgr_init("app"), 0);
    ASSERT_EQ(alarmmgr_set_cb(onAlarm, &alarms), 0);
    ASSERT_EQ(listed().size(), 1U);
    EXPECT_EQ(alarmmgr_remove_alarm(listed()[0]), 0);
    EXPECT_EQ(alarmmgr_remove_alarm(1), PLATFORM_ERROR_NOT_FOUND);
    EXPECT_NE(alarmmgr_add_alarm(1, 1, 1, nullptr, nullptr), 0);

    alarm_id_t id = 0;
    ASSERT_EQ(alarmmgr_add_alarm(0, 1, 1, nullptr, &id), 0);
    EXPECT_GT(id, 0);
    time_t expiry = 0;
    ASSERT_EQ(alarmmgr_get_next_expiry(id, &expiry), 0);
    EXPECT_NEAR(static_cast<double>(expiry - time(nullptr)), 1, 1.1);
    usleep(2'300'000);  // the process sleeps over two expiries
    ASSERT_TRUE(iterateUntil([&] { return !alarms.calls.empty(); }));
    iterateReady();
    EXPECT_EQ(alarms.calls.size(), 1U) << "one late call";
    alarms.removesItself = true;
    ASSERT_TRUE(iterateUntil([&] { return alarms.calls.size() == 2; }, std::chrono::seconds(3)));
    EXPECT_TRUE(listed().empty());
}

TEST(Alarms, AStoreThatFailsNeitherLoopsNorForgets) {
    const TestRoot root;
    Alarms alarms;
    ASSERT_EQ(alarmmgr_init("app"), 0);
    ASSERT_EQ(alarmmgr_set_cb(onAlarm, &alarms), 0);
    alarm_id_t id = 0;
    ASSERT_EQ(alarmmgr_add_alarm(0, 1, 3600, nullptr, &id), 0);
    execute(root, "CREATE TRIGGER full BEFORE UPDATE ON alarms BEGIN SELECT RAISE(ABORT, 'full'); END");

    EXPECT_FALSE(iterateUntil([&] { return !alarms.calls.empty(); }, std::chrono::milliseconds(1300)));

    execute(root, "DROP TRIGGER full");
    alarm_id_t other = 0;
    ASSERT_EQ(alarmmgr_add_alarm(0, 3600, 3600, nullptr, &other), 0);  // the timer is set anew
    ASSERT_TRUE(iterateUntil([&] { return !alarms.calls.empty(); }));
    EXPECT_EQ(alarms.calls, std::vector<alarm_id_t>{id});
}

TEST(ServiceSocket, OpensOnlyWhereItMay) {
    const auto handler = [](pims_ipc_h, pims_ipc_data_h, pims_ipc_data_h*, void*) {};
    struct Row {
        const char* name;
        void (*prepare)(const std::filesystem::path& path);
        bool opens;
    };
    const Row rows[] = {
        {"nothing there", [](const std::filesystem::path&) {}, true},
        {"a file", [](const std::filesystem::path& path) { std::ofstream(path) << "x"; }, false},
        {"a link to nowhere",
         [](const std::filesystem::path& path) { std::filesystem::create_symlink("/nowhere", path); }, false},
        {"a FIFO", [](const std::filesystem::path& path) { EXPECT_EQ(mkfifo(path.c_str(), 0600), 0); },
         false},
        {"a link to a stale socket",
         [](const std::filesystem::path& path) {
             EXPECT_EQ(
                 statusOf(inOtherProcess([] { return pims_ipc_svc_init("/tmp/other", getgid(), 0660); })), 0);
             std::filesystem::create_symlink("other", path);
         },
         false},
        {"a stale socket",
         [](const std::filesystem::path&) {
             EXPECT_EQ(statusOf(inOtherProcess([] { return pims_ipc_svc_init("/tmp/s", getgid(), 0660); })),
                       0);
         },
         true},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        const TestRoot root;
        row.prepare(root.at("/tmp/s"));
        EXPECT_EQ(pims_ipc_svc_init("/tmp/s", getgid(), 0660) == 0, row.opens);
        EXPECT_EQ(pims_ipc_svc_register("m", "c", handler, nullptr) == 0, row.opens);
        if (row.opens) {
            EXPECT_EQ(statusOf(inOtherProcess(
                          [] { return pims_ipc_svc_init("/tmp/s", getgid(), 0660) == 0 ? 1 : 0; })),
                      0);
        } else {
            EXPECT_TRUE(std::filesystem::exists(std::filesystem::symlink_status(root.at("/tmp/s"))))
                << "left alone";
        }
        EXPECT_EQ(pims_ipc_svc_deinit(), 0);
    }
}

TEST(ServiceSocket, ClientsFollowNoLink) {
    const TestRoot root;
    ASSERT_EQ(pims_ipc_svc_init("/tmp/s", getgid(), 0660), 0);
    std::filesystem::create_symlink("s", root.at("/tmp/link"));
    ASSERT_EQ(mkfifo(root.at("/tmp/fifo").c_str(), 0600), 0);
    pims_ipc_h ipc = nullptr;
    for (const char* path : {"/tmp/link", "/tmp/fifo"})
        EXPECT_EQ(pims_ipc_create(path, &ipc), PLATFORM_ERROR_PERMISSION_DENIED) << path;
    EXPECT_EQ(pims_ipc_create("/tmp/none", &ipc), PLATFORM_ERROR_NOT_FOUND);
    ASSERT_EQ(pims_ipc_create("/tmp/s", &ipc), 0);
    EXPECT_EQ(pims_ipc_destroy(ipc), 0);
    EXPECT_EQ(pims_ipc_svc_deinit(), 0);
}

TEST(ServiceSocket, NothingIsToldToAStranger) {
    if (geteuid() != 0) GTEST_SKIP() << "only root can be somebody else";
    const TestRoot root;
    std::filesystem::permissions(root.path(), std::filesystem::perms::all);
    std::filesystem::permissions(root.at("/tmp"), std::filesystem::perms::all);
    ASSERT_EQ(chown(root.at("/opt/usr/dbspace").c_str(), kOwner, kOwner), 0);
    for (const auto& [user, code] : {std::pair<uid_t, int>{kOwner, PLATFORM_ERROR_NONE},
                                     std::pair<uid_t, int>{kOwner + 1, PLATFORM_ERROR_FAILED}}) {
        OtherUser server(user, "/tmp/s");
        pims_ipc_h ipc = nullptr;
        EXPECT_EQ(pims_ipc_create("/tmp/s", &ipc), code) << user;
        EXPECT_EQ(pims_ipc_destroy(ipc), 0);
    }
}

TEST(IpcData, KeepsToItsLimits) {
    pims_ipc_data_h data = pims_ipc_data_create_with_size(1024, 0);
    EXPECT_NE(pims_ipc_data_put(nullptr, "x", 1), 0);
    EXPECT_NE(pims_ipc_data_put(data, nullptr, 1), 0);
    const std::string most(kMaxItemBytes, 'x');
    EXPECT_NE(pims_ipc_data_put(data, most.data(), most.size() + 1), 0);
    int taken = 0;
    while (pims_ipc_data_put(data, most.data(), most.size()) == 0) ++taken;
    EXPECT_EQ(taken, 3) << "a frame has its limit too";
    size_t size = 0;
    EXPECT_NE(pims_ipc_data_get(data, &size), nullptr);
    EXPECT_EQ(size, most.size());
    pims_ipc_data_destroy(data);
}
