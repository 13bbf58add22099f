// AccountService.h: the provider's accounts at the device's account service.
#pragma once

#include <map>
#include <string>

namespace account_service {

// Id to e-mail address.
std::map<int, std::string> accounts();
// A Failure when the id belongs to another application's account.
void insert(int id, const std::string& email);
// An account that is not there is success.
void remove(int id);

}  // namespace account_service
