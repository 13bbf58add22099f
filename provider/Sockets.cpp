#include "Sockets.h"

#include <netinet/in.h>
#include <sys/socket.h>

#include <charconv>
#include <filesystem>
#include <string>

namespace provider {

namespace {

bool isAddress(int fd, int (*name)(int, sockaddr*, socklen_t*), int& port) {
    sockaddr_in address{};
    socklen_t size = sizeof address;
    if (name(fd, reinterpret_cast<sockaddr*>(&address), &size) != 0 || address.sin_family != AF_INET)
        return false;
    port = ntohs(address.sin_port);
    return true;
}

// Calls apply(fd, client port) for each accepted connection of our port.
template <class Apply>
void forEachConnection(int port, const Apply& apply) {
    std::error_code ignored;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd", ignored)) {
        const std::string name = entry.path().filename();
        int fd = -1;
        std::from_chars(name.data(), name.data() + name.size(), fd);
        int local = 0;
        int remote = 0;
        if (isAddress(fd, getsockname, local) && local == port && isAddress(fd, getpeername, remote)) {
            apply(fd, remote);
        }
    }
}

}  // namespace

void resetConnection(int port, int clientPort) {
    forEachConnection(port, [&](int fd, int remote) {
        if (remote != clientPort) return;
        // Dissolving the association of a connected socket is an abortive close.
        const sockaddr none{AF_UNSPEC, {}};
        static_cast<void>(connect(fd, &none, sizeof none));
    });
}

void endConnections(int port) {
    forEachConnection(port, [](int fd, int) { shutdown(fd, SHUT_RD); });
}

}  // namespace provider
