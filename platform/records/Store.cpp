#include "Store.h"

#include <sys/stat.h>

#include <random>
#include <unordered_map>

#include "../base/OpenCode.h"
#include "StoreWrite.h"
#include "platform/error.h"
#include "platform/log.h"
#include "platform/root.h"

namespace platform::records {

namespace {

constexpr const char* kTag = "PLATFORM_RECORDS";
constexpr mode_t kFolderMode = 0770;
constexpr mode_t kFileMode = 0660;

int64_t randomId() {
    std::random_device device;
    return static_cast<int64_t>((static_cast<uint64_t>(device()) << 31 | device()) >> 1);
}

const char* sqlType(Type type) {
    return type == Type::kInt || type == Type::kLong ? "INTEGER" : "TEXT";
}

}  // namespace

std::unordered_map<const Store*, int>& lastVersions() {
    thread_local std::unordered_map<const Store*, int> versions;
    return versions;
}

Store::Store(const char* file, std::span<const View* const> views, const char* filesFolder,
             std::span<const char* const> upgrades)
    : mFile(file), mViews(views), mUpgrades(upgrades), mWriterId(randomId()), mFiles(filesFolder) {}

Store::~Store() = default;

int Store::connect() {
    const std::lock_guard lock(mMutex);
    if (!mConnection.isOpen()) {
        if (const int code = open(); code != PLATFORM_ERROR_NONE) return code;
    }
    ++mConnects;
    return PLATFORM_ERROR_NONE;
}

int Store::disconnect() {
    const std::lock_guard lock(mMutex);
    if (mConnects == 0) return PLATFORM_ERROR_INVALID_PARAMETER;
    if (--mConnects == 0) {
        mConnection.close();
        lastVersions().erase(this);
    }
    return PLATFORM_ERROR_NONE;
}

const View* Store::viewOf(const char* uri) const {
    for (const View* view : mViews) {
        if (uri != nullptr && isSame(view->uri, uri)) return view;
    }
    return nullptr;
}

int Store::codeOf(int sqliteCode) {
    switch (sqliteCode) {
        case SQLITE_OK:
        case SQLITE_ROW:
        case SQLITE_DONE:
            return PLATFORM_ERROR_NONE;
        case SQLITE_CONSTRAINT:
            return PLATFORM_ERROR_INVALID_PARAMETER;
        default:
            dlog_print(DLOG_ERROR, kTag, "%s: %s", mPath.c_str(),
                       mConnection.isOpen() ? mConnection.message() : sqlite3_errstr(sqliteCode));
            return sqliteCode == SQLITE_FULL ? PLATFORM_ERROR_NO_SPACE : PLATFORM_ERROR_DATABASE;
    }
}

int Store::open() {
    const std::string file = mFile;
    if (const int code = makeFolder(file.substr(0, file.rfind('/')), kFolderMode);
        code != PLATFORM_ERROR_NONE) {
        dlog_print(DLOG_ERROR, kTag, "the folder of %s cannot be made", file.c_str());
        return code;
    }
    mPath = rootedPath(file);
    const std::string tables = tablesText();
    const db_schema_s schema{tables.c_str(), mUpgrades};
    if (const int code = mConnection.open(mPath, schema.version()); code != SQLITE_OK)
        return codeOfOpen(code, mPath);
    if (const int code = codeOf(mConnection.apply(schema)); code != PLATFORM_ERROR_NONE) {
        mConnection.close();
        return code;
    }
    // Only its owner may, and needs to: whoever made the file.
    for (const std::string& path : {mPath, mPath + "-journal"}) (void)chmod(path.c_str(), kFileMode);
    sweepFiles();
    return PLATFORM_ERROR_NONE;
}

void Store::sweepFiles() {
    std::set<std::string> named;
    for (const View* view : mViews) {
        if (view->filesProperty == 0) continue;
        const View& files = filesOf(*view);
        Statement statement =
            mConnection.prepare(std::string("SELECT ") + files.properties[0].column + " FROM " + files.table);
        int code = statement.step();
        for (; code == SQLITE_ROW; code = statement.step()) named.insert(statement.text(0));
        if (code != SQLITE_DONE) return;  // nothing is removed on half a look
    }
    mFiles.sweep(named);
}

const View& Store::filesOf(const View& view) const {
    return *viewOf(view.properties[static_cast<size_t>(view.indexOf(view.filesProperty))].childView);
}

std::string Store::tablesText() const {
    std::string text;
    for (const View* view : mViews) {
        if (view->table != nullptr) text += tableText(*view);
    }
    return text +
           "CREATE TABLE store(version INTEGER NOT NULL);"
           "INSERT INTO store VALUES(0);"
           "CREATE TABLE writes(version INTEGER PRIMARY KEY, writer INTEGER NOT NULL, views INTEGER NOT "
           "NULL);"
           "CREATE TABLE tombstones(view TEXT NOT NULL, id INTEGER NOT NULL, book INTEGER NOT NULL, created "
           "INTEGER NOT NULL, deleted INTEGER NOT NULL, synced INTEGER NOT NULL);"
           "CREATE INDEX tombstones_feed ON tombstones(book, deleted)";
}

std::string Store::tableText(const View& view) const {
    const std::string table = view.table;
    std::string text = "CREATE TABLE " + table + "(id INTEGER PRIMARY KEY";
    // Nobody outside knows a child by its id: that may come again.
    text += view.role == Role::kChild ? ", parent INTEGER NOT NULL" : " AUTOINCREMENT";
    if (view.role != Role::kChild)
        text +=
            ", created_version INTEGER NOT NULL, version INTEGER NOT NULL, synced_version INTEGER NOT NULL, "
            "own_version INTEGER NOT NULL";
    if (view.filesProperty != 0) text += ", files_version INTEGER NOT NULL DEFAULT 0";
    for (const Property& property : view.properties) {
        if (property.column != nullptr && !property.readOnly) {
            text += std::string(", ") + property.column + " " + sqlType(property.type) + " NOT NULL";
        }
    }
    text += ");";
    if (view.role == Role::kChild) {
        return text + "CREATE INDEX " + table + "_parent ON " + table + "(parent);";
    }
    if (view.bookProperty != 0) {
        const std::string book = view.columnOf(view.bookProperty);
        text += "CREATE INDEX " + table + "_feed ON " + table + "(" + book + ", version);";
    }
    if (view.hasSeries()) {
        const std::string series = view.columnOf(view.seriesProperty);
        text += "CREATE UNIQUE INDEX " + table + "_instance ON " + table + "(" + series + ", " +
                view.columnOf(view.instanceProperty) + ") WHERE " + series + " <> 0;";
    }
    if (view.onDelete != nullptr) {
        text.append("CREATE TRIGGER ").append(table).append("_gone AFTER DELETE ON ").append(table);
        text.append(" BEGIN ").append(view.onDelete).append("; END;");
    }
    // What an item owns goes with it.
    for (const Property& property : view.properties) {
        const View* child = property.childView != nullptr ? viewOf(property.childView) : nullptr;
        if (child == nullptr || child == &view) continue;
        text.append("CREATE TRIGGER ").append(table).append("_").append(child->table);
        text.append(" AFTER DELETE ON ").append(table).append(" BEGIN DELETE FROM ").append(child->table);
        text.append(" WHERE parent = old.id; END;");
    }
    return text;
}

int Store::currentVersion(int* version) {
    const std::lock_guard lock(mMutex);
    Statement statement = mConnection.prepare("SELECT version FROM store");
    const int code = statement.step();
    if (code != SQLITE_ROW) return codeOf(code == SQLITE_DONE ? SQLITE_CORRUPT : code);
    *version = static_cast<int>(statement.integer(0));
    return PLATFORM_ERROR_NONE;
}

int Store::writeMark(uint64_t* mark) {
    const std::lock_guard lock(mMutex);
    if (!mConnection.isOpen()) return PLATFORM_ERROR_DATABASE;
    return codeOf(mConnection.readChangeCounter(mark));
}

int Store::lastChangeVersion(int* version) {
    const std::lock_guard lock(mMutex);
    const auto own = lastVersions().find(this);
    if (own == lastVersions().end()) return currentVersion(version);
    *version = own->second;
    return PLATFORM_ERROR_NONE;
}

int Store::begin() {
    mMutex.lock();
    if (mDepth == 0) {
        if (const int code = codeOf(mConnection.run("BEGIN IMMEDIATE")); code != PLATFORM_ERROR_NONE) {
            mMutex.unlock();
            return code;
        }
        mTrusted.clear();
        const auto own = lastVersions().find(this);
        mVersionBefore = own != lastVersions().end() ? std::optional(own->second) : std::nullopt;
        mHolder = std::this_thread::get_id();
    }
    ++mDepth;
    return PLATFORM_ERROR_NONE;
}

int Store::end(bool commit) {
    if (mHolder != std::this_thread::get_id()) return PLATFORM_ERROR_INVALID_PARAMETER;
    const std::unique_lock<std::recursive_mutex> held(mMutex, std::adopt_lock);  // taken by begin()
    if (--mDepth > 0) {
        // An inner part that failed takes the whole with it at the outermost end.
        mFailed = mFailed || !commit;
        return PLATFORM_ERROR_NONE;
    }
    mHolder = std::thread::id();
    mTrusted.clear();
    int code = PLATFORM_ERROR_NONE;
    const bool failed = std::exchange(mFailed, false);
    if (commit && !failed) code = codeOf(mConnection.run("COMMIT"));
    if (commit && failed) code = PLATFORM_ERROR_FAILED;
    if (mConnection.inTransaction()) (void)mConnection.run("ROLLBACK");
    commit&& code == PLATFORM_ERROR_NONE ? mFiles.commit() : mFiles.rollback();
    if (!commit || code != PLATFORM_ERROR_NONE) {
        lastVersions().erase(this);
        if (mVersionBefore) lastVersions()[this] = *mVersionBefore;
    }
    return code;
}

}  // namespace platform::records
