// TokenRequest: the OAuth 2.0 refresh-token grant of an account. Threads: a worker that holds the account's refresh mutex.
#pragma once

#include <memory>
#include <string>

class Account;
class IProgressObserver;
class HttpShare;

// `response` receives status line, headers and body. 0 for any HTTP status, else -1. Never logs what it sends or receives.
[[nodiscard]] int requestAccessToken(Account& account, IProgressObserver* observer,
                                     std::shared_ptr<HttpShare> share, long timeout, std::string* response);
