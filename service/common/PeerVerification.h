// PeerVerification: whether servers have to prove who they are.
#pragma once

#include "platform/error.h"
#include "platform/settings.h"

inline constexpr const char* kVerifyPeerKey = "db/vantor-pim-sync/verify_peer";

// Not while the key is unset, 0 or false. A setting that cannot be read may have said otherwise: then they have to.
[[nodiscard]] inline bool isPeerVerified() {
    int number = 0;
    const int code = vconf_get_int(kVerifyPeerKey, &number);
    if (code == PLATFORM_ERROR_NONE) return number != 0;
    if (code == PLATFORM_ERROR_NOT_FOUND) return false;
    bool flag = false;
    return vconf_get_bool(kVerifyPeerKey, &flag) != PLATFORM_ERROR_NONE || flag;
}
