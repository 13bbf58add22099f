// ParkedItems: what the server refused for good. It is not sent again until it changes or a client asks for a sync; the rest goes on.
// Owner: an up-sync director.   Threads: the worker while a run is going on, the main thread between runs.
#pragma once

#include <map>
#include <string>
#include <utility>

class ParkedItems {
public:
    // `version` is that of the item's row: a later edit has another one.
    void park(const char* kind, int id, int version, const std::string& reason) {
        mItems[{kind, id}] = {version, reason};
    }
    [[nodiscard]] bool isParked(const char* kind, int id, int version) const {
        const auto found = mItems.find({kind, id});
        return found != mItems.end() && found->second.version == version;
    }
    void forget(const char* kind, int id) { mItems.erase({kind, id}); }
    void clear() { mItems.clear(); }

    // For people; empty when nothing is parked.
    [[nodiscard]] std::string summary() const {
        if (mItems.empty()) return {};
        const auto& [key, item] = *mItems.begin();
        const std::string others =
            mItems.size() > 1 ? " (and " + std::to_string(mItems.size() - 1) + " more)" : std::string();
        return key.first + " " + std::to_string(key.second) + others +
               " is refused by the server and waits until it is changed: " + item.reason;
    }

private:
    struct Item {
        int version = 0;
        std::string reason;
    };
    std::map<std::pair<std::string, int>, Item> mItems;  // by kind and id
};
