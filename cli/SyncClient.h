// SyncClient.h: the daemon's calls with results that a person understands.
#pragma once

#include <memory>
#include <string>

#include "common/vantor_pim_sync.h"

struct AccountRecordDeleter {
    void operator()(vantor_pim_sync_account_s* record) const noexcept {
        vantor_pim_sync_free_account(record);
    }
};
using AccountRecord = std::unique_ptr<vantor_pim_sync_account_s, AccountRecordDeleter>;

namespace sync_client {

// NULL when the daemon does not have the account (or cannot be asked).
AccountRecord account(int id);
AccountRecord emptyRecord();
void setText(char*& field, const std::string& value);

int state(int id, vantor_pim_sync_type_e kind);
std::string kindName(vantor_pim_sync_type_e kind);

// Why the daemon may have refused a call about the account and kind, as one clause with its remedy.
std::string refusal(int code, int id, vantor_pim_sync_type_e kind);
// Nothing for 0, else a Failure for a call about an account as a whole.
void checkCall(int code, const std::string& what);

}  // namespace sync_client
