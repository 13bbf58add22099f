// RequestLog: what was asked of the provider: counts by kind of request, and the last ones in full, but for secrets.
// Requests are numbered from 1 as they end, so that a reader can ask for what came since.
// Threads: any.
#pragma once

#include <cstdint>
#include <deque>
#include <map>
#include <mutex>
#include <string>

#include "Http.h"

namespace provider {

struct RequestRecord {
    std::string method;
    std::string target;  // path and query; a query that holds a secret is left out
    int status = 0;      // 0: the connection was reset
    std::size_t bytes = 0;
    bool hasAuthorization = false;
    bool isGzip = false;
    std::string account;
    double elapsedMs = 0;
};

class RequestLog {
public:
    // name: the pattern of the route, under which the request is counted.
    void add(const std::string& name, RequestRecord record);
    [[nodiscard]] Json json() const;
    // {"last": number, "requests"}: those after this number, the newest at most.
    [[nodiscard]] Json since(std::uint64_t number, std::size_t atMost) const;
    // The numbers go on.
    void clear();

private:
    static constexpr std::size_t kKept = 1000;
    mutable std::mutex mMutex;
    std::map<std::string, std::size_t> mCounts;
    std::deque<RequestRecord> mLast;
    std::size_t mTotal = 0;
    std::uint64_t mLastNumber = 0;
};

// The target as it may be logged.
std::string withoutSecrets(const std::string& target);

}  // namespace provider
