// FileKeep: the files that belong to records, in a folder of the store. A transaction's copies and removals become final with it.
// Owner: a store.   Threads: one at a time; the store's mutex is held around every use.
// A kill leaves at most files that no record names; they are swept when the store is opened and they have been there for a while.
#pragma once

#include <set>
#include <string>
#include <vector>

namespace platform::records {

class FileKeep {
public:
    // `folder` is absolute, the root is applied on use; NULL: the store keeps no files.
    explicit FileKeep(const char* folder) : mFolder(folder) {}

    [[nodiscard]] bool isKept(const std::string& path) const;
    // Copies a regular file (never through a link, at most 32 MiB) into the folder. `kept` is the copy's path, below the root.
    [[nodiscard]] int keep(const std::string& path, std::string* kept);
    void drop(const std::string& path) { mDropped.push_back(path); }

    // A point in the open transaction.
    struct Mark {
        size_t copied = 0;
        size_t dropped = 0;
    };
    [[nodiscard]] Mark mark() const { return {mCopied.size(), mDropped.size()}; }
    // Undoes what came after the mark, or the whole transaction.
    void rollback(const Mark& mark);
    void rollback() { rollback(Mark()); }
    void commit();

    // Removes what is not in `named` and older than an hour.
    void sweep(const std::set<std::string>& named) const;

private:
    const char* const mFolder;
    std::vector<std::string> mCopied;   // of the open transaction
    std::vector<std::string> mDropped;  // likewise
};

}  // namespace platform::records
