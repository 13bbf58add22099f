#include "exchange/VCardReader.h"

#include <glib.h>

#include <algorithm>

#include "ContactJson.h"
#include "Failure.h"
#include "PhotoFile.h"
#include "exchange/VCardValues.h"

namespace exchange {

namespace {

using content_line::unescape;

template <class Rows>
bool isIn(const Rows& rows, std::string_view name) {
    return std::find(std::begin(rows), std::end(rows), name) != std::end(rows);
}

// Of several values in one place, of which a contact has one.
void append(Json& text, const std::string& more, std::string_view joint) {
    const std::string former = text.is_string() ? text.get<std::string>() : "";
    text = former.empty() ? more : former + std::string(joint) + more;
}

bool isPreferred(const ContentLine& line) {
    return !line.parameter("PREF").empty() || isIn(vcard_values::typesOf(line), "PREF");
}

constexpr std::string_view kLostParameters[] = {"LABEL", "SORT-AS", "GEO", "TZ"};

}  // namespace

std::vector<ContentLine> VCardReader::linesOf(const RawItem& raw) {
    std::vector<ContentLine> lines;
    int depth = 0;  // of a card inside the card
    for (const TextLine& line : raw.lines) {
        auto parsed = content_line::parse(line.text);
        if (!parsed) {
            if (line.text.find_first_not_of(" \t") != std::string::npos) mpLosses->add("malformed lines");
            continue;
        }
        if (parsed->name == "BEGIN" && depth++ == 0) mpLosses->add("cards inside cards");
        if (parsed->name == "END") --depth;
        if (depth > 0 || parsed->name == "END") continue;
        if (line.isTooLong) {
            mpLosses->add(parsed->name + " (too long)");
        } else if (vcard_values::decode(*parsed)) {
            lines.push_back(std::move(*parsed));
        } else {
            throw Failure("line " + std::to_string(line.number) + " is not UTF-8 or holds a NUL character");
        }
    }
    return lines;
}

Card VCardReader::read(const RawItem& raw, NotHeld& losses) {
    if (!raw.problem.empty()) throw Failure(raw.problem);
    mpLosses = &losses;
    mLabels.clear();
    mCompanies.clear();
    Card card;
    card.line = raw.firstLine;
    const std::vector<ContentLine> lines = linesOf(raw);
    for (const ContentLine& line : lines) {
        if (line.name == kLabelProperty && !line.group.empty()) mLabels[line.group] = unescape(line.value);
        if (line.name == "UID") card.uid = line.value;
        if ((line.name == "KIND" || line.name == "X-ADDRESSBOOKSERVER-KIND") &&
            content_line::lower(line.value) == "group")
            card.isList = true;
    }
    for (const ContentLine& line : lines) readLine(line, card);
    finish(lines, card);
    return card;
}

void VCardReader::readLine(const ContentLine& line, Card& card) {
    for (const Parameter& parameter : line.parameters) {
        if (isIn(kLostParameters, parameter.name)) mpLosses->add(line.name + ";" + parameter.name);
    }
    if (line.name == "N") return readName(line, card);
    if (line.name == "ADR") return readAddress(line, card);
    if (line.name == "PHOTO") return readPhoto(line, card);
    const bool isRead = readText(line, card) || readList(line, card) || readCompany(line) ||
                        readMessenger(line, card) || readDate(line, card) || readRelation(line, card) ||
                        readExtra(line, card);
    if (!isRead && line.name != kLabelProperty && !isIn(kSilentCardProperties, line.name) &&
        !line.value.empty())
        mpLosses->add(line.name);
}

// --- types and labels -------------------------------------------------------------------------------------------

std::string VCardReader::labelOf(const ContentLine& line) const {
    const auto found = line.group.empty() ? mLabels.end() : mLabels.find(line.group);
    return found != mLabels.end() ? found->second : std::string();
}

void VCardReader::setPrimary(const ContentLine& line, Json& object) {
    if (isPreferred(line)) object["primary"] = true;
}

void VCardReader::setType(const ContentLine& line, std::span<const CardType> rows, Json& object) {
    std::vector<std::string> types = vcard_values::typesOf(line);
    std::erase_if(types, [](const std::string& type) { return isIn(kNoTypes, type); });
    std::string_view word;
    for (const CardType& row : rows) {
        const auto words = content_line::split(row.types, ',');
        const bool isThere =
            std::all_of(words.begin(), words.end(), [&](auto one) { return isIn(types, one); });
        if (!isThere) continue;
        word = row.word;
        std::erase_if(types, [&](const std::string& type) { return isIn(words, type); });
        break;
    }
    std::string label = labelOf(line);
    if (const std::string common = vcard_values::commonLabel(label); !common.empty()) {
        const std::string lower = content_line::lower(common);
        const bool isWord =
            std::any_of(rows.begin(), rows.end(), [&](const CardType& row) { return row.word == lower; });
        object["type"] = isWord ? lower : "custom";
        if (!isWord) object["label"] = common;
        return;
    }
    if (word.empty() && label.empty() && !types.empty() && line.name == "RELATED") {
        label = content_line::lower(types.front());
        types.erase(types.begin());
    }
    for (const std::string& type : types) mpLosses->add(line.name + ";TYPE=" + type);
    if (!label.empty()) object["label"] = label;
    object["type"] = !word.empty() ? std::string(word) : label.empty() ? "other" : "custom";
}

// --- one kind of property each ----------------------------------------------------------------------------------

bool VCardReader::readText(const ContentLine& line, Card& card) {
    for (const CardText& text : kCardTexts) {
        if (text.property != line.name) continue;
        const std::string value =
            line.name == "NICKNAME" ? vcard_values::joined(line.value, ", ") : unescape(line.value);
        Json& object = text.object.empty() ? card.contact : card.contact[std::string(text.object)];
        if (!value.empty()) append(object[std::string(text.member)], value, text.joint);
        return true;
    }
    return false;
}

bool VCardReader::readList(const ContentLine& line, Card& card) {
    for (const CardList& list : kCardLists) {
        if (list.property != line.name) continue;
        std::string value = unescape(line.value);
        // A number may be written as a link.
        const bool isLink = content_line::lower(line.parameter("VALUE")) == "uri";
        if (isLink && content_line::lower(value.substr(0, 4)) == "tel:") value.erase(0, 4);
        if (value.empty()) return true;
        Json object = {{std::string(list.value), value}};
        setType(line, list.types, object);
        if (list.hasPrimary) setPrimary(line, object);
        if (!list.hasPrimary && isPreferred(line)) mpLosses->add(line.name + ";PREF");
        card.contact[std::string(list.member)].push_back(std::move(object));
        return true;
    }
    return false;
}

void VCardReader::readName(const ContentLine& line, Card& card) {
    const auto parts = content_line::split(line.value, ';');
    for (size_t at = 0; at < std::min(parts.size(), std::size(kNameParts)); ++at) {
        const std::string part = vcard_values::joined(parts[at], ", ");
        if (!part.empty()) card.contact["name"][std::string(kNameParts[at])] = part;
    }
}

void VCardReader::readAddress(const ContentLine& line, Card& card) {
    Json address = Json::object();
    const auto parts = content_line::split(line.value, ';');
    for (size_t at = 0; at < std::min(parts.size(), std::size(kAddressParts)); ++at) {
        const std::string part = vcard_values::joined(parts[at], ", ");
        if (!part.empty()) address[std::string(kAddressParts[at])] = part;
    }
    if (address.empty()) return;
    setType(line, kPlainTypes, address);
    setPrimary(line, address);
    card.contact["addresses"].push_back(std::move(address));
}

VCardReader::Company& VCardReader::companyOf(const ContentLine& line) {
    const auto same = std::find_if(mCompanies.begin(), mCompanies.end(), [&](const Company& company) {
        return !line.group.empty() && company.group == line.group;
    });
    if (same != mCompanies.end()) return *same;
    const auto open = std::find_if(mCompanies.begin(), mCompanies.end(), [&](const Company& company) {
        return (line.group.empty() || company.group.empty()) && !company.properties.contains(line.name);
    });
    Company& company = open != mCompanies.end() ? *open : mCompanies.emplace_back();
    if (company.group.empty()) company.group = line.group;
    return company;
}

bool VCardReader::readCompany(const ContentLine& line) {
    const auto* text = std::find_if(std::begin(kCompanyTexts), std::end(kCompanyTexts),
                                    [&](const CompanyText& row) { return row.property == line.name; });
    if (line.name != "ORG" && text == std::end(kCompanyTexts)) return false;
    if (line.name != "ORG") {
        if (line.value.empty()) return true;
        Company& company = companyOf(line);
        company.properties.insert(line.name);
        append(company.fields[std::string(text->member)], unescape(line.value), ", ");
        return true;
    }
    const auto parts = content_line::split(line.value, ';');
    std::string department;
    for (size_t at = 1; at < parts.size(); ++at) {
        const std::string unit = unescape(parts[at]);
        if (!unit.empty()) department += (department.empty() ? "" : ", ") + unit;
    }
    Company& company = companyOf(line);
    company.properties.insert(line.name);
    company.fields["name"] = unescape(parts.front());
    company.fields["department"] = department;
    setType(line, kCompanyTypes, company.fields);
    return true;
}

bool VCardReader::readMessenger(const ContentLine& line, Card& card) {
    const auto* row = std::find_if(
        std::begin(kMessengers), std::end(kMessengers),
        [&](const CardMessenger& one) { return !one.property.empty() && one.property == line.name; });
    if (line.name != "IMPP" && row == std::end(kMessengers)) return false;
    std::string value = unescape(line.value);
    std::string protocol = row != std::end(kMessengers) ? std::string(row->protocol) : "";
    std::string label = labelOf(line);
    if (line.name == "IMPP") {
        const vcard_values::Messenger said = vcard_values::messengerOf(line);
        value = said.value;
        protocol = said.protocol;
        if (label.empty()) label = said.label;
    }
    if (value.empty()) return true;
    if (protocol == "other" && !label.empty()) protocol = "custom";
    Json object = {{"value", value}, {"protocol", protocol}};
    if (!label.empty()) object["label"] = label;
    card.contact["messengers"].push_back(std::move(object));
    return true;
}

bool VCardReader::readDate(const ContentLine& line, Card& card) {
    const bool isBirthday = line.name == "BDAY";
    if (!isBirthday && line.name != "ANNIVERSARY" && line.name != "X-ANNIVERSARY" &&
        line.name != kDateProperty)
        return false;
    // A date that is known to be there, but not when.
    const bool isOpen = line.value.empty() && content_line::lower(line.parameter("VALUE")) == "text";
    if (line.value.empty() && !isOpen) return true;
    const std::string date = vcard_values::dateOf(line);
    if (date.empty() && !isOpen) {
        mpLosses->add(line.name + " (no whole date)");
        return true;
    }
    Json object = {{"date", date}};
    setType(line, kEventTypes, object);
    if (line.name != kDateProperty) object["type"] = isBirthday ? "birthday" : "anniversary";
    card.contact["events"].push_back(std::move(object));
    return true;
}

bool VCardReader::readRelation(const ContentLine& line, Card& card) {
    if (line.name != "RELATED" && line.name != kNamesProperty) return false;
    const std::string name = unescape(line.value);
    const bool isLink = content_line::lower(line.parameter("VALUE")) != "text" && vcard_values::isLink(name);
    if (isLink) mpLosses->add("RELATED (a link)");
    if (isLink || name.empty()) return true;
    Json object = {{"name", name}};
    setType(line, kRelationTypes, object);
    card.contact["relations"].push_back(std::move(object));
    return true;
}

bool VCardReader::readExtra(const ContentLine& line, Card& card) {
    if (line.name == kFieldProperty && !labelOf(line).empty()) {
        card.contact["fields"].push_back({{"key", labelOf(line)}, {"value", unescape(line.value)}});
        return true;
    }
    if (line.name != "CATEGORIES") return false;
    for (const std::string_view name : content_line::split(line.value, ',')) {
        std::string group = unescape(name);
        if (!group.empty() && !isIn(card.groups, group)) card.groups.push_back(std::move(group));
    }
    return true;
}

void VCardReader::readPhoto(const ContentLine& line, Card& card) {
    if (line.value.empty()) return;
    const std::optional<std::string> bytes = vcard_values::imageOf(line);
    if (!card.photo.empty()) {
        mpLosses->add("PHOTO (a second one)");
    } else if (!bytes) {
        mpLosses->add(vcard_values::isLink(line.value) ? "PHOTO (a link)" : "PHOTO (not an image)");
    } else if (bytes->size() > photo_file::kMostBytes) {
        mpLosses->add("PHOTO (larger than " + std::to_string(photo_file::kMostBytes >> 20) + " MB)");
    } else {
        card.photo = *bytes;
    }
}

void VCardReader::finish(const std::vector<ContentLine>& lines, Card& card) {
    for (Company& company : mCompanies) {
        const bool saysNothing =
            std::all_of(company.fields.begin(), company.fields.end(), [](const Json& field) {
                const auto& text = field.get_ref<const std::string&>();
                return text.empty() || text == "other";
            });
        if (!saysNothing) card.contact["companies"].push_back(std::move(company.fields));
    }
    const auto fn =
        std::find_if(lines.begin(), lines.end(), [](const ContentLine& line) { return line.name == "FN"; });
    const std::string full = fn != lines.end() ? unescape(fn->value) : "";
    // What the name is made of when it is not said: then the full name says nothing more.
    std::vector<std::string> known = {"", card.contact.value("nickname", "")};
    for (const auto& [list, member] :
         {std::pair{"companies", "name"}, {"emails", "value"}, {"phones", "value"}}) {
        if (card.contact.contains(list)) known.push_back(card.contact[list][0].value(member, ""));
    }
    bool hasName = false;
    for (const std::string_view part : kNameParts)
        hasName =
            hasName || (card.contact.contains("name") && card.contact["name"].contains(std::string(part)));
    if (!hasName && !isIn(known, full)) card.contact["name"]["first"] = full;
    if (!hasName || full.empty()) return;
    std::string composed;
    for (const char* part : {"prefix", "first", "middle", "last", "suffix"}) {
        const std::string value = card.contact["name"].value(part, "");
        if (!value.empty()) composed += (composed.empty() ? "" : " ") + value;
    }
    if (composed != full) mpLosses->add("FN (another one than N)");
}

}  // namespace exchange
