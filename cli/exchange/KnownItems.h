// KnownItems.h: the items that a calendar or an address book held before an import, and which of them an item of the
// file is. Each is found once, so that two alike stay two.
#pragma once

#include <set>
#include <string>
#include <unordered_map>
#include <vector>

namespace exchange {

enum class Match {
    kNew,
    kSame,       // says the same
    kDiffers,    // the same item, but it says something else
    kUndecided,  // ask findByKeys() when all others have been looked for
};

class KnownItems {
public:
    void add(int id, const std::vector<std::string>& uids, const std::string& digest,
             const std::vector<std::string>& keys);

    struct Found {
        Match match = Match::kNew;
        int id = 0;
    };
    // By its uid, else by what it says.
    Found find(const std::string& uid, const std::string& digest, const std::vector<std::string>& keys);
    Found findByKeys(const std::vector<std::string>& keys);
    // Whether the file has already given this very item.
    bool isRepeated(const std::string& uid, const std::string& digest);

private:
    struct Item {
        int id;
        std::string digest;
        bool isTaken = false;
    };
    struct Places {
        std::vector<size_t> items;
        size_t next = 0;  // those before it are taken
    };
    using Index = std::unordered_map<std::string, Places>;
    // The first in the index that is not taken; the number of items when there is none.
    [[nodiscard]] size_t firstFree(Index& index, const std::string& name) const;
    Found take(size_t item, Match match);

    std::vector<Item> mItems;
    Index mByUid, mByDigest, mByKey;
    std::set<std::string> mSeen;
};

}  // namespace exchange
