#include "contacts/GroupComposer.h"

#include "common/SyncLog.h"
#include "contacts/ContactComposer.h"

std::string GroupComposer::compose(const std::string& name, const std::string& etag) {
    if (name.empty()) {
        SYNC_ERR("Can't get group name!");
        return {};
    }
    CtXmlElement entry = makeAtomEntry(ct_wire::kGroupTerm, etag, /*withContactNamespace=*/false);
    entry.children.push_back({.name = "atom:title", .attributes = {{"type", "text"}}, .text = name});
    std::string text;
    entry.write(&text);
    return text;
}
