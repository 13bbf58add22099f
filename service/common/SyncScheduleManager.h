// SyncScheduleManager: turns sync periods into repeating alarms and calls the agent whose alarm fires.
// Owner: process-wide, made on first use, never destroyed.   Threads: main thread.   Units: periods are minutes.
#pragma once

#include <map>

#include "common/ISyncScheduleListener.h"
#include "platform/alarm.h"

class SyncScheduleManager {
public:
    static SyncScheduleManager& getInstance();
    SyncScheduleManager();

    // A period below 1 makes no alarm and is success. -1: NULL, or the alarm service refused.
    [[nodiscard]] int addSchedule(ISyncScheduleListener* listener, int period);
    // -1 when the listener has no alarm, or the alarm service refused (the entry stays).
    int removeSchedule(ISyncScheduleListener* listener);
    // For a listener that goes: an alarm that could not be removed calls nobody.
    void forget(const ISyncScheduleListener* listener);
    // Seconds since 1970, 0 when the listener has no alarm.
    [[nodiscard]] int nextAlarm(const ISyncScheduleListener* listener) const;

    // The value 2 of "db/setting/psmode"; a failed read counts as no.
    [[nodiscard]] static bool isPowerSaving();

    static int alarmCallback(alarm_id_t id, void* userParam);
    static int alarmClearCallback(alarm_id_t id, void* userParam);

private:
    void initialize();

    std::map<alarm_id_t, ISyncScheduleListener*> mListeners;  // not owned
};
