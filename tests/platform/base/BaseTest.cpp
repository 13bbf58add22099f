// Root, log, settings, keys, databases, device conditions.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sqlite3.h>
#include <sys/prctl.h>
#include <sys/ptrace.h>
#include <sys/stat.h>
#include <sys/wait.h>

#include <filesystem>
#include <fstream>

#include "../../../platform/base/NetworkRoutes.h"
#include "platform/database.h"
#include "platform/error.h"
#include "platform/keys.h"
#include "platform/log.h"
#include "platform/root.h"
#include "platform/service_manager.h"
#include "platform/settings.h"
#include "platform/support.h"
#include "service/common/MainLoop.h"
#include "support/TestRoot.h"

namespace {

void remember(keynode_t* node, void* seen) {
    static_cast<std::vector<int>*>(seen)->push_back(vconf_keynode_get_int(node));
}

std::string settingsFile(const TestRoot& root, const std::string& key) {
    return root.at("/opt/usr/data/settings/" + key).string();
}

}  // namespace

TEST(Root, FoldersAreMadeBelowIt) {
    const TestRoot root;
    EXPECT_EQ(platform::rootedPath("/opt/x"), root.path().string() + "/opt/x");
    EXPECT_EQ(platform::makeFolder("/opt/new/deep", 0700), 0);
    struct stat info {};
    ASSERT_EQ(stat(root.at("/opt/new/deep").c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0700U);
    std::ofstream(root.at("/opt/file"));
    EXPECT_NE(platform::makeFolder("/opt/file/below"), 0);
}

TEST(Settings, KeysHoldValuesOfOneType) {
    const TestRoot root;
    int number = 5;
    bool flag = false;
    std::string text;
    EXPECT_EQ(vconf_get_int("db/a/b", &number), PLATFORM_ERROR_NOT_FOUND);
    EXPECT_EQ(number, 5) << "untouched";
    ASSERT_EQ(vconf_set_int("db/a/b", -7), 0);
    ASSERT_EQ(vconf_set_bool("file/a", true), 0);
    ASSERT_EQ(vconf_set_str("memory/a", "it's\n\xF0\x9F\x8E\x89"), 0);
    EXPECT_EQ(vconf_get_int("db/a/b", &number), 0);
    EXPECT_EQ(number, -7);
    EXPECT_EQ(vconf_get_bool("file/a", &flag), 0);
    EXPECT_TRUE(flag);
    EXPECT_EQ(vconf_get_str("memory/a", &text), 0);
    EXPECT_EQ(text, "it's\n\xF0\x9F\x8E\x89");
    EXPECT_EQ(vconf_get_str("db/a/b", &text), PLATFORM_ERROR_INVALID_PARAMETER);
    EXPECT_THAT(vconf_list_keys(""), testing::ElementsAre("db/a/b", "file/a", "memory/a"));
    EXPECT_EQ(vconf_unset("db/a/b"), 0);
    EXPECT_EQ(vconf_unset("db/a/b"), 0);
    EXPECT_EQ(vconf_get_type("db/a/b"), VCONF_TYPE_NONE);
    for (const char* key :
         {"", "db", "db/", "/db/a", "other/a", "db/../a", "db//a", "db/a b", "db/.hidden", "db/a/"}) {
        EXPECT_EQ(vconf_set_int(key, 1), PLATFORM_ERROR_INVALID_PARAMETER) << key;
    }
}

TEST(Settings, MemoryEndsWithTheBootAndDamageCountsAsUnset) {
    const TestRoot root;
    ASSERT_EQ(vconf_set_int("memory/x", 1), 0);
    ASSERT_EQ(vconf_set_int("db/x", 1), 0);
    std::ofstream(settingsFile(root, "memory/x")) << VCONF_TYPE_INT << " another-boot\n1";
    int value = 0;
    EXPECT_EQ(vconf_get_int("memory/x", &value), PLATFORM_ERROR_NOT_FOUND);
    for (const char* content : {"", "41", "41 -\n", "41 -\n12x", "99 -\n1", "x -\n1"}) {
        std::ofstream(settingsFile(root, "db/x")) << content;
        EXPECT_EQ(vconf_get_int("db/x", &value), PLATFORM_ERROR_NOT_FOUND) << content;
    }
}

TEST(Settings, WatchesTellEveryProcessAndNeverFromInsideTheCall) {
    const TestRoot root;
    std::vector<int> seen;
    ASSERT_EQ(vconf_notify_key_changed("db/w/x", remember, &seen), 0);
    EXPECT_NE(vconf_notify_key_changed("db/w/x", remember, &seen), 0) << "once";
    ASSERT_EQ(vconf_set_int("db/w/x", 1), 0);
    EXPECT_TRUE(seen.empty());
    ASSERT_TRUE(iterateUntil([&] { return seen.size() == 1; }));
    EXPECT_EQ(
        statusOf(inOtherProcess([] { return vconf_set_int("db/w/x", 2) + vconf_set_int("db/w/other", 9); })),
        0);
    ASSERT_TRUE(iterateUntil([&] { return seen.size() == 2; }));
    ASSERT_EQ(vconf_unset("db/w/x"), 0);
    ASSERT_TRUE(iterateUntil([&] { return seen.size() == 3; }));
    EXPECT_THAT(seen, testing::ElementsAre(1, 2, 0));
    EXPECT_EQ(vconf_ignore_key_changed("db/w/x", remember), 0);
    EXPECT_EQ(vconf_ignore_key_changed("db/w/x", remember), PLATFORM_ERROR_NOT_FOUND);
}

TEST(Settings, AReaderSeesOldOrNewWhateverHappensToTheWriter) {
    const TestRoot root;
    const std::string large(20'000, 'l');
    ASSERT_EQ(vconf_set_str("db/x", ""), 0);
    for (int round = 0; round < 10; ++round) {
        const pid_t writer = inOtherProcess([&] {
            for (;;) {
                if (vconf_set_str("db/x", large.c_str()) != 0 || vconf_set_str("db/x", "") != 0) return 1;
            }
        });
        for (int look = 0; look < 50; ++look) {
            std::string text = "?";
            ASSERT_EQ(vconf_get_str("db/x", &text), 0);
            ASSERT_TRUE(text.empty() || text == large);
        }
        kill(writer, SIGKILL);
        EXPECT_EQ(statusOf(writer), 128 + SIGKILL);
    }
}

TEST(Keys, ArePrivate) {
    const TestRoot root;
    char* value = nullptr;
    EXPECT_EQ(key_storage_get("a.b", &value), PLATFORM_ERROR_NOT_FOUND);
    ASSERT_EQ(key_storage_set("a.b", "secret&="), 0);
    ASSERT_EQ(key_storage_get("a.b", &value), 0);
    EXPECT_STREQ(value, "secret&=");
    free(value);
    const auto file = root.at("/opt/usr/data/key-storage/a.b");
    struct stat info {};
    ASSERT_EQ(stat(file.c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0600U);
    ASSERT_EQ(chmod(file.c_str(), 0640), 0);
    EXPECT_EQ(key_storage_get("a.b", &value), PLATFORM_ERROR_PERMISSION_DENIED);
    std::filesystem::create_symlink(file, root.at("/opt/usr/data/key-storage/link"));
    EXPECT_EQ(key_storage_get("link", &value), PLATFORM_ERROR_PERMISSION_DENIED);
    for (const char* name : {"", ".", "../x", "a/b", ".x"}) EXPECT_NE(key_storage_set(name, "x"), 0) << name;
    EXPECT_NE(key_storage_set("a", ""), 0);
}

TEST(Log, TextFromOutsideForgesNoLine) {
    struct Line {
        std::string text;
        int count = 0;
    } line;
    dlog_set_sink(
        [](log_priority, const char*, const char* message, void* data) {
            static_cast<Line*>(data)->text = message;
            ++static_cast<Line*>(data)->count;
        },
        &line);
    dlog_print(DLOG_ERROR, "T", "%s", "a\nforged\r\x1b[2Jb\x1b[31mred\x1b[0m");
    EXPECT_EQ(line.text, "a forged  [2Jb\x1b[31mred\x1b[0m");
    dlog_print(DLOG_ERROR, "T", "%s", std::string(10'000, 'x').c_str());
    EXPECT_LT(line.text.size(), 4096U);
    EXPECT_EQ(dlog_print(DLOG_DEBUG, "T", "hidden"), 0);
    EXPECT_EQ(line.count, 2);
    dlog_set_sink(nullptr, nullptr);
}

TEST(Log, TheJournalsSeveritiesHaveALetterEach) {
    std::string letters;
    for (int severity = 0; severity < 8; ++severity) letters += dlog_letter_of_syslog(severity);
    EXPECT_EQ(letters, "EEEEWIID");
}

TEST(Database, OnlyDatabasesAreOpened) {
    const TestRoot root;
    const std::string file = root.at("/tmp/x.db").string();
    std::ofstream(file) << std::string(4096, 'x');
    sqlite3* handle = nullptr;
    EXPECT_EQ(db_util_open(file.c_str(), &handle, 0), SQLITE_NOTADB);
    EXPECT_EQ(handle, nullptr);
    std::filesystem::remove(file);
    std::filesystem::create_symlink(root.at("/tmp/y.db"), file);
    EXPECT_NE(db_util_open(file.c_str(), &handle, 0), SQLITE_OK) << "a link is not followed";
    ASSERT_EQ(db_util_open(root.at("/tmp/z.db").c_str(), &handle, 0), SQLITE_OK);
    ASSERT_EQ(sqlite3_exec(handle, "CREATE TABLE t(x)", nullptr, nullptr, nullptr), SQLITE_OK);
    EXPECT_TRUE(std::filesystem::exists(root.at("/tmp/z.db-journal"))) << "the journal stays";
    const auto run = [&handle](const char* sql) {
        return sqlite3_exec(handle, sql, nullptr, nullptr, nullptr);
    };
    EXPECT_EQ(run("BEGIN; INSERT INTO t VALUES(1)"), SQLITE_OK);
    db_util_release_memory();
    EXPECT_EQ(run("COMMIT; INSERT INTO t SELECT x FROM t"), SQLITE_OK) << "an open transaction is not lost";
    EXPECT_EQ(sqlite3_changes(handle), 1);
    EXPECT_EQ(db_util_close(handle), SQLITE_OK);
    db_util_release_memory();  // of none that was closed
    EXPECT_EQ(db_util_close(nullptr), SQLITE_OK);
}

namespace {

// What a connection without the project's settings says of the file.
std::string askStore(const std::string& file, const char* sql) {
    sqlite3* handle = nullptr;
    std::string answer;
    EXPECT_EQ(sqlite3_open(file.c_str(), &handle), SQLITE_OK);
    const auto note = [](void* out, int, char** values, char**) {
        static_cast<std::string*>(out)->append(values[0] != nullptr ? values[0] : "NULL").append(";");
        return 0;
    };
    EXPECT_EQ(sqlite3_exec(handle, sql, note, &answer, nullptr), SQLITE_OK) << sql;
    sqlite3_close(handle);
    return answer;
}

std::string bytesOf(const std::string& file) {
    std::ifstream stream(file, std::ios::binary);
    return {std::istreambuf_iterator<char>(stream), std::istreambuf_iterator<char>()};
}

}  // namespace

TEST(Database, OlderStoresAreBroughtUpAndNewerOnesLeftAlone) {
    const TestRoot root;
    const char* const upgrades[] = {"ALTER TABLE t ADD COLUMN b DEFAULT 'new'", "UPDATE t SET a = a || '!'"};
    const char* const broken[] = {upgrades[0], "UPDATE t SET a = ''; UPDATE missing SET a = 1"};
    const char* const tables = "CREATE TABLE t(a, b DEFAULT 'new')";
    constexpr const char* kFirst = "CREATE TABLE t(a); INSERT INTO t VALUES('kept');";
    struct Row {
        const char* name;
        std::string before;
        std::span<const char* const> upgrades;
        int opened;
        int applied;
        int version;
        const char* question;
        const char* answer;
    };
    for (const Row& row : {
             Row{"none", "", upgrades, 0, 0, 3, "SELECT count(*) FROM pragma_table_info('t')", "2;"},
             Row{"unnumbered", kFirst, upgrades, 0, 0, 3, "SELECT a || b FROM t", "kept!new;"},
             Row{"first", std::string(kFirst) + "PRAGMA user_version=1", upgrades, 0, 0, 3,
                 "SELECT a || b FROM t", "kept!new;"},
             Row{"second", std::string(kFirst) + "ALTER TABLE t ADD b DEFAULT 'x'; PRAGMA user_version=2",
                 upgrades, 0, 0, 3, "SELECT a || b FROM t", "kept!x;"},
             Row{"unfinished", "PRAGMA user_version=1", upgrades, 0, 0, 3,
                 "SELECT count(*) FROM pragma_table_info('t')", "2;"},
             Row{"upgrade fails", kFirst, broken, 0, SQLITE_ERROR, 0, "SELECT * FROM t", "kept;"},
             Row{"newer", std::string(kFirst) + "PRAGMA user_version=4; PRAGMA journal_mode=DELETE", upgrades,
                 kDatabaseIsNewer, 0, 4, "SELECT * FROM t", "kept;"},
             Row{"newer, in a mode of its own",
                 std::string(kFirst) + "PRAGMA user_version=4; PRAGMA journal_mode=WAL", upgrades,
                 kDatabaseIsNewer, 0, 4, "PRAGMA journal_mode", "wal;"},
         }) {
        SCOPED_TRACE(row.name);
        const std::string file = root.at(std::string("/tmp/") + row.name).string();
        if (!row.before.empty()) askStore(file, row.before.c_str());
        const std::string before = bytesOf(file);
        const db_schema_s schema{tables, row.upgrades};
        sqlite3* handle = nullptr;
        ASSERT_EQ(db_util_open(file.c_str(), &handle, schema.version()), row.opened);
        if (row.opened == SQLITE_OK) {
            EXPECT_EQ(db_util_apply_schema(handle, schema), row.applied);
            EXPECT_EQ(db_util_apply_schema(handle, schema), row.applied) << "again";
        } else {
            EXPECT_EQ(bytesOf(file), before);
            EXPECT_TRUE(db_util_met_newer());
        }
        db_util_close(handle);
        EXPECT_EQ(askStore(file, "PRAGMA user_version"), std::to_string(row.version) + ";");
        EXPECT_EQ(askStore(file, row.question), row.answer);
    }
}

TEST(Memory, IsKeptFromOthers) {
    const auto protect = [] {
        platform::protectMemory();
        exit(prctl(PR_GET_DUMPABLE, 0, 0, 0, 0));
    };
    EXPECT_EXIT(protect(), testing::ExitedWithCode(0), "");
    const auto protectTraced = [&protect] {
        if (fork() == 0) {
            ptrace(PTRACE_TRACEME, 0, nullptr, nullptr);
            protect();
        }
        int status = 0;
        wait(&status);
        exit(WEXITSTATUS(status));
    };
    EXPECT_EXIT(protectTraced(), testing::ExitedWithCode(1), "") << "a debugger that started it may look";
}

TEST(Device, StorageAndNetwork) {
    const TestRoot root;
    struct statvfs info {};
    ASSERT_EQ(storage_get_internal_memory_size(&info), 0);
    EXPECT_LE(uint64_t{info.f_bsize} * info.f_bavail, UINT32_MAX);
    const std::string routes = root.at("/tmp/route").string();
    const std::string head = "Iface\tDestination\tGateway\tFlags\tRefCnt\tUse\tMetric\tMask\n";
    const std::string nowhere(32, '0');
    const std::string any = nowhere + " 00 " + nowhere + " 00 fe800000000000000000000000000001 ";
    const std::string lines6 = "fe80" + std::string(28, '0') + " 40 " + nowhere + " 00 " + nowhere +
                               " 00000001 00000001 00000000 00000001 eth1\n" + any +
                               "00000400 00000001 00000000 00000003 eth1\n" + any +
                               "00000064 00000001 00000000 00000003 wwan0\n" + any +
                               "00000001 00000001 00000000 00200200 lo\n";
    struct Row {
        std::string lines;
        std::string lines6;
        const char* interface;
    };
    for (const Row& row :
         {Row{"", "", ""}, Row{"eth0\t0000FEA9\t0\t1\t0\t0\t0\t0000FFFF\n", "", ""},
          Row{"broken\n", "broken\n", ""}, Row{"*\t00000000\t0\t0201\t0\t0\t0\t00000000\n", lines6, "wwan0"},
          Row{"eth0\t00000000\t0\t3\t0\t0\t200\t00000000\nwlan0\t00000000\t0\t3\t0\t0\t100\t00000000\n",
              lines6, "wlan0"}}) {
        std::ofstream(routes) << head << row.lines;
        std::ofstream(routes + "6") << row.lines6;
        EXPECT_EQ(platform::device::defaultInterface(routes, routes + "6"), row.interface);
    }
    const std::string net = root.at("/tmp/net").string();
    std::filesystem::create_directories(net + "/wlan0/wireless");
    std::filesystem::create_directories(net + "/modem0");
    std::ofstream(net + "/modem0/uevent") << "INTERFACE=modem0\nDEVTYPE=wwan\n";
    using platform::device::interfaceType;
    EXPECT_EQ(interfaceType(net, "wlan0"), CONNECTION_TYPE_WIFI);
    EXPECT_EQ(interfaceType(net, "modem0"), CONNECTION_TYPE_CELLULAR);
    EXPECT_EQ(interfaceType(net, "eth0"), CONNECTION_TYPE_ETHERNET);
    EXPECT_EQ(interfaceType(net, ""), CONNECTION_TYPE_DISCONNECTED);
}
