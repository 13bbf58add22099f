#include "Tokens.h"

#include <array>
#include <random>

namespace provider {

std::string Tokens::issue(const std::string& email) {
    constexpr std::string_view kAlphabet = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789-_";
    std::string token = "access.";
    std::random_device random;
    for (int i = 0; i < 43; ++i) token += kAlphabet[random() % kAlphabet.size()];
    const std::lock_guard lock(mMutex);
    const Clock::time_point now = Clock::now();
    std::erase_if(mGrants, [&](const auto& grant) { return grant.second.until <= now; });
    mGrants[token] = {email, now + mLifetime};
    return token;
}

std::string Tokens::owner(const std::string& token) const {
    const std::lock_guard lock(mMutex);
    const auto found = mGrants.find(token);
    return found != mGrants.end() && found->second.until > Clock::now() ? found->second.email : "";
}

void Tokens::expire(const std::string& email) {
    const std::lock_guard lock(mMutex);
    std::erase_if(mGrants, [&](const auto& grant) { return email.empty() || grant.second.email == email; });
}

}  // namespace provider
