#include "common/SyncRunStatus.h"

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/error.h"
#include "platform/settings.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStopped;

namespace {

constexpr const char* kKindNames[] = {"calendar", "contacts"};

}  // namespace

const char* SyncRunStatus::nameOf(vantor_pim_sync_type_e type) {
    return kKindNames[type == VANTOR_PIM_SYNC_TYPE_CALENDAR ? 0 : 1];
}

std::string SyncRunStatus::keyOf(int accountId, vantor_pim_sync_type_e type, const char* name) {
    return "memory/vantor-pim-sync/" + std::to_string(accountId) + "/" + nameOf(type) + "/" + name;
}

SyncRunStatus::SyncRunStatus(int accountId, vantor_pim_sync_type_e type)
    : mPrefix(keyOf(accountId, type, "")) {
    mRun = number("run");
    if (mRun == number("ended")) return;
    clearProgress();
    setNumber("down_result", kFailed);
    setText("failure", "the daemon ended during the sync");
    setNumber("ended", mRun);
}

void SyncRunStatus::begin() {
    mIsRunning = true;
    // Until the halves say otherwise: a run that is stopped before its download has not ended well.
    mDownResult = kStopped;
    mUpResult = kOk;
    mFailure.clear();
    setNumber("run", ++mRun);
}

void SyncRunStatus::endHalf(bool isDown, int result, const std::string& failure) {
    (isDown ? mDownResult : mUpResult) = result;
    if (!failure.empty()) mFailure = failure;
    if (mIsRunning) return;  // told when the run ends
    // An up sync of its own, which no client sees as a run.
    setNumber("up_result", mUpResult);
    setText("failure", failure);
}

void SyncRunStatus::end() {
    if (!mIsRunning) return;
    mIsRunning = false;
    clearProgress();
    setNumber("down_result", mDownResult);
    setNumber("up_result", mUpResult);
    setText("failure", mFailure);
    setNumber("ended", mRun);
}

void SyncRunStatus::setPending(int dirty, int deleted) {
    setNumber("dirty", dirty);
    setNumber("deleted", deleted);
}

void SyncRunStatus::setNextAlarm(int secondsSince1970) {
    setNumber("next_alarm", secondsSince1970);
}

std::string SyncRunStatus::key(const char* name) const {
    return mPrefix + name;
}

void SyncRunStatus::clearProgress() {
    std::string text;
    if (vconf_get_str(key("progress").c_str(), &text) == PLATFORM_ERROR_NONE && !text.empty())
        setText("progress", "");
}

int SyncRunStatus::number(const char* name) const {
    int value = 0;
    return vconf_get_int(key(name).c_str(), &value) == PLATFORM_ERROR_NONE ? value : 0;
}

void SyncRunStatus::setNumber(const char* name, int value) {
    if (vconf_set_int(key(name).c_str(), value) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("%s cannot be written, ignoring", key(name).c_str());
    }
}

void SyncRunStatus::setText(const char* name, const std::string& value) {
    if (vconf_set_str(key(name).c_str(), value.c_str()) != PLATFORM_ERROR_NONE) {
        SYNC_ERR("%s cannot be written, ignoring", key(name).c_str());
    }
}
