#include "e2e/Device.h"

#include <gtest/gtest.h>

#include <fstream>
#include <sstream>

namespace {

const std::string kTool = std::string(VPS_BIN_DIR) + "/vantor-pim-syncctl";

}  // namespace

Device::Device() {
    EXPECT_EQ(tool({"init"}).status, 0);
}

Device::~Device() {
    tool({"daemon", "stop"});
}

CommandResult Device::tool(std::vector<std::string> arguments, const std::string& input, int timeoutMs) {
    arguments.insert(arguments.begin(), kTool);
    return runCommand(arguments, {{"VANTOR_PIM_SYNC_ROOT", mRoot.path().string()}}, input, timeoutMs);
}

Json Device::json(std::vector<std::string> arguments, const std::string& input) {
    arguments.emplace_back("--json");
    const CommandResult result = tool(arguments, input);
    EXPECT_EQ(result.status, 0) << result.error;
    const Json parsed = Json::parse(result.output, nullptr, /*allow_exceptions=*/false);
    EXPECT_FALSE(parsed.is_discarded()) << result.output.substr(0, 500);
    return parsed;
}

void Device::setClient(const std::string& id, const std::string& secret) {
    EXPECT_EQ(tool({"key", "set", "vantor.tovik.client.id"}, id).status, 0);
    EXPECT_EQ(tool({"key", "set", "vantor.tovik.client.secret"}, secret).status, 0);
}

CommandResult Device::addAccount(int id, const std::string& email, const std::string& server,
                                 const std::string& refreshToken, const std::vector<std::string>& more) {
    std::vector<std::string> arguments = {"account", "add",      "--id", std::to_string(id),     "--email",
                                          email,     "--server", server, "--refresh-token-file", "-"};
    arguments.insert(arguments.end(), more.begin(), more.end());
    return tool(arguments, refreshToken);
}

pid_t Device::daemonPid() {
    const Json status = json({"daemon", "status"});
    return status.value("pid", 0);
}

std::string Device::daemonLog() const {
    std::ifstream file(mRoot.at("/opt/usr/data/vantor-pim-sync/daemon.log"));
    std::stringstream text;
    text << file.rdbuf();
    return text.str();
}
