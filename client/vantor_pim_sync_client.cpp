// libvantor-pim-sync: the call interface for other programs. Each call is one exchange with the daemon.
#include "ServiceLink.h"
#include "common/NotificationReceiveManager.h"
#include "common/vantor_pim_sync_ipc_marshal.h"

namespace {

constexpr int kFailed = -1;
constexpr int kTimeoutMs = 15'000;
constexpr int kRemovalTimeoutMs = 25'000;  // the daemon waits for a running sync of each kind

ServiceLink& link() {
    return ServiceLink::getInstance();
}

ServiceLink::Put accountArgument(const vantor_pim_sync_account_s* account) {
    return
        [account](pims_ipc_data_h data) { return vantor_pim_sync_ipc_marshal_sync_account(account, data); };
}

ServiceLink::Put idArgument(int accountId) {
    return [accountId](pims_ipc_data_h data) { return vantor_pim_sync_ipc_marshal_int(accountId, data); };
}

ServiceLink::Put idAndTypeArguments(int accountId, vantor_pim_sync_type_e type) {
    return [accountId, type](pims_ipc_data_h data) {
        const int first = vantor_pim_sync_ipc_marshal_int(accountId, data);
        return first != 0 ? first : vantor_pim_sync_ipc_marshal_int(type, data);
    };
}

ServiceLink::Take numberReply(int* number) {
    return [number](pims_ipc_data_h data) { return vantor_pim_sync_ipc_unmarshal_int(data, number); };
}

}  // namespace

int vantor_pim_sync_initialize(void) {
    return link().connect() == 0 ? 0 : kFailed;
}

int vantor_pim_sync_finalize(void) {
    link().disconnect();
    NotificationReceiveManager::getInstance().detachAllListeners();
    return 0;
}

int vantor_pim_sync_add_account(const vantor_pim_sync_account_s* account) {
    if (account == nullptr) return kFailed;
    return link().call("add_account", /*isRead=*/false, kTimeoutMs, accountArgument(account), nullptr);
}

int vantor_pim_sync_remove_account(int account_id) {
    return link().call("remove_account", /*isRead=*/false, kRemovalTimeoutMs, idArgument(account_id),
                       nullptr);
}

int vantor_pim_sync_update_account(const vantor_pim_sync_account_s* account) {
    if (account == nullptr) return kFailed;
    return link().call("update_account", /*isRead=*/false, kTimeoutMs, accountArgument(account), nullptr);
}

int vantor_pim_sync_get_account(int account_id, vantor_pim_sync_account_s** account) {
    if (account == nullptr) return kFailed;
    return link().call("get_account", /*isRead=*/true, kTimeoutMs, idArgument(account_id),
                       [account](pims_ipc_data_h data) {
                           return vantor_pim_sync_ipc_unmarshal_sync_account(data, account);
                       });
}

int vantor_pim_sync_start(int account_id, vantor_pim_sync_type_e type) {
    return link().call("start", /*isRead=*/false, kTimeoutMs, idAndTypeArguments(account_id, type), nullptr);
}

int vantor_pim_sync_stop(int account_id, vantor_pim_sync_type_e type) {
    return link().call("stop", /*isRead=*/false, kTimeoutMs, idAndTypeArguments(account_id, type), nullptr);
}

int vantor_pim_sync_get_state(int account_id, vantor_pim_sync_type_e type, int* state) {
    if (state == nullptr) return 0;
    return link().call("get_state", /*isRead=*/true, kTimeoutMs, idAndTypeArguments(account_id, type),
                       numberReply(state));
}

int vantor_pim_sync_get_sync_time(int account_id, vantor_pim_sync_type_e type, int* time) {
    if (time == nullptr) return kFailed;
    return link().call("get_sync_time", /*isRead=*/true, kTimeoutMs, idAndTypeArguments(account_id, type),
                       numberReply(time));
}

int vantor_pim_sync_add_state_changed_cb(vantor_pim_sync_type_e type,
                                         vantor_pim_sync_state_changed_cb callback, void* user_data) {
    return NotificationReceiveManager::getInstance().attachListener(
        std::make_shared<StateChangedListener>(type, callback, user_data));
}

int vantor_pim_sync_remove_state_changed_cb(vantor_pim_sync_type_e type,
                                            vantor_pim_sync_state_changed_cb callback, void* user_data) {
    (void)NotificationReceiveManager::getInstance().detachListener(type, callback, user_data);
    return 0;
}
