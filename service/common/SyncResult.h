// SyncResult.h: the result codes shared across the daemon. No bare number appears elsewhere.
#pragma once

namespace sync_result {

inline constexpr int kOk = 0;
inline constexpr int kStopped = 1;   // a step ended early because the sync was stopped
inline constexpr int kFailed = -1;   // failure or refusal
inline constexpr int kAborted = -2;  // transfer ended by the progress observer
inline constexpr int kTransferTimeout = -3;
inline constexpr int kTokenFailed = -5;  // no new access token could be obtained
inline constexpr int kStorageFull = -28;

}  // namespace sync_result
