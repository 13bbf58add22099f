// CtSnapshot: what one address book holds of contacts, or of groups, before a comparison, read once: rows of the metadata store and
// the state of the device's records.
// Owner: one run.   Threads: one worker. Memory: ids, uris, etags and versions, never bodies.
#pragma once

#include <string>
#include <unordered_map>
#include <unordered_set>
#include <vector>

#include "contacts/CtItemKind.h"

struct CtRecordState {
    int version = 0;               // of its last write
    int syncedVersion = 0;         // of the sync's own last write, 0 when it never wrote it
    std::vector<int> groups = {};  // of a contact, those that the device has

    [[nodiscard]] bool isEnginesOwnWrite() const { return syncedVersion != 0 && syncedVersion == version; }
};

// A record that the sync once wrote and that has no row.
struct CtOrphan {
    int id = 0;
    std::string etag;  // as kept with the record
};

template <class Kind>
class CtSnapshot {
public:
    using Row = typename Kind::Row;

    [[nodiscard]] int load(CtMetaDataDBHelper& store, int addressBookId);

    [[nodiscard]] int addressBookId() const { return mAddressBookId; }
    // NULL when unknown.
    [[nodiscard]] const Row* rowByUri(const std::string& uri) const;
    [[nodiscard]] const CtRecordState* record(int id) const;
    [[nodiscard]] const CtOrphan* orphan(const std::string& uri) const;
    [[nodiscard]] const std::vector<Row>& rows() const { return mRows; }

    // Whether the row's record is gone although nobody deleted it: the next download makes it again.
    [[nodiscard]] bool isLost(const Row& row) const;
    // Whether the device's contact is not in a group that the entry names and the device has: the group came later, or came again.
    [[nodiscard]] bool missesGroup(const Row& row, const std::vector<int>& groups) const;
    // Whether the device's record holds a change that has not been sent: a mark, or a version that nobody but a user wrote.
    [[nodiscard]] bool hasLocalChange(const Row& row) const;

private:
    [[nodiscard]] int readStates();
    [[nodiscard]] int readOrphans();
    [[nodiscard]] int readUnseenDeletions(CtMetaDataDBHelper& store);

    int mAddressBookId = 0;
    std::vector<Row> mRows;
    std::unordered_map<std::string, size_t> mByUri;
    std::unordered_map<int, CtRecordState> mRecords;
    std::unordered_map<std::string, CtOrphan> mOrphans;  // by server id
    std::unordered_set<int> mDeletedByUser;              // not examined yet
};
