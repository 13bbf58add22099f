#include "PhotoFile.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "Failure.h"
#include "Handles.h"
#include "InputFile.h"
#include "platform/root.h"

namespace {

constexpr const char* kFolder = "/tmp";
constexpr const char* kPattern = "/vantor-pim-syncctl-XXXXXX";
constexpr mode_t kNewFileMode = 0666;  // less the user's mask

void writeAll(int fd, const std::string& bytes, const std::string& target) {
    for (size_t done = 0; done < bytes.size();) {
        const ssize_t written = write(fd, bytes.data() + done, bytes.size() - done);
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) throw Failure(target + " cannot be written: " + std::strerror(errno));
        done += static_cast<size_t>(written);
    }
}

}  // namespace

StagedPhoto::StagedPhoto(const std::string& source) {
    if (source.empty()) return;
    const std::string bytes = photo_file::read(source);
    if (bytes.empty()) throw Failure(source + " is empty; it is no photo");
    stage(bytes);
}

void StagedPhoto::stage(const std::string& bytes) {
    check(platform::makeFolder(kFolder), "the folder for photos");
    std::string path = platform::rootedPath(std::string(kFolder) + kPattern);
    const Descriptor file(mkostemp(path.data(), O_CLOEXEC));
    if (!file) throw Failure(path + " cannot be made: " + std::strerror(errno));
    mPath = path.substr(platform::rootFolder().size());
    try {
        writeAll(file.get(), bytes, path);
    } catch (const Failure&) {
        unlink(path.c_str());
        throw;
    }
}

StagedPhoto::~StagedPhoto() {
    if (!mPath.empty()) unlink(platform::rootedPath(mPath).c_str());
}

namespace photo_file {

std::string read(const std::string& source) {
    return input_file::read(source, kMostBytes);
}

void save(const std::string& source, const std::string& target) {
    const std::string bytes = read(source);
    if (target == "-") {
        writeAll(STDOUT_FILENO, bytes, "standard output");
        return;
    }
    const Descriptor file(open(target.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, kNewFileMode));
    if (!file) throw Failure(target + " cannot be written: " + std::strerror(errno));
    writeAll(file.get(), bytes, target);
}

}  // namespace photo_file
