// Faults and holds: what goes wrong, or waits, on purpose. Threads: any.
#pragma once

#include <chrono>
#include <condition_variable>
#include <list>
#include <mutex>
#include <optional>
#include <regex>
#include <string>

#include "Http.h"

namespace provider {

// Which requests are meant: a method ("" or "*": any) and an expression found in path and query.
struct Match {
    std::string method;
    std::string pathText;
    std::regex path;

    // Reads "method" and "path". Throws ApiError 400.
    static Match parse(const Json& body);
    [[nodiscard]] bool fits(const Call& call) const;
};

enum class FaultKind { kStatus, kDelay, kReset, kCut, kCorruptGzip, kShortGzip, kBody, kRewrite };

struct Fault {
    Match match;
    FaultKind kind = FaultKind::kStatus;
    int count = 1;   // uses left
    int status = 0;  // 0: the kind's default
    std::chrono::milliseconds delay{0};
    std::optional<std::string> body;
    std::map<std::string, std::string> headers;
    bool afterHandling = false;
    std::string from;  // what kRewrite looks for in the request's body, and puts there instead
    std::string to;

    static Fault parse(const Json& body);
    [[nodiscard]] Json json() const;
    // What the request becomes before it is carried out.
    void rewrite(Call& call) const;
};

class Faults {
public:
    void add(Fault fault);
    // The first fault that fits, with one use taken off.
    std::optional<Fault> take(const Call& call);
    [[nodiscard]] Json list() const;
    void clear();

    void hold(Match match);
    // Lets everything go that waits and forgets the holds.
    void release();
    [[nodiscard]] Json holds() const;
    // Waits until so many requests are held; false at the time limit.
    bool waitForHeld(std::size_t count, std::chrono::milliseconds limit);
    // Blocks while a hold fits the call.
    void pass(const Call& call);

    // A pause that ends early when the server stops.
    void pause(std::chrono::milliseconds time);
    void stop();

private:
    mutable std::mutex mMutex;
    std::condition_variable mChanged;
    std::list<Fault> mFaults;
    std::list<Match> mHolds;
    std::size_t mHeld = 0;
    unsigned mReleases = 0;
    bool mStopped = false;
};

}  // namespace provider
