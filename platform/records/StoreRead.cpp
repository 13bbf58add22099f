// Reading records, lists and the change feed.
#include <algorithm>

#include "Store.h"
#include "platform/error.h"

namespace platform::records {

namespace {

constexpr size_t kFeedValues = 6;  // of a change feed's record

// A read transaction, unless the thread has a transaction open already: several statements see one state.
class Snapshot {
public:
    explicit Snapshot(Connection& connection)
        : mConnection(connection),
          mOwn(!connection.inTransaction() && connection.prepare("BEGIN").step() == SQLITE_DONE) {}
    ~Snapshot() {
        if (mOwn) (void)mConnection.prepare("COMMIT").step();
    }
    Snapshot(const Snapshot&) = delete;
    Snapshot& operator=(const Snapshot&) = delete;

private:
    Connection& mConnection;
    const bool mOwn;
};

// The store's own columns have their own names; read-only properties name them in their column.
bool isRead(const Query& query, size_t index) {
    return query.projection.empty() || query.projection[index];
}

std::string conditionOf(const Query& query, std::vector<Value>* values) {
    std::string condition;
    for (const Query::Filter& filter : query.filters) {
        condition += condition.empty() ? " WHERE " : " AND ";
        condition += std::string(query.view->properties[filter.index].column) + " = ?";
        values->push_back(filter.value);
    }
    if (!query.ids.empty()) {
        condition += condition.empty() ? " WHERE " : " AND ";
        condition += "id IN (SELECT value FROM json_each(?))";
        values->emplace_back(query.ids);
    }
    return condition;
}

// Adds its values to those of the condition.
std::string tailOf(const Query& query, int offset, int limit, std::vector<Value>* values) {
    std::string tail = " ORDER BY ";
    if (query.sortIndex >= 0) {
        tail += std::string(query.view->properties[static_cast<size_t>(query.sortIndex)].column) +
                (query.ascending ? ", " : " DESC, ");
    }
    tail += "id";
    if (limit > 0 || offset > 0) {
        tail += " LIMIT ? OFFSET ?";
        values->insert(values->end(), {int64_t{limit > 0 ? limit : -1}, int64_t{std::max(offset, 0)}});
    }
    return tail;
}

// The index knows exceptions only.
std::string exceptionsOf(const View& view, const std::string& selectIds) {
    const std::string series = view.columnOf(view.seriesProperty);
    return " WHERE " + series + " <> 0 AND " + series + " IN (" + selectIds + ")";
}

std::string childrenOf(const View& child, const std::string& selectIds) {
    std::string columns = "parent, id";
    for (const Property& column : child.properties) columns.append(", ").append(column.column);
    return "SELECT " + columns + " FROM " + child.table + " WHERE parent IN (" + selectIds + ") ORDER BY id";
}

}  // namespace

int Store::get(const View& view, int id, std::unique_ptr<Record>* out) {
    if (view.table == nullptr || view.role == Role::kChild) return PLATFORM_ERROR_INVALID_PARAMETER;
    Query query(view);
    query.filters.push_back({static_cast<size_t>(view.indexOf(view.idProperty)), int64_t{id}});
    std::unique_ptr<Record> found;
    const int code = visit(query, [&found](std::unique_ptr<Record>& record) { found = std::move(record); });
    if (code != PLATFORM_ERROR_NONE) return code;
    if (found == nullptr) return PLATFORM_ERROR_NOT_FOUND;
    *out = std::move(found);
    return PLATFORM_ERROR_NONE;
}

int Store::getMany(const View& view, std::span<const int> ids, std::vector<std::unique_ptr<Record>>* out) {
    Query query(view);
    query.ids = idArray(ids);
    std::map<int, std::unique_ptr<Record>> found;
    const int code = visit(query, [&found](std::unique_ptr<Record>& record) {
        const int id = record->id();
        found[id] = std::move(record);
    });
    if (code != PLATFORM_ERROR_NONE) return code;
    out->clear();
    for (const int id : ids) out->push_back(std::move(found[id]));
    return PLATFORM_ERROR_NONE;
}

int Store::query(const Query& query, int offset, int limit, RecordList* out) {
    if (query.view->table == nullptr || query.view->role == Role::kChild)
        return PLATFORM_ERROR_INVALID_PARAMETER;
    const std::lock_guard lock(mMutex);
    if (!mConnection.isOpen()) return PLATFORM_ERROR_DATABASE;
    const Snapshot snapshot(mConnection);
    std::vector<Value> values;
    const std::string condition = conditionOf(query, &values);
    std::vector<std::unique_ptr<Record>> found;
    const std::string tail = tailOf(query, offset, limit, &values);
    const int code = readRecords(query, condition, values, tail, &found);
    if (code != PLATFORM_ERROR_NONE) return code;
    out->records.reserve(out->records.size() + found.size());
    for (auto& record : found) out->records.push_back(record.release());
    return PLATFORM_ERROR_NONE;
}

// The statement that reads a query's records, and what its columns are.
struct Store::Selected {
    std::string sql;
    std::vector<size_t> read;  // the properties behind the id
    bool readsChildren = false;

    [[nodiscard]] std::unique_ptr<Record> recordOf(const View& view, const Statement& statement) const {
        auto record = std::make_unique<Record>(view);
        record->reserve(read.size() + 1);
        record->setAllPresent(false);
        record->setNumber(view.idProperty, statement.integer(0));
        for (size_t k = 0; k < read.size(); ++k) {
            record->setAt(read[k], statement.value(static_cast<int>(k) + 1, view.properties[read[k]].type));
        }
        return record;
    }
};

Store::Selected Store::select(const Query& query, const std::string& condition, const std::string& tail) {
    const View& view = *query.view;
    Selected selected;
    std::string columns = "id";
    for (size_t i = 0; i < view.properties.size(); ++i) {
        if (!isRead(query, i)) continue;
        if (view.properties[i].type == Type::kChildren) {
            selected.readsChildren = true;
        } else {
            columns += std::string(", ") + view.properties[i].column;
            selected.read.push_back(i);
        }
    }
    selected.sql = "SELECT " + columns + " FROM " + view.table + condition + tail;
    return selected;
}

int Store::readRecords(const Query& query, const std::string& condition, const std::vector<Value>& values,
                       const std::string& tail, std::vector<std::unique_ptr<Record>>* out) {
    const View& view = *query.view;
    const Selected selected = select(query, condition, tail);
    std::map<int, Record*> byId;
    {
        Statement statement = mConnection.prepare(selected.sql);
        for (const Value& value : values) statement.bind(value);
        int code = statement.step();
        for (; code == SQLITE_ROW; code = statement.step()) {
            auto record = selected.recordOf(view, statement);
            if (selected.readsChildren) byId[record->id()] = record.get();
            out->push_back(std::move(record));
        }
        if (code != SQLITE_DONE) return codeOf(code);
    }
    if (!selected.readsChildren || byId.empty()) return PLATFORM_ERROR_NONE;
    return readChildren(view, query, std::string("SELECT id FROM ") + view.table + condition + tail, values,
                        &byId);
}

int Store::visit(const Query& query, const Use& use) {
    const View& view = *query.view;
    if (view.table == nullptr || view.role == Role::kChild || query.sortIndex >= 0)
        return PLATFORM_ERROR_INVALID_PARAMETER;
    const std::lock_guard lock(mMutex);
    if (!mConnection.isOpen()) return PLATFORM_ERROR_DATABASE;
    const Snapshot snapshot(mConnection);
    std::vector<Value> values;
    const std::string condition = conditionOf(query, &values);
    // Without an order the rows come as the index has them, and none waits for the last.
    const Selected selected = select(query, condition, "");
    Statement statement = mConnection.prepare(selected.sql);
    for (const Value& value : values) statement.bind(value);
    constexpr size_t kAtOnce = 128;
    std::vector<std::unique_ptr<Record>> batch;
    int code = statement.step();
    for (; code == SQLITE_ROW; code = statement.step()) {
        auto record = selected.recordOf(view, statement);
        if (!selected.readsChildren) {
            use(record);
            continue;
        }
        batch.push_back(std::move(record));
        if (batch.size() < kAtOnce) continue;
        if (const int handed = hand(query, &batch, use); handed != PLATFORM_ERROR_NONE) return handed;
    }
    return code == SQLITE_DONE ? hand(query, &batch, use) : codeOf(code);
}

// Gives the records their children, hands them out and empties the batch.
int Store::hand(const Query& query, std::vector<std::unique_ptr<Record>>* batch, const Use& use) {
    if (batch->empty()) return PLATFORM_ERROR_NONE;
    std::map<int, Record*> byId;
    std::vector<int> list;
    for (const auto& record : *batch) {
        byId[record->id()] = record.get();
        list.push_back(record->id());
    }
    // One is looked up without a table of ids.
    const bool isOne = batch->size() == 1;
    const Value ids = isOne ? Value(int64_t{list.front()}) : Value(idArray(list));
    const char* const selectIds = isOne ? "?" : "SELECT value FROM json_each(?)";
    if (const int code = readChildren(*query.view, query, selectIds, {ids}, &byId);
        code != PLATFORM_ERROR_NONE) {
        return code;
    }
    for (auto& record : *batch) use(record);
    batch->clear();
    return PLATFORM_ERROR_NONE;
}

int Store::readChildren(const View& view, const Query& query, const std::string& selectIds,
                        const std::vector<Value>& values, std::map<int, Record*>* byId) {
    for (size_t i = 0; i < view.properties.size(); ++i) {
        const Property& property = view.properties[i];
        if (property.type != Type::kChildren || !isRead(query, i)) continue;
        for (auto& [id, record] : *byId) record->setPresent(i, true);
        const View& child = *viewOf(property.childView);
        const bool isException = property.id == view.exceptionsProperty;
        std::vector<std::unique_ptr<Record>> children;
        std::vector<int> parents;
        if (isException) {
            // Exceptions have attendees and alarms of their own, but no exceptions.
            Query exceptions(view);
            exceptions.projection.assign(view.properties.size(), true);
            exceptions.projection[i] = false;
            const int code =
                readRecords(exceptions, exceptionsOf(view, selectIds), values, " ORDER BY id", &children);
            if (code != PLATFORM_ERROR_NONE) return code;
            for (const auto& record : children) {
                parents.push_back(record->seriesId());
                if (const auto parent = byId->find(record->seriesId()); parent != byId->end())
                    parent->second->readExceptions.push_back(record->id());
            }
        } else {
            Statement statement = mConnection.prepare(childrenOf(child, selectIds));
            for (const Value& value : values) statement.bind(value);
            int code = statement.step();
            for (; code == SQLITE_ROW; code = statement.step()) {
                auto record = std::make_unique<Record>(child);
                for (size_t k = 0; k < child.properties.size(); ++k) {
                    record->setAt(k, statement.value(static_cast<int>(k) + 2, child.properties[k].type));
                }
                parents.push_back(static_cast<int>(statement.integer(0)));
                children.push_back(std::move(record));
            }
            if (code != SQLITE_DONE) return codeOf(code);
        }
        for (size_t k = 0; k < children.size(); ++k) {
            if (const auto parent = byId->find(parents[k]); parent != byId->end()) {
                parent->second->children(i).push_back(std::move(children[k]));
            }
        }
    }
    return PLATFORM_ERROR_NONE;
}

int Store::changes(const View& view, int bookId, int since, RecordList* out, int* current) {
    RecordList found;
    const auto keep = [&found](std::unique_ptr<Record>& record) {
        found.records.push_back(record.release());
    };
    const int code = visitChanges(view, bookId, since, keep, current);
    if (code == PLATFORM_ERROR_NONE) out->records.swap(found.records);
    return code;
}

int Store::visitChanges(const View& view, int bookId, int since, const Use& use, int* current) {
    if (view.role != Role::kItem || view.feed == nullptr) return PLATFORM_ERROR_INVALID_PARAMETER;
    const FeedShape& feed = *view.feed;
    const std::lock_guard lock(mMutex);
    if (!mConnection.isOpen()) return PLATFORM_ERROR_DATABASE;
    const Snapshot snapshot(mConnection);
    int version = 0;
    if (const int code = currentVersion(&version); code != PLATFORM_ERROR_NONE) return code;

    const std::string book = view.columnOf(view.bookProperty);
    const std::string topLevel =
        view.hasSeries() ? std::string(" AND ") + view.columnOf(view.seriesProperty) + " = 0" : "";
    Statement statement = mConnection.prepare(
        "SELECT id, CASE WHEN created_version > ? THEN 0 ELSE 1 END, version AS changed, synced_version, " +
        std::string(view.filesProperty != 0 ? "files_version" : "0") + " FROM " + std::string(view.table) +
        " WHERE " + book + " = ? AND version > ?" + topLevel +
        " UNION ALL SELECT id, 2, deleted AS changed, synced, 0 FROM tombstones WHERE book = ? AND deleted > "
        "? "
        "AND (created <= ? OR synced <> 0) "
        "AND view = ? ORDER BY changed, id");
    const int64_t from = since;
    const int64_t inBook = bookId;
    statement.bind(from).bind(inBook).bind(from).bind(inBook).bind(from).bind(from).bind(
        std::string(view.uri));
    int code = statement.step();
    for (; code == SQLITE_ROW; code = statement.step()) {
        auto record = std::make_unique<Record>(*feed.view);
        record->reserve(kFeedValues);
        record->setNumber(feed.id, statement.integer(0));
        record->setNumber(feed.book, bookId);
        record->setNumber(feed.change, statement.integer(1));
        record->setNumber(feed.version, statement.integer(2));
        record->setNumber(feed.syncedVersion, statement.integer(3));
        if (feed.filesChanged != 0)
            record->setNumber(feed.filesChanged, statement.integer(4) > since ? 1 : 0);
        use(record);
    }
    if (code != SQLITE_DONE) return codeOf(code);
    *current = version;
    return PLATFORM_ERROR_NONE;
}

}  // namespace platform::records
