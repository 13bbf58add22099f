// CtGroupMap: the groups of one address book between the server's ids and the device's, read once a run.
// Owner: whoever converts contacts.   Threads: one at a time.
#pragma once

#include <string>
#include <unordered_map>
#include <vector>

#include "contacts/ContactComposer.h"
#include "contacts/CtMetaDataDBHelper.h"

class CtGroupMap {
public:
    [[nodiscard]] int load(CtMetaDataDBHelper& store, int addressBookId) {
        std::vector<CtGroupSyncRow> rows;
        const int result = store.getAllGroups(addressBookId, &rows);
        for (const CtGroupSyncRow& row : rows) {
            if (row.uri.empty()) continue;
            mIds.emplace(row.uri, row.group_id);
            mUris.emplace(row.group_id, row.uri);
        }
        return result;
    }

    [[nodiscard]] int idOf(const std::string& uri) const {
        const auto found = mIds.find(uri);
        return found != mIds.end() ? found->second : 0;
    }
    // Of those that the device has.
    [[nodiscard]] std::vector<int> idsOf(const std::vector<std::string>& uris) const {
        std::vector<int> ids;
        for (const std::string& uri : uris) {
            if (const int id = idOf(uri); id != 0) ids.push_back(id);
        }
        return ids;
    }
    [[nodiscard]] std::string uriOf(int groupId) const {
        const auto found = mUris.find(groupId);
        return found != mUris.end() ? found->second : std::string();
    }

    // Both use the map, which must outlive them.
    [[nodiscard]] CtJsonEntryConverter converter() const {
        return CtJsonEntryConverter([this](const std::string& uri) { return idOf(uri); });
    }
    [[nodiscard]] ContactComposer composer(const std::string& feedBase) const {
        return {feedBase, [this](const std::string& uri) { return idOf(uri); },
                [this](int id) { return uriOf(id); }};
    }

private:
    std::unordered_map<std::string, int> mIds;
    std::unordered_map<int, std::string> mUris;
};
