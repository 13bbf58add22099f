// Feeds of contacts and groups, as far as the records and back to the entries of uploads; and public profiles.
#include "common/JsonText.h"
#include "common/SyncResult.h"
#include "contacts/ContactComposer.h"
#include "contacts/CtFeedParsers.h"
#include "contacts/CtJsonOrbitPeopleConverter.h"
#include "contacts/GroupComposer.h"
#include "fuzz/Fuzz.h"
#include "service/contacts/AtomReader.h"

using fuzz::require;
using sync_result::kOk;

namespace {

constexpr int kGroup = 4;

int groupOf(const std::string& uri) {
    return uri == "g" ? kGroup : 0;
}

std::string uriOf(int id) {
    return id == kGroup ? "g" : "";
}

const ContactComposer& composer() {
    static const ContactComposer* const instance = new ContactComposer("http://h/m8/feeds", groupOf, uriOf);
    return *instance;
}

// NULL when the entry cannot be read.
ContactsRecord recordOf(const std::string& entryText) {
    ContactsRecord record;
    try {
        if (CtJsonEntryConverter(groupOf).convert(entryText, &record, 1, /*withPhoto=*/false) == kOk)
            return record;
    } catch (const JsonException&) {
    }
    return nullptr;
}

void checkContact(const ContactInfo& info) {
    const std::string text = info.jsonText();
    require(json_text::parse(text) != nullptr, "an entry's text is JSON", text);
    const ContactsRecord record = recordOf(text);
    if (!record) return;
    const std::string sent = composer().compose(record.get(), info.etag);
    const Json read = readAtom(sent);
    require(!read.is_null(), "an entry is well-formed", sent);
    const ContactsRecord again = recordOf(read.dump(-1, ' ', false, Json::error_handler_t::replace));
    if (!again) return;  // an element without text or attributes is one that cannot be sent
    const std::string fields = composer().composeFields(record.get());
    require(fields == composer().composeFields(again.get()), "an entry is read to the same fields",
            sent + "\n" + fields + "\n" + composer().composeFields(again.get()));
}

void checkGroup(const GroupInfo& info) {
    const std::string sent = GroupComposer::compose(info.title, info.etag);
    require(sent.empty() == info.title.empty(), "a group with a name is sent");
    if (sent.empty()) return;
    const Json read = readAtom(sent);
    require(!read.is_null(), "a group is well-formed", sent);
    require(ctXmlEscape(read.at("title").value("$t", "")) == ctXmlEscape(info.title),
            "a group keeps its name", sent);
}

void checkProfile(const std::string& text) {
    std::string url;
    (void)CtJsonOrbitPeopleConverter::getPhotoUrl(text, "http://h", &url);
    const ContactsRecord record = recordOf("{}");
    require(record != nullptr, "an empty entry can be read");
    (void)CtJsonOrbitPeopleConverter::convert(text, record.get());
    const std::string sent = composer().compose(record.get(), "");
    require(!readAtom(sent).is_null(), "an entry is well-formed", sent);
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string text = fuzz::textOf(data, size);
    CtContactPage contacts;
    CtGroupPage groups;
    const bool isFeed = CtContactListJsonParser::parse(text, &contacts) == kOk;
    require(isFeed == (CtGroupListJsonParser::parse(text, &groups) == kOk), "a feed is one for both readers");
    for (const auto& info : contacts.entries) checkContact(*info);
    for (const auto& info : groups.entries) checkGroup(*info);
    if (!isFeed) checkProfile(text);
    return 0;
}
