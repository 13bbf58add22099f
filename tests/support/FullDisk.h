// FullDisk: a disk that is full for whoever opens a store while the object lives.
#pragma once

#include <gtest/gtest.h>
#include <sqlite3.h>

class FullDisk {
public:
    FullDisk() { EXPECT_EQ(sqlite3_auto_extension(mExtension), SQLITE_OK); }
    ~FullDisk() { sqlite3_cancel_auto_extension(mExtension); }

private:
    static int allowTwoPages(sqlite3* database, const char**, const struct sqlite3_api_routines*) {
        return sqlite3_exec(database, "PRAGMA max_page_count = 2", nullptr, nullptr, nullptr);
    }
    void (*const mExtension)() = reinterpret_cast<void (*)()>(&allowTwoPages);
};
