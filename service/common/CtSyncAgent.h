// CtSyncAgent: the agent of an account's contacts and groups.
#pragma once

#include "common/DirectedSyncAgent.h"

class CtSyncAgent : public DirectedSyncAgent {
public:
    explicit CtSyncAgent(Account* account);

protected:
    int doUpSync() override;
    int doDownSync() override;
    [[nodiscard]] bool hasSomethingToSend() override;
    void countPending(int* dirty, int* deleted) override;
    void onRequestsDropped() override;

private:
    void prepare();
};
