// Device: one private root, driven only through the command-line tool, as a person or a script would.
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "e2e/Process.h"
#include "support/TestRoot.h"

using Json = nlohmann::json;

class Device {
public:
    Device();
    ~Device();  // stops the daemon
    Device(const Device&) = delete;
    Device& operator=(const Device&) = delete;

    [[nodiscard]] const TestRoot& root() const { return mRoot; }

    CommandResult tool(std::vector<std::string> arguments, const std::string& input = "",
                       int timeoutMs = 60'000);
    // Runs a command that must succeed and gives its JSON; a failure fails the test.
    Json json(std::vector<std::string> arguments, const std::string& input = "");

    // The provider's client credentials, then an account that was told its refresh token.
    void setClient(const std::string& id, const std::string& secret);
    CommandResult addAccount(int id, const std::string& email, const std::string& server,
                             const std::string& refreshToken, const std::vector<std::string>& more = {});
    CommandResult sync(int account, const std::string& kind = "calendar") {
        return tool({"sync", std::to_string(account), kind, "--wait"});
    }

    [[nodiscard]] pid_t daemonPid();
    // All log lines of the daemon so far.
    [[nodiscard]] std::string daemonLog() const;

private:
    TestRoot mRoot;
};
