#include "cli/ToolRoot.h"

#include <gtest/gtest.h>

#include "platform/contacts.h"

namespace {
const std::string kTool = std::string(VPS_BIN_DIR) + "/vantor-pim-syncctl";
}

ToolRoot::ToolRoot() {
    EXPECT_EQ(run({"init"}).status, 0);
}

CommandResult ToolRoot::run(const std::vector<std::string>& arguments, const std::string& input) {
    std::vector<std::string> command = {kTool};
    command.insert(command.end(), arguments.begin(), arguments.end());
    return runCommand(command, {}, input);
}

Json ToolRoot::json(const std::vector<std::string>& arguments, const std::string& input) {
    const CommandResult result = run(arguments, input);
    EXPECT_EQ(result.status, 0) << result.error;
    Json value = Json::parse(result.output, nullptr, /*allow_exceptions=*/false);
    EXPECT_FALSE(value.is_discarded()) << result.output;
    return value;
}

int ToolRoot::addEvent(int calendar, const std::string& object) {
    const CommandResult result = run({"event", "add", "-", "--calendar", std::to_string(calendar)}, object);
    EXPECT_EQ(result.status, 0) << result.error;
    return result.status == 0 ? std::stoi(result.output) : 0;
}

int ToolRoot::addCalendar(int account, const char* name, bool isReadOnly, int storeType) {
    EXPECT_EQ(calendar_connect_with_flags(0), 0);
    calendar_record_h raw = nullptr;
    EXPECT_EQ(calendar_record_create(_calendar_book, &raw), 0);
    const CalendarRecord book(raw);
    EXPECT_EQ(calendar_record_set_int(raw, CALENDAR_BOOK_ACCOUNT_ID, account), 0);
    EXPECT_EQ(calendar_record_set_int(raw, CALENDAR_BOOK_STORE_TYPE, storeType), 0);
    EXPECT_EQ(calendar_record_set_str(raw, CALENDAR_BOOK_NAME, name), 0);
    EXPECT_EQ(calendar_record_set_str(raw, CALENDAR_BOOK_COLOR, "10.20.30.255"), 0);
    EXPECT_EQ(calendar_record_set_int(raw, CALENDAR_BOOK_MODE, isReadOnly ? 1 : 0), 0);
    int id = 0;
    EXPECT_EQ(calendar_db_insert_record(raw, &id), 0);
    calendar_disconnect();
    return id;
}

int ToolRoot::addAddressBook(int account) {
    EXPECT_EQ(contacts_connect_with_flags(0), 0);
    contacts_record_h raw = nullptr;
    EXPECT_EQ(contacts_record_create(_contacts_address_book, &raw), 0);
    const ContactsRecord book(raw);
    EXPECT_EQ(contacts_record_set_int(raw, CONTACTS_ADDRESS_BOOK_ACCOUNT_ID, account), 0);
    int id = 0;
    EXPECT_EQ(contacts_db_insert_record(raw, &id), 0);
    contacts_disconnect();
    return id;
}

int ToolRoot::addSystemGroup(int book, const char* name) {
    EXPECT_EQ(contacts_connect_with_flags(0), 0);
    contacts_record_h raw = nullptr;
    EXPECT_EQ(contacts_record_create(_contacts_group, &raw), 0);
    const ContactsRecord group(raw);
    EXPECT_EQ(contacts_record_set_int(raw, CONTACTS_GROUP_ADDRESS_BOOK_ID, book), 0);
    EXPECT_EQ(contacts_record_set_str(raw, CONTACTS_GROUP_NAME, name), 0);
    EXPECT_EQ(contacts_record_set_str(raw, CONTACTS_GROUP_SYSTEM_ID, name), 0);
    EXPECT_EQ(contacts_record_set_int(raw, CONTACTS_GROUP_IS_READ_ONLY, 1), 0);
    int id = 0;
    EXPECT_EQ(contacts_db_insert_record(raw, &id), 0);
    contacts_disconnect();
    return id;
}
