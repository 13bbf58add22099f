// The calling side: blocking, with a deadline.
#include <poll.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <memory>

#include "IpcData.h"
#include "IpcSocket.h"
#include "platform/error.h"

using platform::ipc::Cut;
using platform::ipc::ReplyStatus;
using Clock = std::chrono::steady_clock;

struct pims_ipc_s {
    int fd = -1;
    uint32_t sequence = 0;
    std::string input;
    bool broken = false;
};

namespace {

int waitFor(int fd, short events, Clock::time_point deadline) {
    for (;;) {
        const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - Clock::now()).count();
        if (left <= 0) return PLATFORM_ERROR_TIMED_OUT;
        pollfd entry{fd, events, 0};
        const int count = poll(&entry, 1, static_cast<int>(left));
        if (count > 0) return PLATFORM_ERROR_NONE;
        if (count < 0 && errno != EINTR) return PLATFORM_ERROR_IO;
    }
}

int sendAll(int fd, std::string_view bytes, Clock::time_point deadline) {
    while (!bytes.empty()) {
        const ssize_t count = send(fd, bytes.data(), bytes.size(), MSG_NOSIGNAL | MSG_DONTWAIT);
        if (count > 0) {
            bytes.remove_prefix(static_cast<size_t>(count));
        } else if (errno == EAGAIN) {
            if (const int code = waitFor(fd, POLLOUT, deadline); code != PLATFORM_ERROR_NONE) return code;
        } else if (errno != EINTR) {
            return PLATFORM_ERROR_IO;
        }
    }
    return PLATFORM_ERROR_NONE;
}

// Reads until the reply to the handle's latest request is there.
int receiveReply(pims_ipc_s* ipc, std::vector<std::string>* items, Clock::time_point deadline) {
    for (;;) {
        std::string payload;
        uint32_t sequence = 0;
        switch (platform::ipc::cutFrame(&ipc->input, &payload)) {
            case Cut::kBroken:
                return PLATFORM_ERROR_IO;
            case Cut::kFrame:
                if (!platform::ipc::parseFrame(payload, &sequence, items) || items->empty())
                    return PLATFORM_ERROR_IO;
                if (sequence == ipc->sequence) return PLATFORM_ERROR_NONE;
                continue;
            case Cut::kIncomplete:
                break;
        }
        char chunk[16 * 1024];
        const ssize_t count = recv(ipc->fd, chunk, sizeof chunk, MSG_DONTWAIT);
        if (count > 0) {
            ipc->input.append(chunk, static_cast<size_t>(count));
        } else if (count < 0 && errno == EAGAIN) {
            if (const int code = waitFor(ipc->fd, POLLIN, deadline); code != PLATFORM_ERROR_NONE) return code;
        } else if (count == 0 || errno != EINTR) {
            return PLATFORM_ERROR_IO;
        }
    }
}

}  // namespace

int pims_ipc_create(const char* path, pims_ipc_h* ipc) {
    if (path == nullptr || ipc == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    sockaddr_un address{};
    if (!platform::ipc::addressOf(path, &address)) return PLATFORM_ERROR_INVALID_PARAMETER;
    // What is called here is given secrets: a link that somebody put in the socket's place is not followed.
    struct stat info {};
    if (lstat(address.sun_path, &info) == 0 && !S_ISSOCK(info.st_mode))
        return PLATFORM_ERROR_PERMISSION_DENIED;
    const int fd = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (fd == -1) return PLATFORM_ERROR_IO;
    if (connect(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
        const int error = errno;
        close(fd);
        if (error == ENOENT || error == ECONNREFUSED || error == ENOTDIR) return PLATFORM_ERROR_NOT_FOUND;
        return error == EACCES || error == EPERM ? PLATFORM_ERROR_PERMISSION_DENIED : PLATFORM_ERROR_IO;
    }
    if (!platform::ipc::isServerTrusted(fd)) {
        close(fd);
        return PLATFORM_ERROR_FAILED;
    }
    auto handle = std::make_unique<pims_ipc_s>();
    handle->fd = fd;
    *ipc = handle.release();
    return PLATFORM_ERROR_NONE;
}

int pims_ipc_destroy(pims_ipc_h ipc) {
    if (ipc == nullptr) return PLATFORM_ERROR_NONE;
    close(ipc->fd);
    delete ipc;
    return PLATFORM_ERROR_NONE;
}

int pims_ipc_call(pims_ipc_h ipc, const char* module, const char* command, pims_ipc_data_h data_in,
                  pims_ipc_data_h* data_out, int timeout_ms) {
    if (ipc == nullptr || module == nullptr || command == nullptr || data_out == nullptr) {
        return PLATFORM_ERROR_INVALID_PARAMETER;
    }
    if (ipc->broken) return PLATFORM_ERROR_IO;
    const auto deadline = Clock::now() + std::chrono::milliseconds(timeout_ms);
    const std::string frame = platform::ipc::composeFrame(++ipc->sequence, {module, command}, data_in);
    std::vector<std::string> items;
    // From here on the peer may be in the middle of a frame.
    ipc->broken = true;
    if (const int code = sendAll(ipc->fd, frame, deadline); code != PLATFORM_ERROR_NONE) return code;
    if (const int code = receiveReply(ipc, &items, deadline); code != PLATFORM_ERROR_NONE) return code;
    ipc->broken = false;

    uint32_t status = 0;
    if (items[0].size() != sizeof status) return PLATFORM_ERROR_IO;
    std::memcpy(&status, items[0].data(), sizeof status);
    switch (static_cast<ReplyStatus>(status)) {
        case ReplyStatus::kNoData:
            *data_out = nullptr;
            return PLATFORM_ERROR_NONE;
        case ReplyStatus::kData: {
            auto reply = std::make_unique<pims_ipc_data_s>();
            reply->items.assign(std::make_move_iterator(items.begin() + 1),
                                std::make_move_iterator(items.end()));
            *data_out = reply.release();
            return PLATFORM_ERROR_NONE;
        }
        case ReplyStatus::kUnknown:
            return PLATFORM_ERROR_NOT_FOUND;
    }
    return PLATFORM_ERROR_IO;
}

bool pims_ipc_is_alive(pims_ipc_h ipc) {
    if (ipc == nullptr || ipc->broken) return false;
    pollfd entry{ipc->fd, POLLIN, 0};
    // Between calls nothing is sent, so anything to read is the end of the connection.
    return poll(&entry, 1, 0) == 0;
}

int pims_ipc_get_server_pid(pims_ipc_h ipc, int* pid) {
    if (ipc == nullptr || pid == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    ucred peer{};
    socklen_t length = sizeof peer;
    if (getsockopt(ipc->fd, SOL_SOCKET, SO_PEERCRED, &peer, &length) != 0) return PLATFORM_ERROR_IO;
    *pid = peer.pid;
    return PLATFORM_ERROR_NONE;
}
