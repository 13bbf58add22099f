// Identity.h: what items are called outside of this device, and what tells that two are the same.
#pragma once

#include <string>
#include <vector>

#include "Output.h"

namespace exchange::identity {

// A name for a record of this device that no other device gives: made of the device's own, which is set when it is
// first needed, and the record's id. `kind` is "event", "todo" or "contact".
std::string uidOf(const std::string& kind, int id);

// A digest of what an item says, without its ids. Two with the same digest are the same item.
std::string digestOf(const Json& item);
std::string sha256(const std::string& bytes);

// What two items have in common that are probably the same one, edited since: title and start of an event (to the
// minute: the server keeps no seconds), title and day of a to-do; a contact's name with each address and number.
std::vector<std::string> eventKeys(const Json& event);
std::vector<std::string> todoKeys(const Json& todo);
std::vector<std::string> contactKeys(const Json& contact);

}  // namespace exchange::identity
