// Daemon: the daemon program on a test's root, ended with the object. Its log is a file in the root.
#pragma once

#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

#include <chrono>
#include <fstream>
#include <functional>
#include <memory>
#include <string>
#include <thread>

#include "common/vantor_pim_sync_ipc_marshal.h"
#include "e2e/Process.h"
#include "platform/account.h"
#include "support/TestRoot.h"

struct DestroyIpc {
    void operator()(pims_ipc_s* ipc) const noexcept { pims_ipc_destroy(ipc); }
    void operator()(pims_ipc_data_s* data) const noexcept { pims_ipc_data_destroy(data); }
};
using Ipc = std::unique_ptr<pims_ipc_s, DestroyIpc>;
using IpcData = std::unique_ptr<pims_ipc_data_s, DestroyIpc>;

// Asks until `done` holds; false after ten seconds. For what another process does.
inline bool eventually(const std::function<bool()>& done) {
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (!done()) {
        if (std::chrono::steady_clock::now() > deadline) return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    return true;
}

class Daemon {
public:
    explicit Daemon(const TestRoot& root) : mLog(root.path() / "daemon.log") { start(); }
    void start() {
        process = std::make_unique<Process>(std::vector<std::string>{VPS_BIN_DIR "/vantor-pim-sync"},
                                            Environment{}, mLog);
    }
    // A connection once the daemon answers; NULL when it has ended.
    [[nodiscard]] Ipc connect() const {
        pims_ipc_h ipc = nullptr;
        (void)eventually(
            [&] { return process->wait(0).has_value() || pims_ipc_create(kServiceSocket, &ipc) == 0; });
        return Ipc(ipc);
    }
    [[nodiscard]] std::string log() const {
        std::ifstream file(mLog);
        return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
    }
    std::unique_ptr<Process> process;

private:
    std::string mLog;
};

// An account of the provider as the device's account application leaves it.
inline void addDeviceAccount(const TestRoot& root, int id) {
    ASSERT_EQ(account_insert(id, "com.morvane.vantor-service-account-lite", "me@x"), 0);
    std::ofstream(root.at("/opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted/") /
                  (std::to_string(id) + "_file"))
        << "token";
}

// A server that takes connections and never answers: a sync with it goes on until it is stopped.
class SilentServer {
public:
    SilentServer() : mSocket(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof address;
        auto* generic = reinterpret_cast<sockaddr*>(&address);
        EXPECT_EQ(bind(mSocket, generic, size), 0);
        EXPECT_EQ(getsockname(mSocket, generic, &size), 0);
        EXPECT_EQ(listen(mSocket, 16), 0);
        url = "http://127.0.0.1:" + std::to_string(ntohs(address.sin_port));
    }
    ~SilentServer() { close(mSocket); }
    SilentServer(const SilentServer&) = delete;
    SilentServer& operator=(const SilentServer&) = delete;

    std::string url;

private:
    int mSocket;
};
