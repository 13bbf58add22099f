#include "FloorStore.h"

#include <stdexcept>

namespace bench {

namespace {

constexpr const char* kRecordSchema =
    "CREATE TABLE IF NOT EXISTS record(uid TEXT PRIMARY KEY, etag TEXT, summary TEXT, description TEXT, "
    "location TEXT, "
    "start TEXT, finish TEXT) WITHOUT ROWID";
constexpr const char* kRecordInsert = "INSERT OR REPLACE INTO record VALUES(?,?,?,?,?,?,?)";
constexpr const char* kRowSchema =
    "CREATE TABLE IF NOT EXISTS row(uri TEXT PRIMARY KEY, etag TEXT) WITHOUT ROWID";
constexpr const char* kRowInsert = "INSERT OR REPLACE INTO row VALUES(?,?)";

[[noreturn]] void fail(sqlite3* database) {
    throw std::runtime_error(sqlite3_errmsg(database));
}

sqlite3* opened(const std::string& path) {
    sqlite3* database = nullptr;
    if (sqlite3_open(path.c_str(), &database) != SQLITE_OK) throw std::runtime_error("cannot open " + path);
    return database;
}

}  // namespace

FloorStore::File::File(const std::string& path, const char* schema, const char* insertSql)
    : database(opened(path)) {
    run("PRAGMA journal_mode=PERSIST");
    run(schema);
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v3(database.get(), insertSql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr) !=
        SQLITE_OK)
        fail(database.get());
    insert.reset(statement);
}

void FloorStore::File::run(const char* sql) {
    if (sqlite3_exec(database.get(), sql, nullptr, nullptr, nullptr) != SQLITE_OK) fail(database.get());
}

void FloorStore::File::put(std::initializer_list<const std::string*> texts) {
    int column = 0;
    for (const std::string* text : texts)
        sqlite3_bind_text64(insert.get(), ++column, text->data(), text->size(), SQLITE_STATIC, SQLITE_UTF8);
    if (sqlite3_step(insert.get()) != SQLITE_DONE) fail(database.get());
    sqlite3_reset(insert.get());
}

FloorStore::FloorStore(const std::string& folder)
    : mRecords(folder + "/records.db", kRecordSchema, kRecordInsert),
      mRows(folder + "/rows.db", kRowSchema, kRowInsert) {}

std::unordered_map<std::string, std::string> FloorStore::etags() {
    std::unordered_map<std::string, std::string> known;
    const auto note = [](void* map, int, char** values, char**) {
        static_cast<std::unordered_map<std::string, std::string>*>(map)->emplace(values[0], values[1]);
        return 0;
    };
    if (sqlite3_exec(mRows.database.get(), "SELECT uri, etag FROM row", note, &known, nullptr) != SQLITE_OK)
        fail(mRows.database.get());
    return known;
}

void FloorStore::write(const std::vector<FloorItem>& items) {
    if (items.empty()) return;
    mRecords.run("BEGIN IMMEDIATE");
    for (const FloorItem& item : items) {
        mRecords.put({&item.uid, &item.etag, &item.texts[0], &item.texts[1], &item.texts[2], &item.texts[3],
                      &item.texts[4]});
    }
    mRecords.run("COMMIT");
    mRows.run("BEGIN IMMEDIATE");
    for (const FloorItem& item : items) mRows.put({&item.uid, &item.etag});
    mRows.run("COMMIT");
}

void FloorStore::writeRow(const FloorItem& item) {
    mRows.put({&item.uid, &item.etag});
}

}  // namespace bench
