// device.h: conditions of the device: storage, network connection, e-mail accounts. Threads: any.
#pragma once

#include <sys/statvfs.h>

// Internal storage: the file system under the root. f_bavail and f_blocks are capped so that their product
// with the block size stays below 4 GiB (readers multiply in 32 bits). 0 or a negative code.
[[nodiscard]] int storage_get_internal_memory_size(struct statvfs* out);

// The active network connection, from the kernel's routing table and the device type.
enum connection_type_e {
    CONNECTION_TYPE_DISCONNECTED = 0,
    CONNECTION_TYPE_WIFI = 1,
    CONNECTION_TYPE_CELLULAR = 2,
    CONNECTION_TYPE_ETHERNET = 3,
};
struct connection_s;
using connection_h = connection_s*;
[[nodiscard]] int connection_create(connection_h* connection);
[[nodiscard]] int connection_get_type(connection_h connection, connection_type_e* type);
int connection_destroy(connection_h connection);

// E-mail accounts: none unless the file "/opt/usr/data/email/accounts" under the root lists some, a line
// each: ACCOUNT_ID SYNC_STATUS (1: syncing).
struct email_account_t {
    int account_svc_id;  // the account service's id of the same account
    int sync_status;     // 1 while the e-mail service syncs it
};
// On success *list is a heap array of *count entries, released with email_free_account.
[[nodiscard]] int email_get_account_list(email_account_t** list, int* count);
int email_free_account(email_account_t** list, int count);
