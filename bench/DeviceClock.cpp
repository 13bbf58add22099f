#include "DeviceClock.h"

#include <glib.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cstring>
#include <ctime>
#include <stdexcept>
#include <utility>

#include "common/vantor_pim_sync_ipc_marshal.h"
#include "platform/error.h"
#include "platform/root.h"

namespace bench {

namespace {

constexpr unsigned kDeadlineSeconds = 600;

gboolean expire(gpointer isLate) {
    *static_cast<bool*>(isLate) = true;
    return G_SOURCE_REMOVE;
}

}  // namespace

double cpuMsOf(pid_t process) {
    clockid_t clock{};
    timespec now{};
    if (clock_getcpuclockid(process, &clock) != 0 || clock_gettime(clock, &now) != 0)
        throw std::runtime_error("the daemon's processor time cannot be read");
    return static_cast<double>(now.tv_sec) * 1e3 + static_cast<double>(now.tv_nsec) / 1e6;
}

pid_t daemonPid() {
    const std::string path = platform::rootedPath(kServiceSocket);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    if (path.size() >= sizeof address.sun_path) throw std::runtime_error("the root's path is too long");
    std::memcpy(address.sun_path, path.c_str(), path.size());
    const int fd = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    ucred peer{};
    socklen_t size = sizeof peer;
    const bool isKnown = connect(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0 &&
                         getsockopt(fd, SOL_SOCKET, SO_PEERCRED, &peer, &size) == 0;
    close(fd);
    if (!isKnown) throw std::runtime_error("no daemon serves this root");
    return peer.pid;
}

Cost measure(const std::function<void()>& work) {
    const pid_t daemon = daemonPid();
    const double cpu = cpuMsOf(daemon);
    const Stopwatch wall;
    work();
    const double ms = wall.ms();
    return {ms, cpuMsOf(daemon) - cpu};
}

KeyWatch::KeyWatch(std::string key) : mKey(std::move(key)) {
    if (vconf_notify_key_changed(mKey.c_str(), note, this) != PLATFORM_ERROR_NONE)
        throw std::runtime_error(mKey + " cannot be watched");
}

KeyWatch::~KeyWatch() {
    vconf_ignore_key_changed(mKey.c_str(), note);
}

void KeyWatch::note(keynode_s*, void* self) {
    static_cast<KeyWatch*>(self)->mIsWritten = true;
}

int settingOf(const std::string& key) {
    int value = 0;
    return vconf_get_int(key.c_str(), &value) == PLATFORM_ERROR_NONE ? value : 0;
}

void KeyWatch::wait(const std::function<bool(int)>& isEnd) {
    bool isLate = false;
    const guint deadline = g_timeout_add_seconds(kDeadlineSeconds, expire, &isLate);
    bool isOver = false;
    while (!isOver && !isLate) {
        g_main_context_iteration(nullptr, /*may_block=*/TRUE);
        if (std::exchange(mIsWritten, false)) isOver = isEnd(settingOf(mKey));
    }
    if (isLate) throw std::runtime_error(mKey + " did not change in time");
    g_source_remove(deadline);
}

std::string stateKey(int account, const std::string& kind, const std::string& name) {
    return "memory/vantor-pim-sync/" + std::to_string(account) + "/" + kind + "/" + name;
}

}  // namespace bench
