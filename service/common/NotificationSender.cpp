#include "common/NotificationSender.h"

#include <fcntl.h>
#include <unistd.h>

#include <cstring>

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/root.h"

namespace {

const char* checked(const char* path) {
    SYNC_ASSERT_TEXT(path != nullptr && strlen(path) > 0, "path != __null && strlen(path) > 0");
    return path;
}

}  // namespace

NotificationSender::NotificationSender(const char* path) : mPath(platform::rootedPath(checked(path))) {}

int NotificationSender::notifyChange() {
    const int fd = open(mPath.c_str(), O_RDWR | O_TRUNC | O_CLOEXEC | O_NOFOLLOW);
    SYNC_ASSERT(fd != -1);
    close(fd);
    return sync_result::kOk;
}
