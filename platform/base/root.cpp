#include "platform/root.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

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

}  // namespace platform
