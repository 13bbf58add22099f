#include "calendar/CalUpSyncDirector.h"

#include "calendar/CalDataManager.h"
#include "common/Account.h"
#include "common/SyncResult.h"

using sync_result::kFailed;
using sync_result::kOk;

CalUpSyncDirector::CalUpSyncDirector(Account* account, IStopQuery* /*stopQuery*/) : mpAccount(account) {}

int CalUpSyncDirector::run() {
    mFailure.clear();
    if (CalDataManager::getInstance().setAccountChanged(mpAccount->getAccountId()) != kOk) {
        mFailure = "the device's changes could not be read";
        return kFailed;
    }
    return kOk;
}
