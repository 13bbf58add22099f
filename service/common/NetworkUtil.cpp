#include "common/NetworkUtil.h"

#include "common/SyncLog.h"
#include "platform/device.h"
#include "platform/error.h"
#include "platform/settings.h"

int is_roaming_zone() {
    constexpr int kZoneRoaming = 2;
    connection_h connection = nullptr;
    if (const int code = connection_create(&connection); code != PLATFORM_ERROR_NONE) {
        SYNC_ERR("fail(%d)", code);
        return 0;
    }
    connection_type_e type = CONNECTION_TYPE_DISCONNECTED;
    if (const int code = connection_get_type(connection, &type); code != PLATFORM_ERROR_NONE)
        SYNC_ERR("fail(%d)", code);
    int zone = 0;
    const bool roaming = type == CONNECTION_TYPE_CELLULAR &&
                         vconf_get_int("memory/telephony/zone_type", &zone) == PLATFORM_ERROR_NONE &&
                         zone == kZoneRoaming;
    connection_destroy(connection);
    return roaming ? 1 : 0;
}
