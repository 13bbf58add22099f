#include "exchange/KnownItems.h"

#include <algorithm>

namespace exchange {

void KnownItems::add(int id, const std::vector<std::string>& uids, const std::string& digest,
                     const std::vector<std::string>& keys) {
    const size_t place = mItems.size();
    mItems.push_back({id, digest});
    for (const std::string& uid : uids) {
        if (!uid.empty()) mByUid[uid].items.push_back(place);
    }
    mByDigest[digest].items.push_back(place);
    for (const std::string& key : keys) mByKey[key].items.push_back(place);
}

size_t KnownItems::firstFree(Index& index, const std::string& name) const {
    const auto found = index.find(name);
    if (found == index.end()) return mItems.size();
    Places& places = found->second;
    while (places.next < places.items.size() && mItems[places.items[places.next]].isTaken) ++places.next;
    return places.next < places.items.size() ? places.items[places.next] : mItems.size();
}

KnownItems::Found KnownItems::take(size_t item, Match match) {
    mItems[item].isTaken = true;
    return {match, mItems[item].id};
}

KnownItems::Found KnownItems::find(const std::string& uid, const std::string& digest,
                                   const std::vector<std::string>& keys) {
    if (const size_t named = firstFree(mByUid, uid); named != mItems.size())
        return take(named, mItems[named].digest == digest ? Match::kSame : Match::kDiffers);
    if (const size_t same = firstFree(mByDigest, digest); same != mItems.size())
        return take(same, Match::kSame);
    const bool hasKey = std::any_of(keys.begin(), keys.end(),
                                    [this](const std::string& key) { return mByKey.contains(key); });
    return {hasKey ? Match::kUndecided : Match::kNew, 0};
}

KnownItems::Found KnownItems::findByKeys(const std::vector<std::string>& keys) {
    for (const std::string& key : keys) {
        if (const size_t alike = firstFree(mByKey, key); alike != mItems.size())
            return take(alike, Match::kDiffers);
    }
    return {};
}

bool KnownItems::isRepeated(const std::string& uid, const std::string& digest) {
    return !uid.empty() && !mSeen.insert(uid + "\n" + digest).second;
}

}  // namespace exchange
