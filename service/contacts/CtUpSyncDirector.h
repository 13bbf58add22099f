// CtUpSyncDirector: sends the device's changes of one account's groups and contacts to the server.
// Owner: the contacts agent.   Threads: the worker's; the result is read on the main thread.
#pragma once

#include <memory>
#include <string>

#include "common/ParkedItems.h"
#include "common/SyncDirector.h"
#include "contacts/CtCurl.h"

class Account;

class CtUpSyncDirector : public SyncDirector, private IProgressObserver {
public:
    // Neither is owned; `stopQuery` may be NULL.
    CtUpSyncDirector(Account* account, IStopQuery* stopQuery);

    int run() override;
    [[nodiscard]] std::string lastFailure() const override { return mFailure; }
    [[nodiscard]] bool isInTrouble() const override { return mIsInTrouble; }
    void forgetRefusals() override { mParked.clear(); }

private:
    int onProgress(double, double, double, double) override {
        return mpStopQuery != nullptr && mpStopQuery->isStopped() ? 1 : 0;
    }
    // Contacts and groups of an earlier run whose answer was lost: those that the server lists are ours already.
    [[nodiscard]] int findSentItems(int addressBookId);

    Account* const mpAccount;
    IStopQuery* const mpStopQuery;
    CtCurl mCurl;
    ParkedItems mParked;
    bool mIsInTrouble = false;
    std::string mFailure;
};
