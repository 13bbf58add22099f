#include "exchange/OutputFile.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "Failure.h"

namespace exchange {

namespace {

constexpr size_t kBufferBytes = 65536;

std::string folderOf(const std::string& path) {
    const size_t slash = path.rfind('/');
    if (slash == std::string::npos) return ".";
    return slash == 0 ? "/" : path.substr(0, slash);
}

}  // namespace

OutputFile::OutputFile(const std::string& path)
    : mPath(path == "-" ? "standard output" : path), mFd(STDOUT_FILENO) {
    if (path == "-") return;
    struct stat info {};
    const bool isThere = stat(path.c_str(), &info) == 0;
    if (isThere && S_ISDIR(info.st_mode)) throw Failure(path + " is a folder; name a file in it");
    if (isThere && !S_ISREG(info.st_mode)) {
        mFile = Descriptor(open(path.c_str(), O_WRONLY | O_CLOEXEC));
    } else {
        mFresh = path + ".XXXXXX";
        mFile = Descriptor(mkostemp(mFresh.data(), O_CLOEXEC));  // mode 0600
        if (!mFile) mFresh.clear();
    }
    if (!mFile) fail("made");
    mFd = mFile.get();
}

OutputFile::~OutputFile() {
    if (!mFresh.empty()) unlink(mFresh.c_str());
}

void OutputFile::fail(const char* what) {
    throw Failure(mPath + " cannot be " + what + ": " + std::strerror(errno));
}

void OutputFile::flush() {
    for (size_t done = 0; done < mBuffer.size();) {
        const ssize_t written = ::write(mFd, mBuffer.data() + done, mBuffer.size() - done);
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) fail("written");
        done += static_cast<size_t>(written);
    }
    mBuffer.clear();
}

void OutputFile::write(std::string_view text) {
    mBuffer += text;
    if (mBuffer.size() >= kBufferBytes) flush();
}

void OutputFile::finish() {
    flush();
    if (mFresh.empty()) return;
    if (fsync(mFd) != 0 || rename(mFresh.c_str(), mPath.c_str()) != 0) fail("written");
    mFresh.clear();
    const Descriptor folder(open(folderOf(mPath).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder) fsync(folder.get());
}

}  // namespace exchange
