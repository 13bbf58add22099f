// Account: the in-memory settings and tokens of one provider account.
// Owner: SyncService's account map.   Threads: any; mMutex guards the fields, getters return copies, because the main
// loop and two workers share an account.
#pragma once

#include <array>
#include <mutex>
#include <string>

#include "common/RetryGate.h"
#include "common/vantor_pim_sync.h"

class Account {
public:
    explicit Account(const vantor_pim_sync_account_s& record);
    virtual ~Account();

    Account(const Account&) = delete;
    Account& operator=(const Account&) = delete;

    // A NULL record breaks an invariant ("pAccountInfo"). NULL strings and ports of 0 or less keep what was there.
    void update(const vantor_pim_sync_account_s* record);

    [[nodiscard]] int getAccountId() const;
    [[nodiscard]] std::string getAccessToken() const;
    [[nodiscard]] std::string getRefreshToken() const;
    [[nodiscard]] int getReserved() const;
    [[nodiscard]] bool getSsl() const;
    [[nodiscard]] bool getCalendarSync() const;
    [[nodiscard]] std::string getCalendarServer() const;
    [[nodiscard]] int getCalendarServerPort() const;
    [[nodiscard]] bool getContactsSync() const;
    [[nodiscard]] std::string getContactsServer() const;
    [[nodiscard]] int getContactsServerPort() const;
    [[nodiscard]] std::string getEmail() const;
    [[nodiscard]] int getCalendarPeriod() const;  // minutes
    [[nodiscard]] int getContactsPeriod() const;  // minutes
    [[nodiscard]] int getRoaming() const;

    void setAccessToken(const std::string& token);

    // Held by a worker while it refreshes the access token: one refresh per account at a time. Whoever gets it looks
    // first whether the token is still the one that the server refused.
    std::mutex& refreshMutex() { return mRefreshMutex; }

    [[nodiscard]] RetryGate& retryGate(vantor_pim_sync_type_e type) { return mRetryGates[type]; }

private:
    struct Fields {
        int accountId = 0;
        std::string accessToken;
        std::string refreshToken;
        int reserved = 0;
        bool ssl = false;
        bool calendarSync = false;
        std::string calendarServer;
        int calendarServerPort = 0;
        bool contactsSync = false;
        std::string contactsServer;
        int contactsServerPort = 0;
        std::string email;
        int calendarPeriod = 0;
        int contactsPeriod = 0;
        int roaming = 0;
    };

    template <class T>
    [[nodiscard]] T get(T Fields::*field) const;

    mutable std::mutex mMutex;
    Fields mFields;  // guarded by mMutex
    std::mutex mRefreshMutex;
    std::array<RetryGate, 2> mRetryGates;  // by type
};
