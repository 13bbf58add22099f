// CalUpSyncDirector: sends one account's local calendar changes to the server.
// Owner: the calendar agent.   Threads: run() on the worker, one at a time.
#pragma once

#include <string>

#include "common/SyncDirector.h"

class Account;

class CalUpSyncDirector : public SyncDirector {
public:
    // Neither pointer is owned. `stopQuery` may be NULL.
    CalUpSyncDirector(Account* account, IStopQuery* stopQuery);

    int run() override;
    [[nodiscard]] std::string lastFailure() const override { return mFailure; }

private:
    Account* const mpAccount;
    std::string mFailure;
};
