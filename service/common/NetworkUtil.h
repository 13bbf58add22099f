// Network conditions of a scheduled sync. Threads: any.
#pragma once

// 1 when the active connection is cellular and the telephony zone is roaming, else 0, failures included.
[[nodiscard]] int is_roaming_zone();
