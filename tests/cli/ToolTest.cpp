// The built tool: exit statuses, what it prints where, init, settings, keys.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <fstream>
#include <iterator>

#include "Commands.h"
#include "cli/ToolRoot.h"
#include "platform/settings.h"

namespace {

using testing::HasSubstr;

struct StatusRow {
    std::vector<std::string> arguments;
    int status;
};

TEST(Tool, TellsMisuseFromFailureAndSaysWhyInOneLine) {
    ToolRoot tool;
    const StatusRow rows[] = {
        {{}, 2},
        {{"dance"}, 2},
        {{"contacts", "show"}, 2},
        {{"todo", "show", "0"}, 2},
        {{"todo", "show", "1"}, 1},
        {{"event"}, 2},
        {{"event", "show"}, 2},
        {{"event", "show", "x"}, 2},
        {{"event", "show", "0"}, 2},
        {{"event", "show", "0x1"}, 2},
        {{"event", "show", "99999999999"}, 2},
        {{"event", "show", "1"}, 1},
        {{"event", "show", "1", "2"}, 2},
        {{"event", "show", "1", "--yaml"}, 2},
        {{"event", "add", "/nowhere.json"}, 1},
        {{"event", "add", "/"}, 1},
        {{"event", "delete", "1"}, 1},
        {{"event", "set", "1", "uid=x"}, 2},
        {{"event", "set", "1", "summary"}, 2},
        {{"event", "set", "1", "busy=true", "busy=false"}, 2},
        {{"event", "set", "1", "summary=x"}, 1},
        {{"events", "list", "--calendar", "7"}, 1},
        {{"events", "list", "--calendar", "seven"}, 2},
        {{"calendars", "list", "--account", "-1"}, 2},
        {{"setting", "get", "db/none"}, 1},
        {{"setting", "get", "db/../x"}, 2},
        {{"setting", "set", "db/x"}, 2},
        {{"setting", "set", "db/x", "1", "2"}, 2},
        {{"setting", "set", "db/x", "99999999999"}, 1},
        {{"key", "set", "../x"}, 2},
        {{"account", "show", "7"}, 1},
        {{"account", "remove", "7"}, 1},
        {{"account", "update", "7"}, 2},
        {{"account", "update", "7", "--roaming"}, 1},
        {{"account", "add", "--id", "7", "--email", "a@b"}, 2},
        {{"account", "add", "--id", "7", "--email", "me", "--server", "pim.example"}, 2},
        {{"account", "add", "--id", "7", "--email", "a@b", "--server", "ftp://x"}, 2},
        {{"account", "add", "--id", "7", "--email", "a@b", "--server", "x", "--contacts-server", "ftp://y"},
         2},
        {{"account", "add", "--id", "7", "--email", "a@b", "--server", "x", "--calendar-period", "-1"}, 2},
        {{"sync", "7", "mail"}, 2},
        {{"sync", "7"}, 1},
        {{"stop", "7"}, 1},
        {{"status", "7"}, 1},
        {{"daemon", "status"}, 1},
    };
    for (const StatusRow& row : rows) {
        SCOPED_TRACE(testing::PrintToString(row.arguments));
        const CommandResult result = tool.run(row.arguments, "value");
        EXPECT_EQ(result.status, row.status) << result.error;
        EXPECT_EQ(std::count(result.error.begin(), result.error.end(), '\n'), 1) << result.error;
        EXPECT_EQ(result.output, "");
    }
}

TEST(Tool, EveryCommandHasHelpWithExamples) {
    ToolRoot tool;
    for (const Command& command : allCommands()) {
        std::vector<std::string> arguments = {command.noun};
        if (command.verb != nullptr) arguments.emplace_back(command.verb);
        arguments.emplace_back("--help");
        const CommandResult result = tool.run(arguments);
        EXPECT_EQ(result.status, 0) << command.noun;
        EXPECT_THAT(result.output, HasSubstr("Examples:\n  vantor-pim-syncctl " + arguments[0]))
            << command.noun;
    }
}

TEST(Tool, InitMakesWhatIsMissingAndLeavesTheRest) {
    ToolRoot tool;
    std::filesystem::remove_all(tool.root().path());
    struct ModeRow {
        const char* path;
        mode_t mode;
    };
    const ModeRow rows[] = {
        {"/tmp", 01777},
        {"/opt/usr/dbspace", 0770},
        {"/opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted", 0700},
        {"/opt/usr/data/vantor-pim-sync/.notificationPathCalendar", 0644},
        {"/opt/usr/data/vantor-pim-sync/.notificationPathContacts", 0644},
    };
    ASSERT_EQ(tool.run({"init"}).status, 0);
    const int calendar = ToolRoot::addCalendar(1, "Work");
    std::filesystem::permissions(tool.root().at("/opt/usr/dbspace"), std::filesystem::perms::owner_all);
    ASSERT_EQ(tool.run({"init"}).status, 0);
    for (const ModeRow& row : rows) {
        struct stat info {};
        ASSERT_EQ(stat(tool.root().at(row.path).c_str(), &info), 0) << row.path;
        const bool wasChangedByTheUser = std::string(row.path) == "/opt/usr/dbspace";
        EXPECT_EQ(info.st_mode & 07777, wasChangedByTheUser ? 0700 : row.mode) << row.path;
    }
    EXPECT_EQ(tool.json({"calendars", "list", "--json"})[0]["id"], calendar);
}

TEST(Tool, ASettingHasTheTypeOfItsText) {
    ToolRoot tool;
    struct SettingRow {
        const char* text;
        vconf_type_e type;
        const char* json;
    };
    const SettingRow rows[] = {
        {"5", VCONF_TYPE_INT, "5"},
        {"-5", VCONF_TYPE_INT, "-5"},
        {"true", VCONF_TYPE_BOOL, "true"},
        {"false", VCONF_TYPE_BOOL, "false"},
        {"5 ", VCONF_TYPE_STRING, "\"5 \""},
        {"", VCONF_TYPE_STRING, "\"\""},
        {"True", VCONF_TYPE_STRING, "\"True\""},
        {"-", VCONF_TYPE_STRING, "\"-\""},
    };
    for (const SettingRow& row : rows) {
        SCOPED_TRACE(row.text);
        const CommandResult result = tool.run({"setting", "set", "db/test/x", row.text});
        ASSERT_EQ(result.status, 0) << result.error;
        EXPECT_EQ(vconf_get_type("db/test/x"), row.type);
        EXPECT_EQ(tool.json({"setting", "get", "db/test/x", "--json"})["value"].dump(), row.json);
    }
}

TEST(Tool, AKeyIsStoredAndNeverPrinted) {
    ToolRoot tool;
    const CommandResult result = tool.run({"key", "set", "client_id"}, "s3cret value\r\n");
    EXPECT_EQ(result.status, 0) << result.error;
    EXPECT_EQ(result.output + result.error, "");
    for (const char* empty : {"", "\n", "\r\n"})
        EXPECT_EQ(tool.run({"key", "set", "client_id"}, empty).status, 1);
    EXPECT_EQ(tool.run({"key", "set", "client_id"}, std::string("a\0b", 3)).status, 1);
    bool isFound = false;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(tool.root().path())) {
        if (!entry.is_regular_file()) continue;
        std::ifstream file(entry.path());
        const std::string text((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
        if (text.find("s3cret value") == std::string::npos) continue;
        isFound = true;
        EXPECT_EQ(text.find('\n'), std::string::npos);
        EXPECT_EQ(entry.status().permissions() & std::filesystem::perms(0077), std::filesystem::perms::none);
    }
    EXPECT_TRUE(isFound);
}

TEST(Tool, AFullStandardOutputIsAFailure) {
    ToolRoot tool;
    const std::string binary = std::string(VPS_BIN_DIR) + "/vantor-pim-syncctl";
    EXPECT_EQ(runCommand({"/bin/sh", "-c", binary + " calendars list --json > /dev/full"}, {}).status, 1);
}

}  // namespace
