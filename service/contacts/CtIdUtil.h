// CtIdUtil: the ids inside the service's hrefs. The account part of an href ends in a mail domain, which is what is looked for.
// Threads: any.
#pragma once

#include <string>

enum class CtItemType { kContact, kGroup, kPhoto };

namespace CtIdUtil {

// What follows the last delimiter, or the last slash when there is none, percent-encoded as the href is: ids stay in that form.
std::string idAfterBase(const std::string& href);  // ".com/base/"
std::string idAfterFull(const std::string& href);  // ".com/full/"
std::string idAfterCom(const std::string& href);   // ".com/"

// `feedBase`: the contacts feed base of the account. What would leave the id's segment is percent-encoded.
std::string makeEditHref(const std::string& feedBase, CtItemType type, const std::string& id);
// What a membership refers to; its end is the group's id, unchanged.
std::string makeGroupBaseHref(const std::string& feedBase, const std::string& groupId);

// Whether a photo's id, which comes from the server, may name a file: not empty, no slash, no leading dot, at most 200 bytes.
bool isFileName(const std::string& id);

}  // namespace CtIdUtil
