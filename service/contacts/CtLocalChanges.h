// CtLocalChanges: what was changed on the device, by change version. A change is the sync's own when its version is the one in the
// row, or when the record says that the sync wrote it last.
// Threads: any.   Errors: 0 or -1, logged.
#pragma once

#include <vector>

#include "contacts/CtItemKind.h"

struct CtLocalChange {
    int itemId = 0;
    int addressBookId = 0;
    int type = RECORD_UPDATED;
    int version = 0;
    int syncedVersion = 0;
    int imageChanged = 0;

    [[nodiscard]] bool isOwnWrite() const { return syncedVersion == version; }
};

namespace ct_changes {

// What others than the sync changed since a version.
struct Changes {
    std::vector<CtLocalChange> foreign;
    bool any = false;  // somebody changed something, be it the sync
    int current = 0;   // the store's version
};
template <class Kind>
[[nodiscard]] int read(int addressBookId, int since, Changes* changes);

// Whether there is a change that is not the sync's own since the version that is stored for the address book.
template <class Kind>
[[nodiscard]] bool some(CtMetaDataDBHelper& store, int addressBookId);

// Brings the rows' marks up to date, in one transaction: when one cannot be made, none is, and the next walk sees the changes again.
template <class Kind>
[[nodiscard]] int mark(CtMetaDataDBHelper& store, int addressBookId);

// After a run: moves past its own writes, so that no later look goes through them again. A user's change among them stops it: that one
// is left for whoever is told of it.
template <class Kind>
[[nodiscard]] int passOwn(CtMetaDataDBHelper& store, int addressBookId);

}  // namespace ct_changes
