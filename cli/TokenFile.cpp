#include "TokenFile.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <cstdio>
#include <cstring>

#include "Device.h"
#include "Failure.h"
#include "Handles.h"
#include "platform/root.h"
#include "platform/service_manager.h"

namespace token_file {

namespace {

constexpr unsigned kMode = 0600;
constexpr size_t kMostBytes = 64 * 1024;

std::string nameOf(int accountId) {
    return std::to_string(accountId) + "_file";
}

[[noreturn]] void fail(const std::string& name, const char* what) {
    const int error = errno;
    throw Failure("the token file " + platform::rootedPath(device::kTrustedFolder) + "/" + name +
                  " cannot be " + what + ": " + std::strerror(error));
}

// -1 when the folder is not there.
Descriptor openFolder() {
    const std::string path = platform::rootedPath(device::kTrustedFolder);
    Descriptor folder(open(path.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    if (!folder && errno != ENOENT) throw Failure(path + " cannot be opened: " + std::strerror(errno));
    return folder;
}

}  // namespace

std::optional<std::string> read(int accountId) {
    platform::protectMemory();
    const std::string name = nameOf(accountId);
    const Descriptor folder = openFolder();
    if (!folder) return std::nullopt;
    const Descriptor file(openat(folder.get(), name.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
    if (!file && errno == ENOENT) return std::nullopt;
    struct stat info {};
    if (!file || fstat(file.get(), &info) != 0) fail(name, "read");
    if (!S_ISREG(info.st_mode)) throw Failure("the token file " + name + " is no plain file; move it away");
    std::string token(kMostBytes, '\0');
    const ssize_t got = ::read(file.get(), token.data(), token.size());
    if (got < 0) fail(name, "read");
    token.resize(static_cast<size_t>(got));
    if (token.ends_with('\n')) token.pop_back();
    if (token.ends_with('\r')) token.pop_back();
    return token;
}

void write(int accountId, const std::string& token) {
    if (!platform::replaceFile(path(accountId), token, kMode)) fail(nameOf(accountId), "written");
}

std::string path(int accountId) {
    return platform::rootedPath(device::kTrustedFolder) + "/" + nameOf(accountId);
}

Access access(int accountId) {
    struct stat info {};
    if (lstat(path(accountId).c_str(), &info) != 0) return {};
    return {info.st_mode & 07777, info.st_uid == geteuid() || geteuid() == 0};
}

void remove(int accountId) {
    const std::string name = nameOf(accountId);
    const Descriptor folder = openFolder();
    if (folder && unlinkat(folder.get(), name.c_str(), 0) != 0 && errno != ENOENT) fail(name, "removed");
}

}  // namespace token_file
