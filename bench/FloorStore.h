// FloorStore: two files, two rows an item, with the journal mode and the synchronous level of the daemon's stores. A failure throws
// std::runtime_error.
#pragma once

#include <array>
#include <string>
#include <unordered_map>
#include <vector>

#include "common/Handles.h"

namespace bench {

struct FloorItem {
    std::string uid;
    std::string etag;
    std::array<std::string, 5> texts;  // what a person sees of it
};

class FloorStore {
public:
    // Opens or makes both files in the folder.
    explicit FloorStore(const std::string& folder);

    // Etags by uid, as the second file has them.
    std::unordered_map<std::string, std::string> etags();
    // Inserts or replaces: one durable transaction in each file.
    void write(const std::vector<FloorItem>& items);
    // One durable row in the second file.
    void writeRow(const FloorItem& item);

private:
    struct CloseDatabase {
        void operator()(sqlite3* handle) const noexcept { sqlite3_close_v2(handle); }
    };
    struct File {
        std::unique_ptr<sqlite3, CloseDatabase> database;
        SqliteStmt insert;

        File(const std::string& path, const char* schema, const char* insertSql);
        void run(const char* sql);
        void put(std::initializer_list<const std::string*> texts);
    };
    File mRecords;
    File mRows;
};

}  // namespace bench
