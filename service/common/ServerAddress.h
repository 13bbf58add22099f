// ServerAddress: where an account's services live. Base addresses have no trailing slash. Threads: any.
#pragma once

#include <string>

class Account;

namespace server_address {

// `server` is a URL or a bare host. A bare host gets https:// when `ssl`, else http://; a port above 0 is appended when
// the text has none (IPv6 hosts stand in brackets).
std::string compose(const std::string& server, int port, bool ssl);

std::string calendarBase(const Account& account);
std::string contactsBase(const Account& account);
// The settings keys "db/vantor-pim-sync/token_server" and "db/vantor-pim-sync/people_server" name another base;
// otherwise the calendar server (the contacts server of an account without calendar sync).
std::string tokenBase(const Account& account);
std::string peopleBase(const Account& account);

}  // namespace server_address
