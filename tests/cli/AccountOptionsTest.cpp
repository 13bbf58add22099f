// What the options of account add and update make of the record that the daemon gets.
#include <gtest/gtest.h>

#include "AccountOptions.h"
#include "Failure.h"

namespace {

// Parsed as the tool does it.
AccountOptions parse(std::vector<std::string> arguments) {
    AccountOptions options;
    CLI::App app;
    options.declare(app);
    std::reverse(arguments.begin(), arguments.end());
    app.parse(arguments);
    return options;
}

std::string serverOf(const char* server, int port) {
    return server == nullptr ? "-" : std::string(server) + "|" + std::to_string(port);
}

struct ServerRow {
    std::vector<std::string> arguments;
    int formerPort;
    const char* calendar;
    const char* contacts;
    bool ssl;
};

TEST(AccountOptions, AddressesDecideAboutSslAndPorts) {
    const ServerRow rows[] = {
        {{"--server", "pim.example"}, 0, "pim.example|0", "pim.example|0", true},
        {{"--server", "http://pim.example:8080"},
         0,
         "http://pim.example:8080|0",
         "http://pim.example:8080|0",
         false},
        {{"--server", "https://a", "--calendar-server", "http://b"}, 0, "http://b|0", "https://a|0", false},
        // A port that another program stored must not end up behind the new address.
        {{"--calendar-server", "https://b"}, 8080, "https://b|443", "-", true},
        {{"--calendar-server", "http://b"}, 8080, "http://b|80", "-", false},
        {{"--calendar-server", "b:9"}, 8080, "b:9|9", "-", true},
        {{"--roaming"}, 8080, "-", "-", true},
    };
    for (const ServerRow& row : rows) {
        SCOPED_TRACE(testing::PrintToString(row.arguments));
        const AccountRecord record = sync_client::emptyRecord();
        record->ssl = true;
        record->calserverport = row.formerPort;
        const AccountOptions options = parse(row.arguments);
        options.checkTexts();
        options.apply(*record);
        EXPECT_EQ(serverOf(record->calserver, record->calserverport), row.calendar);
        EXPECT_EQ(serverOf(record->ctserver, record->ctserverport), row.contacts);
        EXPECT_EQ(record->ssl, row.ssl);
    }
}

TEST(AccountOptions, WhatIsNotSaidStaysAsItIs) {
    const AccountRecord record = sync_client::emptyRecord();
    record->calsync = true;
    record->calperiod = 30;
    record->roaming = 1;
    EXPECT_TRUE(parse({}).saysNothing());
    parse({"--no-roaming"}).apply(*record);
    EXPECT_TRUE(record->calsync);
    EXPECT_EQ(record->calperiod, 30);
    EXPECT_EQ(record->roaming, 0);
    parse({"--no-calendar", "--calendar-period", "0", "--email", "you@example.com"}).apply(*record);
    EXPECT_FALSE(record->calsync);
    EXPECT_EQ(record->calperiod, 0);
    EXPECT_STREQ(record->email, "you@example.com");
}

TEST(AccountOptions, NonsenseIsMisuse) {
    for (const char* option : {"--no-contacts", "--contacts"}) EXPECT_NO_THROW(parse({option}).checkTexts());
    EXPECT_THROW(parse({"--email", "me"}).checkTexts(), Misuse);
    EXPECT_THROW(parse({"--email", "me @example.com"}).checkTexts(), Misuse);
    EXPECT_THROW(parse({"--server", "file:///etc"}).checkTexts(), Misuse);
    EXPECT_THROW(parse({"--contacts-server", "file:///etc"}).checkTexts(), Misuse);
}

}  // namespace
