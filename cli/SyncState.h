// SyncState.h: what the daemon publishes about one kind of one account, beyond what its calls tell. Settings keys
// under "memory/vantor-pim-sync/ACCOUNT/KIND/".
#pragma once

#include <optional>
#include <string>

#include "common/vantor_pim_sync.h"

class SyncState {
public:
    SyncState(int accountId, vantor_pim_sync_type_e kind);

    // Number of the latest visible sync, raised when it starts; 0 before the first.
    [[nodiscard]] int run() const { return number("run").value_or(0); }
    // Number of the latest run that has ended; written after its results.
    [[nodiscard]] int ended() const { return number("ended").value_or(0); }
    [[nodiscard]] int downResult() const { return number("down_result").value_or(0); }
    [[nodiscard]] int upResult() const { return number("up_result").value_or(0); }
    // Text of the last failure, "" for none.
    [[nodiscard]] std::string failure() const { return text("failure"); }
    // How far a running sync is, "" when it has nothing to say.
    [[nodiscard]] std::string progress() const { return text("progress"); }
    // Records that wait to go up; nothing when the daemon has not counted them.
    [[nodiscard]] std::optional<int> dirty() const { return number("dirty"); }
    [[nodiscard]] std::optional<int> deleted() const { return number("deleted"); }
    // Seconds since 1970, 0 for none.
    [[nodiscard]] int nextAlarm() const { return number("next_alarm").value_or(0); }

    [[nodiscard]] std::string endedKey() const { return mPrefix + "ended"; }
    [[nodiscard]] int accountId() const { return mAccountId; }
    [[nodiscard]] vantor_pim_sync_type_e kind() const { return mKind; }

private:
    [[nodiscard]] std::optional<int> number(const char* name) const;
    [[nodiscard]] std::string text(const char* name) const;

    int mAccountId;
    vantor_pim_sync_type_e mKind;
    std::string mPrefix;
};
