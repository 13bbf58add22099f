#include "common/CalSyncAgent.h"

#include <initializer_list>

#include "calendar/CalDataManager.h"
#include "calendar/CalDownSyncDirector.h"
#include "calendar/CalTodoDataManager.h"
#include "calendar/CalUpSyncDirector.h"
#include "common/Account.h"
#include "common/SyncResult.h"

using sync_result::kOk;

CalSyncAgent::CalSyncAgent(Account* account) : DirectedSyncAgent(account, VANTOR_PIM_SYNC_TYPE_CALENDAR) {
    setDirectors(std::make_unique<CalDownSyncDirector>(account, worker()),
                 std::make_unique<CalUpSyncDirector>(account, worker()));
}

bool CalSyncAgent::hasSomethingToSend() {
    const int accountId = mpAccount->getAccountId();
    return CalDataManager::getInstance().hasSomethingToSend(accountId) ||
           CalTodoDataManager::getInstance().hasSomethingToSend(accountId);
}

void CalSyncAgent::countPending(int* dirty, int* deleted) {
    *dirty = *deleted = 0;
    for (CalManager* manager : std::initializer_list<CalManager*>{&CalDataManager::getInstance(),
                                                                  &CalTodoDataManager::getInstance()}) {
        int dirtyOfKind = 0;
        int deletedOfKind = 0;
        if (manager->countPending(mpAccount->getAccountId(), &dirtyOfKind, &deletedOfKind) != kOk) continue;
        *dirty += dirtyOfKind;
        *deleted += deletedOfKind;
    }
}
