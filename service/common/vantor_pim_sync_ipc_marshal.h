// Putting values into an IPC data object and taking them out, on both sides of the socket.
// All return 0 or -1; outputs are untouched on failure. An item of the wrong size, or a text item that does not end in NUL, is a
// failed read: nothing is ever read past an item.
#pragma once

#include "common/vantor_pim_sync.h"
#include "platform/ipc.h"

inline constexpr const char* kServiceSocket = "/tmp/.vantor_pim_sync_ipc";
inline constexpr const char* kServiceModule = "vantor_pim_sync_ipc_module";

[[nodiscard]] int vantor_pim_sync_ipc_marshal_int(int value, pims_ipc_data_h data);
[[nodiscard]] int vantor_pim_sync_ipc_marshal_bool(bool value, pims_ipc_data_h data);
// NULL travels as the length -1 alone.
[[nodiscard]] int vantor_pim_sync_ipc_marshal_string(const char* value, pims_ipc_data_h data);
[[nodiscard]] int vantor_pim_sync_ipc_marshal_sync_account(const vantor_pim_sync_account_s* account,
                                                           pims_ipc_data_h data);

[[nodiscard]] int vantor_pim_sync_ipc_unmarshal_int(pims_ipc_data_h data, int* value);
[[nodiscard]] int vantor_pim_sync_ipc_unmarshal_bool(pims_ipc_data_h data, bool* value);
// A heap copy, released with free(); NULL when NULL was sent, or when the text itself is missing.
[[nodiscard]] int vantor_pim_sync_ipc_unmarshal_string(pims_ipc_data_h data, char** value);
// Released with vantor_pim_sync_free_account().
[[nodiscard]] int vantor_pim_sync_ipc_unmarshal_sync_account(pims_ipc_data_h data,
                                                             vantor_pim_sync_account_s** account);
