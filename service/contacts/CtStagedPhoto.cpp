#include "contacts/CtStagedPhoto.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <mutex>
#include <unordered_set>

#include "common/SyncLog.h"
#include "contacts/CtIdUtil.h"
#include "platform/root.h"

using platform::rootedPath;

namespace {

constexpr mode_t kFileMode = 0600;
constexpr const char* kFolder = "/tmp/";

// The files in use. Accounts may have photos of the same id, and their workers run side by side.
struct Names {
    std::mutex mutex;
    std::unordered_set<std::string> inUse;
};

Names& names() {
    static Names* const instance = new Names;
    return *instance;
}

std::string claim(const std::string& id) {
    const std::lock_guard lock(names().mutex);
    std::string path = kFolder + id;
    for (int i = 1; !names().inUse.insert(path).second; ++i) path = kFolder + id + "." + std::to_string(i);
    return path;
}

void release(const std::string& path) {
    const std::lock_guard lock(names().mutex);
    names().inUse.erase(path);
}

bool isMarkup(const char* head, size_t size) {
    size_t at = 0;
    while (at < size && strchr(" \t\r\n", head[at]) != nullptr) ++at;
    return at < size && head[at] == '<';
}

}  // namespace

std::unique_ptr<CtStagedPhoto> CtStagedPhoto::create(const std::string& id) {
    if (!CtIdUtil::isFileName(id)) {
        SYNC_ERR("the photo's id(%.64s) cannot name a file", id.c_str());
        return nullptr;
    }
    std::string path = claim(id);
    const std::string rooted = rootedPath(path);
    // What lies there is left over from a run that was killed, or somebody put it there.
    (void)unlink(rooted.c_str());
    const int fd = open(rooted.c_str(), O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, kFileMode);
    FILE* file = fd != -1 ? fdopen(fd, "w+b") : nullptr;
    if (file == nullptr) {
        SYNC_ERR("%s cannot be made: %s", path.c_str(), strerror(errno));
        if (fd != -1) close(fd);
        release(path);
        return nullptr;
    }
    return std::unique_ptr<CtStagedPhoto>(new CtStagedPhoto(std::move(path), file));
}

CtStagedPhoto::~CtStagedPhoto() {
    if (mpFile != nullptr) (void)fclose(mpFile);
    (void)unlink(rootedPath(mPath).c_str());
    release(mPath);
}

bool CtStagedPhoto::finish(const std::string& contentType) {
    char head[64] = {};
    const bool isWritten = fflush(mpFile) == 0 && fseek(mpFile, 0, SEEK_SET) == 0;
    const size_t size = isWritten ? fread(head, 1, sizeof head, mpFile) : 0;
    const bool isClosed = fclose(mpFile) == 0;
    mpFile = nullptr;
    if (!isWritten || !isClosed) {
        SYNC_ERR("%s cannot be written: %s", mPath.c_str(), strerror(errno));
        return false;
    }
    if (size == 0 || isMarkup(head, size) ||
        (!contentType.empty() && !contentType.starts_with("image/") &&
         !contentType.starts_with("application/octet-stream"))) {
        SYNC_ERR("the photo %s is no image", mPath.c_str());
        return false;
    }
    return true;
}
