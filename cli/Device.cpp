#include "Device.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstring>
#include <string>

#include "CalendarStore.h"
#include "Failure.h"
#include "Handles.h"
#include "platform/account.h"
#include "platform/error.h"
#include "platform/root.h"

namespace device {

namespace {

constexpr Folder kFolders[] = {
    {"/tmp", 01777, true},
    {kStoreFolder, 0770, false},
    {kDataFolder, 0755, false},
    {kTrustedFolder, 0700, false},
};
// Clients watch them, the daemon alone writes.
constexpr const char* kNotificationFiles[] = {"/.notificationPathCalendar", "/.notificationPathContacts"};

void makeFolder(const Folder& folder) {
    const std::string path = platform::rootedPath(folder.path);
    struct stat info {};
    if (stat(path.c_str(), &info) == 0) {
        if (S_ISDIR(info.st_mode)) return;
        throw Failure(path + " is there and is no folder; move it away");
    }
    // The folders above it are for everybody to pass through.
    const std::string name(folder.path);
    const std::string above = name.substr(0, name.rfind('/'));
    if (!above.empty())
        check(platform::makeFolder(above), "making the folder " + platform::rootedPath(above));
    check(platform::makeFolder(folder.path, folder.mode), "making the folder " + path);
    if (chmod(path.c_str(), folder.mode) != 0) throw Failure(path + ": " + std::strerror(errno));
}

void makeNotificationFile(const std::string& path) {
    const Descriptor file(
        open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, kNotificationMode));
    if (!file && errno != EEXIST) throw Failure(path + " cannot be made: " + std::strerror(errno));
    if (file &&
        (fchmod(file.get(), kNotificationMode) != 0 || !platform::giveToFolderOwner(file.get(), path)))
        throw Failure(path + ": " + std::strerror(errno));
}

}  // namespace

bool isPrivate() {
    return !platform::rootFolder().empty();
}

std::span<const Folder> folders() {
    return kFolders;
}

std::array<std::string, 2> notificationFiles() {
    return {std::string(kDataFolder) + kNotificationFiles[0],
            std::string(kDataFolder) + kNotificationFiles[1]};
}

void prepare() {
    for (const Folder& folder : kFolders) {
        if (folder.isOfTheSystem && !isPrivate()) continue;
        makeFolder(folder);
    }
    for (const std::string& path : notificationFiles()) makeNotificationFile(platform::rootedPath(path));
    check(account_connect(), "the account store");
    account_disconnect();
    const CalendarStore calendars;
}

}  // namespace device
