#include "calendar/CalUpSyncDirector.h"

#include "calendar/CalUploader.h"
#include "common/Account.h"
#include "common/SyncLog.h"

using sync_result::kFailed;
using sync_result::kOk;
using sync_result::kStopped;
using sync_result::kTokenFailed;

CalUpSyncDirector::CalUpSyncDirector(Account* account, IStopQuery* stopQuery)
    : mpAccount(account),
      mpStopQuery(stopQuery),
      mpShare(std::make_shared<HttpShare>()),
      mEvents(account, this, mpShare),
      mTodos(account, this, mpShare),
      mEventTask(account, this, mpShare),
      mTodoTask(account, this, mpShare) {}

int CalUpSyncDirector::onProgress(double, double, double, double) {
    return isStopped() ? 1 : 0;
}

int CalUpSyncDirector::run() {
    mFailure.clear();
    mMustEnd = mIsInTrouble = false;
    const int calendars = syncCalendar();
    if (calendars == kStopped || calendars == kTokenFailed || mMustEnd) return calendars;
    const int tasks = syncTodo();
    if (calendars == kOk && tasks == kOk) mFailure = mParked.summary();
    return tasks == kStopped || tasks == kTokenFailed || calendars == kOk ? tasks : calendars;
}

int CalUpSyncDirector::syncBooks(CalSyncSide& side, CalUpSyncTask& task) {
    CalManager& manager = side.manager();
    CalItemStore* store = manager.prepared();
    std::list<int> calendarIds;
    if (manager.setAccountChanged(mpAccount->getAccountId()) != kOk || store == nullptr ||
        store->books().getIds(mpAccount->getAccountId(), &calendarIds) != kOk) {
        mFailure = "the device's changes could not be read";
        return kFailed;
    }
    int first = kOk;
    for (const int calendarId : calendarIds) {
        CalBookMetaData book;
        if (isStopped()) return kStopped;
        if (store->books().get(calendarId, &book) != kOk) continue;
        CalUploader uploader(&side, &task, mpStopQuery, &mParked, book);
        const int result = uploader.run();
        if (uploader.sent() > 0) {
            SYNC_INFO("%s(%s): %d changes sent", manager.kind().bookName, book.uri.c_str(), uploader.sent());
        }
        if (result == kStopped) return kStopped;
        if (result == kOk) continue;
        if (mFailure.empty()) mFailure = uploader.failure();
        mIsInTrouble = mIsInTrouble || uploader.isInTrouble();
        if (result == kTokenFailed) return result;
        if (first == kOk) first = result;
        mMustEnd = uploader.mustEnd();
        if (mMustEnd) break;
    }
    return first;
}
