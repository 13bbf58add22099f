// SyncLog.h: the daemon's one log format. SYNC_ERR is for failures and for every decision worth noting; the exact
// text is a literal where it is logged, so that it can be found. SYNC_DBG is hidden unless debug is asked for.
// Never a secret: no token, no key, no body of a token reply.
#pragma once

#include <cstdlib>

#include "platform/log.h"

inline constexpr const char* kSyncLogTag = "VANTOR_PIM_SYNC_SERVICE";

#define SYNC_ERR(format, ...) SYNC_ERR_AS(__func__, format __VA_OPT__(, ) __VA_ARGS__)

// As SYNC_ERR, under the name of another function: for helpers that log for the operation they serve.
#define SYNC_ERR_AS(function, format, ...)                                                 \
    dlog_print_at(DLOG_ERROR, kSyncLogTag, log_place_s{__FILE_NAME__, function, __LINE__}, \
                  "\033[31m* Critical * " format "\033[0m" __VA_OPT__(, ) __VA_ARGS__)

// What a run did, for people who read the log.
#define SYNC_INFO(format, ...)                                                            \
    dlog_print_at(DLOG_INFO, kSyncLogTag, log_place_s{__FILE_NAME__, __func__, __LINE__}, \
                  format __VA_OPT__(, ) __VA_ARGS__)

#define SYNC_DBG(format, ...)                                                              \
    dlog_print_at(DLOG_DEBUG, kSyncLogTag, log_place_s{__FILE_NAME__, __func__, __LINE__}, \
                  format __VA_OPT__(, ) __VA_ARGS__)

// A broken invariant: logs its text and aborts, in every build type.
#define SYNC_ASSERT_TEXT(condition, text)   \
    do {                                    \
        if (!(condition)) {                 \
            SYNC_ERR("Assertion %s", text); \
            std::abort();                   \
        }                                   \
    } while (false)

#define SYNC_ASSERT(condition) SYNC_ASSERT_TEXT(condition, #condition)
