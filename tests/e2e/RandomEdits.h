// RandomEdits: what the random two-way tests share: a source of choices that a seed replays, and the loop of edits and syncs.
// VPS_RANDOM_SEED replays a run, VPS_RANDOM_STEPS makes it longer.
#pragma once

#include <gtest/gtest.h>

#include <cstdlib>
#include <ctime>
#include <random>

#include "e2e/SyncPair.h"

class RandomEdits {
public:
    RandomEdits(unsigned seed, int accounts, const std::vector<std::string>& providerArguments,
                const std::string& kind)
        : mRandom(seed), mPair(accounts, providerArguments, kind) {}

    void tellWhatHappened() { ADD_FAILURE() << mHistory << mPair.device.daemonLog(); }

protected:
    size_t below(size_t limit) { return std::uniform_int_distribution<size_t>(0, limit - 1)(mRandom); }
    bool chance() { return below(2) == 0; }
    template <class List>
    const typename List::value_type* pick(const List& list) {
        return list.empty() ? nullptr : &list[below(list.size())];
    }
    void run(std::vector<std::string> arguments, const std::string& input = "") {
        // An item may have gone since it was listed: the daemon works all the time.
        note("device", Json(arguments).dump() + " " + input);
        const CommandResult result = mPair.device.tool(std::move(arguments), input);
        EXPECT_TRUE(result.status == 0 || result.error.find("there is no") != std::string::npos ||
                    result.error.find("is cancelled") != std::string::npos)
            << result.error;
    }
    Json onProvider(const std::string& method, const std::string& path, const Json& body = nullptr) {
        note("provider", method + " " + path + " " + body.dump());
        // Likewise an item of the provider, or a group that it names.
        return mPair.provider.attempt(method, path, body, [](int status, const std::string& answer) {
            return status == 404 || status == 410 ||
                   (status == 400 && answer.find("group") != std::string::npos);
        });
    }
    // What was done, for people who look at a failure.
    void note(const char* side, const std::string& what) {
        mHistory += std::to_string(time(nullptr) % 3600) + " " + mName + ", " + side + ": " + what + "\n";
    }
    void syncAll(std::initializer_list<int> accounts) {
        for (const int account : accounts)
            ASSERT_EQ(mPair.sync(account).status, 0) << mPair.device.daemonLog();
    }

    std::mt19937 mRandom;
    SyncPair mPair;
    std::string mName;
    std::string mHistory;
};

inline unsigned fromEnvironment(const char* name, unsigned otherwise) {
    const char* text = std::getenv(name);
    return text != nullptr ? static_cast<unsigned>(std::strtoul(text, nullptr, 10)) : otherwise;
}

// `Edits` makes one edit a step and compares both sides after every sync.
template <class Edits>
void runRandomEdits(unsigned usualSeed, int usualSteps, int stepsBetweenSyncs) {
    const unsigned seed = fromEnvironment("VPS_RANDOM_SEED", usualSeed);
    const auto steps =
        static_cast<int>(fromEnvironment("VPS_RANDOM_STEPS", static_cast<unsigned>(usualSteps)));
    SCOPED_TRACE("VPS_RANDOM_SEED=" + std::to_string(seed));
    Edits edits(seed);
    for (int step = 1; step <= steps && !testing::Test::HasFailure(); ++step) {
        SCOPED_TRACE("step " + std::to_string(step));
        edits.step(step);
        if (step % stepsBetweenSyncs == 0) edits.syncAndCompare();
    }
    if (testing::Test::HasFailure()) return edits.tellWhatHappened();
    edits.syncAndCompare();
    edits.expectQuiet();
}
