#include "SyncClient.h"

#include <cstdlib>
#include <cstring>
#include <new>

#include "DaemonLink.h"
#include "Failure.h"
#include "Names.h"

namespace sync_client {

namespace {

constexpr int kStorageFull = -28;
constexpr const char* kStorageFullText = "the device's storage is full; make room and try again";

}  // namespace

AccountRecord account(int id) {
    vantor_pim_sync_account_s* record = nullptr;
    const int code = vantor_pim_sync_get_account(id, &record);
    AccountRecord owned(record);
    return code == 0 ? std::move(owned) : nullptr;
}

AccountRecord emptyRecord() {
    AccountRecord record(
        static_cast<vantor_pim_sync_account_s*>(calloc(1, sizeof(vantor_pim_sync_account_s))));
    if (record == nullptr) throw std::bad_alloc();
    return record;
}

void setText(char*& field, const std::string& value) {
    char* copy = strdup(value.c_str());
    if (copy == nullptr) throw std::bad_alloc();
    free(field);
    field = copy;
}

int state(int id, vantor_pim_sync_type_e kind) {
    int value = SYNC_AGENT_STATE_NONE;
    return vantor_pim_sync_get_state(id, kind, &value) == 0 ? value : SYNC_AGENT_STATE_NONE;
}

std::string kindName(vantor_pim_sync_type_e kind) {
    return std::string(nameOf(kKinds, kind));
}

std::string refusal(int code, int id, vantor_pim_sync_type_e kind) {
    const std::string number = std::to_string(id);
    if (code == kStorageFull) return kStorageFullText;
    if (!daemon_link::servingPid()) return "the daemon has ended; " + daemon_link::startAdvice();
    if (state(id, kind) == SYNC_AGENT_STATE_UNAVAILABLE) {
        return "the account's authorisation is no longer accepted; renew the token with: account update " +
               number + " --refresh-token-file FILE";
    }
    const AccountRecord record = account(id);
    if (record == nullptr) {
        return "the daemon does not have the account " + number + "; see: vantor-pim-syncctl account list";
    }
    const bool isCalendar = kind == VANTOR_PIM_SYNC_TYPE_CALENDAR;
    if (isCalendar ? !record->calsync : !record->ctsync) {
        const std::string name = isCalendar ? "calendar" : "contacts";
        return name + " sync of the account " + number +
               " is off; turn it on with: vantor-pim-syncctl account update " + number + " --" + name;
    }
    return "the daemon refused; its log tells why";
}

void checkCall(int code, const std::string& what) {
    if (code == 0) return;
    if (code == kStorageFull) throw Failure(what + ": " + kStorageFullText);
    throw Failure(what + ": " +
                  (daemon_link::servingPid() ? "the daemon refused; its log tells why"
                                             : "the daemon does not answer; its log tells why"));
}

}  // namespace sync_client
