#include "common/SyncUtil.h"

#include <cstdint>

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/device.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStorageFull;

int is_storage_full() {
    constexpr unsigned kBytesPerMegabyteShift = 20;
    constexpr long kEnoughMegabytes = 4;
    struct statvfs st {};
    if (const int code = storage_get_internal_memory_size(&st); code < 0) {
        SYNC_ERR("ret_from_storage_lib : %d", code);
        return kFailed;
    }
    // Multiplied in 32 bits; the storage service caps the product below 4 GiB.
    const uint32_t bytes = static_cast<uint32_t>(st.f_bsize) * static_cast<uint32_t>(st.f_bavail);
    const auto megabytes = static_cast<long>(bytes >> kBytesPerMegabyteShift);
    if (megabytes > kEnoughMegabytes) return kOk;
    SYNC_ERR("total[%lf] avail[%lf]", static_cast<double>(st.f_frsize) * static_cast<double>(st.f_blocks),
             static_cast<double>(st.f_bsize) * static_cast<double>(st.f_bavail));
    SYNC_ERR("Not enough free space of storage [%ld] MB.", megabytes);
    return kStorageFull;
}
