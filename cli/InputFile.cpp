#include "InputFile.h"

#include <fcntl.h>

#include <array>
#include <cerrno>
#include <cstring>

#include "Failure.h"
#include "Handles.h"
#include "platform/service_manager.h"

namespace input_file {

namespace {

constexpr const char* kStandardInput = "-";
constexpr size_t kMostSecretBytes = 64 * 1024;

std::string nameOf(const std::string& path) {
    return path == kStandardInput ? "standard input" : path;
}

}  // namespace

std::string read(const std::string& path, size_t mostBytes) {
    Descriptor file;
    int fd = STDIN_FILENO;
    if (path != kStandardInput) {
        file = Descriptor(open(path.c_str(), O_RDONLY | O_CLOEXEC));
        fd = file.get();
    }
    std::string text;
    std::array<char, 16384> block{};
    for (;;) {
        const ssize_t got = fd < 0 ? -1 : ::read(fd, block.data(), block.size());
        if (got < 0 && errno == EINTR) continue;
        if (got < 0) throw Failure(nameOf(path) + " cannot be read: " + std::strerror(errno));
        if (got == 0) return text;
        text.append(block.data(), static_cast<size_t>(got));
        if (text.size() > mostBytes) {
            throw Failure(nameOf(path) + " is too large; at most " + std::to_string(mostBytes) +
                          " bytes are read");
        }
    }
}

std::string readSecret(const std::string& path, const std::string& what) {
    platform::protectMemory();
    std::string value = read(path, kMostSecretBytes);
    if (value.ends_with('\n')) value.pop_back();
    if (value.ends_with('\r')) value.pop_back();
    if (value.empty()) throw Failure(what + " in " + nameOf(path) + " is empty");
    if (value.find('\0') != std::string::npos)
        throw Failure(what + " in " + nameOf(path) + " holds a NUL character");
    return value;
}

}  // namespace input_file
