#include "contacts/CtFeedParsers.h"

#include "common/HeaderText.h"
#include "common/JsonAccess.h"
#include "common/JsonText.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "contacts/CtIdUtil.h"
#include "contacts/CtJsonEntryConverter.h"

using json_access::object;
using json_access::textOr;
using sync_result::kFailed;
using sync_result::kOk;

namespace {

std::string elementText(JsonObject* parent, const char* member) {
    return textOr(object(parent, member), "$t", "");
}

void readCommon(JsonNode* node, CtEntryInfo* info) {
    JsonObject* entry = json_access::objectIn(node);
    info->json.reset(json_node_ref(node));
    const std::string id = elementText(entry, "id");
    info->id = id.empty() ? id : CtIdUtil::idAfterBase(id);
    info->etag = textOr(entry, "gd$etag", "");
    info->updated = elementText(entry, "updated");
    info->title = elementText(entry, "title");
    info->isDeleted = json_access::member(entry, "deleted") != nullptr ||
                      json_access::member(entry, "gd$deleted") != nullptr;
    forEachElement(entry, "link", [info](JsonObject* link) {
        const std::string rel = textOr(link, "rel", "");
        if (rel == "self" || rel == "edit") info->editId = CtIdUtil::idAfterFull(textOr(link, "href", ""));
    });
}

void readKind(JsonObject* entry, ContactInfo* info) {
    (void)photoLinkOf(entry, &info->photoHref, &info->photoEtag);
    forEachElement(entry, "gContact$website",
                   [info](JsonObject* website) { info->websites.push_back(textOr(website, "href", "")); });
    forEachElement(entry, "gContact$groupMembershipInfo", [info](JsonObject* membership) {
        info->groupUris.push_back(CtIdUtil::idAfterBase(textOr(membership, "href", "")));
    });
}

void readKind(JsonObject* entry, GroupInfo* info) {
    JsonNode* kind = json_access::member(entry, "gContact$systemGroup");
    if (kind == nullptr) return;
    info->isSystem = true;
    info->systemId = textOr(json_access::objectIn(kind), "id", "");
    if (info->systemId.empty()) SYNC_ERR("Is this system group or editable group?");
}

template <class Info>
void readEntry(JsonNode* node, CtPage<Info>* page) {
    auto info = std::make_shared<Info>();
    try {
        if (!JSON_NODE_HOLDS_OBJECT(node)) throw JsonException("an entry is no object");
        readCommon(node, info.get());
        readKind(json_access::objectIn(node), info.get());
    } catch (const JsonException& error) {
        SYNC_ERR("Handle this execption! (%s)", error.what());
        if (info->id.empty()) {
            ++page->unreadable;
        } else {
            page->idOnly.push_back(info->id);
        }
        return;
    }
    if (info->id.empty()) {
        SYNC_ERR("an entry(%s) has no id, it is left out", info->title.c_str());
        ++page->unreadable;
    } else if (info->etag.empty() && !info->isDeleted) {
        SYNC_ERR("entry(%s, %s) has no etag, it is left as it is", info->id.c_str(), info->title.c_str());
        page->idOnly.push_back(info->id);
    } else {
        page->entries.push_back(std::move(info));
    }
}

template <class Info>
int readFeed(const std::string& text, CtPage<Info>* out) {
    const JsonNodePtr root = json_text::parse(text);
    if (!root) {
        SYNC_ERR("load json fail! %s", "the reply is no JSON");
        return kFailed;
    }
    JsonObject* feed = object(json_access::objectIn(root.get()), "feed");
    JsonNode* entries = json_access::member(feed, "entry");
    if (feed == nullptr || (entries != nullptr && !JSON_NODE_HOLDS_ARRAY(entries))) {
        SYNC_ERR("load json fail! %s", "the reply is no feed");
        return kFailed;
    }
    CtPage<Info> page;
    try {
        forEachElement(feed, "link", [&page](JsonObject* link) {
            if (textOr(link, "rel", "") == "next") page.nextPageToken = textOr(link, "href", "");
        });
    } catch (const JsonException& error) {
        SYNC_ERR("load json fail! %s", error.what());
        return kFailed;
    }
    JsonArray* items = entries != nullptr ? json_node_get_array(entries) : nullptr;
    for (guint i = 0; items != nullptr && i < json_array_get_length(items); ++i)
        readEntry(json_array_get_element(items, i), &page);
    *out = std::move(page);
    return kOk;
}

bool readLink(JsonObject* link, CtEntryMetaData* meta) {
    const std::optional<std::string> rel = json_access::text(link, "rel");
    if (!rel) {
        SYNC_ERR("cannot find link-href");
        return false;
    }
    const std::string href = textOr(link, "href", "");
    if (*rel == "self" || *rel == "edit") {
        meta->editId = CtIdUtil::idAfterFull(href);
    } else if (rel->ends_with(ct_wire::kPhotoRelEnd)) {
        meta->photoHref = href;
        meta->photoEtag = textOr(link, "gd$etag", "");
    } else {
        SYNC_DBG("unknown type of rel %s", rel->c_str());
    }
    return true;
}

}  // namespace

JsonObject* CtEntryInfo::object() const {
    return json_access::objectIn(json.get());
}

std::string CtEntryInfo::jsonText() const {
    return json_text::textOf(json.get());
}

int CtContactListJsonParser::parse(const std::string& text, CtContactPage* page) {
    return readFeed(text, page);
}

int CtGroupListJsonParser::parse(const std::string& text, CtGroupPage* page) {
    return readFeed(text, page);
}

int CtEntryMetaDataParser::getMetaData(const std::string& text, CtEntryMetaData* out) {
    const JsonNodePtr root = json_text::parse(text);
    JsonNode* node = json_access::member(json_access::objectIn(root.get()), "entry");
    JsonObject* entry = json_access::objectIn(node);
    if (entry == nullptr) {
        SYNC_ERR("load json fail! %s", "the reply holds no entry");
        return kFailed;
    }
    CtEntryMetaData meta;
    meta.etag = textOr(entry, "gd$etag", "");
    if (meta.etag.empty()) {
        SYNC_ERR("cannot find gd$etag");
        return kFailed;
    }
    const std::string id = elementText(entry, "id");
    if (id.empty()) {
        SYNC_ERR("cannot find id");
        return kFailed;
    }
    meta.id = CtIdUtil::idAfterBase(id);
    meta.updated = elementText(entry, "updated");
    bool isReadable = true;
    try {
        forEachElement(entry, "link",
                       [&](JsonObject* link) { isReadable = readLink(link, &meta) && isReadable; });
    } catch (const JsonException& error) {
        SYNC_ERR("load json fail! %s", error.what());
        return kFailed;
    }
    if (!isReadable) return kFailed;
    meta.entry.reset(json_node_ref(node));
    *out = std::move(meta);
    return kOk;
}

int CtAccessTokenParser::getAccessToken(const std::string& text, std::string* token) {
    const JsonNodePtr root = json_text::parse(text);
    const std::string found = textOr(json_access::objectIn(root.get()), "access_token", "");
    if (found.empty() || !header_text::isValid(found)) {
        SYNC_ERR("don't have token");
        return kFailed;
    }
    *token = found;
    return kOk;
}
