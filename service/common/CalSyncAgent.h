// CalSyncAgent: the agent of an account's calendars and events.
#pragma once

#include "common/DirectedSyncAgent.h"

class CalSyncAgent : public DirectedSyncAgent {
public:
    explicit CalSyncAgent(Account* account);

protected:
    [[nodiscard]] bool hasSomethingToSend() override;
    void countPending(int* dirty, int* deleted) override;
};
