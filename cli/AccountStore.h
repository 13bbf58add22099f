// AccountStore.h: the accounts as the daemon keeps them, read from its store.
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>

// One data kind of an account.
struct StoredKind {
    bool isEnabled = false;
    std::string server;
    int port = 0;  // 0: none of its own
    int periodMinutes = 0;
    int64_t syncedSec = 0;  // since 1970, 0: never
};
struct StoredAccount {
    std::string email;
    bool ssl = false;
    bool roaming = false;
    StoredKind calendar;
    StoredKind contacts;
};

namespace account_store {

std::map<int, StoredAccount> accounts();

}  // namespace account_store
