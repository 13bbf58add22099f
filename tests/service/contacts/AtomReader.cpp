#include "service/contacts/AtomReader.h"

#include <glib.h>

#include <set>
#include <vector>

namespace {

const std::set<std::string> kRepeated = {"gd$email",
                                         "gd$phoneNumber",
                                         "gd$im",
                                         "gd$organization",
                                         "gd$structuredPostalAddress",
                                         "gContact$event",
                                         "gContact$relation",
                                         "gContact$website",
                                         "gContact$groupMembershipInfo",
                                         "gContact$userDefinedField",
                                         "gContact$externalId"};

struct Open {
    std::string name;
    Json value = Json::object();
};

std::string jsonName(std::string name) {
    if (name.starts_with("atom:")) return name.substr(5);
    if (const size_t colon = name.find(':'); colon != std::string::npos) name[colon] = '$';
    return name;
}

void begin(GMarkupParseContext*, const char* name, const char** names, const char** values, void* data,
           GError**) {
    Open open{.name = jsonName(name)};
    for (size_t i = 0; names[i] != nullptr; ++i) open.value[jsonName(names[i])] = values[i];
    static_cast<std::vector<Open>*>(data)->push_back(std::move(open));
}

void end(GMarkupParseContext*, const char*, void* data, GError**) {
    auto& stack = *static_cast<std::vector<Open>*>(data);
    if (stack.size() == 1) return;
    Open done = std::move(stack.back());
    stack.pop_back();
    Json& parent = stack.back().value;
    if (kRepeated.contains(done.name)) {
        parent[done.name].push_back(done.value);
    } else {
        parent[done.name] = done.value;
    }
}

void text(GMarkupParseContext*, const char* value, gsize size, void* data, GError**) {
    if (size == 0) return;
    Json& element = static_cast<std::vector<Open>*>(data)->back().value;
    element["$t"] = element.value("$t", "") + std::string(value, size);
}

}  // namespace

Json readAtom(const std::string& xml) {
    constexpr GMarkupParser kParser{begin, end, text, nullptr, nullptr};
    std::vector<Open> stack;
    GMarkupParseContext* context = g_markup_parse_context_new(&kParser, {}, &stack, nullptr);
    const bool isRead =
        g_markup_parse_context_parse(context, xml.data(), static_cast<gssize>(xml.size()), nullptr) &&
        g_markup_parse_context_end_parse(context, nullptr);
    g_markup_parse_context_free(context);
    if (!isRead || stack.size() != 1 || stack[0].name != "entry") return nullptr;
    return stack[0].value;
}
