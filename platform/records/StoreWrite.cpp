#include "StoreWrite.h"

#include "platform/error.h"

namespace platform::records {

namespace {

// Readers look within seconds; a reader that finds a gap takes it that everything was written.
constexpr int kKeptWrites = 4096;
// More than any account holds, so that no reader misses a deletion between two looks; some 14 MB.
constexpr int kKeptDeletions = 256 * 1024;

}  // namespace

Store::Write::Write(Store& store, const record_write_options_s& options)
    : mStore(store),
      mOptions(options),
      mLock(store.mMutex),
      mNested(store.mDepth > 0),
      mFilesBefore(store.mFiles.mark()) {
    if (!mStore.mConnection.isOpen()) {
        mBegun = PLATFORM_ERROR_DATABASE;
        return;
    }
    // SQLite undoes a transaction by itself, as on a full disk. What came after must not be kept without what came before.
    if (mNested && !mStore.mConnection.inTransaction()) {
        mBegun = PLATFORM_ERROR_DATABASE;
        return;
    }
    mBegun = mStore.codeOf(mStore.mConnection.run(mNested ? "SAVEPOINT call" : "BEGIN IMMEDIATE"));
    if (mBegun != PLATFORM_ERROR_NONE) return;
    if (!mNested) mStore.mTrusted.clear();
    mBegun = mStore.currentVersion(&mVersion);
    ++mVersion;
}

Store::Write::~Write() {
    if (!mNested) mStore.mTrusted.clear();
    if (mDone) return;
    mStore.mFiles.rollback(mFilesBefore);
    if (!mStore.mConnection.isOpen() || !mStore.mConnection.inTransaction()) return;
    (void)mStore.mConnection.run(mNested ? "ROLLBACK TO call;RELEASE call" : "ROLLBACK");
}

int Store::Write::expected(size_t position) const {
    return position < mOptions.expected_versions.size() ? mOptions.expected_versions[position] : kAnyVersion;
}

void Store::Write::touch(const View& view) {
    for (size_t i = 0; i < mStore.mViews.size(); ++i) {
        if (mStore.mViews[i] == &view) mViews |= uint64_t{1} << i;
    }
}

int Store::Write::finish(int result) {
    if (result != PLATFORM_ERROR_NONE) return result;
    Connection& connection = mStore.mConnection;
    if (mViews != 0) {
        const int code = [&] {
            if (const int stored =
                    connection.prepare("UPDATE store SET version = ?").bind(int64_t{mVersion}).step();
                stored != SQLITE_DONE) {
                return stored;
            }
            if (const int noted =
                    connection.prepare("INSERT INTO writes(version, writer, views) VALUES(?, ?, ?)")
                        .bind(int64_t{mVersion})
                        .bind(mStore.mWriterId)
                        .bind(static_cast<int64_t>(mViews))
                        .step();
                noted != SQLITE_DONE) {
                return noted;
            }
            if (const int dropped = connection.prepare("DELETE FROM writes WHERE version <= ?")
                                        .bind(int64_t{mVersion} - kKeptWrites)
                                        .step();
                dropped != SQLITE_DONE) {
                return dropped;
            }
            return connection
                .prepare("DELETE FROM tombstones WHERE rowid <= (SELECT max(rowid) FROM tombstones) - ?")
                .bind(int64_t{kKeptDeletions})
                .step();
        }();
        if (const int stored = mStore.codeOf(code); stored != PLATFORM_ERROR_NONE) return stored;
    }
    const int ended = mStore.codeOf(connection.run(mNested ? "RELEASE call" : "COMMIT"));
    if (ended != PLATFORM_ERROR_NONE) return ended;
    mDone = true;
    if (!mNested) mStore.mFiles.commit();
    if (mViews != 0) lastVersions()[&mStore] = mVersion;
    return PLATFORM_ERROR_NONE;
}

namespace {

// Runs `writeOne` for each position. What has moved on or is gone is skipped, anything else ends the call.
template <class WriteOne>
int forEach(size_t count, std::vector<Store::Skip>* skips, WriteOne writeOne) {
    for (size_t i = 0; i < count; ++i) {
        const int code = writeOne(i);
        if (code == PLATFORM_ERROR_CONFLICT || code == PLATFORM_ERROR_NOT_FOUND) {
            skips->push_back({i, code});
        } else if (code != PLATFORM_ERROR_NONE) {
            return code;
        }
    }
    return PLATFORM_ERROR_NONE;
}

}  // namespace

int Store::insert(std::span<Record* const> records, const record_write_options_s& options,
                  std::vector<Skip>* skips) {
    Write write(*this, options);
    if (write.begun() != PLATFORM_ERROR_NONE) return write.begun();
    return write.finish(forEach(records.size(), skips,
                                [&](size_t i) { return insertOne(write, *records[i], write.expected(i)); }));
}

int Store::update(std::span<Record* const> records, const record_write_options_s& options,
                  std::vector<Skip>* skips) {
    Write write(*this, options);
    if (write.begun() != PLATFORM_ERROR_NONE) return write.begun();
    return write.finish(forEach(records.size(), skips,
                                [&](size_t i) { return updateOne(write, *records[i], write.expected(i)); }));
}

int Store::replace(std::span<Record* const> records, std::span<const int> ids,
                   const record_write_options_s& options, std::vector<Skip>* skips) {
    if (ids.size() != records.size()) return PLATFORM_ERROR_INVALID_PARAMETER;
    Write write(*this, options);
    if (write.begun() != PLATFORM_ERROR_NONE) return write.begun();
    return write.finish(forEach(records.size(), skips, [&](size_t i) {
        return replaceOne(write, *records[i], ids[i], write.expected(i));
    }));
}

int Store::remove(const View& view, std::span<const int> ids, const record_write_options_s& options,
                  std::vector<Skip>* skips) {
    if (view.table == nullptr || view.role == Role::kChild) return PLATFORM_ERROR_INVALID_PARAMETER;
    Write write(*this, options);
    if (write.begun() != PLATFORM_ERROR_NONE) return write.begun();
    return write.finish(forEach(ids.size(), skips,
                                [&](size_t i) { return removeOne(write, view, ids[i], write.expected(i)); }));
}

}  // namespace platform::records
