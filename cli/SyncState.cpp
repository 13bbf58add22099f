#include "SyncState.h"

#include "SyncClient.h"
#include "platform/error.h"
#include "platform/settings.h"

SyncState::SyncState(int accountId, vantor_pim_sync_type_e kind)
    : mAccountId(accountId),
      mKind(kind),
      mPrefix("memory/vantor-pim-sync/" + std::to_string(accountId) + "/" + sync_client::kindName(kind) +
              "/") {}

std::string SyncState::text(const char* name) const {
    std::string text;
    const int code = vconf_get_str((mPrefix + name).c_str(), &text);
    return code == PLATFORM_ERROR_NONE ? text : std::string();
}

std::optional<int> SyncState::number(const char* name) const {
    int value = 0;
    const int code = vconf_get_int((mPrefix + name).c_str(), &value);
    return code == PLATFORM_ERROR_NONE ? std::optional(value) : std::nullopt;
}
