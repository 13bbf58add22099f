#include "common/RetryGate.h"

#include <algorithm>
#include <ctime>
#include <random>

namespace {

constexpr int64_t kLongestAsked = 24L * 3600;
constexpr int64_t kFirstPause = 30;
constexpr int64_t kLongestPause = 3600;
constexpr int kMostDoublings = 7;

int64_t now() {
    timespec time{};
    clock_gettime(CLOCK_BOOTTIME, &time);
    return time.tv_sec;
}

// Between three quarters of it and all.
int64_t spread(int64_t pause) {
    static thread_local std::minstd_rand random(std::random_device{}());
    return std::uniform_int_distribution<int64_t>(pause - pause / 4, pause)(random);
}

}  // namespace

void RetryGate::askedToWait(long seconds) {
    const std::lock_guard lock(mMutex);
    const int64_t until = now() + std::clamp<int64_t>(seconds, 1, kLongestAsked);
    mAskedUntil = std::max(mAskedUntil, until);
}

void RetryGate::runFailed() {
    const std::lock_guard lock(mMutex);
    const int64_t pause = std::min(kLongestPause, kFirstPause << std::min(mFailures, kMostDoublings));
    ++mFailures;
    mFailedUntil = now() + spread(pause);
}

void RetryGate::open() {
    const std::lock_guard lock(mMutex);
    mAskedUntil = mFailedUntil = 0;
    mFailures = 0;
}

int RetryGate::secondsLeft() const {
    const std::lock_guard lock(mMutex);
    return static_cast<int>(std::max<int64_t>(0, std::max(mAskedUntil, mFailedUntil) - now()));
}

bool RetryGate::isAskedToWait() const {
    const std::lock_guard lock(mMutex);
    return mAskedUntil > now();
}
