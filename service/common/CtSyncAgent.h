// CtSyncAgent: the agent of an account's contacts and groups.
#pragma once

#include "common/DirectedSyncAgent.h"

class CtSyncAgent : public DirectedSyncAgent {
public:
    explicit CtSyncAgent(Account* account);

protected:
    [[nodiscard]] bool hasSomethingToSend() override;
    void countPending(int* dirty, int* deleted) override;
    void onRequestsDropped() override;
};
