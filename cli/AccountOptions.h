// AccountOptions.h: the options that account add and account update share.
#pragma once

#include <CLI/CLI.hpp>
#include <optional>
#include <string>

#include "SyncClient.h"

struct AccountOptions {
    int id = 0;
    std::string email;
    std::string server;
    std::string calendarServer;
    std::string contactsServer;
    std::optional<bool> calendar;  // nothing: not said
    std::optional<bool> contacts;
    std::optional<bool> roaming;
    int calendarPeriod = -1;  // minutes; -1: not said
    int contactsPeriod = -1;
    std::string tokenFile;

    void declare(CLI::App& app);
    // What does not need the device: a Misuse for text that is no e-mail address or server, a Failure for what is not
    // available yet.
    void checkTexts() const;
    [[nodiscard]] bool saysNothing() const;
    // Writes what was said into the record.
    void apply(vantor_pim_sync_account_s& record) const;

private:
    [[nodiscard]] std::string calendarText() const {
        return calendarServer.empty() ? server : calendarServer;
    }
    [[nodiscard]] std::string contactsText() const {
        return contactsServer.empty() ? server : contactsServer;
    }
};
