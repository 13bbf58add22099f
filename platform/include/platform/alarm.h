// alarm.h: the alarm manager: repeating alarms on a clock that also counts the time the machine is suspended.
// After a long sleep (or a stopped process) an alarm is delivered once, late, and then keeps its interval.
// Alarms belong to the application named in alarmmgr_init; they are kept on disk and listed (and delivered)
// after a restart until they are removed. Ids are above 0.
// Threads: main thread; callbacks are delivered by the default main context.
#pragma once

#include <ctime>

using alarm_id_t = int;
using alarm_cb_t = int (*)(alarm_id_t id, void* user_param);
using alarm_enum_fn_t = int (*)(alarm_id_t id, void* user_param);

[[nodiscard]] int alarmmgr_init(const char* application);
// One callback an application; a later call replaces it. Alarms that expire while none is set wait for it.
[[nodiscard]] int alarmmgr_set_cb(alarm_cb_t handler, void* user_param);

// First expiry in `trigger_at_time` seconds (0 or more), then every `interval` seconds (0: once).
// `alarm_type` must be 0; `destination` is unused, pass NULL.
[[nodiscard]] int alarmmgr_add_alarm(int alarm_type, time_t trigger_at_time, time_t interval,
                                     const char* destination, alarm_id_t* id);
// PLATFORM_ERROR_NOT_FOUND when the application holds no such alarm.
int alarmmgr_remove_alarm(alarm_id_t id);
// Calls `fn` for each alarm that the application holds; alarms may be removed from inside it.
[[nodiscard]] int alarmmgr_enum_alarm_ids(alarm_enum_fn_t fn, void* user_param);
// The next expiry as wall-clock time (seconds since 1970).
[[nodiscard]] int alarmmgr_get_next_expiry(alarm_id_t id, time_t* expiry);
