// The daemon program over its socket: the commands, bad clients, its life and death.
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sqlite3.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <climits>
#include <ctime>

#include "../../../platform/ipc/IpcData.h"
#include "common/AccountDBHelper.h"
#include "platform/error.h"
#include "platform/keys.h"
#include "platform/root.h"
#include "platform/settings.h"
#include "support/Daemon.h"
#include "support/Hostile.h"

namespace {

// The sizes and first int of a reply's items.
struct Reply {
    int code = 0;
    std::vector<int> numbers;
    bool operator==(const Reply&) const = default;
};

Reply call(pims_ipc_h ipc, const char* command, const std::vector<int>& arguments,
           const char* module = kServiceModule) {
    const IpcData request(pims_ipc_data_create_with_size(64, 0));
    for (const int argument : arguments)
        EXPECT_EQ(vantor_pim_sync_ipc_marshal_int(argument, request.get()), 0);
    pims_ipc_data_h raw = nullptr;
    Reply reply;
    reply.code = pims_ipc_call(ipc, module, command, request.get(), &raw, 10'000);
    const IpcData data(raw);
    int number = 0;
    while (raw != nullptr && vantor_pim_sync_ipc_unmarshal_int(raw, &number) == 0)
        reply.numbers.push_back(number);
    return reply;
}

int rawConnection() {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    const std::string path = platform::rootedPath(kServiceSocket);
    path.copy(address.sun_path, sizeof address.sun_path - 1);
    const int fd = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    EXPECT_EQ(connect(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
    return fd;
}

// Sends the same bytes again and again, until the daemon takes no more or `most` went.
void fill(int fd, const std::string& bytes, size_t most) {
    size_t sent = 0;
    pollfd writable{.fd = fd, .events = POLLOUT, .revents = 0};
    while (sent < most && poll(&writable, 1, 20) == 1) {
        const ssize_t count =
            send(fd, bytes.data(), std::min(bytes.size(), most - sent), MSG_NOSIGNAL | MSG_DONTWAIT);
        if (count < 0 && errno != EAGAIN) return;
        if (count > 0) sent += static_cast<size_t>(count);
    }
}

size_t memoryMb(const std::string& process) {
    std::ifstream status(process + "/statm");
    size_t pages = 0;
    status >> pages >> pages;
    return (pages * static_cast<size_t>(getpagesize())) >> 20U;
}

}  // namespace

TEST(Daemon, AnswersTheEightCommands) {
    const TestRoot root;
    addDeviceAccount(root, 7);
    Daemon daemon(root);
    const Ipc ipc = daemon.connect();
    ASSERT_TRUE(ipc) << daemon.log();
    for (const char* command : {"add_account", "remove_account", "update_account", "get_account", "start",
                                "stop", "get_state", "get_sync_time"}) {
        EXPECT_EQ(call(ipc.get(), command, {}), (Reply{0, {0}})) << command << " without data runs nothing";
    }
    struct Row {
        const char* command;
        std::vector<int> arguments;
        std::vector<int> reply;
    };
    for (const Row& row :
         {Row{"get_state", {7}, {-1}}, Row{"get_sync_time", {7}, {-1}}, Row{"add_account", {7}, {-1}},
          Row{"get_account", {99}, {-1}}, Row{"get_state", {99, 0}, {0, 0}}, Row{"get_state", {7, 5}, {0, 0}},
          Row{"start", {99, 0}, {-1}}, Row{"stop", {7, 0}, {-1}}, Row{"remove_account", {99}, {-1}}}) {
        EXPECT_EQ(call(ipc.get(), row.command, row.arguments).numbers, row.reply) << row.command;
    }
    EXPECT_EQ(call(ipc.get(), "get_nothing", {1}).code, PLATFORM_ERROR_NOT_FOUND);
    EXPECT_EQ(call(ipc.get(), "start", {7, 0}, "other_module").code, PLATFORM_ERROR_NOT_FOUND);

    // An account: added, told, switched off, refused.
    std::string server = "127.0.0.1";
    vantor_pim_sync_account_s account{};
    account.account_id = 7;
    account.calsync = true;
    account.calserver = server.data();
    const auto send = [&](const char* command) {
        const IpcData request(pims_ipc_data_create_with_size(64, 0));
        EXPECT_EQ(vantor_pim_sync_ipc_marshal_sync_account(&account, request.get()), 0);
        pims_ipc_data_h raw = nullptr;
        EXPECT_EQ(pims_ipc_call(ipc.get(), kServiceModule, command, request.get(), &raw, 10'000), 0);
        const IpcData reply(raw);
        int result = -99;
        EXPECT_EQ(vantor_pim_sync_ipc_unmarshal_int(raw, &result), 0);
        return result;
    };
    EXPECT_EQ(send("update_account"), -1);
    EXPECT_EQ(send("add_account"), 0);
    EXPECT_EQ(send("add_account"), -1);
    EXPECT_EQ(call(ipc.get(), "get_state", {7, 0}).numbers, (std::vector<int>{0, 1}));
    account.calsync = false;
    EXPECT_EQ(send("update_account"), 0);
    EXPECT_EQ(call(ipc.get(), "start", {7, 0}).numbers, std::vector<int>{-1});
    EXPECT_NE(daemon.log().find("The sync option for calendar is disabled"), std::string::npos);
    EXPECT_EQ(call(ipc.get(), "get_state", {7, 0}).numbers, (std::vector<int>{0, 1})) << "the agent stays";
    EXPECT_EQ(call(ipc.get(), "remove_account", {7}).numbers, std::vector<int>{0});
    EXPECT_EQ(call(ipc.get(), "get_state", {7, 0}).numbers, (std::vector<int>{0, 0}));
}

TEST(Daemon, BadClientsDisturbNobody) {
    const TestRoot root;
    addDeviceAccount(root, 7);
    Daemon daemon(root);
    const Ipc ipc = daemon.connect();
    ASSERT_TRUE(ipc);
    std::vector<int> silent;
    for (int i = 0; i < 200; ++i) silent.push_back(rawConnection());
    for (const std::string& bytes :
         {std::string("\xff\xff\xff\xff", 4), std::string("\4\0\0\0\1\0\0\0", 8),
          std::string("\10\0\0\0\1\0\0\0\xff\xff\xff\x7f", 12), std::string("\0\0\0\0", 4)}) {
        const int fd = rawConnection();
        EXPECT_EQ(write(fd, bytes.data(), bytes.size()), static_cast<ssize_t>(bytes.size()));
        char byte = 0;
        EXPECT_EQ(read(fd, &byte, 1), 0) << "disconnected";
        close(fd);
    }
    EXPECT_EQ(write(silent[0], "\x20", 1), 1);  // half a length, for ever
    EXPECT_EQ(call(ipc.get(), "get_state", {7, 0}).numbers.size(), 2U);
    for (const int fd : silent) close(fd);
}

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool kIsSanitized = true;
#else
constexpr bool kIsSanitized = false;
#endif

TEST(Daemon, AThousandClientsOfWhomMostAreRudeKeepNobodyWaiting) {
    rlimit limit{};
    ASSERT_EQ(getrlimit(RLIMIT_NOFILE, &limit), 0);
    limit.rlim_cur = limit.rlim_max;
    ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &limit), 0);
    const TestRoot root;
    addDeviceAccount(root, 7);
    Daemon daemon(root);
    const Ipc ipc = daemon.connect();
    ASSERT_TRUE(ipc) << daemon.log();
    ASSERT_EQ(call(ipc.get(), "get_state", {7, 0}).numbers.size(), 2U) << "it has started";
    const std::string process = "/proc/" + std::to_string(daemon.process->pid());
    const auto descriptors = [&] {
        return std::distance(std::filesystem::directory_iterator(process + "/fd"), {});
    };
    const size_t memoryBefore = memoryMb(process);
    const auto descriptorsBefore = descriptors();

    const std::string request = platform::ipc::composeFrame(1, {kServiceModule, "get_state"}, nullptr);
    std::string many;
    while (many.size() < 64U * 1024) many += request;
    std::string half;
    platform::ipc::appendUint32(&half, kMaxFrameBytes);
    half.resize(kMaxFrameBytes);
    std::vector<int> asking;
    std::vector<int> rude;
    std::chrono::steady_clock::duration longest{};
    for (int i = 0; i < 1000; ++i) {
        const int fd = rawConnection();
        ASSERT_NE(fd, -1);
        (i % 5 < 2 ? asking : rude).push_back(fd);
        if (i % 5 < 2) fill(fd, request, request.size());
        if (i % 5 == 2) fill(fd, half, half.size());  // a frame that never ends
        if (i % 50 == 3) fill(fd, many, SIZE_MAX);    // reads no answer
        const auto begun = std::chrono::steady_clock::now();
        ASSERT_EQ(call(ipc.get(), "get_state", {7, 0}).numbers.size(), 2U);
        longest = std::max(longest, std::chrono::steady_clock::now() - begun);
    }
    EXPECT_LT(longest, std::chrono::seconds(1));
    // A sanitizer's allocator keeps what was given back, so that late uses of it are found: up to 256 MiB.
    EXPECT_LT(memoryMb(process) - memoryBefore, kIsSanitized ? 400U : 40U) << "MiB";
    for (const int fd : asking) {
        char length[4];
        EXPECT_EQ(recv(fd, length, sizeof length, MSG_WAITALL), 4) << "everybody is answered";
        close(fd);
    }
    for (const int fd : rude) close(fd);
    EXPECT_TRUE(eventually([&] { return descriptors() == descriptorsBefore; }));
}

TEST(Daemon, NoArgumentBringsItDown) {
    const TestRoot root;
    addDeviceAccount(root, 7);
    Daemon daemon(root);
    const Ipc ipc = daemon.connect();
    ASSERT_TRUE(ipc) << daemon.log();
    for (const hostile::Body& body : hostile::jsonSuite()) {
        for (const char* command :
             {"add_account", "update_account", "get_account", "remove_account", "get_state"}) {
            const IpcData request(pims_ipc_data_create_with_size(64, 0));
            ASSERT_EQ(pims_ipc_data_put(request.get(), body.text.data(), body.text.size()), 0) << body.name;
            pims_ipc_data_h raw = nullptr;
            ASSERT_EQ(pims_ipc_call(ipc.get(), kServiceModule, command, request.get(), &raw, 10'000), 0)
                << body.name;
            const IpcData reply(raw);
            int result = 0;
            EXPECT_EQ(vantor_pim_sync_ipc_unmarshal_int(raw, &result), 0);
            EXPECT_EQ(result, -1) << command << " " << body.name;
        }
    }
    EXPECT_EQ(call(ipc.get(), "get_state", {7, 0}).numbers, (std::vector<int>{0, 0}))
        << "no account was made";
}

TEST(Daemon, LivesAndDies) {
    const TestRoot root;
    {
        Daemon none(root);
        EXPECT_EQ(none.process->wait(5000), 0) << "no account, nothing to do";
    }
    addDeviceAccount(root, 7);
    Daemon daemon(root);
    ASSERT_TRUE(daemon.connect());
    {
        Daemon second(root);
        EXPECT_EQ(second.process->wait(5000), 0);
        EXPECT_NE(second.log().find("pims_ipc_svc_register error"), std::string::npos);
    }
    ASSERT_TRUE(daemon.connect()) << "the first one still serves";
    daemon.process->kill(SIGKILL);
    EXPECT_EQ(daemon.process->wait(5000), 128 + SIGKILL);
    daemon.start();
    ASSERT_TRUE(daemon.connect()) << "the socket was stale";
    daemon.process->kill(SIGTERM);
    EXPECT_EQ(daemon.process->wait(3000), 0);
    EXPECT_FALSE(std::filesystem::exists(root.at(kServiceSocket)));
}

namespace {

int versionOf(const std::filesystem::path& store, const char* change = nullptr) {
    sqlite3* database = nullptr;
    int version = -1;
    EXPECT_EQ(sqlite3_open(store.c_str(), &database), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(database, change, nullptr, nullptr, nullptr), SQLITE_OK);
    const auto note = [](void* out, int, char** values, char**) {
        return *static_cast<int*>(out) = atoi(values[0]), 0;
    };
    EXPECT_EQ(sqlite3_exec(database, "PRAGMA user_version", note, &version, nullptr), SQLITE_OK);
    sqlite3_close(database);
    return version;
}

}  // namespace

TEST(Daemon, TakesItsStoresAsOlderVersionsLeftThemAndLeavesNewerOnesAlone) {
    const TestRoot root;
    addDeviceAccount(root, 7);
    const auto serves = [](Daemon& daemon) {
        const bool connected = daemon.connect() != nullptr;
        daemon.process->kill(SIGTERM);
        return connected && daemon.process->wait(3000) == 0;
    };
    Daemon daemon(root);
    EXPECT_TRUE(serves(daemon)) << daemon.log();
    for (const char* store :
         {"/opt/usr/data/records/calendar.db", "/opt/usr/data/records/contacts.db",
          "/opt/usr/data/accounts/accounts.db", "/opt/usr/dbspace/.vantor_pim_sync_account.db",
          "/opt/usr/dbspace/.vantor_pim_sync_calendar.db", "/opt/usr/dbspace/.vantor_pim_sync_todo.db",
          "/opt/usr/dbspace/.vantor_pim_sync_contacts.db"}) {
        SCOPED_TRACE(store);
        const auto read = [file = root.at(store)] {
            std::ifstream stream(file, std::ios::binary);
            return std::string(std::istreambuf_iterator<char>(stream), {});
        };
        EXPECT_EQ(versionOf(root.at(store), "PRAGMA user_version=0"), 0);
        daemon.start();
        EXPECT_TRUE(serves(daemon));
        EXPECT_EQ(versionOf(root.at(store)), 1);
        EXPECT_EQ(versionOf(root.at(store), "PRAGMA user_version=99"), 99);
        const std::string before = read();
        daemon.start();
        EXPECT_EQ(daemon.process->wait(5000), 78);
        EXPECT_EQ(read(), before);
        EXPECT_NE(daemon.log().find(std::string(store) + " was written by a newer version"),
                  std::string::npos);
        versionOf(root.at(store), "PRAGMA user_version=1");
    }
}

TEST(Daemon, StartsWithWhatTheDeviceStillHas) {
    const TestRoot root;
    addDeviceAccount(root, 7);
    addDeviceAccount(root, 8);
    vantor_pim_sync_account_s account{};
    account.calsync = true;
    for (account.account_id = 7; account.account_id <= 9; ++account.account_id) {
        ASSERT_EQ(AccountDBHelper::getInstance().insertAccount(Account(account)), 0);
    }
    Daemon daemon(root);
    const Ipc ipc = daemon.connect();
    ASSERT_TRUE(ipc) << daemon.log();
    EXPECT_EQ(call(ipc.get(), "get_state", {8, 0}).numbers, (std::vector<int>{0, 1}));
    EXPECT_EQ(call(ipc.get(), "get_account", {9}).numbers, std::vector<int>{-1});
    EXPECT_NE(daemon.log().find("removed account[9]"), std::string::npos);

    daemon.process->kill(SIGTERM);
    EXPECT_EQ(daemon.process->wait(3000), 0);
    std::filesystem::remove(
        root.at("/opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted/8_file"));
    daemon.start();
    EXPECT_EQ(daemon.process->wait(5000), 128 + SIGABRT) << "it cannot run without an account's token";
    EXPECT_NE(daemon.log().find("account 8 has no readable refresh token"), std::string::npos);
}

namespace {

// An account that syncs with `server`, in the daemon's store.
void storeAccount(const TestRoot& root, int id, std::string server, int period, time_t lastSync) {
    addDeviceAccount(root, id);
    vantor_pim_sync_account_s account{};
    account.account_id = id;
    account.calsync = true;
    account.calserver = server.data();
    account.calperiod = period;
    ASSERT_EQ(AccountDBHelper::getInstance().insertAccount(Account(account)), 0);
    ASSERT_EQ(AccountDBHelper::getInstance().updateSyncTime(id, 0, static_cast<int>(lastSync)), 0);
}

int statusOf(int accountId) {
    account_h account = nullptr;
    account_sync_state_e status = ACCOUNT_SYNC_INVALID;
    EXPECT_EQ(account_create(&account), 0);
    EXPECT_EQ(account_query_account_by_account_id(accountId, &account), 0);
    EXPECT_EQ(account_get_sync_support(account, &status), 0);
    account_destroy(account);
    return status;
}

}  // namespace

TEST(Daemon, SyncsWhatIsOverdueAndWhatASettingAsksForAndEndsInTheMiddleOfIt) {
    const TestRoot root;
    const SilentServer server;
    for (const char* name : {"vantor.tovik.client.id", "vantor.tovik.client.secret"})
        ASSERT_EQ(key_storage_set(name, "value"), 0);
    storeAccount(root, 7, server.url, 15, time(nullptr) - 16 * 60);
    storeAccount(root, 8, server.url, 15, time(nullptr));
    storeAccount(root, 9, server.url, INT_MAX, 0);
    storeAccount(root, 10, server.url, 0, 0);
    Daemon daemon(root);
    const Ipc ipc = daemon.connect();
    ASSERT_TRUE(ipc) << daemon.log();
    const auto state = [&](int id) { return call(ipc.get(), "get_state", {id, 0}).numbers.back(); };
    EXPECT_EQ(state(7), SYNC_AGENT_STATE_IN_PROGRESS);
    for (const int id : {8, 9, 10}) EXPECT_EQ(state(id), SYNC_AGENT_STATE_READY) << id;

    ASSERT_EQ(account_update_sync_status_by_id(7, ACCOUNT_SYNC_STATUS_IDLE), 0);
    EXPECT_TRUE(eventually([] { return statusOf(7) == ACCOUNT_SYNC_STATUS_RUNNING; }))
        << "a sync that goes on is not idle, whoever says so";

    ASSERT_EQ(vconf_set_int("db/private/com.morvane.calendar/calendar-sync", 1), 0);
    for (const int id : {8, 9, 10}) {
        EXPECT_TRUE(eventually([&] { return state(id) == SYNC_AGENT_STATE_IN_PROGRESS; })) << id;
    }
    daemon.process->kill(SIGTERM);
    EXPECT_EQ(daemon.process->wait(3000), 0) << "however many syncs there are";
}

namespace {

// The side of the service manager: a socket that takes what the daemon tells.
class ServiceManager {
public:
    explicit ServiceManager(const TestRoot& root)
        : path(root.at("/tmp/notify")), mSocket(socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0)) {
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        path.copy(address.sun_path, sizeof address.sun_path - 1);
        EXPECT_EQ(bind(mSocket, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
        const timeval limit{.tv_sec = 5, .tv_usec = 0};
        EXPECT_EQ(setsockopt(mSocket, SOL_SOCKET, SO_RCVTIMEO, &limit, sizeof limit), 0);
    }
    ~ServiceManager() { close(mSocket); }
    ServiceManager(const ServiceManager&) = delete;
    ServiceManager& operator=(const ServiceManager&) = delete;

    // The next message that begins with `wanted`, empty when none comes in time.
    std::string await(std::string_view wanted) const {
        std::string message(512, '\0');
        ssize_t length = 0;
        while ((length = recv(mSocket, message.data(), message.size(), 0)) > 0) {
            if (std::string_view(message.data(), static_cast<size_t>(length)).starts_with(wanted))
                return message.substr(0, static_cast<size_t>(length));
        }
        return {};
    }
    std::string path;

private:
    int mSocket;
};

}  // namespace

TEST(Daemon, TellsTheServiceManagerHowItStands) {
    const TestRoot root;
    const ServiceManager manager(root);
    Daemon daemon(root);
    const auto start = [&] {
        daemon.process = std::make_unique<Process>(
            std::vector<std::string>{VPS_BIN_DIR "/vantor-pim-sync"},
            Environment{{"NOTIFY_SOCKET", manager.path}, {"WATCHDOG_USEC", "200000"}});
    };
    start();
    EXPECT_EQ(manager.await("READY=1"), "READY=1\nSTATUS=There is no account")
        << "an end before that is a failure";
    EXPECT_EQ(daemon.process->wait(5000), 0);

    addDeviceAccount(root, 7);
    start();
    EXPECT_EQ(manager.await("READY=1"), "READY=1\nSTATUS=Idle");
    daemon.process->kill(SIGHUP);
    const auto begin = std::chrono::steady_clock::now();
    for (int beat = 0; beat < 4; ++beat) EXPECT_FALSE(manager.await("WATCHDOG=1").empty());
    EXPECT_GT(std::chrono::steady_clock::now() - begin, std::chrono::milliseconds(200))
        << "not without a pause";
    EXPECT_TRUE(daemon.connect()) << "a hang-up is nothing to it";
    daemon.process->kill(SIGTERM);
    EXPECT_FALSE(manager.await("STOPPING=1").empty());
    EXPECT_EQ(daemon.process->wait(3000), 0);
}

TEST(Daemon, PowerSavingTakesTheScheduleAwayAndGivesItBack) {
    const TestRoot root;
    storeAccount(root, 7, "127.0.0.1", 15, time(nullptr));
    Daemon daemon(root);
    ASSERT_TRUE(daemon.connect()) << daemon.log();
    const auto isScheduled = [] {
        int alarm = -1;
        (void)vconf_get_int("memory/vantor-pim-sync/7/calendar/next_alarm", &alarm);
        return alarm > time(nullptr);
    };
    EXPECT_TRUE(eventually(isScheduled));
    for (const int mode : {2, 0, 2, 1}) {
        ASSERT_EQ(vconf_set_int("db/setting/psmode", mode), 0);
        EXPECT_TRUE(eventually([&] { return isScheduled() == (mode != 2); })) << mode;
    }
}

TEST(Daemon, ARootThatIsTooLongIsToldPlainly) {
    const TestRoot root;
    const std::filesystem::path deep = root.path() / std::string(100, 'd');
    std::filesystem::create_directories(deep);
    setenv("VANTOR_PIM_SYNC_ROOT", deep.c_str(), 1);
    Daemon daemon(root);
    EXPECT_EQ(daemon.process->wait(5000), 0);
    EXPECT_NE(daemon.log().find("the root folder is too long"), std::string::npos);
}
