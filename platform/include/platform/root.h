// root.h: the folder under which the whole device lives.
// Every absolute path of the system passes through rootedPath(), so that a test, a demo or an unprivileged
// user has a device of their own in any folder.
#pragma once

#include <string>
#include <string_view>

namespace platform {

// The value of VANTOR_PIM_SYNC_ROOT without trailing slashes; empty means the real root. Read at each call.
// Threads: any, as long as nobody changes the environment.
std::string rootFolder();

// `absolute` ("/opt/usr/...") with the root put in front.
std::string rootedPath(std::string_view absolute);

// Makes the folder `absolute` under the root with all its parents. Folders that are there keep their mode.
// Returns PLATFORM_ERROR_NONE, PLATFORM_ERROR_PERMISSION_DENIED, PLATFORM_ERROR_NO_SPACE or PLATFORM_ERROR_IO.
[[nodiscard]] int makeFolder(std::string_view absolute, unsigned mode = 0755);

// Gives what the superuser has just made at `path` (of the machine) to the owner of the folder that it lies in: the
// daemon has a user of its own, and the administrator's tool writes what it reads. Does nothing for other users.
// False with errno.
[[nodiscard]] bool giveToFolderOwner(int fd, const std::string& path);

// Puts `content` at `path` (of the machine), in a folder that is there and no link, as the folder's owner's. Readers see
// the former content or the new one, never half, and so does whoever looks after the power failed. Not `isDurable`: for
// what ends with the boot anyway; nothing is waited for. False with errno: the former content is still there.
[[nodiscard]] bool replaceFile(const std::string& path, std::string_view content, unsigned mode,
                               bool isDurable = true);

}  // namespace platform
