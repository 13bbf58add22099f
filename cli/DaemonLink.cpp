#include "DaemonLink.h"

#include <glib.h>
#include <poll.h>
#include <signal.h>
#include <sys/syscall.h>
#include <sys/un.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <memory>
#include <string>

#include "AccountService.h"
#include "DaemonProcess.h"
#include "Device.h"
#include "Failure.h"
#include "Handles.h"
#include "platform/error.h"
#include "platform/ipc.h"
#include "platform/root.h"

namespace daemon_link {

namespace {

using Clock = std::chrono::steady_clock;

constexpr const char* kSocket = "/tmp/.vantor_pim_sync_ipc";
constexpr const char* kModule = "vantor_pim_sync_ipc_module";
constexpr std::chrono::seconds kStartLimit{10};
constexpr std::chrono::seconds kStopLimit{15};
constexpr int kProbeTimeoutMs = 500;
constexpr int kProbePauseMs = 30;

constexpr const char* kUseSystemctl =
    "this is a system install (VANTOR_PIM_SYNC_ROOT is not set); use: systemctl %s vantor-pim-sync";

struct IpcDeleter {
    void operator()(pims_ipc_s* ipc) const noexcept { pims_ipc_destroy(ipc); }
};
using Ipc = std::unique_ptr<pims_ipc_s, IpcDeleter>;
struct DataDeleter {
    void operator()(pims_ipc_data_s* data) const noexcept { pims_ipc_data_destroy(data); }
};
using IpcData = std::unique_ptr<pims_ipc_data_s, DataDeleter>;

void checkSocketPath() {
    const std::string path = platform::rootedPath(kSocket);
    if (path.size() < sizeof(sockaddr_un::sun_path)) return;
    throw Failure("the root folder's path is too long for a socket (" + path + "); choose a shorter one");
}

Ipc connect() {
    checkSocketPath();
    pims_ipc_h ipc = nullptr;
    const int code = pims_ipc_create(kSocket, &ipc);
    if (code == PLATFORM_ERROR_PERMISSION_DENIED) {
        throw Failure(
            "the daemon's socket refuses this user; run it as the daemon's user or a member of its group");
    }
    if (code == PLATFORM_ERROR_FAILED) {
        throw Failure("another user's program serves the daemon's socket " + platform::rootedPath(kSocket) +
                      ", nothing is told to it; see who made the file, and remove it");
    }
    return Ipc(code == PLATFORM_ERROR_NONE ? ipc : nullptr);
}

std::string systemctl(const char* verb) {
    const GChars text(g_strdup_printf(kUseSystemctl, verb));
    return text.get();
}

std::string whyItEnded(const DaemonProcess& process) {
    if (account_service::accounts().empty()) {
        return "the daemon does not stay up without an account; add one with: vantor-pim-syncctl account add";
    }
    return "the daemon ended at its start (" + process.howItEnded() +
           "); its log tells why: " + platform::rootedPath(DaemonProcess::kLog);
}

// False when the process is still there at the deadline.
bool waitUntilGone(const Descriptor& process, Clock::time_point deadline) {
    for (;;) {
        const auto left =
            std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now()).count();
        pollfd wait{process.get(), POLLIN, 0};
        const int ready = poll(&wait, 1, static_cast<int>(left < 0 ? 0 : left));
        if (ready > 0) return true;
        if (ready == 0 || errno != EINTR) return false;
    }
}

}  // namespace

std::optional<int> servingPid() {
    const Ipc ipc = connect();
    int pid = 0;
    if (ipc == nullptr || pims_ipc_get_server_pid(ipc.get(), &pid) != PLATFORM_ERROR_NONE || pid <= 0) {
        return std::nullopt;
    }
    return pid;
}

bool isAnswering(int timeoutMs) {
    const Ipc ipc = connect();
    if (ipc == nullptr) return false;
    const IpcData request(pims_ipc_data_create_with_size(64, 0));
    const int32_t account = 0;
    const int32_t kind = 0;
    if (request == nullptr ||
        pims_ipc_data_put(request.get(), &account, sizeof account) != PLATFORM_ERROR_NONE ||
        pims_ipc_data_put(request.get(), &kind, sizeof kind) != PLATFORM_ERROR_NONE) {
        return false;
    }
    pims_ipc_data_h reply = nullptr;
    const int code = pims_ipc_call(ipc.get(), kModule, "get_state", request.get(), &reply, timeoutMs);
    const IpcData owned(reply);
    return code == PLATFORM_ERROR_NONE;
}

void requireRunning() {
    if (servingPid()) return;
    throw Failure("the daemon does not run; " + startAdvice());
}

std::string startAdvice() {
    return device::isPrivate() ? "start it with: vantor-pim-syncctl daemon start"
                               : "start it with: systemctl start vantor-pim-sync";
}

bool start() {
    if (!device::isPrivate()) throw Failure(systemctl("start"));
    if (isAnswering(kProbeTimeoutMs)) return false;
    device::prepare();
    DaemonProcess process = DaemonProcess::spawn();
    const auto deadline = Clock::now() + kStartLimit;
    while (!isAnswering(kProbeTimeoutMs)) {
        if (process.waitForEnd(kProbePauseMs)) {
            // Another start may have been faster: its daemon has the socket, ours gave way.
            if (isAnswering(kProbeTimeoutMs)) return false;
            throw Failure(whyItEnded(process));
        }
        if (Clock::now() < deadline) continue;
        process.kill();
        throw Failure("the daemon does not answer; its log tells why: " +
                      platform::rootedPath(DaemonProcess::kLog));
    }
    return true;
}

void awaitService() {
    const auto deadline = Clock::now() + kStartLimit;
    while (!isAnswering(kProbeTimeoutMs)) {
        if (Clock::now() > deadline) {
            throw Failure(
                "the daemon was not started; see: systemctl status vantor-pim-sync.path "
                "vantor-pim-sync.service");
        }
        g_usleep(kProbePauseMs * G_TIME_SPAN_MILLISECOND);
    }
}

bool stop() {
    if (!device::isPrivate()) throw Failure(systemctl("stop"));
    const std::optional<int> pid = servingPid();
    if (!pid) return false;
    const Descriptor process(static_cast<int>(syscall(SYS_pidfd_open, *pid, 0)));
    // The number may have gone to another process since it was told; that of a process that still answers has not.
    if ((!process && errno == ESRCH) || (process && servingPid() != pid)) return false;
    if (!process ||
        (syscall(SYS_pidfd_send_signal, process.get(), SIGTERM, nullptr, 0) != 0 && errno != ESRCH)) {
        throw Failure("the daemon (process " + std::to_string(*pid) +
                      ") cannot be ended: " + std::strerror(errno));
    }
    if (!waitUntilGone(process, Clock::now() + kStopLimit)) {
        throw Failure("the daemon (process " + std::to_string(*pid) +
                      ") was asked to end and still runs; try again");
    }
    return true;
}

bool ensureRunning() {
    if (servingPid()) return false;
    if (!device::isPrivate()) requireRunning();
    return start();
}

}  // namespace daemon_link
