#include "e2e/ExpectedContacts.h"

#include <algorithm>
#include <functional>
#include <set>
#include <vector>

namespace {

using Words = std::set<std::string>;

std::string textOf(const Json& object, const char* member, const char* inner = "$t") {
    const auto found = object.find(member);
    return found != object.end() ? found->value(inner, "") : "";
}

std::string wordOf(const std::string& rel) {
    const size_t hash = rel.rfind('#');
    return hash == std::string::npos ? rel : rel.substr(hash + 1);
}

// Adds the type of an element; a word that is not known is none.
Json typed(Json item, const Json& element, const Words& words, const char* member = "type",
           const char* attribute = "rel") {
    const std::string word = wordOf(element.value(attribute, ""));
    item[member] = words.contains(word) ? word : "other";
    item["label"] = "";
    if (element.contains(attribute)) return item;
    item["label"] = element.value("label", "");
    if (item["label"] != "") item[member] = "custom";
    return item;
}

Json listOf(const Json& wire, const char* member, const std::function<Json(const Json&)>& itemOf) {
    Json items = Json::array();
    if (wire.contains(member)) {
        for (const Json& element : wire[member]) items.push_back(itemOf(element));
    }
    return items;
}

std::string dateOf(const std::string& text) {
    return text.starts_with("--") ? "" : text;
}

Json eventsOf(const Json& wire) {
    Json events = listOf(wire, "gContact$event", [](const Json& element) {
        return typed({{"date", dateOf(textOf(element, "gd$when", "startTime"))}}, element, {"anniversary"});
    });
    if (wire.contains("gContact$birthday")) {
        const Json birthday = {
            {"date", dateOf(textOf(wire, "gContact$birthday", "when"))}, {"type", "birthday"}, {"label", ""}};
        events.push_back(birthday);
    }
    return events;
}

Json companiesOf(const Json& wire) {
    return listOf(wire, "gd$organization", [](const Json& element) {
        return typed({{"name", textOf(element, "gd$orgName")},
                      {"title", textOf(element, "gd$orgTitle")},
                      {"department", textOf(element, "gd$orgDepartment")},
                      {"description", textOf(element, "gd$orgJobDescription")},
                      {"location", textOf(element, "gd$where", "valueString")},
                      {"symbol", textOf(element, "gd$orgSymbol")}},
                     element, {"work"});
    });
}

Json addressesOf(const Json& wire) {
    return listOf(wire, "gd$structuredPostalAddress", [](const Json& element) {
        return typed({{"street", textOf(element, "gd$street")},
                      {"pobox", textOf(element, "gd$pobox")},
                      {"extended", textOf(element, "gd$neighborhood")},
                      {"city", textOf(element, "gd$city")},
                      {"region", textOf(element, "gd$region")},
                      {"postcode", textOf(element, "gd$postcode")},
                      {"country", textOf(element, "gd$country")},
                      {"primary", element.value("primary", "") == "true"}},
                     element, {"home", "work"});
    });
}

Json phonesOf(const Json& wire) {
    static const Words kWords = {"mobile", "home",        "work",      "work_fax", "home_fax",
                                 "pager",  "assistant",   "car",       "fax",      "isdn",
                                 "other",  "work_mobile", "work_pager"};
    return listOf(wire, "gd$phoneNumber", [](const Json& element) {
        return typed(
            {{"value", element.value("$t", "")}, {"primary", element.value("primary", "") == "true"}},
            element, kWords);
    });
}

Json messengersOf(const Json& wire) {
    static const Words kWords = {"VANTOR_TALK", "MSN", "YAHOO", "ICQ", "AIM", "QQ", "JABBER", "SKYPE"};
    return listOf(wire, "gd$im", [](const Json& element) {
        return typed({{"value", element.value("address", "")}}, element, kWords, "protocol", "protocol");
    });
}

Json relationsOf(const Json& wire) {
    static const Words kWords = {
        "assistant", "brother", "child",   "domestic-partner", "father",   "friend", "manager",
        "mother",    "parent",  "partner", "referred-by",      "relative", "sister", "spouse"};
    return listOf(wire, "gContact$relation", [](const Json& element) {
        return typed({{"name", element.value("$t", "")}}, element, kWords);
    });
}

Json groupsOf(const Json& wire, const std::map<std::string, std::string>& groups) {
    std::set<std::string> names;
    for (const Json& element : wire.value("gContact$groupMembershipInfo", Json::array())) {
        const std::string href = element.value("href", "");
        names.insert(groups.at(href.substr(href.rfind('/') + 1)));
    }
    return names;
}

// The order of elements is no part of what a contact says: an upload sorts the birthday and what it carries over.
Json sorted(Json contact) {
    for (auto& member : contact.items()) {
        if (member.value().is_array()) std::sort(member.value().begin(), member.value().end());
    }
    return contact;
}

}  // namespace

Json expectedContact(const Json& wire, const std::map<std::string, std::string>& groups) {
    const Json name = wire.value("gd$name", Json::object());
    return sorted(
        {{"name",
          {{"first", textOf(name, "gd$givenName")},
           {"middle", textOf(name, "gd$additionalName")},
           {"last", textOf(name, "gd$familyName")},
           {"prefix", textOf(name, "gd$namePrefix")},
           {"suffix", textOf(name, "gd$nameSuffix")},
           {"phoneticFirst", textOf(name, "gd$givenName", "yomi")},
           {"phoneticMiddle", textOf(name, "gd$additionalName", "yomi")},
           {"phoneticLast", textOf(name, "gd$familyName", "yomi")}}},
         {"nickname", textOf(wire, "gContact$nickname")},
         {"note", textOf(wire, "content")},
         {"emails", listOf(wire, "gd$email",
                           [](const Json& element) {
                               return typed({{"value", element.value("address", "")}}, element,
                                            {"home", "work", "mobile"});
                           })},
         {"phones", phonesOf(wire)},
         {"addresses", addressesOf(wire)},
         {"companies", companiesOf(wire)},
         {"messengers", messengersOf(wire)},
         {"events", eventsOf(wire)},
         {"relations", relationsOf(wire)},
         {"urls",
          listOf(wire, "gContact$website",
                 [](const Json& element) {
                     return typed({{"value", element.value("href", "")}}, element, {"home", "work", "other"});
                 })},
         {"groups", groupsOf(wire, groups)},
         {"fields", listOf(wire, "gContact$userDefinedField", [](const Json& element) {
              return Json({{"key", element.value("key", "")}, {"value", element.value("value", "")}});
          })}});
}

Json comparableContact(Json listed, const std::map<int, std::string>& groups) {
    for (const char* member : {"id", "account", "photo"}) listed.erase(member);
    for (Json& group : listed["groups"]) group = groups.at(group.get<int>());
    return sorted(std::move(listed));
}
