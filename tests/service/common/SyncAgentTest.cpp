// The state machine over the full product of states, operations, reservations and events, against a model that says the rules
// in their own words.
#include <gtest/gtest.h>

#include <optional>
#include <vector>

#include "common/Account.h"
#include "common/AccountDBHelper.h"
#include "common/SyncAgent.h"
#include "platform/settings.h"
#include "service/common/MainLoop.h"
#include "support/TestRoot.h"

struct SyncAgentProbe {
    static void set(SyncAgent& agent, int state, int operation, bool down, bool up, bool removing) {
        agent.mState = state;
        agent.mOperation = operation;
        agent.mIsDownSyncReserved = down;
        agent.mIsUpSyncReserved = up;
        agent.mIsRemoving = removing;
        for (const guint source : agent.mIdleSources) g_source_remove(source);
        agent.mIdleSources.clear();
    }
    static int state(const SyncAgent& agent) { return agent.mState; }
    static int operation(const SyncAgent& agent) { return agent.mOperation; }
    static bool down(const SyncAgent& agent) { return agent.mIsDownSyncReserved; }
    static bool up(const SyncAgent& agent) { return agent.mIsUpSyncReserved; }
};

namespace {

constexpr int kId = 7;

class FakeAgent : public SyncAgent {
public:
    explicit FakeAgent(Account* account) : SyncAgent(account, VANTOR_PIM_SYNC_TYPE_CALENDAR) {}
    int doUpSync() override { return did("up"); }
    int doDownSync() override { return did("down"); }
    int doStop() override { return did("stop"); }
    void abandonRun() override {}
    [[nodiscard]] vantor_pim_sync_type_e getType() const override { return VANTOR_PIM_SYNC_TYPE_CALENDAR; }
    [[nodiscard]] bool hasSomethingToSend() override { return somethingToSend; }

    std::string takeRun() {
        iterateReady();
        return std::exchange(run, "");
    }
    std::string run;  // what the main loop was asked to do
    int failWith = 0;
    bool somethingToSend = false;

private:
    int did(const char* what) {
        run += what;
        return failWith;
    }
};

struct Machine {
    int state;
    int operation;
    bool down;
    bool up;
    bool removing;
};

enum Event { kStart, kStartUp, kStop, kRemove, kAvailable, kDone, kFailedHalf, kTokenGone, kStoppedHalf };
constexpr const char* kEventNames[] = {"startSync",          "startUpSync",      "stopSync",
                                       "stopSyncForRemoval", "makeAvailable",    "continueSync(0)",
                                       "continueSync(-1)",   "continueSync(-5)", "continueSync(1)"};
constexpr int kResults[] = {0, 0, 0, 0, 0, 0, -1, -5, 1};

// What must come out; nothing: the program aborts.
struct Outcome {
    Machine after;
    int result;
    std::string run;
    bool syncTime = false;
};

std::optional<Outcome> startUp(Machine m) {
    m.up = m.operation != 1;
    const bool begins = m.operation == 1;
    if (begins) m.operation = 2;
    return Outcome{m, begins ? 0 : -1, begins ? "up" : ""};
}

std::optional<Outcome> startDown(Machine m) {
    if (m.operation > 2) return std::nullopt;
    m.down = m.operation == 2;
    const bool begins = m.operation == 1;
    if (begins) m.operation = 3;
    return Outcome{m, begins ? 0 : -1, begins ? "down" : ""};
}

std::optional<Outcome> model(Machine m, Event event) {
    switch (event) {
        case kStart:
            if (m.state != 1) return Outcome{m, -1, ""};
            if (m.down) return std::nullopt;
            m.state = 2;
            if (!m.up) return startDown(m);
            m.down = true;
            return startUp(m);
        case kStartUp:
            return startUp(m);
        case kRemove:
            m.removing = true;
            [[fallthrough]];
        case kStop:
            if (m.state != 2) return Outcome{m, -1, ""};
            if (m.operation == 4) return Outcome{m, 0, ""};
            if (m.operation == 1) return std::nullopt;
            if (m.operation == 2) {
                m.down = false;
                m.up = true;
            }
            m.operation = 4;
            return Outcome{m, 0, "stop"};
        case kAvailable:
            if (m.state == 3) m.state = 1;
            return Outcome{m, 0, ""};
        case kDone:
        case kFailedHalf:
        case kTokenGone:
        case kStoppedHalf: {
            if (m.state == 3) m.operation = 1;
            if (m.state == 0 || m.state == 3 || m.operation == 1) return Outcome{m, -1, ""};
            const int finished = std::exchange(m.operation, 1);
            if (m.removing) {
                m.state = 1;
                return Outcome{m, 0, ""};
            }
            if (event == kTokenGone) {
                m.down = m.up = false;
                m.state = 3;
                return Outcome{m, -1, ""};
            }
            if (m.down) return startDown(m);
            const bool syncTime = event == kDone && finished == 3;
            if (!m.up || finished != 3) m.state = 1;
            std::optional<Outcome> next = m.up ? startUp(m) : Outcome{m, 0, ""};
            next->syncTime = syncTime;
            return next;
        }
    }
    return std::nullopt;
}

int apply(FakeAgent& agent, Event event) {
    switch (event) {
        case kStart:
            return agent.startSync();
        case kStartUp:
            return agent.startUpSync();
        case kStop:
            return agent.stopSync();
        case kRemove:
            return agent.stopSyncForRemoval();
        case kAvailable:
            agent.makeAvailable();
            return 0;
        case kDone:
        case kFailedHalf:
        case kTokenGone:
        case kStoppedHalf:
            break;
    }
    return agent.continueSync(kResults[event]);
}

class SyncAgentStates : public testing::Test {
protected:
    SyncAgentStates() : account(record()), agent(&account) {
        EXPECT_EQ(AccountDBHelper::getInstance().insertAccount(account), 0);
    }
    static vantor_pim_sync_account_s record() {
        vantor_pim_sync_account_s fields{};
        fields.account_id = kId;
        return fields;
    }
    static int number(const char* name) {
        int value = -99;
        (void)vconf_get_int((std::string("memory/vantor-pim-sync/7/calendar/") + name).c_str(), &value);
        return value;
    }

    TestRoot root;
    Account account;
    FakeAgent agent;
};

using SyncAgentDeath = SyncAgentStates;

}  // namespace

TEST_F(SyncAgentStates, EveryEventInEveryState) {
    int checked = 0;
    for (int bits = 0; bits < 4 * 4 * 8; ++bits) {
        const Machine before{bits % 4, bits / 4 % 4 + 1, (bits / 16 & 1) != 0, (bits / 32 & 1) != 0,
                             (bits / 64 & 1) != 0};
        for (int event = kStart; event <= kStoppedHalf; ++event) {
            const std::optional<Outcome> expected = model(before, static_cast<Event>(event));
            if (!expected) continue;  // aborts: see SyncAgentDeath
            SCOPED_TRACE(testing::Message() << kEventNames[event] << " in state " << before.state
                                            << ", operation " << before.operation << ", down " << before.down
                                            << ", up " << before.up << ", removing " << before.removing);
            ASSERT_EQ(AccountDBHelper::getInstance().updateSyncTime(kId, 0, 0), 0);
            SyncAgentProbe::set(agent, before.state, before.operation, before.down, before.up,
                                before.removing);

            EXPECT_EQ(apply(agent, static_cast<Event>(event)), expected->result);

            EXPECT_EQ(SyncAgentProbe::state(agent), expected->after.state);
            EXPECT_EQ(SyncAgentProbe::operation(agent), expected->after.operation);
            EXPECT_EQ(SyncAgentProbe::down(agent), expected->after.down);
            EXPECT_EQ(SyncAgentProbe::up(agent), expected->after.up);
            EXPECT_EQ(agent.takeRun(), expected->run);
            int time = 0;
            ASSERT_EQ(AccountDBHelper::getInstance().getSyncTime(kId, 0, &time), 0);
            EXPECT_EQ(time != 0, expected->syncTime);
            ++checked;
        }
    }
    EXPECT_GT(checked, 900);
}

TEST_F(SyncAgentDeath, BrokenInvariantsEndTheProcess) {
    GTEST_FLAG_SET(death_test_style, "fast");
    struct Case {
        Machine before;
        Event event;
        const char* text;
    };
    const std::vector<Case> cases = {
        {{1, 3, false, false, false}, kStart, "Assertion 0"},
        {{1, 1, true, false, false}, kStart, "mIsDownSyncReserved == false"},
        {{2, 1, false, false, false}, kStop, "Assertion 0"},
    };
    for (const Case& test : cases) {
        ASSERT_FALSE(model(test.before, test.event));
        SyncAgentProbe::set(agent, test.before.state, test.before.operation, test.before.down, test.before.up,
                            false);
        EXPECT_DEATH(apply(agent, test.event), test.text);
    }
    // A remainder that fills the nanoseconds makes the wait invalid: 999 ms more than any full second does.
    SyncAgentProbe::set(agent, 2, 3, false, false, false);
    EXPECT_DEATH(
        {
            for (int i = 0; i < 50; ++i) (void)agent.waitForResult(999);
        },
        "pthread_cond_timedwait error");
}

TEST_F(SyncAgentStates, ARunIsPublishedWithItsResultsAndEndsLast) {
    ASSERT_EQ(agent.startSync(), 0);
    EXPECT_EQ(number("run"), 1);
    EXPECT_EQ(agent.startUpSync(), -1);  // reserved behind the download
    EXPECT_TRUE(agent.requestUpSync());
    EXPECT_EQ(agent.continueSync(0), 0);
    EXPECT_NE(number("ended"), 1) << "the up half still runs";
    EXPECT_EQ(agent.continueSync(-1), 0);
    EXPECT_EQ(number("ended"), 1);
    EXPECT_EQ(agent.waitForResult(10'000), 0) << "nothing runs";
    EXPECT_EQ(agent.takeRun(), "downup");

    // The next daemon finds a run that never ended.
    ASSERT_EQ(agent.startSync(), 0);
    const FakeAgent next(&account);
    EXPECT_EQ(number("ended"), 2);
    EXPECT_EQ(number("down_result"), -1);
}

TEST_F(SyncAgentStates, AHalfThatCannotBeginIsClosedLikeAFinishedOne) {
    agent.failWith = -1;
    ASSERT_EQ(agent.startSync(), 0);
    EXPECT_EQ(agent.takeRun(), "down");
    EXPECT_EQ(agent.getState(), SYNC_AGENT_STATE_READY);
}

TEST_F(SyncAgentStates, WhatWaitsIsSentOnceTheAgentIsAvailableAgain) {
    agent.somethingToSend = true;
    SyncAgentProbe::set(agent, SYNC_AGENT_STATE_UNAVAILABLE, 1, false, false, false);
    agent.makeAvailable();
    EXPECT_EQ(agent.getState(), SYNC_AGENT_STATE_READY);
    EXPECT_EQ(agent.takeRun(), "up");
}

TEST_F(SyncAgentStates, ScheduledSyncsKeepToTheSwitches) {
    struct Case {
        const char* name;
        int autoSync;
        const char* run;
    };
    for (const Case& test : {Case{"off", 0, ""}, Case{"on", 1, "down"}}) {
        SCOPED_TRACE(test.name);
        ASSERT_EQ(vconf_set_int("db/account/auto_sync", test.autoSync), 0);
        agent.onSchedule();
        EXPECT_EQ(agent.takeRun(), test.run);
    }
    agent.continueSync(0);
    ASSERT_EQ(vconf_unset("db/account/auto_sync"), 0);
    agent.onSchedule();
    EXPECT_EQ(agent.takeRun(), "down") << "an unset switch counts as on";
}

TEST_F(SyncAgentStates, AServerThatIsLeftAloneIsAskedByClientsOnly) {
    RetryGate& gate = account.retryGate(VANTOR_PIM_SYNC_TYPE_CALENDAR);
    gate.askedToWait(1000);
    gate.askedToWait(10);
    EXPECT_GT(gate.secondsLeft(), 990) << "the longest counts";
    agent.onSchedule();
    EXPECT_EQ(agent.startUpSync(), -1);
    EXPECT_TRUE(agent.requestUpSync()) << "it comes when the pause is over";
    EXPECT_EQ(agent.takeRun(), "");
    ASSERT_EQ(agent.startSync(), 0);
    EXPECT_EQ(agent.takeRun(), "down");
    EXPECT_EQ(gate.secondsLeft(), 0);
    // An up sync that was asked for during a run that shut the gate waits as well.
    EXPECT_TRUE(agent.requestUpSync());
    gate.runFailed();
    agent.continueSync(-1);
    EXPECT_EQ(agent.takeRun(), "");
    EXPECT_EQ(agent.getState(), SYNC_AGENT_STATE_READY);
}

TEST(RetryGate, PausesDoubleUpToAnHour) {
    RetryGate gate;
    int last = 0;
    for (int i = 0; i < 20; ++i) {
        gate.runFailed();
        const int left = gate.secondsLeft();
        EXPECT_GE(left, std::min(30 << std::min(i, 7), 3600) * 3 / 4 - 1);
        EXPECT_LE(left, 3600);
        if (i < 6) {
            EXPECT_GT(left, last);
        }
        last = left;
    }
    EXPECT_FALSE(gate.isAskedToWait());
    gate.open();
    gate.runFailed();
    EXPECT_LE(gate.secondsLeft(), 30) << "a run that went well begins anew";
}

TEST_F(SyncAgentStates, ARequestThatWasPostedGoesWithItsAgent) {
    auto doomed = std::make_unique<FakeAgent>(&account);
    ASSERT_EQ(doomed->startSync(), 0);
    doomed.reset();
    iterateReady();  // would call into the agent that is gone
}
