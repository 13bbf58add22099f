// Tokens: the access tokens of this run. Threads: any.
#pragma once

#include <chrono>
#include <mutex>
#include <string>
#include <unordered_map>

namespace provider {

class Tokens {
public:
    explicit Tokens(std::chrono::seconds lifetime) : mLifetime(lifetime) {}

    std::string issue(const std::string& email);
    // The owner of a token that is still valid, else "".
    [[nodiscard]] std::string owner(const std::string& token) const;
    // Ends the tokens of one account, or all of them.
    void expire(const std::string& email = "");
    [[nodiscard]] std::chrono::seconds lifetime() const { return mLifetime; }

private:
    using Clock = std::chrono::steady_clock;
    struct Grant {
        std::string email;
        Clock::time_point until;
    };
    const std::chrono::seconds mLifetime;
    mutable std::mutex mMutex;
    std::unordered_map<std::string, Grant> mGrants;
};

}  // namespace provider
