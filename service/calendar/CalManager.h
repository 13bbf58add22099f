// CalManager: what the data managers of events and of to-dos share: books (calendars or task lists) between server, device and
// metadata store, and the detection of local changes by change version.
// Owner: see the two managers.   Threads: sync workers and the main loop (change callback); the stores' own locks serialise them.
// Errors: 0 or -1, each failure logged; outputs untouched on failure.
#pragma once

#include <list>
#include <map>
#include <mutex>
#include <string>
#include <vector>

#include "calendar/CalItemKind.h"
#include "calendar/CalItemStore.h"
#include "calendar/CalListInfo.h"
#include "platform/calendar.h"

class CalManager {
public:
    virtual ~CalManager() = default;
    CalManager(const CalManager&) = delete;
    CalManager& operator=(const CalManager&) = delete;

    [[nodiscard]] const CalItemKind& kind() const { return mKind; }
    // The metadata store, or NULL ("not prepare sync" logged).
    [[nodiscard]] CalItemStore* prepared();

    // --- books
    [[nodiscard]] int insertBook(int accountId, const CalListInfo& entry);
    // Writes name, and of calendars colour and access role, of known books in one batch, and their rows' etags.
    [[nodiscard]] int updateBooks(int accountId, const CalList& entries);
    // The book with its items, on the device and in the metadata store.
    [[nodiscard]] int deleteBook(int accountId, const std::string& uri);
    // Whether the device's book differs from the server's entry.
    [[nodiscard]] virtual bool isBookChanged(int accountId, const CalListInfo& entry) = 0;
    [[nodiscard]] static bool isReadOnly(int calendarId);
    // Makes rows and books agree before a comparison: rows of books that were deleted on the device go, a book of the account
    // without a row (a download that was cut off) gets its row again.
    [[nodiscard]] int reconcileBooks(int accountId);
    [[nodiscard]] int deleteAccount(int accountId);

    // --- local changes
    // Whether the calendar service has a change of the book that the sync has not examined, its own writes left out.
    [[nodiscard]] bool setChanged(int calendarId);
    // Brings the dirty and deleted marks of a book, or of all books of an account, up to date.
    [[nodiscard]] int setBookChanged(int calendarId);
    // After a run: moves past its own writes, so that no later look goes through them again. A user's change among them stops it: that
    // one is left for whoever is told of it.
    [[nodiscard]] int passOwnWrites(int calendarId);
    [[nodiscard]] int setAccountChanged(int accountId);
    // Marks that wait, or changes not examined yet.
    [[nodiscard]] bool hasSomethingToSend(int accountId);
    [[nodiscard]] int countPending(int accountId, int* dirty, int* deleted);

    // A record of the kind.
    [[nodiscard]] int getRecord(int itemId, CalendarRecord* record);

protected:
    explicit CalManager(const CalItemKind& kind) : mKind(kind) {}

    // The store, made on first use together with everything that it needs; NULL when that fails.
    virtual CalItemStore* prepareStore() = 0;
    // The rows of an account's books, whose records are gone.
    virtual int deleteBookRows(CalItemStore& store, int accountId, const std::vector<int>& calendarIds) = 0;
    // Asks for an upload of each account that has a change.
    void sendChanges();

private:
    [[nodiscard]] bool anyBookChanged(int accountId);

    const CalItemKind& mKind;
};
