// The built tool and accounts: a step that fails takes the earlier ones back; what can be told while the daemon is down.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/stat.h>

#include <fstream>
#include <iterator>

#include "AccountService.h"
#include "TokenFile.h"
#include "cli/ToolRoot.h"
#include "platform/account.h"

namespace {

using testing::HasSubstr;
using testing::Not;

// A copy of the tool that has another daemon beside it: a shell script, or none.
class LonelyTool {
public:
    LonelyTool(const TestRoot& root, const char* daemonScript) : mFolder(root.path() / "bin") {
        std::filesystem::create_directory(mFolder);
        std::filesystem::copy_file(std::string(VPS_BIN_DIR) + "/vantor-pim-syncctl",
                                   mFolder / "vantor-pim-syncctl");
        if (daemonScript == nullptr) return;
        const std::filesystem::path daemon = mFolder / "vantor-pim-sync";
        std::ofstream(daemon) << "#!/bin/sh\n" << daemonScript << "\n";
        std::filesystem::permissions(daemon, std::filesystem::perms::owner_all);
    }
    ~LonelyTool() { std::filesystem::remove_all(mFolder); }
    LonelyTool(const LonelyTool&) = delete;
    LonelyTool& operator=(const LonelyTool&) = delete;

    CommandResult addAccount(const std::string& token) const {
        return runCommand({mFolder / "vantor-pim-syncctl", "account", "add", "--id", "7", "--email",
                           "me@example.com", "--server", "http://127.0.0.1:9", "--refresh-token-file", "-"},
                          {{"PATH", "/usr/bin:/bin"}}, token);
    }

private:
    std::filesystem::path mFolder;
};

struct RollbackRow {
    const char* name;
    const char* daemonScript;
    const char* formerToken;  // NULL: the account was not there before
    const char* reason;
};

TEST(AccountTool, AnAddThatFailsLeavesWhatWasThereBefore) {
    const RollbackRow rows[] = {
        {"no daemon, new account", nullptr, nullptr, "neither beside"},
        {"no daemon, known account", nullptr, "former", "neither beside"},
        {"daemon ends, new account", "exit 3", nullptr, "exit status 3"},
        {"daemon ends, known account", "kill -9 $$", "former", "signal 9"},
        {"daemon ends well", "", nullptr, "ended at its start"},
    };
    for (const RollbackRow& row : rows) {
        SCOPED_TRACE(row.name);
        ToolRoot tool;
        if (row.formerToken != nullptr) {
            token_file::write(7, row.formerToken);
            account_service::insert(7, "former@example.com");
        }
        const LonelyTool lonely(tool.root(), row.daemonScript);
        const CommandResult result = lonely.addAccount("s3cret\n");
        EXPECT_EQ(result.status, 1);
        EXPECT_THAT(result.error, HasSubstr(row.reason));
        EXPECT_THAT(result.output + result.error, Not(HasSubstr("s3cret")));
        EXPECT_EQ(token_file::read(7),
                  row.formerToken == nullptr ? std::nullopt : std::optional<std::string>("former"));
        EXPECT_EQ(account_service::accounts().size(), row.formerToken == nullptr ? 0U : 1U);
    }
}

TEST(AccountTool, ATokenIsOneWordInAPlainFile) {
    ToolRoot tool;
    const LonelyTool lonely(tool.root(), "exit 3");
    for (const char* bad : {"", "\n", "two words", "two\nlines\n"}) {
        const CommandResult result = lonely.addAccount(bad);
        EXPECT_THAT(result.error, HasSubstr("refresh token")) << bad;
        EXPECT_EQ(result.status, 1) << bad;
        EXPECT_EQ(token_file::read(7), std::nullopt);
    }
    // A link that somebody put there is neither read nor written through.
    const std::filesystem::path victim = tool.root().path() / "victim";
    std::ofstream(victim) << "before";
    const auto tokenFile =
        tool.root().at("/opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted/7_file");
    std::filesystem::create_symlink(victim, tokenFile);
    EXPECT_EQ(lonely.addAccount("token").status, 1);
    std::ifstream file(victim);
    EXPECT_EQ(std::string((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>()),
              "before");
    std::filesystem::remove(tokenFile);
    ASSERT_EQ(mkfifo(tokenFile.c_str(), 0600), 0);
    EXPECT_EQ(lonely.addAccount("token").status, 1) << "nor is a FIFO waited for";
}

TEST(AccountTool, RemoveCleansAnAccountThatOnlyTheServiceKnows) {
    ToolRoot tool;
    token_file::write(7, "token");
    account_service::insert(7, "me@example.com");
    EXPECT_EQ(tool.json({"account", "show", "7", "--json"})["configured"], false);
    EXPECT_EQ(tool.run({"account", "remove", "7"}).status, 0);
    EXPECT_EQ(token_file::read(7), std::nullopt);
    EXPECT_EQ(tool.run({"account", "list", "--json"}).output, "[]\n");
    EXPECT_EQ(tool.run({"account", "remove", "7"}).status, 1);
}

void execute(const std::filesystem::path& path, const std::string& sql) {
    sqlite3* database = nullptr;
    ASSERT_EQ(sqlite3_open(path.c_str(), &database), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(database, sql.c_str(), nullptr, nullptr, nullptr), SQLITE_OK)
        << sqlite3_errmsg(database);
    sqlite3_close(database);
}

// What the daemon's stores say about account 7 and one calendar whose changes were looked at up to `version`.
void writeStores(const TestRoot& root, int calendar, int version, const std::string& rows) {
    execute(
        root.at("/opt/usr/dbspace/.vantor_pim_sync_account.db"),
        "CREATE TABLE account_table(account_id INTEGER PRIMARY KEY, email TEXT, ssl INTEGER, calsync INTEGER,"
        " calserver TEXT, calserverport INTEGER, calperiod INTEGER DEFAULT 0, ctsync INTEGER, ctserver TEXT,"
        " ctserverport INTEGER, ctperiod INTEGER DEFAULT 0, roaming INTEGER DEFAULT 0,"
        " calsyncedtime INTEGER DEFAULT 0, ctsyncedtime INTEGER DEFAULT 0);"
        "INSERT INTO account_table VALUES(7,'me@example.com',1,1,'https://x',0,30,0,'',0,0,0,1398938400,0);");
    execute(
        root.at("/opt/usr/dbspace/.vantor_pim_sync_calendar.db"),
        "CREATE TABLE calendarbooksync_table(id INTEGER PRIMARY KEY AUTOINCREMENT, calendar_id INTEGER "
        "UNIQUE,"
        " account_id INTEGER, sync_version INTEGER, dirty INTEGER, deleted INTEGER, uri TEXT, etag TEXT );"
        "CREATE TABLE eventsync_table(id INTEGER PRIMARY KEY AUTOINCREMENT, event_id INTEGER, calendar_id "
        "INTEGER,"
        " version INTEGER, dirty INTEGER, deleted INTEGER, original_event_id INTEGER, exception_type INTEGER,"
        " sequence INTEGER, recurrence_id TEXT, uri TEXT, etag TEXT );"
        "INSERT INTO calendarbooksync_table(calendar_id, account_id, sync_version, dirty, deleted, uri, etag)"
        " VALUES(" +
            std::to_string(calendar) + ",7," + std::to_string(version) + ",0,0,'u','e');" + rows);
}

std::string row(int event, int calendar, int version, int dirty, int deleted) {
    const auto text = [](int value) { return std::to_string(value); };
    return "INSERT INTO eventsync_table(event_id, calendar_id, version, dirty, deleted, original_event_id) "
           "VALUES(" +
           text(event) + "," + text(calendar) + "," + text(version) + "," + text(dirty) + "," +
           text(deleted) + ",0);";
}

int storeVersion() {
    int version = 0;
    EXPECT_EQ(calendar_connect_with_flags(0), 0);
    EXPECT_EQ(calendar_db_get_current_version(&version), 0);
    calendar_disconnect();
    return version;
}

TEST(AccountTool, PendingCountsComeFromTheStoresWhileTheDaemonIsDown) {
    ToolRoot tool;
    constexpr const char* kEvent = R"({"start": "2014-05-01", "end": "2014-05-02"})";
    const int work = ToolRoot::addCalendar(7, "Work");
    const int synced = tool.addEvent(work, kEvent);
    const int marked = tool.addEvent(work, kEvent);
    const int removed = tool.addEvent(work, kEvent);
    const int lookedAt = storeVersion();
    // After the daemon looked: one edit, one edit of an event that is marked already, one deletion, one new event, and
    // one change that the row says was the engine's own.
    ASSERT_EQ(tool.run({"event", "set", std::to_string(synced), "summary=new"}).status, 0);
    ASSERT_EQ(tool.run({"event", "set", std::to_string(marked), "summary=new"}).status, 0);
    ASSERT_EQ(tool.run({"event", "delete", std::to_string(removed)}).status, 0);
    tool.addEvent(work, kEvent);
    const int own = tool.addEvent(work, kEvent);
    writeStores(tool.root(), work, lookedAt,
                row(synced, work, lookedAt, 0, 0) + row(marked, work, lookedAt, 1, 0) +
                    row(removed, work, lookedAt, 0, 0) + row(4711, work, lookedAt, 0, 1) +
                    row(own, work, storeVersion(), 0, 0));
    const Json status = tool.json({"status", "7", "--json"});
    ASSERT_EQ(status.size(), 2U);
    EXPECT_EQ(status[0].dump(),
              R"({"account":7,"kind":"calendar","state":"none","lastSync":"2014-05-01T10:00:00Z",)"
              R"("pending":{"dirty":3,"deleted":2},"failure":"","nextSync":null})");
    EXPECT_EQ(status[1]["kind"], "contacts");
    EXPECT_TRUE(status[1]["lastSync"].is_null());
}

}  // namespace
