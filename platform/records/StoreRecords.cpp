// What a writing call does to one record.
#include <algorithm>

#include "StoreWrite.h"
#include "platform/error.h"

namespace platform::records {

namespace {

bool isDone(int code) {
    return code == SQLITE_DONE;
}

// Statements that are the same for every record of a view.
enum Kept { kInsertRow, kInsertChild, kClearChildren, kLoad, kFindBook };

bool isColumn(const Property& property) {
    return property.column != nullptr && !property.readOnly;
}

std::string insertItem(const View& view) {
    std::string columns = "created_version, version, own_version, synced_version";
    std::string places = "?, ?, ?, ?";
    for (const Property& property : view.properties) {
        if (!isColumn(property)) continue;
        columns += std::string(", ") + property.column;
        places += ", ?";
    }
    return std::string("INSERT INTO ") + view.table + "(" + columns + ") VALUES(" + places + ")";
}

std::string insertChild(const View& child) {
    std::string columns = "parent";
    std::string places = "?";
    for (const Property& column : child.properties) {
        if (!isColumn(column)) continue;
        columns.append(", ").append(column.column);
        places += ", ?";
    }
    return std::string("INSERT INTO ") + child.table + "(" + columns + ") VALUES(" + places + ")";
}

}  // namespace

int Store::load(const View& view, int id, Stored* stored) {
    Statement statement = mConnection.prepare(view, kLoad, [&view] {
        std::string sql = "SELECT version, synced_version, ";
        sql += view.bookProperty != 0 ? view.columnOf(view.bookProperty) : "0";
        sql += ", ";
        sql += view.hasSeries() ? view.columnOf(view.seriesProperty) : "0";
        return sql + " FROM " + view.table + " WHERE id = ?";
    });
    const int code = statement.bind(int64_t{id}).step();
    if (isDone(code)) return PLATFORM_ERROR_NOT_FOUND;
    if (code != SQLITE_ROW) return codeOf(code);
    *stored = {.version = static_cast<int>(statement.integer(0)),
               .syncedVersion = static_cast<int>(statement.integer(1)),
               .bookId = static_cast<int>(statement.integer(2)),
               .seriesId = static_cast<int>(statement.integer(3))};
    return PLATFORM_ERROR_NONE;
}

// An exception is as old as its series: whoever changed the series, or another of its exceptions, has moved it on.
int Store::check(const View& view, int id, const Stored& stored, int expected) {
    if (expected == kAnyVersion) return PLATFORM_ERROR_NONE;
    const int subject = stored.seriesId != 0 ? stored.seriesId : id;
    if (mTrusted.contains({&view, subject})) return PLATFORM_ERROR_NONE;
    int version = stored.version;
    if (stored.seriesId != 0) {
        Stored series;
        if (const int code = load(view, stored.seriesId, &series); code != PLATFORM_ERROR_NONE) return code;
        version = series.version;
    }
    if (version != expected) return PLATFORM_ERROR_CONFLICT;
    mTrusted.insert({&view, subject});
    return PLATFORM_ERROR_NONE;
}

// A child's write is an update of its series. The series counts as the sync's own only if no unseen edit is in it.
int Store::touchSeries(Write& write, const View& view, int seriesId) {
    Stored series;
    if (const int code = load(view, seriesId, &series); code != PLATFORM_ERROR_NONE) return code;
    const bool clean = series.version == series.syncedVersion || mTrusted.contains({&view, seriesId});
    const int synced = write.bySync() && clean ? write.version() : series.syncedVersion;
    Statement statement = mConnection.prepare(std::string("UPDATE ") + view.table +
                                              " SET version = ?, synced_version = ? WHERE id = ?");
    const int code =
        statement.bind(int64_t{write.version()}).bind(int64_t{synced}).bind(int64_t{seriesId}).step();
    if (clean) mTrusted.insert({&view, seriesId});
    return codeOf(code);
}

int Store::checkBook(const View& view, int bookId) {
    Statement statement = mConnection.prepare(view, kFindBook, [this, &view] {
        const View* books = viewOf(view.bookView);
        const char* type = view.bookTypeProperty != 0 ? books->columnOf(view.bookTypeProperty) : "NULL";
        return std::string("SELECT ") + type + " FROM " + books->table + " WHERE id = ?";
    });
    const int code = statement.bind(int64_t{bookId}).step();
    if (isDone(code)) return PLATFORM_ERROR_INVALID_PARAMETER;
    if (code != SQLITE_ROW) return codeOf(code);
    const bool fits = view.bookTypeProperty == 0 || statement.integer(0) == view.bookType;
    return fits ? PLATFORM_ERROR_NONE : PLATFORM_ERROR_INVALID_PARAMETER;
}

int Store::insertOne(Write& write, Record& record, int expected) {
    const View& view = record.view();
    if (view.table == nullptr || view.role == Role::kChild) return PLATFORM_ERROR_INVALID_PARAMETER;
    const int seriesId = record.seriesId();
    int bookId = 0;
    if (seriesId != 0) {
        Stored series;
        if (const int code = load(view, seriesId, &series); code != PLATFORM_ERROR_NONE) return code;
        if (series.seriesId != 0) return PLATFORM_ERROR_INVALID_PARAMETER;
        if (const int code = check(view, seriesId, series, expected); code != PLATFORM_ERROR_NONE)
            return code;
        bookId = series.bookId;
    } else if (view.bookProperty != 0) {
        bookId = static_cast<int>(record.number(view.bookProperty));
        if (const int code = checkBook(view, bookId); code != PLATFORM_ERROR_NONE) return code;
    }
    if (const int code = insertRow(write, record, bookId); code != PLATFORM_ERROR_NONE) return code;
    write.touch(view);
    if (seriesId != 0) return touchSeries(write, view, seriesId);
    if (!view.hasSeries()) return PLATFORM_ERROR_NONE;
    for (auto& exception : record.children(static_cast<size_t>(view.indexOf(view.exceptionsProperty)))) {
        exception->setNumber(view.seriesProperty, record.id());
        if (const int code = insertOne(write, *exception, kAnyVersion); code != PLATFORM_ERROR_NONE)
            return code;
    }
    return PLATFORM_ERROR_NONE;
}

int Store::insertRow(Write& write, Record& record, int bookId) {
    const View& view = record.view();
    Statement statement = mConnection.prepare(view, kInsertRow, [&view] { return insertItem(view); });
    const int64_t version = write.version();
    statement.bind(version).bind(version).bind(version).bind(write.bySync() ? version : int64_t{0});
    if (view.bookProperty != 0) record.setNumber(view.bookProperty, bookId);
    for (size_t i = 0; i < view.properties.size(); ++i) {
        if (isColumn(view.properties[i])) statement.bind(record.valueAt(i));
    }
    if (const int code = statement.step(); !isDone(code)) return codeOf(code);
    const auto id = static_cast<int>(mConnection.lastRowId());
    record.setNumber(view.idProperty, id);
    mTrusted.insert({&view, id});
    return writeChildren(record, id, ChildWrite::kFirst, write.version());
}

// Attendees, alarms and the like become those of the record.
int Store::writeChildren(Record& record, int id, ChildWrite how, int version) {
    const View& view = record.view();
    if (view.filesProperty != 0) {
        if (const int code = keepFiles(record, id, how, version); code != PLATFORM_ERROR_NONE) return code;
    }
    for (size_t i = 0; i < view.properties.size(); ++i) {
        const Property& property = view.properties[i];
        if (property.type != Type::kChildren || property.id == view.exceptionsProperty) continue;
        if (how == ChildWrite::kIfPresent && !record.isPresent(i)) continue;
        const Record::Children& children = std::as_const(record).children(i);
        // A record that was just inserted has none to be cleared.
        if (how == ChildWrite::kFirst && children.empty()) continue;
        const View& child = *viewOf(property.childView);
        if (how != ChildWrite::kFirst) {
            Statement clear = mConnection.prepare(child, kClearChildren, [&child] {
                return std::string("DELETE FROM ") + child.table + " WHERE parent = ?";
            });
            if (const int code = clear.bind(int64_t{id}).step(); !isDone(code)) return codeOf(code);
        }
        for (const auto& entry : children) {
            Statement insert =
                mConnection.prepare(child, kInsertChild, [&child] { return insertChild(child); });
            insert.bind(int64_t{id});
            for (size_t k = 0; k < child.properties.size(); ++k) {
                if (isColumn(child.properties[k])) insert.bind(entry->valueAt(k));
            }
            if (const int code = insert.step(); !isDone(code)) return codeOf(code);
        }
    }
    return PLATFORM_ERROR_NONE;
}

int Store::keepFiles(Record& record, int id, ChildWrite how, int version) {
    const View& view = record.view();
    const auto index = static_cast<size_t>(view.indexOf(view.filesProperty));
    if (how == ChildWrite::kIfPresent && !record.isPresent(index)) return PLATFORM_ERROR_NONE;
    const View& files = filesOf(view);
    const std::string column = files.properties[0].column;
    std::set<std::string> before;
    if (how == ChildWrite::kFirst && std::as_const(record).children(index).empty())
        return PLATFORM_ERROR_NONE;
    if (how != ChildWrite::kFirst) {
        Statement statement =
            mConnection.prepare("SELECT " + column + " FROM " + files.table + " WHERE parent = ?");
        int code = statement.bind(int64_t{id}).step();
        for (; code == SQLITE_ROW; code = statement.step()) before.insert(statement.text(0));
        if (!isDone(code)) return codeOf(code);
    }
    bool changed = false;
    for (const auto& child : record.children(index)) {
        const std::string path = std::get<std::string>(child->valueAt(0));
        // A file of its own: what another record names goes with that one.
        if (before.erase(path) != 0) continue;
        std::string kept;
        if (const int code = mFiles.keep(path, &kept); code != PLATFORM_ERROR_NONE) return code;
        child->setAt(0, kept);
        changed = true;
    }
    for (const std::string& path : before) mFiles.drop(path);
    if (!changed && before.empty()) return PLATFORM_ERROR_NONE;
    Statement note =
        mConnection.prepare(std::string("UPDATE ") + view.table + " SET files_version = ? WHERE id = ?");
    const int code = note.bind(int64_t{version}).bind(int64_t{id}).step();
    return isDone(code) ? PLATFORM_ERROR_NONE : codeOf(code);
}

int Store::dropFiles(const View& view, const std::string& condition, int64_t value) {
    if (view.filesProperty == 0) return PLATFORM_ERROR_NONE;
    const View& files = filesOf(view);
    Statement statement = mConnection.prepare(std::string("SELECT ") + files.properties[0].column + " FROM " +
                                              files.table + " WHERE parent " + condition);
    int code = statement.bind(value).step();
    for (; code == SQLITE_ROW; code = statement.step()) mFiles.drop(statement.text(0));
    return isDone(code) ? PLATFORM_ERROR_NONE : codeOf(code);
}

int Store::writeColumns(Write& write, const View& view, int id, const Record& record, bool bySync,
                        const MayWrite& mayWrite) {
    std::string columns = "version = ?, own_version = ?";
    if (bySync) columns += ", synced_version = ?";
    for (size_t i = 0; i < view.properties.size(); ++i) {
        if (isColumn(view.properties[i]) && mayWrite(view.properties[i], i)) {
            columns += std::string(", ") + view.properties[i].column + " = ?";
        }
    }
    Statement statement =
        mConnection.prepare(std::string("UPDATE ") + view.table + " SET " + columns + " WHERE id = ?");
    statement.bind(int64_t{write.version()}).bind(int64_t{write.version()});
    if (bySync) statement.bind(int64_t{write.version()});
    for (size_t i = 0; i < view.properties.size(); ++i) {
        if (isColumn(view.properties[i]) && mayWrite(view.properties[i], i))
            statement.bind(record.valueAt(i));
    }
    const int code = statement.bind(int64_t{id}).step();
    if (!isDone(code)) return codeOf(code);
    write.touch(view);
    mTrusted.insert({&view, id});
    return PLATFORM_ERROR_NONE;
}

int Store::updateOne(Write& write, Record& record, int expected) {
    const View& view = record.view();
    if (view.table == nullptr || view.role == Role::kChild) return PLATFORM_ERROR_INVALID_PARAMETER;
    const int id = record.id();
    Stored stored;
    if (const int code = load(view, id, &stored); code != PLATFORM_ERROR_NONE) return code;
    if (const int code = check(view, id, stored, expected); code != PLATFORM_ERROR_NONE) return code;
    const int code =
        writeColumns(write, view, id, record, write.bySync(), [&](const Property& property, size_t i) {
            return record.isPresent(i) && !view.isFixed(property.id);
        });
    if (code != PLATFORM_ERROR_NONE) return code;
    if (const int children = writeChildren(record, id, ChildWrite::kIfPresent, write.version());
        children != PLATFORM_ERROR_NONE) {
        return children;
    }
    if (stored.seriesId != 0) return touchSeries(write, view, stored.seriesId);
    if (!view.hasSeries()) return PLATFORM_ERROR_NONE;
    return updateExceptions(write, record);
}

int Store::updateExceptions(Write& write, Record& record) {
    const View& view = record.view();
    const auto index = static_cast<size_t>(view.indexOf(view.exceptionsProperty));
    if (!record.isPresent(index)) return PLATFORM_ERROR_NONE;
    std::unique_ptr<Record> before;
    if (const int code = get(view, record.id(), &before); code != PLATFORM_ERROR_NONE) return code;
    std::map<int, const Record*> left;
    for (const auto& exception : before->children(index)) left[exception->id()] = exception.get();

    for (auto& exception : record.children(index)) {
        const auto known = left.find(exception->id());
        int code = PLATFORM_ERROR_NONE;
        if (known == left.end()) {
            exception->setNumber(view.seriesProperty, record.id());
            code = insertOne(write, *exception, kAnyVersion);
        } else {
            if (!exception->hasSameContent(*known->second)) code = updateOne(write, *exception, kAnyVersion);
            left.erase(known);
        }
        if (code != PLATFORM_ERROR_NONE) return code;
    }
    for (const auto& [id, exception] : left) {
        // Only what the writer saw and took out: another may have added some since.
        if (std::find(record.readExceptions.begin(), record.readExceptions.end(), id) ==
            record.readExceptions.end())
            continue;
        if (const int code = removeOne(write, view, id, kAnyVersion); code != PLATFORM_ERROR_NONE)
            return code;
    }
    return PLATFORM_ERROR_NONE;
}

int Store::replaceOne(Write& write, Record& record, int id, int expected) {
    const View& view = record.view();
    if (view.table == nullptr || view.role == Role::kChild) return PLATFORM_ERROR_INVALID_PARAMETER;
    Stored stored;
    if (const int code = load(view, id, &stored); code != PLATFORM_ERROR_NONE) return code;
    if (const int code = check(view, id, stored, expected); code != PLATFORM_ERROR_NONE) return code;
    const int code =
        writeColumns(write, view, id, record, write.bySync(), [&](const Property& property, size_t) {
            return !view.isFixed(property.id) && property.id != view.keptOnReplace;
        });
    if (code != PLATFORM_ERROR_NONE) return code;
    if (const int children = writeChildren(record, id, ChildWrite::kAlways, write.version());
        children != PLATFORM_ERROR_NONE) {
        return children;
    }
    return stored.seriesId != 0 ? touchSeries(write, view, stored.seriesId) : PLATFORM_ERROR_NONE;
}

int Store::removeOne(Write& write, const View& view, int id, int expected) {
    Stored stored;
    if (const int code = load(view, id, &stored); code != PLATFORM_ERROR_NONE) return code;
    if (const int code = check(view, id, stored, expected); code != PLATFORM_ERROR_NONE) return code;
    write.touch(view);
    if (view.role == Role::kBook) return removeBook(write, view, id);
    return removeItem(write, view, id, stored);
}

int Store::removeItem(Write& write, const View& view, int id, const Stored& stored) {
    const std::string table = view.table;
    if (const int code = dropFiles(view, "= ?", id); code != PLATFORM_ERROR_NONE) return code;
    if (stored.seriesId == 0) {
        Statement bury = mConnection.prepare(
            "INSERT INTO tombstones(view, id, book, created, deleted, synced) SELECT ?, id, ?, "
            "created_version, ?, ? FROM " +
            table + " WHERE id = ?");
        const int64_t synced = write.bySync() ? write.version() : stored.syncedVersion;
        const int code = bury.bind(std::string(view.uri))
                             .bind(int64_t{stored.bookId})
                             .bind(int64_t{write.version()})
                             .bind(synced)
                             .bind(int64_t{id})
                             .step();
        if (!isDone(code)) return codeOf(code);
        if (view.hasSeries()) {
            const std::string series = view.columnOf(view.seriesProperty);
            Statement exceptions = mConnection.prepare("DELETE FROM " + table + " WHERE " + series +
                                                       " <> 0 AND " + series + " = ?");
            if (const int removed = exceptions.bind(int64_t{id}).step(); !isDone(removed))
                return codeOf(removed);
        }
    }
    Statement statement = mConnection.prepare("DELETE FROM " + table + " WHERE id = ?");
    if (const int code = statement.bind(int64_t{id}).step(); !isDone(code)) return codeOf(code);
    return stored.seriesId != 0 ? touchSeries(write, view, stored.seriesId) : PLATFORM_ERROR_NONE;
}

// A book's records go unlisted, and so do the deletions that were listed for it.
int Store::removeBook(Write& write, const View& view, int id) {
    for (const View* items : mViews) {
        if (items->bookProperty == 0 || !isSame(items->bookView, view.uri)) continue;
        const std::string inBook = std::string("IN (SELECT id FROM ") + items->table + " WHERE " +
                                   items->columnOf(items->bookProperty) + " = ?)";
        if (const int code = dropFiles(*items, inBook, id); code != PLATFORM_ERROR_NONE) return code;
        Statement statement = mConnection.prepare(std::string("DELETE FROM ") + items->table + " WHERE " +
                                                  items->columnOf(items->bookProperty) + " = ?");
        if (const int code = statement.bind(int64_t{id}).step(); !isDone(code)) return codeOf(code);
        write.touch(*items);
    }
    Statement forget = mConnection.prepare("DELETE FROM tombstones WHERE book = ?");
    if (const int code = forget.bind(int64_t{id}).step(); !isDone(code)) return codeOf(code);
    Statement statement = mConnection.prepare(std::string("DELETE FROM ") + view.table + " WHERE id = ?");
    const int code = statement.bind(int64_t{id}).step();
    return isDone(code) ? PLATFORM_ERROR_NONE : codeOf(code);
}

}  // namespace platform::records
