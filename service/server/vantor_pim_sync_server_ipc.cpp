#include "server/vantor_pim_sync_server_ipc.h"

#include <iterator>

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "common/vantor_pim_sync_ipc_marshal.h"

using sync_result::kOk;

namespace {

constexpr size_t kReplyBytes = 1024;

// What a request carries and a reply may carry; records are released on every path.
struct Call {
    vantor_pim_sync_account_s* account = nullptr;
    int accountId = 0;
    int type = 0;
    int number = 0;

    Call() = default;
    ~Call() { vantor_pim_sync_free_account(account); }
    Call(const Call&) = delete;
    Call& operator=(const Call&) = delete;

    [[nodiscard]] vantor_pim_sync_type_e kind() const { return static_cast<vantor_pim_sync_type_e>(type); }
};

// --- decoding

int takeAccount(pims_ipc_data_h data, Call* call) {
    return vantor_pim_sync_ipc_unmarshal_sync_account(data, &call->account);
}

int takeId(pims_ipc_data_h data, Call* call) {
    return vantor_pim_sync_ipc_unmarshal_int(data, &call->accountId);
}

int takeIdAndType(pims_ipc_data_h data, Call* call) {
    if (const int result = takeId(data, call); result != kOk) return result;
    return vantor_pim_sync_ipc_unmarshal_int(data, &call->type);
}

// --- encoding of a reply's second item

int putNothing(const Call&, pims_ipc_data_h) {
    return kOk;
}

int putAccount(const Call& call, pims_ipc_data_h data) {
    return call.account != nullptr ? vantor_pim_sync_ipc_marshal_sync_account(call.account, data) : kOk;
}

int putNumber(const Call& call, pims_ipc_data_h data) {
    return vantor_pim_sync_ipc_marshal_int(call.number, data);
}

// The type as it came: a value that is no kind is the operations' to refuse.
struct Command {
    const char* name;
    int (*decode)(pims_ipc_data_h, Call*);
    int (*run)(Call*);
    int (*encode)(const Call&, pims_ipc_data_h);
};

// Decode, call, encode: the steps of every command.
void handle(const Command& command, pims_ipc_data_h request, pims_ipc_data_h* reply) {
    int result = 0;
    Call call;
    // A request without data runs nothing and is answered with 0.
    if (request != nullptr) {
        result = command.decode(request, &call);
        if (result != kOk) {
            SYNC_ERR("unmarshal fail");
        } else {
            result = command.run(&call);
        }
    }
    if (reply == nullptr) {
        SYNC_ERR("outdata ins NULL");
        return;
    }
    *reply = pims_ipc_data_create_with_size(kReplyBytes, 0);
    if (*reply == nullptr) {
        SYNC_ERR("pims_ipc_data_create fail");
        return;
    }
    bool complete = pims_ipc_data_put(*reply, &result, sizeof result) == kOk;
    if (complete && result == kOk && request != nullptr) complete = command.encode(call, *reply) == kOk;
    if (complete) return;
    pims_ipc_data_destroy(*reply);
    *reply = nullptr;
    SYNC_ERR("pims_ipc_data_put fail");
}

constexpr Command kCommands[] = {
    {"add_account", takeAccount, [](Call* call) { return vantor_pim_sync_add_account(call->account); },
     putNothing},
    {"remove_account", takeId, [](Call* call) { return vantor_pim_sync_remove_account(call->accountId); },
     putNothing},
    {"update_account", takeAccount, [](Call* call) { return vantor_pim_sync_update_account(call->account); },
     putNothing},
    {"get_account", takeId,
     [](Call* call) { return vantor_pim_sync_get_account(call->accountId, &call->account); }, putAccount},
    {"start", takeIdAndType, [](Call* call) { return vantor_pim_sync_start(call->accountId, call->kind()); },
     putNothing},
    {"stop", takeIdAndType, [](Call* call) { return vantor_pim_sync_stop(call->accountId, call->kind()); },
     putNothing},
    {"get_state", takeIdAndType,
     [](Call* call) { return vantor_pim_sync_get_state(call->accountId, call->kind(), &call->number); },
     putNumber},
    {"get_sync_time", takeIdAndType,
     [](Call* call) { return vantor_pim_sync_get_sync_time(call->accountId, call->kind(), &call->number); },
     putNumber},
};

template <size_t Index>
void handler(pims_ipc_h, pims_ipc_data_h request, pims_ipc_data_h* reply, void*) {
    handle(kCommands[Index], request, reply);
}

}  // namespace

// The handlers under the names that a debugger shows.
#define SERVER_IPC_HANDLER(name, index)                                                                     \
    static void vantor_pim_sync_server_ipc_##name(pims_ipc_h ipc, pims_ipc_data_h in, pims_ipc_data_h* out, \
                                                  void* data) {                                             \
        handler<index>(ipc, in, out, data);                                                                 \
    }
SERVER_IPC_HANDLER(add_account, 0)
SERVER_IPC_HANDLER(remove_account, 1)
SERVER_IPC_HANDLER(update_account, 2)
SERVER_IPC_HANDLER(get_account, 3)
SERVER_IPC_HANDLER(start, 4)
SERVER_IPC_HANDLER(stop, 5)
SERVER_IPC_HANDLER(get_state, 6)
SERVER_IPC_HANDLER(get_sync_time, 7)

bool vantor_pim_sync_server_ipc_register() {
    constexpr pims_ipc_call_cb kHandlers[] = {
        vantor_pim_sync_server_ipc_add_account,    vantor_pim_sync_server_ipc_remove_account,
        vantor_pim_sync_server_ipc_update_account, vantor_pim_sync_server_ipc_get_account,
        vantor_pim_sync_server_ipc_start,          vantor_pim_sync_server_ipc_stop,
        vantor_pim_sync_server_ipc_get_state,      vantor_pim_sync_server_ipc_get_sync_time,
    };
    static_assert(std::size(kHandlers) == std::size(kCommands));
    for (size_t i = 0; i < std::size(kCommands); ++i) {
        if (pims_ipc_svc_register(kServiceModule, kCommands[i].name, kHandlers[i], nullptr) != kOk) {
            SYNC_ERR("pims_ipc_svc_register error");
            return false;
        }
    }
    return true;
}
