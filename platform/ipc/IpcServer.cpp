// The serving side: one listening source and one source a connection, all on the default main context.
#include <glib-unix.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstring>
#include <map>
#include <memory>
#include <utility>

#include "IpcData.h"
#include "IpcSocket.h"
#include "platform/error.h"
#include "platform/log.h"
#include "platform/root.h"

namespace platform::ipc {

namespace {

constexpr const char* kTag = "PLATFORM_IPC";
constexpr guint kAcceptPauseMs = 200;
constexpr size_t kReadChunkBytes = 16 * 1024;
constexpr size_t kMostUnfinishedBytes =
    16 * kMaxFrameBytes;  // of all clients' requests that are not whole yet

class Service;

// One client. It is asked for its next request only when its last reply has been taken, so a client that never reads costs
// one reply.
class Connection {
public:
    Connection(Service* service, int fd) : mService(service), mFd(fd) { watch(G_IO_IN); }
    ~Connection() {
        g_source_remove(mSource);
        close(mFd);
    }
    Connection(const Connection&) = delete;
    Connection& operator=(const Connection&) = delete;

    [[nodiscard]] size_t unfinishedBytes() const { return mInput.size(); }

private:
    void watch(GIOCondition condition) {
        if (mSource != 0) g_source_remove(mSource);
        mSource = g_unix_fd_add(mFd, condition, onReady, this);
    }

    static gboolean onReady(gint, GIOCondition condition, gpointer self) {
        auto* connection = static_cast<Connection*>(self);
        const bool alive = (condition & G_IO_OUT) != 0 ? connection->send() : connection->receive();
        if (!alive) connection->drop();
        return G_SOURCE_CONTINUE;  // drop() and watch() have removed the source where it must go
    }

    void drop();
    bool receive();
    bool answerNext();
    bool send();

    Service* const mService;
    const int mFd;
    guint mSource = 0;
    bool mWaiting = false;  // for room to send
    std::string mInput;
    std::string mOutput;
};

class Service {
public:
    static Service& instance() {
        static Service* const service = new Service;
        return *service;
    }

    int open(const char* path, unsigned group, unsigned mode) {
        if (path == nullptr || mFd != -1) return PLATFORM_ERROR_INVALID_PARAMETER;
        raiseDescriptorLimit();
        // As soon as clients can connect a signal ends the service in order: at the latest when the loop begins to run.
        mSignals[0] = g_unix_signal_add(SIGTERM, onSignal, this);
        mSignals[1] = g_unix_signal_add(SIGINT, onSignal, this);
        mClaim = claimService(path);
        const int fd = mClaim < 0 ? mClaim : openService(path, group, mode);
        if (fd < 0) {
            for (const guint signal : mSignals) g_source_remove(signal);
            if (mClaim >= 0) close(std::exchange(mClaim, -1));
            return fd;
        }
        mFd = fd;
        mPath = path;
        struct stat info {};
        if (lstat(rootedPath(mPath).c_str(), &info) == 0) mInode = info.st_ino;
        listen();
        return PLATFORM_ERROR_NONE;
    }

    int add(const char* module, const char* command, pims_ipc_call_cb callback, void* userData) {
        if (mFd == -1) return PLATFORM_ERROR_FAILED;
        if (module == nullptr || command == nullptr || callback == nullptr)
            return PLATFORM_ERROR_INVALID_PARAMETER;
        mCommands[{module, command}] = {callback, userData};
        return PLATFORM_ERROR_NONE;
    }

    void run(GMainLoop* loop) {
        const bool own = loop == nullptr;
        mLoop = own ? g_main_loop_new(nullptr, FALSE) : loop;
        g_main_loop_run(mLoop);
        if (own) g_main_loop_unref(mLoop);
        mLoop = nullptr;
    }

    void shut() {
        mConnections.clear();
        if (mFd == -1) return;
        g_source_remove(mSource);
        for (const guint signal : mSignals) g_source_remove(signal);
        close(mFd);
        mFd = -1;
        // Another process may have opened its own socket at the path meanwhile.
        struct stat info {};
        const std::string path = rootedPath(mPath);
        if (lstat(path.c_str(), &info) == 0 && info.st_ino == mInode) unlink(path.c_str());
        close(std::exchange(mClaim, -1));
        mCommands.clear();
    }

    void drop(Connection* connection) { mConnections.erase(connection); }

    // Whether the requests that are not whole yet leave room for another long one.
    [[nodiscard]] bool hasRoom() const {
        size_t bytes = 0;
        for (const auto& [connection, owned] : mConnections) bytes += connection->unfinishedBytes();
        return bytes <= kMostUnfinishedBytes;
    }

    // Composes the reply to one request; empty when the request breaks the format.
    std::string answer(const std::string& payload) {
        uint32_t sequence = 0;
        std::vector<std::string> items;
        if (!parseFrame(payload, &sequence, &items) || items.size() < 2) return {};
        const auto command = mCommands.find({items[0], items[1]});
        if (command == mCommands.end()) return reply(sequence, ReplyStatus::kUnknown, nullptr);
        pims_ipc_data_s request;
        request.items.assign(std::make_move_iterator(items.begin() + 2),
                             std::make_move_iterator(items.end()));
        pims_ipc_data_h data = nullptr;
        command->second.callback(nullptr, request.items.empty() ? nullptr : &request, &data,
                                 command->second.userData);
        const std::unique_ptr<pims_ipc_data_s> owned(data);
        return reply(sequence, owned ? ReplyStatus::kData : ReplyStatus::kNoData, owned.get());
    }

private:
    struct Command {
        pims_ipc_call_cb callback;
        void* userData;
    };

    static std::string reply(uint32_t sequence, ReplyStatus status, const pims_ipc_data_s* data) {
        std::string code;
        appendUint32(&code, static_cast<uint32_t>(status));
        return composeFrame(sequence, {code}, data);
    }

    static void raiseDescriptorLimit() {
        rlimit limit{};
        if (getrlimit(RLIMIT_NOFILE, &limit) != 0 || limit.rlim_cur == limit.rlim_max) return;
        limit.rlim_cur = limit.rlim_max;
        (void)setrlimit(RLIMIT_NOFILE, &limit);
    }

    void listen() { mSource = g_unix_fd_add(mFd, G_IO_IN, onConnect, this); }

    static gboolean onSignal(gpointer self) {
        GMainLoop* loop = static_cast<Service*>(self)->mLoop;
        if (loop != nullptr) g_main_loop_quit(loop);
        return G_SOURCE_CONTINUE;
    }

    static gboolean onConnect(gint, GIOCondition, gpointer self) {
        return static_cast<Service*>(self)->accept() ? G_SOURCE_CONTINUE : G_SOURCE_REMOVE;
    }

    static gboolean onAcceptAgain(gpointer self) {
        auto* service = static_cast<Service*>(self);
        if (service->mFd != -1) service->listen();
        return G_SOURCE_REMOVE;
    }

    // False when no descriptor is left: the source goes and comes back after a pause.
    bool accept() {
        const int fd = accept4(mFd, nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK);
        if (fd == -1) {
            if (errno != EMFILE && errno != ENFILE && errno != ENOMEM && errno != ENOBUFS) return true;
            dlog_print(DLOG_ERROR, kTag, "no connection can be taken: %s", std::strerror(errno));
            mSource = g_timeout_add(kAcceptPauseMs, onAcceptAgain, this);
            return false;
        }
        if (!isPeerAllowed(fd, mPath)) {
            dlog_print(DLOG_ERROR, kTag, "a client without the right to call was refused");
            close(fd);
            return true;
        }
        auto connection = std::make_unique<Connection>(this, fd);
        mConnections.emplace(connection.get(), std::move(connection));
        return true;
    }

    int mClaim = -1;  // keeps the path for this process
    int mFd = -1;
    guint mSource = 0;
    guint mSignals[2] = {};
    GMainLoop* mLoop = nullptr;
    std::string mPath;
    ino_t mInode = 0;
    std::map<std::pair<std::string, std::string>, Command> mCommands;
    std::map<Connection*, std::unique_ptr<Connection>> mConnections;
};

void Connection::drop() {
    mService->drop(this);
}

bool Connection::receive() {
    char chunk[kReadChunkBytes];
    const ssize_t count = recv(mFd, chunk, sizeof chunk, 0);
    if (count == 0) return false;
    if (count < 0) return errno == EAGAIN || errno == EINTR;
    mInput.append(chunk, static_cast<size_t>(count));
    if (!answerNext()) return false;
    if (mInput.empty()) mInput.shrink_to_fit();  // a long request leaves nothing behind
    if (mInput.size() <= kReadChunkBytes || mService->hasRoom()) return true;
    dlog_print(DLOG_ERROR, kTag, "too many long requests are not whole yet, a client is disconnected");
    return false;
}

bool Connection::answerNext() {
    std::string payload;
    while (mOutput.empty()) {
        const Cut cut = cutFrame(&mInput, &payload);
        if (cut == Cut::kIncomplete) return true;
        if (cut == Cut::kFrame) mOutput = mService->answer(payload);
        if (mOutput.empty()) {
            dlog_print(DLOG_ERROR, kTag, "a client sent a malformed request and is disconnected");
            return false;
        }
        if (!send()) return false;
    }
    return true;
}

bool Connection::send() {
    const bool waited = !mOutput.empty() && mWaiting;
    while (!mOutput.empty()) {
        const ssize_t count = ::send(mFd, mOutput.data(), mOutput.size(), MSG_NOSIGNAL);
        if (count < 0 && errno == EINTR) continue;
        if (count < 0 && errno == EAGAIN) {
            if (!mWaiting) watch(G_IO_OUT);
            mWaiting = true;
            return true;
        }
        if (count <= 0) return false;
        mOutput.erase(0, static_cast<size_t>(count));
    }
    if (!waited) return true;
    mWaiting = false;
    watch(G_IO_IN);
    return answerNext();
}

}  // namespace

}  // namespace platform::ipc

using platform::ipc::Service;

int pims_ipc_svc_init(const char* path, unsigned group, unsigned mode) {
    return Service::instance().open(path, group, mode);
}

int pims_ipc_svc_register(const char* module, const char* command, pims_ipc_call_cb callback,
                          void* user_data) {
    return Service::instance().add(module, command, callback, user_data);
}

void pims_ipc_svc_run_main_loop(void* main_loop) {
    Service::instance().run(static_cast<GMainLoop*>(main_loop));
}

int pims_ipc_svc_deinit() {
    Service::instance().shut();
    return PLATFORM_ERROR_NONE;
}
