// What the servers answer a write with: the entry of the contacts service, etag and id of the calendar's and tasks'.
#include "calendar/CalJsonParser.h"
#include "common/JsonAccess.h"
#include "common/JsonText.h"
#include "common/SyncResult.h"
#include "contacts/CtFeedParsers.h"
#include "contacts/CtIdUtil.h"
#include "fuzz/Fuzz.h"

using fuzz::require;
using sync_result::kOk;

namespace {

void checkEntry(const std::string& text) {
    CtEntryMetaData meta;
    meta.etag = "before";
    if (CtEntryMetaDataParser::getMetaData(text, &meta) != kOk) {
        require(meta.etag == "before" && meta.id.empty() && !meta.entry, "a refusal changes nothing");
        return;
    }
    require(!meta.etag.empty(), "an entry that was taken has an etag");
    const std::string again = R"({"entry":)" + json_text::textOf(meta.entry.get()) + "}";
    CtEntryMetaData second;
    require(CtEntryMetaDataParser::getMetaData(again, &second) == kOk, "what is kept can be read", again);
    require(second.id == meta.id && second.etag == meta.etag && second.editId == meta.editId &&
                second.photoHref == meta.photoHref && second.photoEtag == meta.photoEtag &&
                second.updated == meta.updated,
            "what is kept says the same", again);
    const std::string edit = CtIdUtil::makeEditHref("http://h/m8/feeds", CtItemType::kContact, meta.editId);
    require(edit.find_first_of(" \r\n\t\\\"") == std::string::npos, "an id stays within its address", edit);
}

void checkItem(const std::string& text) {
    CalJsonParser parser;
    if (parser.setString(text) != kOk) return;
    (void)parser.checkData();
    std::string etag = "before";
    std::string uri = "before";
    if (parser.getEtagUri(&etag, &uri) != kOk)
        require(etag == "before" && uri == "before", "a refusal changes nothing");
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string text = fuzz::textOf(data, size);
    checkEntry(text);
    checkItem(text);
    return 0;
}
