// GroupNames.h: the groups of contacts by their names, as cards know them.
#pragma once

#include <map>
#include <optional>
#include <string>

namespace exchange {

// By id; of all accounts or of one.
std::map<int, std::string> groupNames(std::optional<int> account);

}  // namespace exchange
