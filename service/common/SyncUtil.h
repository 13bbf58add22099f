// Device conditions of a sync. Threads: any.
#pragma once

// 0 when there is room, -28 when 4 MB or less are free, -1 when the storage cannot be asked.
[[nodiscard]] int is_storage_full();
