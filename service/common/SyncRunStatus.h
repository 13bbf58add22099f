// SyncRunStatus: what the eight IPC commands cannot tell, published for the command-line tool in settings keys under
// "memory/vantor-pim-sync/ACCOUNT/KIND/":
//
//   run           int  number of the latest visible sync; written when it begins
//   ended         int  number of the latest visible sync that has ended; written last when it ends
//   down_result   int  how its halves ended (SyncResult.h); up_result is 0 when no up half was needed
//   up_result     int
//   failure       str  why, for people; empty after a run that ended well
//   dirty         int  changes that wait to be sent
//   deleted       int  deletions that wait to be sent
//   progress      str  how far a running sync is, when it takes long (SyncProgress.h); empty when none is running
//   next_alarm    int  when the next scheduled sync is due, in seconds since 1970; 0 when none is
//
// The keys outlive the daemon, so numbers go on after a restart, and a run that was cut off is ended then.
// Owner: an agent.   Threads: main thread (the agent's lock is held).   Errors: a key that cannot be written is logged, ignoring.
#pragma once

#include <string>

#include "common/vantor_pim_sync.h"

class SyncRunStatus {
public:
    SyncRunStatus(int accountId, vantor_pim_sync_type_e type);

    void begin();
    // `failure` is empty for a half that ended well.
    void endHalf(bool isDown, int result, const std::string& failure);
    void end();

    void setPending(int dirty, int deleted);
    void setNextAlarm(int secondsSince1970);

    // Of the kind, as in the keys: "calendar" or "contacts".
    static const char* nameOf(vantor_pim_sync_type_e type);
    static std::string keyOf(int accountId, vantor_pim_sync_type_e type, const char* name);

private:
    [[nodiscard]] std::string key(const char* name) const;
    [[nodiscard]] int number(const char* name) const;
    void setNumber(const char* name, int value);
    void clearProgress();
    void setText(const char* name, const std::string& value);

    const std::string mPrefix;
    int mRun = 0;
    int mDownResult = 0;
    int mUpResult = 0;
    std::string mFailure;
    bool mIsRunning = false;
};
