#include "calendar/CalJsonParser.h"

#include <cstdlib>

#include "common/HeaderText.h"
#include "common/JsonAccess.h"
#include "common/JsonText.h"
#include "common/SyncLog.h"
#include "common/SyncResult.h"

using sync_result::kFailed;
using sync_result::kOk;

namespace {

// What the elements of a list are read for.
struct ListShape {
    const char* title = "summary";
    bool needsEtag = true;
    bool hasColour = false;
    bool keepsJson = false;
};

// A list that is read as one reply may be cut short by the server all the same, so its token is read as well.
constexpr ListShape kBookList{.hasColour = true};
constexpr ListShape kEventList{};
constexpr ListShape kEventAllPage{.keepsJson = true};
constexpr ListShape kTodoBookList{.title = "title", .needsEtag = false};
constexpr ListShape kTodoList{.title = "title"};

CalListInfoPtr readElement(JsonNode* node, const ListShape& shape) {
    JsonObject* object = json_access::objectIn(node);
    CalListInfoPtr info = std::make_shared<CalListInfo>();
    info->id = json_access::textOr(object, "id", "");
    info->etag = json_access::textOr(object, "etag", "");
    info->summary = json_access::textOr(object, shape.title, "");
    if (shape.hasColour) {
        info->backgroundColor = json_access::textOr(object, "backgroundColor", "");
        info->accessRole = json_access::textOr(object, "accessRole", "");
    }
    if (shape.keepsJson) info->json.reset(json_node_ref(node));
    return info;
}

int readList(const JsonNodePtr& root, const ListShape& shape, CalListPage* out) {
    JsonObject* document = json_access::objectIn(root.get());
    if (document == nullptr) {
        SYNC_ERR("json_node_get_object() failed");
        return kFailed;
    }
    JsonArray* items = json_access::array(document, "items");
    if (items == nullptr) {
        SYNC_ERR("json_object_get_array_member() failed");
        return kFailed;
    }
    CalListPage page;
    page.nextPageToken = json_access::textOr(document, "nextPageToken", "");
    for (guint i = 0; i < json_array_get_length(items); ++i) {
        CalListInfoPtr info = readElement(json_array_get_element(items, i), shape);
        if (info->id.empty()) {
            SYNC_ERR("element %u has no id, it is left out", i);
            ++page.unreadable;
        } else if (shape.needsEtag && info->etag.empty()) {
            SYNC_ERR("No etag, so skip");
            page.idOnly.push_back(info->id);
        } else {
            page.entries.push_back(std::move(info));
        }
    }
    *out = std::move(page);
    return kOk;
}

}  // namespace

JsonObject* jsonObjectOf(const JsonNodePtr& node) {
    return json_access::objectIn(node.get());
}

JsonObject* CalJsonParser::root() const {
    return jsonObjectOf(mpRoot);
}

int CalJsonParser::setString(std::string_view body) {
    JsonNodePtr root = json_text::parse(body);
    if (!root) {
        SYNC_ERR("load fail");
        return kFailed;
    }
    mpRoot = std::move(root);
    return kOk;
}

int CalJsonParser::checkData() const {
    JsonObject* error = json_access::object(json_access::objectIn(mpRoot.get()), "error");
    if (error == nullptr) return 0;
    SYNC_ERR("Has error return");
    int code = 0;
    if (const std::optional<int> number = json_access::number(error, "code")) {
        code = *number;
    } else {
        constexpr int kDecimal = 10;
        code =
            static_cast<int>(std::strtol(json_access::textOr(error, "code", "").c_str(), nullptr, kDecimal));
    }
    // An error without a usable code is an error all the same.
    return code != 0 ? code : kFailed;
}

int CalJsonParser::getAccessToken(std::string* token) const {
    const std::string found = json_access::textOr(json_access::objectIn(mpRoot.get()), "access_token", "");
    if (found.empty() || !header_text::isValid(found)) {
        SYNC_ERR("don't have token");
        return kFailed;
    }
    *token = found;
    return kOk;
}

int CalJsonParser::getEtagUri(std::string* etag, std::string* uri) const {
    JsonObject* item = json_access::objectIn(mpRoot.get());
    if (item == nullptr) {
        SYNC_ERR("json_node_get_object() failed");
        return kFailed;
    }
    *etag = json_access::textOr(item, "etag", "");
    *uri = json_access::textOr(item, "id", "");
    return kOk;
}

int CalJsonParser::getBookList(CalListPage* page) const {
    return readList(mpRoot, kBookList, page);
}
int CalJsonParser::getEventList(CalListPage* page) const {
    return readList(mpRoot, kEventList, page);
}
int CalJsonParser::getEventListPage(CalListPage* page) const {
    return readList(mpRoot, kEventList, page);
}
int CalJsonParser::getEventAllPage(CalListPage* page) const {
    return readList(mpRoot, kEventAllPage, page);
}
int CalJsonParser::getTodoBookList(CalListPage* page) const {
    return readList(mpRoot, kTodoBookList, page);
}
int CalJsonParser::getTodoListPage(CalListPage* page) const {
    return readList(mpRoot, kTodoList, page);
}
