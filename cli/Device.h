// Device.h: what a root folder needs before the daemon can work in it.
#pragma once

#include <sys/types.h>

#include <array>
#include <span>
#include <string>

namespace device {

struct Folder {
    const char* path;
    mode_t mode;
    bool isOfTheSystem;  // there in every real root, and not ours to change there
};

// Makes the folders, the notification files and the stores that are missing; what is there stays as it is.
void prepare();

// What prepare() makes, as paths of the system.
std::span<const Folder> folders();
std::array<std::string, 2> notificationFiles();
inline constexpr mode_t kNotificationMode = 0644;

// Whether a root folder of its own is set (VANTOR_PIM_SYNC_ROOT), so that the tool may start and end its daemon.
bool isPrivate();

inline constexpr const char* kDataFolder = "/opt/usr/data/vantor-pim-sync";
inline constexpr const char* kStoreFolder = "/opt/usr/dbspace";
inline constexpr const char* kTrustedFolder =
    "/opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted";

}  // namespace device
