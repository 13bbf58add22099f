// account.h: the device's account service: which accounts exist, of which package, and how their sync stands.
// One SQLite file shared by all processes. Threads: any; subscriptions are main thread only and are delivered
// by the default main context, for the writes of every process, the subscriber's own included.
#pragma once

struct account_s;
using account_h = account_s*;
struct account_subscribe_s;
using account_subscribe_h = account_subscribe_s*;

enum account_sync_state_e {
    ACCOUNT_SYNC_INVALID = 0,
    ACCOUNT_SYNC_NOT_SUPPORT = 1,
    ACCOUNT_SYNC_STATUS_OFF = 2,
    ACCOUNT_SYNC_STATUS_IDLE = 3,
    ACCOUNT_SYNC_STATUS_RUNNING = 4,
};

// Events of a subscription: "insert", "update", "delete", "sync_update" (the sync status was written).
// Return true to keep the subscription.
using account_event_cb = bool (*)(const char* event_type, int account_id, void* user_data);
// Return true to continue. The handle is valid during the call only.
using account_cb = bool (*)(account_h account, void* user_data);

[[nodiscard]] int account_connect();
int account_disconnect();

[[nodiscard]] int account_create(account_h* account);
int account_destroy(account_h account);
// PLATFORM_ERROR_NOT_FOUND when there is no such account; the handle is filled on success.
[[nodiscard]] int account_query_account_by_account_id(int account_id, account_h* account);
// PLATFORM_ERROR_NOT_FOUND when the package has no account at all.
[[nodiscard]] int account_query_account_by_package_name(account_cb callback, const char* package_name,
                                                        void* user_data);
[[nodiscard]] int account_get_account_id(account_h account, int* account_id);
// Borrowed from the handle.
[[nodiscard]] int account_get_email_address(account_h account, const char** email);
[[nodiscard]] int account_get_sync_support(account_h account, account_sync_state_e* status);

// While a package has accounts the file "/opt/usr/data/accounts/packages/PACKAGE" is there; a registration gives it a
// new time. A service manager that watches it starts what serves the accounts. What a process left undone is made up
// for by account_connect.
// For account applications and the tool. An id that is taken is PLATFORM_ERROR_INVALID_PARAMETER.
[[nodiscard]] int account_insert(int account_id, const char* package_name, const char* email);
[[nodiscard]] int account_delete(int account_id);

[[nodiscard]] int account_update_sync_status_by_id(int account_id, int status);

[[nodiscard]] int account_subscribe_create(account_subscribe_h* handle);
[[nodiscard]] int account_subscribe_notification(account_subscribe_h handle, account_event_cb callback,
                                                 void* user_data);
// Ends the subscription and releases the handle; NULL is success.
int account_unsubscribe_notification(account_subscribe_h handle);
