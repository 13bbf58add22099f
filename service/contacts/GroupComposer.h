// GroupComposer: a group as the Atom entry that the service takes. Threads: any.
#pragma once

#include <string>

namespace GroupComposer {

// Empty (logged) for a group without a name. `etag` may be empty.
std::string compose(const std::string& name, const std::string& etag);

}  // namespace GroupComposer
