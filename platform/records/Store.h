// Store: the records of one service in one SQLite file that all processes share.
// Owner: a service, for the life of the process.   Threads: any; mMutex (recursive) guards everything but the callbacks, and is
// held by the thread of an open transaction from begin to end. Callbacks: main thread.
// Errors: platform/error.h; every refusal of SQLite is logged once.
#pragma once

#include <atomic>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <span>
#include <string>
#include <thread>
#include <vector>

#include "../base/StoreWatch.h"
#include "Connection.h"
#include "FileKeep.h"
#include "Record.h"
#include "View.h"

namespace platform::records {

class Store {
public:
    // `file` is absolute, the root is applied when the store is opened.
    // `filesFolder` is where the files of records are kept, NULL when none has any. `upgrades` as in db_schema_s; the
    // tables follow from the views.
    Store(const char* file, std::span<const View* const> views, const char* filesFolder = nullptr,
          std::span<const char* const> upgrades = {});
    ~Store();
    Store(const Store&) = delete;
    Store& operator=(const Store&) = delete;

    // Counted. The first opens (and makes) the file, the last closes it.
    [[nodiscard]] int connect();
    int disconnect();

    [[nodiscard]] const View* viewOf(const char* uri) const;

    // --- writes: one call is one transaction or part of the thread's open one. `skips` receives position and reason of the
    // records that were left out.
    struct Skip {
        size_t position;
        int reason;  // PLATFORM_ERROR_CONFLICT or PLATFORM_ERROR_NOT_FOUND
    };
    [[nodiscard]] int insert(std::span<Record* const> records, const record_write_options_s& options,
                             std::vector<Skip>* skips);
    [[nodiscard]] int update(std::span<Record* const> records, const record_write_options_s& options,
                             std::vector<Skip>* skips);
    [[nodiscard]] int replace(std::span<Record* const> records, std::span<const int> ids,
                              const record_write_options_s& options, std::vector<Skip>* skips);
    [[nodiscard]] int remove(const View& view, std::span<const int> ids,
                             const record_write_options_s& options, std::vector<Skip>* skips);
    [[nodiscard]] int begin();
    [[nodiscard]] int end(bool commit);

    // --- reads
    [[nodiscard]] int get(const View& view, int id, std::unique_ptr<Record>* out);
    // One for each id, in order; NULL for those that are not there.
    [[nodiscard]] int getMany(const View& view, std::span<const int> ids,
                              std::vector<std::unique_ptr<Record>>* out);
    [[nodiscard]] int query(const Query& query, int offset, int limit, RecordList* out);
    [[nodiscard]] int changes(const View& view, int bookId, int since, RecordList* out, int* current);
    // One record at a time, of one state of the store, in no particular order. `use` runs with the lock held and may take the
    // record over; it must not call the store.
    using Use = std::function<void(std::unique_ptr<Record>& record)>;
    [[nodiscard]] int visit(const Query& query, const Use& use);
    // As changes(), one at a time.
    [[nodiscard]] int visitChanges(const View& view, int bookId, int since, const Use& use, int* current);
    [[nodiscard]] int currentVersion(int* version);
    // Stays as long as nobody commits a write, in any process. Takes no lock of the file.
    [[nodiscard]] int writeMark(uint64_t* mark);
    [[nodiscard]] int lastChangeVersion(int* version);

    // --- change callbacks
    using Callback = void (*)(const char* view, void* userData);
    [[nodiscard]] int addCallback(const View& view, Callback callback, void* userData);
    int removeCallback(const View& view, Callback callback, void* userData);

private:
    // One writing call: lock, transaction or savepoint, the call's version.
    class Write;

    // A stored record's state, for the expected-version check.
    struct Stored {
        int version = 0;
        int syncedVersion = 0;
        int bookId = 0;
        int seriesId = 0;
    };

    struct Watcher {
        const View* view;
        Callback callback;
        void* userData;
        bool operator==(const Watcher&) const = default;
    };

    using RecordKey = std::pair<const View*, int>;

    // Opening.
    [[nodiscard]] int open();
    [[nodiscard]] std::string tablesText() const;
    void sweepFiles();
    // The view of an item's files.
    [[nodiscard]] const View& filesOf(const View& view) const;
    [[nodiscard]] std::string tableText(const View& view) const;
    [[nodiscard]] int codeOf(int sqliteCode);

    // Single records inside a writing call.
    [[nodiscard]] int insertOne(Write& write, Record& record, int expected);
    [[nodiscard]] int insertRow(Write& write, Record& record, int bookId);
    [[nodiscard]] int updateOne(Write& write, Record& record, int expected);
    [[nodiscard]] int updateExceptions(Write& write, Record& record);
    [[nodiscard]] int replaceOne(Write& write, Record& record, int id, int expected);
    [[nodiscard]] int removeOne(Write& write, const View& view, int id, int expected);
    [[nodiscard]] int removeItem(Write& write, const View& view, int id, const Stored& stored);
    [[nodiscard]] int removeBook(Write& write, const View& view, int id);
    using MayWrite = std::function<bool(const Property& property, size_t index)>;
    [[nodiscard]] int writeColumns(Write& write, const View& view, int id, const Record& record, bool bySync,
                                   const MayWrite& mayWrite);
    enum class ChildWrite {
        kFirst,
        kAlways,
        kIfPresent
    };  // of a new record, of every record, where read or set
    [[nodiscard]] int writeChildren(Record& record, int id, ChildWrite how, int version);
    // Takes the record's files into the store's keeping where they are not yet, lets go of those that it no longer names, and notes
    // the version when anything changed.
    [[nodiscard]] int keepFiles(Record& record, int id, ChildWrite how, int version);
    // Lets go of the files of the items that `condition` chooses by their id.
    [[nodiscard]] int dropFiles(const View& view, const std::string& condition, int64_t value);
    [[nodiscard]] int load(const View& view, int id, Stored* stored);
    [[nodiscard]] int check(const View& view, int id, const Stored& stored, int expected);
    [[nodiscard]] int touchSeries(Write& write, const View& view, int seriesId);
    [[nodiscard]] int checkBook(const View& view, int bookId);

    // Reading.
    struct Selected;
    [[nodiscard]] static Selected select(const Query& query, const std::string& condition,
                                         const std::string& tail);
    [[nodiscard]] int hand(const Query& query, std::vector<std::unique_ptr<Record>>* batch, const Use& use);
    [[nodiscard]] int readRecords(const Query& query, const std::string& condition,
                                  const std::vector<Value>& values, const std::string& tail,
                                  std::vector<std::unique_ptr<Record>>* out);
    [[nodiscard]] int readChildren(const View& view, const Query& query, const std::string& selectIds,
                                   const std::vector<Value>& values, std::map<int, Record*>* byId);

    // Notification.
    void look();
    [[nodiscard]] int readForeignWrites(uint64_t* views);

    static constexpr int kBusyTimeoutMs = 10'000;  // as db_util_open sets it

    const char* const mFile;
    const std::span<const View* const> mViews;
    const std::span<const char* const> mUpgrades;
    const int64_t mWriterId;

    std::recursive_mutex mMutex;
    std::atomic<std::thread::id> mHolder;  // the thread of the open transaction
    FileKeep mFiles;                       // guarded by mMutex, as the next ones
    Connection mConnection;                // guarded by mMutex, as all below up to the callbacks
    std::string mPath;
    int mConnects = 0;
    int mDepth = 0;                     // of begin()
    bool mFailed = false;               // an inner transaction was undone
    std::optional<int> mVersionBefore;  // the thread's last version when the open transaction began
    std::set<RecordKey> mTrusted;  // written, or checked against an expected version, in the open transaction

    std::vector<Watcher> mWatchers;  // main thread, as the next two
    std::unique_ptr<StoreWatch> mWatch;
    int64_t mSeen = 0;  // the last version that was looked at
};

}  // namespace platform::records
