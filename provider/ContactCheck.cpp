#include "ContactCheck.h"

#include <algorithm>
#include <iterator>

#include "Times.h"

namespace provider {

namespace {

enum class Typed {
    kNo,
    kYes,         // exactly one of rel and label
    kByProtocol,  // a protocol will do as well
};

// An element that may be there more than once, and what it needs.
struct ListMember {
    const char* name;
    Typed typed = Typed::kNo;
    bool hasText = false;
    const char* attribute = nullptr;
};
constexpr ListMember kListMembers[] = {
    {"gd$email", Typed::kYes, false, "address"},
    {"gd$phoneNumber", Typed::kYes, true},
    {"gd$im", Typed::kByProtocol, false, "address"},
    {"gd$organization", Typed::kYes},
    {"gd$structuredPostalAddress", Typed::kYes},
    {"gd$extendedProperty", Typed::kNo, false, "name"},
    {"gContact$event", Typed::kYes},
    {"gContact$relation", Typed::kYes, true},
    {"gContact$website", Typed::kYes, false, "href"},
    {"gContact$groupMembershipInfo", Typed::kNo, false, "href"},
    {"gContact$userDefinedField", Typed::kNo, false, "key"},
    {"gContact$externalId"},
    {"gContact$calendarLink"},
    {"gContact$jot"},
    {"gContact$hobby"},
    {"gContact$language"},
};
constexpr const char* kEntryOwnMembers[] = {
    "id",   "etag",       "gd$etag", "updated", "published",           "category",
    "link", "gd$deleted", "photo",   "deleted", "gContact$systemGroup"};
constexpr int kMaxJsonDepth = 16;

const ListMember* listMember(const std::string& name) {
    const auto* found = std::find_if(std::begin(kListMembers), std::end(kListMembers),
                                     [&](const ListMember& row) { return name == row.name; });
    return found == std::end(kListMembers) ? nullptr : found;
}

bool has(const Json& element, const char* attribute) {
    const auto found = element.find(attribute);
    return found != element.end() && found->is_string() && !found->get_ref<const std::string&>().empty();
}

std::string textOrNone(const Json& element, const char* attribute) {
    return has(element, attribute) ? element.at(attribute).get<std::string>() : "";
}

// Attributes and texts are strings, everything else is an element or a list of them.
void checkShape(const std::string& name, const Json& value, int depth) {
    if (depth > kMaxJsonDepth) invalid(name, "nested too deeply");
    if (value.is_array()) {
        if (!isListMember(name)) invalid(name, "must be there only once");
        for (const Json& item : value) {
            if (!item.is_object()) invalid(name, "must be a list of elements");
            checkShape(name, item, depth + 1);
        }
        return;
    }
    if (!value.is_object()) invalid(name, "must be an element");
    for (const auto& [member, inner] : value.items()) {
        if (!inner.is_string()) checkShape(member, inner, depth + 1);
    }
}

void checkType(const ListMember& row, const Json& element) {
    const int words = static_cast<int>(has(element, "rel")) + static_cast<int>(has(element, "label"));
    const bool mayBeNone = row.typed == Typed::kByProtocol && has(element, "protocol");
    if (words == 0 && !mayBeNone) invalid(row.name, "needs rel or label");
    if (words == 2) invalid(row.name, "has both rel and label");
}

void checkListed(const ListMember& row, const Json& element) {
    if (row.typed != Typed::kNo) checkType(row, element);
    if (row.hasText && !has(element, "$t")) invalid(row.name, "needs a text");
    if (row.attribute != nullptr && !has(element, row.attribute))
        invalid(row.name, std::string("needs ") + row.attribute);
}

void checkContactEvent(const Json& event) {
    const auto when = event.find("gd$when");
    if (when == event.end() || !when->is_object()) invalid("gContact$event", "needs gd:when");
    if (!parseDate(textOrNone(*when, "startTime"))) invalid("gContact$event", "startTime must be YYYY-MM-DD");
}

void checkBirthday(const Json& birthday) {
    std::string when = textOrNone(birthday, "when");
    if (when.starts_with("--")) when = "2000-" + when.substr(2);
    if (!parseDate(when)) invalid("gContact$birthday", "when must be YYYY-MM-DD or --MM-DD");
}

}  // namespace

bool isListMember(const std::string& member) {
    return listMember(member) != nullptr;
}

void dropOwnMembers(Json& fields) {
    for (const char* member : kEntryOwnMembers) fields.erase(member);
}

void checkFields(FeedKind kind, const Json& fields) {
    for (const auto& [name, value] : fields.items()) {
        checkShape(name, value, 0);
        const ListMember* row = listMember(name);
        if (row == nullptr) continue;
        if (!value.is_array()) invalid(name, "must be a list");
        for (const Json& element : value) checkListed(*row, element);
    }
    const auto events = fields.find("gContact$event");
    if (events != fields.end()) {
        for (const Json& event : *events) checkContactEvent(event);
    }
    if (fields.contains("gContact$birthday")) checkBirthday(fields.at("gContact$birthday"));
    if (kind == FeedKind::kGroup && (!fields.contains("title") || !has(fields.at("title"), "$t")))
        invalid("title", "a group needs one");
}

std::string titleOf(const Json& fields) {
    const auto name = fields.find("gd$name");
    if (name == fields.end()) return "";
    const auto part = [&](const char* member) {
        const auto found = name->find(member);
        return found == name->end() || !found->is_object() ? "" : textOrNone(*found, "$t");
    };
    std::string title = part("gd$fullName");
    if (!title.empty()) return title;
    for (const char* member :
         {"gd$namePrefix", "gd$givenName", "gd$additionalName", "gd$familyName", "gd$nameSuffix"}) {
        const std::string text = part(member);
        if (!text.empty()) title += (title.empty() ? "" : " ") + text;
    }
    return title;
}

}  // namespace provider
