#include "FileKeep.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <random>

#include "../base/ErrnoCode.h"
#include "platform/error.h"
#include "platform/log.h"
#include "platform/root.h"

namespace platform::records {

namespace {

constexpr const char* kTag = "PLATFORM_RECORDS";
constexpr mode_t kFolderMode = 0770;
constexpr mode_t kFileMode = 0660;
constexpr off_t kMaxBytes = 32L * 1024 * 1024;
constexpr time_t kSweptAfterSeconds = 3600;

class Descriptor {
public:
    explicit Descriptor(int fd) : mFd(fd) {}
    ~Descriptor() {
        if (mFd != -1) close(mFd);
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    [[nodiscard]] int get() const { return mFd; }

private:
    const int mFd;
};

std::string freshName() {
    std::random_device device;
    char name[32];
    std::snprintf(name, sizeof name, "%08x%08x", device(), device());
    return name;
}

bool copyAll(int from, int to) {
    char buffer[64 * 1024];
    for (;;) {
        const ssize_t count = read(from, buffer, sizeof buffer);
        if (count == 0) return fsync(to) == 0;
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) return false;
        for (ssize_t done = 0; done < count;) {
            const ssize_t written = write(to, buffer + done, static_cast<size_t>(count - done));
            if (written < 0 && errno != EINTR) return false;
            if (written > 0) done += written;
        }
    }
}

}  // namespace

bool FileKeep::isKept(const std::string& path) const {
    return mFolder != nullptr && path.starts_with(std::string(mFolder) + "/");
}

int FileKeep::keep(const std::string& path, std::string* kept) {
    if (mFolder == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    const Descriptor from(open(rootedPath(path).c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK));
    struct stat info {};
    if (from.get() == -1 || fstat(from.get(), &info) != 0 || !S_ISREG(info.st_mode) ||
        info.st_size > kMaxBytes) {
        dlog_print(DLOG_ERROR, kTag, "%s is no file that can be kept", path.c_str());
        return PLATFORM_ERROR_INVALID_PARAMETER;
    }
    if (const int code = makeFolder(mFolder, kFolderMode); code != PLATFORM_ERROR_NONE) return code;
    const std::string copy = std::string(mFolder) + "/" + freshName();
    const Descriptor to(
        open(rootedPath(copy).c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC | O_NOFOLLOW, kFileMode));
    if (to.get() == -1) return codeOfErrno(errno);
    mCopied.push_back(copy);
    if (!copyAll(from.get(), to.get())) {
        const int code = codeOfErrno(errno);
        dlog_print(DLOG_ERROR, kTag, "%s cannot be copied: %s", path.c_str(), strerror(errno));
        return code;
    }
    *kept = copy;
    return PLATFORM_ERROR_NONE;
}

void FileKeep::commit() {
    for (const std::string& path : mDropped) unlink(rootedPath(path).c_str());
    mDropped.clear();
    mCopied.clear();
}

void FileKeep::rollback(const Mark& mark) {
    for (size_t i = mark.copied; i < mCopied.size(); ++i) unlink(rootedPath(mCopied[i]).c_str());
    mCopied.resize(std::min(mark.copied, mCopied.size()));
    mDropped.resize(std::min(mark.dropped, mDropped.size()));
}

void FileKeep::sweep(const std::set<std::string>& named) const {
    if (mFolder == nullptr) return;
    std::error_code error;
    for (const auto& entry : std::filesystem::directory_iterator(rootedPath(mFolder), error)) {
        struct stat info {};
        const std::string path = std::string(mFolder) + "/" + entry.path().filename().string();
        if (named.contains(path) || lstat(entry.path().c_str(), &info) != 0) continue;
        if (time(nullptr) - info.st_mtime > kSweptAfterSeconds) unlink(entry.path().c_str());
    }
}

}  // namespace platform::records
