// FeedJson: contacts and groups as a client sees them.
#pragma once

#include <string>

#include "ContactCheck.h"
#include "Http.h"

namespace provider {

struct FeedEntry;

// Percent-encodes one path segment.
std::string encodeSegment(std::string_view text);
// "/m8/feeds/contacts/EMAIL/VIEW/ID", the view being "base" or "full".
std::string feedPath(FeedKind kind, const std::string& email, const std::string& view,
                     const std::string& id = "");
// With the origin where a placeholder for it stands.
Json shown(const Json& fields, const std::string& origin);
// The account as its owner addresses it.
struct FeedPlace {
    std::string origin;
    std::string email;
};
Json entryJson(FeedKind kind, const FeedEntry& entry, const FeedPlace& place);
// {"version","encoding",NAME: content}
Json document(const char* name, Json content);
// What every feed begins with.
Json feedHead(FeedKind kind, const FeedPlace& place);

}  // namespace provider
