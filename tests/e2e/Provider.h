// Provider: a provider process on a free loopback port, and its admin services.
#pragma once

#include <memory>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "e2e/Process.h"

class Provider {
public:
    explicit Provider(const std::vector<std::string>& arguments = {"--seed", "sample"});

    struct Account {
        std::string email;
        std::string refreshToken;
    };
    [[nodiscard]] const std::string& url() const { return mUrl; }
    [[nodiscard]] const std::string& clientId() const { return mClientId; }
    [[nodiscard]] const std::string& clientSecret() const { return mClientSecret; }
    [[nodiscard]] const std::vector<Account>& accounts() const { return mAccounts; }

    // A request to the admin services; `path` begins after "/admin". A failure fails the test and gives null.
    nlohmann::json admin(const std::string& method, const std::string& path,
                         const nlohmann::json& body = nullptr);

    // The same for what may have gone meanwhile: `mayFail` says whether this answer is none of the test's business.
    nlohmann::json attempt(const std::string& method, const std::string& path, const nlohmann::json& body,
                           bool (*mayFail)(int status, const std::string& answer));
    // What a client of the first account reads at `path`.
    nlohmann::json read(const std::string& path);
    // The body of a GET; a failure fails the test.
    std::string bytes(const std::string& path);
    // Writes bytes with their content type.
    void putBytes(const std::string& path, const std::string& content, const std::string& type);

    Process& process() { return *mProcess; }

private:
    std::unique_ptr<Process> mProcess;
    std::string mUrl;
    std::string mClientId;
    std::string mClientSecret;
    std::vector<Account> mAccounts;
};
