#include "AccountService.h"

#include "Failure.h"
#include "platform/account.h"
#include "platform/error.h"

namespace account_service {

namespace {

constexpr const char* kPackage = "com.morvane.vantor-service-account-lite";

class Connection {
public:
    Connection() { check(account_connect(), "the account store"); }
    ~Connection() { account_disconnect(); }
    Connection(const Connection&) = delete;
    Connection& operator=(const Connection&) = delete;
};

bool collect(account_h account, void* userData) {
    int id = 0;
    const char* email = nullptr;
    if (account_get_account_id(account, &id) != PLATFORM_ERROR_NONE) return true;
    const bool hasEmail =
        account_get_email_address(account, &email) == PLATFORM_ERROR_NONE && email != nullptr;
    (*static_cast<std::map<int, std::string>*>(userData))[id] = hasEmail ? email : "";
    return true;
}

}  // namespace

std::map<int, std::string> accounts() {
    const Connection connection;
    std::map<int, std::string> found;
    const int code = account_query_account_by_package_name(collect, kPackage, &found);
    if (code != PLATFORM_ERROR_NOT_FOUND) check(code, "reading the account store");
    return found;
}

void insert(int id, const std::string& email) {
    const Connection connection;
    const int code = account_insert(id, kPackage, email.c_str());
    if (code == PLATFORM_ERROR_INVALID_PARAMETER) {
        throw Failure("the account id " + std::to_string(id) +
                      " is taken by another application; choose another");
    }
    check(code, "registering the account " + std::to_string(id));
}

void remove(int id) {
    const Connection connection;
    const int code = account_delete(id);
    if (code != PLATFORM_ERROR_NOT_FOUND) check(code, "removing the account " + std::to_string(id));
}

}  // namespace account_service
