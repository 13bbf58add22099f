#include "common/SyncProgress.h"

#include "common/SyncLog.h"
#include "common/SyncRunStatus.h"
#include "platform/error.h"
#include "platform/settings.h"

namespace {

constexpr std::chrono::milliseconds kPause{400};

std::string counted(size_t number, const char* what) {
    return std::to_string(number) + " " + what + (number == 1 ? "" : "s");
}

}  // namespace

SyncProgress::SyncProgress(int accountId, vantor_pim_sync_type_e type)
    : mKey(SyncRunStatus::keyOf(accountId, type, "progress")) {}

void SyncProgress::beginRun() {
    mWritten = Clock::now();
}

void SyncProgress::beginPart(const std::string& name) {
    mPart = name;
    mPages = 0;
    mItems = 0;
}

void SyncProgress::addPage(size_t items) {
    ++mPages;
    mItems += items;
    const Clock::time_point now = Clock::now();
    if (now - mWritten < kPause) return;
    mWritten = now;
    const std::string text = mPart + ": " + counted(mPages, "page") + ", " + counted(mItems, "item");
    if (vconf_set_str(mKey.c_str(), text.c_str()) != PLATFORM_ERROR_NONE) SYNC_DBG("progress is not shown");
}
