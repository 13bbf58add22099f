#include "platform/keys.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>

#include "ErrnoCode.h"
#include "platform/error.h"
#include "platform/root.h"

namespace {

constexpr const char* kFolder = "/opt/usr/data/key-storage";
constexpr size_t kMaxValueBytes = 64 * 1024;
constexpr mode_t kOthersMask = 077;

bool isValidName(const char* name) {
    if (name == nullptr || *name == '\0' || *name == '.' || std::strlen(name) > 200) return false;
    return std::strspn(name, "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789._-") ==
           std::strlen(name);
}

std::string pathOf(const char* name) {
    return platform::rootedPath(std::string(kFolder) + "/" + name);
}

// A key that others could read or exchange is not trusted.
bool isPrivate(int fd) {
    struct stat info {};
    const bool isOwn = fstat(fd, &info) == 0 && (info.st_uid == geteuid() || geteuid() == 0);
    return isOwn && S_ISREG(info.st_mode) && (info.st_mode & kOthersMask) == 0;
}

}  // namespace

int key_storage_get(const char* name, char** value) {
    if (!isValidName(name) || value == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    const int fd = open(pathOf(name).c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK);
    if (fd == -1) return platform::codeOfErrno(errno);
    if (!isPrivate(fd)) {
        close(fd);
        return PLATFORM_ERROR_PERMISSION_DENIED;
    }
    std::string content(kMaxValueBytes, '\0');
    const ssize_t length = read(fd, content.data(), content.size());
    close(fd);
    if (length < 0) return PLATFORM_ERROR_IO;
    content.resize(static_cast<size_t>(length));
    char* copy = strdup(content.c_str());
    if (copy == nullptr) return PLATFORM_ERROR_FAILED;
    *value = copy;
    return PLATFORM_ERROR_NONE;
}

int key_storage_set(const char* name, const char* value) {
    if (!isValidName(name) || value == nullptr || *value == '\0') return PLATFORM_ERROR_INVALID_PARAMETER;
    const std::string_view text(value);
    if (text.size() >= kMaxValueBytes) return PLATFORM_ERROR_INVALID_PARAMETER;
    if (const int code = platform::makeFolder(kFolder, 0700); code != PLATFORM_ERROR_NONE) return code;
    constexpr unsigned kMode = 0600;
    return platform::replaceFile(pathOf(name), text, kMode) ? PLATFORM_ERROR_NONE
                                                            : platform::codeOfErrno(errno);
}
