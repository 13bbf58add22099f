// The token endpoint's reply as it comes from the transport: status line, headers and body.
#include <algorithm>

#include "calendar/CalJsonParser.h"
#include "common/SyncResult.h"
#include "contacts/CtFeedParsers.h"
#include "fuzz/Fuzz.h"

using fuzz::require;
using sync_result::kOk;

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string reply = fuzz::textOf(data, size);
    const std::string body = reply.substr(std::min(reply.find('{'), reply.size()));
    std::string contacts = "before";
    const bool isThere = CtAccessTokenParser::getAccessToken(body, &contacts) == kOk;
    CalJsonParser parser;
    std::string calendar = "before";
    const bool isThereToo = parser.setString(body) == kOk && parser.getAccessToken(&calendar) == kOk;
    require(isThere == isThereToo && contacts == calendar, "both readers take the same token");
    require(isThere || contacts == "before", "a refusal changes nothing");
    require(!contacts.empty(), "a token is never empty");
    require(
        std::none_of(contacts.begin(), contacts.end(), [](unsigned char c) { return c < 0x20 || c == 0x7F; }),
        "a token fits into a header line");
    return 0;
}
