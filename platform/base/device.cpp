#include "platform/device.h"

#include <linux/route.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <limits>
#include <sstream>
#include <string>
#include <vector>

#include "NetworkRoutes.h"
#include "platform/error.h"
#include "platform/root.h"

struct connection_s {};

namespace platform::device {

namespace {

// The one of the lowest metric, of those that lead somewhere.
class BestRoute {
public:
    void offer(const std::string& interface, unsigned long metric, unsigned long flags) {
        const bool isUsable = (flags & RTF_UP) != 0 && (flags & RTF_REJECT) == 0;
        if (!isUsable || (!mInterface.empty() && metric >= mMetric)) return;
        mInterface = interface;
        mMetric = metric;
    }
    [[nodiscard]] const std::string& interface() const { return mInterface; }

private:
    std::string mInterface;
    unsigned long mMetric = 0;
};

bool isZero(const std::string& digits) {
    return digits.find_first_not_of('0') == std::string::npos;
}

std::string bestOf4(const std::string& routeFile) {
    std::ifstream file(routeFile);
    std::string line;
    std::getline(file, line);  // the head
    BestRoute best;
    while (std::getline(file, line)) {
        std::istringstream fields(line);
        std::string interface, destination, gateway, references, use, mask;
        unsigned long flags = 0;
        unsigned long metric = 0;
        fields >> interface >> destination >> gateway >> std::hex >> flags >> std::dec >> references >> use >>
            metric >> mask;
        if (fields && isZero(destination) && isZero(mask)) best.offer(interface, metric, flags);
    }
    return best.interface();
}

std::string bestOf6(const std::string& routeFile) {
    std::ifstream file(routeFile);
    BestRoute best;
    for (std::string line; std::getline(file, line);) {
        std::istringstream fields(line);
        std::string destination, length, source, sourceLength, gateway, references, use, interface;
        unsigned long metric = 0;
        unsigned long flags = 0;
        fields >> destination >> length >> source >> sourceLength >> gateway >> std::hex >> metric >>
            references >> use >> flags >> interface;
        if (fields && isZero(destination) && isZero(length)) best.offer(interface, metric, flags);
    }
    return best.interface();
}

}  // namespace

std::string defaultInterface(const std::string& routeFile, const std::string& route6File) {
    const std::string interface = bestOf4(routeFile);
    return interface.empty() ? bestOf6(route6File) : interface;
}

connection_type_e interfaceType(const std::string& interfacesFolder, const std::string& interface) {
    if (interface.empty()) return CONNECTION_TYPE_DISCONNECTED;
    const std::filesystem::path folder = std::filesystem::path(interfacesFolder) / interface;
    std::error_code ignored;
    if (std::filesystem::exists(folder / "wireless", ignored) ||
        std::filesystem::exists(folder / "phy80211", ignored)) {
        return CONNECTION_TYPE_WIFI;
    }
    std::ifstream uevent(folder / "uevent");
    for (std::string line; std::getline(uevent, line);) {
        if (line == "DEVTYPE=wwan") return CONNECTION_TYPE_CELLULAR;
        if (line == "DEVTYPE=wlan") return CONNECTION_TYPE_WIFI;
    }
    // Modems that speak the point-to-point protocol have no device type of their own.
    if (interface.starts_with("ppp") || interface.starts_with("wwan") || interface.starts_with("rmnet")) {
        return CONNECTION_TYPE_CELLULAR;
    }
    return CONNECTION_TYPE_ETHERNET;
}

}  // namespace platform::device

int storage_get_internal_memory_size(struct statvfs* out) {
    if (out == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    struct statvfs info {};
    const std::string root = platform::rootFolder();
    if (statvfs(root.empty() ? "/" : root.c_str(), &info) != 0) return PLATFORM_ERROR_IO;
    // Readers multiply blocks and block size in 32 bits; a larger product would wrap to next to nothing.
    constexpr uint64_t kMostBytes = std::numeric_limits<uint32_t>::max();
    if (info.f_bsize > 0) info.f_bavail = std::min<uint64_t>(info.f_bavail, kMostBytes / info.f_bsize);
    if (info.f_frsize > 0) info.f_blocks = std::min<uint64_t>(info.f_blocks, kMostBytes / info.f_frsize);
    *out = info;
    return PLATFORM_ERROR_NONE;
}

int connection_create(connection_h* connection) {
    if (connection == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    *connection = new connection_s;
    return PLATFORM_ERROR_NONE;
}

int connection_get_type(connection_h connection, connection_type_e* type) {
    if (connection == nullptr || type == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    using namespace platform::device;
    *type = interfaceType("/sys/class/net", defaultInterface("/proc/net/route", "/proc/net/ipv6_route"));
    return PLATFORM_ERROR_NONE;
}

int connection_destroy(connection_h connection) {
    if (connection == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    delete connection;
    return PLATFORM_ERROR_NONE;
}

int email_get_account_list(email_account_t** list, int* count) {
    if (list == nullptr || count == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    std::vector<email_account_t> accounts;
    std::ifstream file(platform::rootedPath("/opt/usr/data/email/accounts"));
    email_account_t account{};
    while (file >> account.account_svc_id >> account.sync_status) accounts.push_back(account);
    auto* copy = static_cast<email_account_t*>(std::calloc(accounts.size() + 1, sizeof(email_account_t)));
    if (copy == nullptr) return PLATFORM_ERROR_FAILED;
    std::copy(accounts.begin(), accounts.end(), copy);
    *list = copy;
    *count = static_cast<int>(accounts.size());
    return PLATFORM_ERROR_NONE;
}

int email_free_account(email_account_t** list, int /*count*/) {
    if (list == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    std::free(*list);
    *list = nullptr;
    return PLATFORM_ERROR_NONE;
}
