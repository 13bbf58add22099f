#include "platform/root.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdlib>

#include "ErrnoCode.h"
#include "platform/error.h"

namespace platform {

std::string rootFolder() {
    const char* value = std::getenv("VANTOR_PIM_SYNC_ROOT");
    std::string root = value != nullptr ? value : "";
    while (!root.empty() && root.back() == '/') root.pop_back();
    return root;
}

std::string rootedPath(std::string_view absolute) {
    return rootFolder().append(absolute);
}

bool giveToFolderOwner(int fd, const std::string& path) {
    if (geteuid() != 0) return true;
    struct stat folder {};
    const size_t end = path.rfind('/');
    if (stat(end == 0 ? "/" : path.substr(0, end).c_str(), &folder) != 0) return false;
    return fchown(fd, folder.st_uid, folder.st_gid) == 0;
}

namespace {

bool giveFolderAway(const std::string& path) {
    const int fd = open(path.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    if (fd == -1) return geteuid() != 0;  // a mode that keeps its own user out
    const bool given = giveToFolderOwner(fd, path);
    close(fd);
    return given;
}

// Of a name of its own in the folder; -1 with errno.
int makeFresh(int folder, std::string* name) {
    static std::atomic<unsigned> count{0};
    for (;;) {
        *name = "." + std::to_string(getpid()) + "." + std::to_string(count++);
        const int fd =
            openat(folder, name->c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600);
        if (fd != -1 || errno != EEXIST) return fd;
    }
}

bool writeAll(int fd, std::string_view content) {
    while (!content.empty()) {
        const ssize_t count = write(fd, content.data(), content.size());
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) return false;
        content.remove_prefix(static_cast<size_t>(count));
    }
    return true;
}

bool replaceIn(int folder, const std::string& path, std::string_view content, unsigned mode, bool isDurable) {
    std::string fresh;
    const int fd = makeFresh(folder, &fresh);
    if (fd == -1) return false;
    const bool isWritten = writeAll(fd, content) && fchmod(fd, mode) == 0 && giveToFolderOwner(fd, path) &&
                           (!isDurable || fsync(fd) == 0);
    int error = isWritten ? 0 : errno;
    close(fd);
    const std::string name = path.substr(path.rfind('/') + 1);
    if (isWritten && renameat(folder, fresh.c_str(), folder, name.c_str()) != 0) error = errno;
    if (error != 0) unlinkat(folder, fresh.c_str(), 0);
    if (error == 0 && isDurable) (void)fsync(folder);
    errno = error;
    return error == 0;
}

}  // namespace

int makeFolder(std::string_view absolute, unsigned mode) {
    const std::string path = rootedPath(absolute);
    for (size_t end = path.find('/', 1);; end = path.find('/', end + 1)) {
        const bool last = end == std::string::npos;
        const std::string part = path.substr(0, end);
        const bool made = mkdir(part.c_str(), last ? mode : 0755) == 0;
        if ((!made && errno != EEXIST) || (made && !giveFolderAway(part))) return codeOfErrno(errno);
        if (last) break;
    }
    struct stat info {};
    if (stat(path.c_str(), &info) != 0) return codeOfErrno(errno);
    return S_ISDIR(info.st_mode) ? PLATFORM_ERROR_NONE : PLATFORM_ERROR_IO;
}

bool replaceFile(const std::string& path, std::string_view content, unsigned mode, bool isDurable) {
    const std::string parent = path.substr(0, path.rfind('/'));
    const int folder = open(parent.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    if (folder == -1) return false;
    const bool isDone = replaceIn(folder, path, content, mode, isDurable);
    const int error = errno;
    close(folder);
    errno = error;
    return isDone;
}

}  // namespace platform
