#include "IpcSocket.h"

#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <cstring>
#include <vector>

#include "platform/error.h"
#include "platform/log.h"
#include "platform/root.h"

namespace platform::ipc {

namespace {

constexpr const char* kTag = "PLATFORM_IPC";
constexpr int kBacklog = 1024;

// Whether somebody answers at the socket.
bool isServed(const sockaddr_un& address) {
    const int fd = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    if (fd == -1) return true;
    const bool refused = connect(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 &&
                         errno == ECONNREFUSED;
    close(fd);
    return !refused;
}

// Makes way for a new socket: removes a stale one of this user, nothing else.
int removeStale(const sockaddr_un& address) {
    struct stat info {};
    if (lstat(address.sun_path, &info) != 0) return errno == ENOENT ? PLATFORM_ERROR_NONE : PLATFORM_ERROR_IO;
    if (!S_ISSOCK(info.st_mode)) {
        dlog_print(DLOG_ERROR, kTag, "%s is no socket, it is left alone and no service is opened",
                   address.sun_path);
        return PLATFORM_ERROR_PERMISSION_DENIED;
    }
    if (info.st_uid != geteuid()) {
        dlog_print(DLOG_ERROR, kTag, "%s belongs to user %u, no service is opened", address.sun_path,
                   info.st_uid);
        return PLATFORM_ERROR_PERMISSION_DENIED;
    }
    if (isServed(address)) {
        dlog_print(DLOG_ERROR, kTag, "%s is served by another process, no service is opened",
                   address.sun_path);
        return PLATFORM_ERROR_FAILED;
    }
    if (unlink(address.sun_path) != 0 && errno != ENOENT) return PLATFORM_ERROR_IO;
    dlog_print(DLOG_INFO, kTag, "%s was stale and is opened anew", address.sun_path);
    return PLATFORM_ERROR_NONE;
}

int bindPrivately(int fd, const sockaddr_un& address) {
    // Nobody may connect before group and mode are set.
    const mode_t before = umask(0177);
    const int result = bind(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address);
    umask(before);
    return result;
}

}  // namespace

bool addressOf(const std::string& path, sockaddr_un* address) {
    const std::string rooted = rootedPath(path);
    if (rooted.size() >= sizeof address->sun_path) {
        dlog_print(DLOG_ERROR, kTag,
                   "the root folder is too long: the socket path %s has %zu bytes, at most %zu fit",
                   rooted.c_str(), rooted.size(), sizeof address->sun_path - 1);
        return false;
    }
    *address = sockaddr_un{};
    address->sun_family = AF_UNIX;
    std::copy(rooted.begin(), rooted.end(), address->sun_path);
    return true;
}

int claimService(const std::string& path) {
    sockaddr_un address{};
    if (!addressOf(path, &address)) return PLATFORM_ERROR_INVALID_PARAMETER;
    const std::string rooted = rootedPath(path);
    const size_t slash = rooted.rfind('/');
    struct stat folder {};
    if (stat(rooted.substr(0, slash + 1).c_str(), &folder) != 0) {
        dlog_print(DLOG_ERROR, kTag, "%s cannot be opened: %s", rooted.c_str(), std::strerror(errno));
        return PLATFORM_ERROR_IO;
    }
    // A name without a file: nothing is left behind, however the process ends.
    const std::string name = "pims-ipc:" + std::to_string(folder.st_dev) + ":" +
                             std::to_string(folder.st_ino) + ":" + rooted.substr(slash + 1);
    address = sockaddr_un{.sun_family = AF_UNIX, .sun_path = {}};
    if (name.size() + 1 > sizeof address.sun_path) return PLATFORM_ERROR_INVALID_PARAMETER;
    std::copy(name.begin(), name.end(), address.sun_path + 1);
    const auto length = static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + 1 + name.size());
    const int fd = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    if (fd == -1) return PLATFORM_ERROR_IO;
    if (bind(fd, reinterpret_cast<const sockaddr*>(&address), length) == 0) return fd;
    dlog_print(DLOG_ERROR, kTag, "%s is served by another process, no service is opened", rooted.c_str());
    close(fd);
    return PLATFORM_ERROR_FAILED;
}

int openService(const std::string& path, unsigned group, unsigned mode) {
    sockaddr_un address{};
    if (!addressOf(path, &address)) return PLATFORM_ERROR_INVALID_PARAMETER;
    if (const int code = removeStale(address); code != PLATFORM_ERROR_NONE) return code;
    const int fd = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    if (fd == -1) return PLATFORM_ERROR_IO;
    if (bindPrivately(fd, address) != 0) {
        dlog_print(DLOG_ERROR, kTag, "%s cannot be opened: %s", address.sun_path, std::strerror(errno));
        close(fd);
        return PLATFORM_ERROR_IO;
    }
    struct stat made {};
    const bool isOfGroup = lstat(address.sun_path, &made) == 0 && made.st_gid == group;
    if (!isOfGroup && lchown(address.sun_path, static_cast<uid_t>(-1), group) != 0) {
        dlog_print(DLOG_ERROR, kTag, "%s cannot be given to group %u (%s), it keeps its own, ignoring",
                   address.sun_path, group, std::strerror(errno));
    }
    if (chmod(address.sun_path, mode) != 0 || listen(fd, kBacklog) != 0) {
        dlog_print(DLOG_ERROR, kTag, "%s cannot be opened: %s", address.sun_path, std::strerror(errno));
        unlink(address.sun_path);
        close(fd);
        return PLATFORM_ERROR_IO;
    }
    return fd;
}

bool isPeerAllowed(int connection, const std::string& path) {
    ucred peer{};
    socklen_t length = sizeof peer;
    struct stat info {};
    if (getsockopt(connection, SOL_SOCKET, SO_PEERCRED, &peer, &length) != 0) return false;
    if (lstat(rootedPath(path).c_str(), &info) != 0) return false;
    if (peer.uid == 0 || peer.uid == info.st_uid) return true;
    if ((info.st_mode & S_IWGRP) == 0) return false;
    if (peer.gid == info.st_gid) return true;
    std::vector<gid_t> groups(1024);
    length = static_cast<socklen_t>(groups.size() * sizeof(gid_t));
    if (getsockopt(connection, SOL_SOCKET, SO_PEERGROUPS, groups.data(), &length) != 0) return false;
    groups.resize(length / sizeof(gid_t));
    return std::find(groups.begin(), groups.end(), info.st_gid) != groups.end();
}

bool isServerTrusted(int connection) {
    ucred peer{};
    socklen_t length = sizeof peer;
    if (getsockopt(connection, SOL_SOCKET, SO_PEERCRED, &peer, &length) != 0) return false;
    if (peer.uid == 0 || peer.uid == geteuid()) return true;
    struct stat stores {};
    return stat(rootedPath("/opt/usr/dbspace").c_str(), &stores) == 0 && peer.uid == stores.st_uid;
}

}  // namespace platform::ipc
