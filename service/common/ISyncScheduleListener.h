// ISyncScheduleListener: who is called when a schedule's alarm fires, on the main thread.
#pragma once

class ISyncScheduleListener {
public:
    virtual void onSchedule() = 0;
    virtual ~ISyncScheduleListener() = default;
};
