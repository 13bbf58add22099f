// Entries that clients write to the provider.
#include "AtomEntry.h"
#include "ContactCheck.h"
#include "fuzz/Fuzz.h"

using fuzz::require;
using provider::FeedKind;
using provider::Json;

namespace {

void check(const std::string& body, FeedKind kind) {
    provider::Call call;
    call.body = body;
    call.header = [](const char* name) {
        return std::string_view(name) == "Content-Type" ? "application/atom+xml; charset=utf-8" : "";
    };
    try {
        Json fields = provider::atomBody(call, kind);
        // Throws when a text is not UTF-8.
        const std::string text = fields.dump();
        require(Json::parse(text) == fields, "an entry is kept as it was read", text);
        provider::dropOwnMembers(fields);
        provider::checkFields(kind, fields);
        (void)provider::titleOf(fields);
    } catch (const provider::ApiError& error) {
        require(error.status >= 400 && error.status < 500, "a bad entry is the client's fault",
                error.message);
        require(!provider::errorBody(error).empty(), "a refusal says why");
    }
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string body = fuzz::textOf(data, size);
    check(body, FeedKind::kContact);
    check(body, FeedKind::kGroup);
    return 0;
}
