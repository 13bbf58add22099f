#include "exchange/VCardWriter.h"

#include <glib.h>

#include <algorithm>

#include "ContactJson.h"
#include "Handles.h"
#include "exchange/VCardMapping.h"

namespace exchange {

namespace {

const std::string& textOf(const Json& object, std::string_view member) {
    return object.at(std::string(member)).get_ref<const std::string&>();
}

// Which row stands for the word; "" when it needs none.
std::string_view typesOf(std::span<const CardType> rows, std::string_view word) {
    for (const CardType& row : rows) {
        if (row.word == word && !row.isOnlyRead) return row.types;
    }
    return {};
}

struct Image {
    std::string_view magic;
    const char* type;
};
constexpr Image kImages[] = {{"\xFF\xD8\xFF", "image/jpeg"},
                             {"\x89PNG", "image/png"},
                             {"GIF8", "image/gif"},
                             {"RIFF", "image/webp"},
                             {"BM", "image/bmp"}};

std::string dataUri(const std::string& bytes) {
    std::string type = "application/octet-stream";
    for (const Image& image : kImages) {
        if (bytes.starts_with(image.magic)) type = image.type;
    }
    const GChars encoded(g_base64_encode(reinterpret_cast<const guchar*>(bytes.data()), bytes.size()));
    return "data:" + type + ";base64," + encoded.get();
}

// A link is no text: its commas and semicolons stand as they are.
std::string linkText(const std::string& escaped) {
    std::string out;
    for (size_t at = 0; at < escaped.size(); ++at) {
        const bool isPair = escaped[at] == '\\' && at + 1 < escaped.size();
        if (isPair && escaped[at + 1] != ',' && escaped[at + 1] != ';') out += escaped[at];
        if (isPair) ++at;
        out += escaped[at];
    }
    return out;
}

std::string schemeText(const std::string& value) {
    const GChars escaped(g_uri_escape_string(value.c_str(), "!$&'*+=@/?", /*allow_utf8=*/TRUE));
    return escaped.get();
}

}  // namespace

std::string VCardWriter::escaped(const std::string& text) {
    if (content_line::losesControls(text)) mLosses.add("control characters in texts");
    return content_line::escape(text);
}

void VCardWriter::addText(std::string_view property, const std::string& text) {
    if (!text.empty()) add({"", std::string(property), {}, escaped(text)});
}

void VCardWriter::addItem(ContentLine line, const Json& object, std::string_view types) {
    if (!types.empty()) {
        Parameter parameter{"TYPE", {}};
        for (const std::string_view word : content_line::split(types, ','))
            parameter.values.push_back(content_line::lower(word));
        line.parameters.push_back(std::move(parameter));
    }
    if (object.value("primary", false)) line.parameters.push_back({"PREF", {"1"}});
    const std::string label = object.value("label", "");
    if (!label.empty() && line.group.empty()) line.group = nextGroup();
    const std::string group = line.group;
    add(line);
    if (!label.empty()) add({group, std::string(kLabelProperty), {}, escaped(label)});
}

void VCardWriter::addNames(const Json& contact) {
    std::string shown = contact_json::displayNameOf(contact);
    for (const char* list : {"emails", "phones"}) {
        if (shown.empty() && !contact[list].empty()) shown = textOf(contact[list][0], "value");
    }
    add({"", "FN", {}, escaped(shown)});
    const Json& name = contact["name"];
    std::string parts;
    for (const std::string_view part : kNameParts)
        parts += (parts.empty() && part == kNameParts[0] ? "" : ";") + escaped(textOf(name, part));
    if (parts != ";;;;") add({"", "N", {}, parts});
    for (const CardText& text : kCardTexts)
        addText(text.property,
                textOf(text.object.empty() ? contact : contact[std::string(text.object)], text.member));
}

void VCardWriter::addLists(const Json& contact) {
    for (const CardList& list : kCardLists) {
        for (const Json& object : contact[std::string(list.member)]) {
            const std::string value = escaped(textOf(object, list.value));
            addItem({"", std::string(list.property), {}, list.isText ? value : linkText(value)}, object,
                    typesOf(list.types, textOf(object, "type")));
        }
    }
}

void VCardWriter::addAddresses(const Json& contact) {
    for (const Json& address : contact["addresses"]) {
        std::string parts;
        for (const std::string_view part : kAddressParts)
            parts += (part == kAddressParts[0] ? "" : ";") + escaped(textOf(address, part));
        addItem({"", "ADR", {}, parts}, address, typesOf(kPlainTypes, textOf(address, "type")));
    }
}

void VCardWriter::addCompanies(const Json& contact) {
    for (const Json& company : contact["companies"]) {
        const std::string group = nextGroup();
        std::string value = escaped(textOf(company, "name"));
        if (!textOf(company, "department").empty()) value += ";" + escaped(textOf(company, "department"));
        const std::string_view types = typesOf(kCompanyTypes, textOf(company, "type"));
        if (!value.empty() || !types.empty() || !textOf(company, "label").empty())
            addItem({group, "ORG", {}, value}, company, types);
        for (const CompanyText& text : kCompanyTexts) {
            const std::string& said = textOf(company, text.member);
            if (!said.empty()) add({group, std::string(text.property), {}, escaped(said)});
        }
    }
}

void VCardWriter::addMessengers(const Json& contact) {
    for (const Json& messenger : contact["messengers"]) {
        std::string_view scheme = "x-im";
        for (const CardMessenger& row : kMessengers) {
            if (row.protocol == textOf(messenger, "protocol") && !row.isOnlyRead) scheme = row.scheme;
        }
        addItem({"", "IMPP", {}, std::string(scheme) + ":" + schemeText(textOf(messenger, "value"))},
                messenger, "");
    }
}

void VCardWriter::addDates(const Json& contact) {
    // A card has one birthday and one anniversary.
    std::vector<std::string> taken;
    for (const Json& event : contact["events"]) {
        const std::string& date = textOf(event, "date");
        const std::string& type = textOf(event, "type");
        const bool isOwn = !date.empty() && (type == "birthday" || type == "anniversary") &&
                           std::find(taken.begin(), taken.end(), type) == taken.end();
        if (!isOwn) {
            addItem({"", std::string(kDateProperty), {{"VALUE", {date.empty() ? "text" : "date"}}}, date},
                    event, typesOf(kEventTypes, type));
            continue;
        }
        taken.push_back(type);
        std::string compact = date;
        std::erase(compact, '-');
        addItem({"", type == "birthday" ? "BDAY" : "ANNIVERSARY", {}, compact}, event, "");
    }
}

void VCardWriter::addRelations(const Json& contact) {
    for (const Json& relation : contact["relations"]) {
        addItem({"", "RELATED", {{"VALUE", {"text"}}}, escaped(textOf(relation, "name"))}, relation,
                typesOf(kRelationTypes, textOf(relation, "type")));
    }
}

void VCardWriter::addExtras(const Json& contact, const CardExtras& extras) {
    for (const Json& field : contact["fields"]) {
        const std::string group = nextGroup();
        add({group, std::string(kFieldProperty), {}, escaped(textOf(field, "value"))});
        add({group, std::string(kLabelProperty), {}, escaped(textOf(field, "key"))});
    }
    std::string categories;
    for (const std::string& group : extras.groups)
        categories += (categories.empty() ? "" : ",") + escaped(group);
    if (!categories.empty()) add({"", "CATEGORIES", {}, categories});
    if (!extras.photo.empty()) add({"", "PHOTO", {}, dataUri(extras.photo)});
}

std::string VCardWriter::card(const Json& contact, const CardExtras& extras) {
    mText = "BEGIN:VCARD\r\nVERSION:4.0\r\nPRODID:-//vantor-pim-sync//vantor-pim-syncctl//EN\r\n";
    mGroups = 0;
    if (!extras.uid.empty()) add({"", "UID", {}, extras.uid});
    addNames(contact);
    addLists(contact);
    addAddresses(contact);
    addCompanies(contact);
    addMessengers(contact);
    addDates(contact);
    addRelations(contact);
    addExtras(contact, extras);
    return mText + "END:VCARD\r\n";
}

}  // namespace exchange
