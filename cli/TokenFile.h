// TokenFile.h: the file in which the daemon finds an account's refresh token. Its folder and its name are the
// device's; links are never followed. The token is in no text that a Failure carries.
#pragma once

#include <optional>
#include <string>

namespace token_file {

// Nothing when there is none; without its one trailing line end.
std::optional<std::string> read(int accountId);
// Replaced whole, mode 0600.
void write(int accountId, const std::string& token);
// Where it is, below the root.
std::string path(int accountId);
struct Access {
    unsigned mode = 0;
    bool isOwn = false;  // belongs to this user, or this is root
};
// Who may read it; the default when there is none.
Access access(int accountId);
// None is success.
void remove(int accountId);

}  // namespace token_file
