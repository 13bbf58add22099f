// Store: accounts and calendars. Everything that is kept, and nothing that goes with a run.
// Owner: the server. Threads: any; the caller holds guard() as long as it uses what the store hands out.
// Errors: ApiError.
#pragma once

#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "Calendar.h"
#include "ContactBook.h"
#include "TaskList.h"

namespace provider {

// A calendar on the list of an account. Two accounts may have the same one, with rights of their own.
struct CalendarEntry {
    std::string calendarId;
    std::string accessRole;  // "owner", "writer" or "reader"
    std::string etag;        // of the entry, which also moves with the calendar's own members
};

struct Account {
    std::string email;
    std::string name;
    std::string refreshToken;  // empty: revoked
    std::vector<CalendarEntry> calendars;
    std::vector<std::unique_ptr<TaskList>> taskLists;
    std::unique_ptr<ContactBook> contacts;

    [[nodiscard]] const CalendarEntry* find(const std::string& calendarId) const;
};

// A person who shows a profile to everybody.
struct Person {
    explicit Person(const Json& shown) : profile(shown) {}

    Json profile;
    Image photo;
};

class Store {
public:
    [[nodiscard]] std::unique_lock<std::mutex> guard() const { return std::unique_lock(mMutex); }

    [[nodiscard]] const std::map<std::string, Account>& accounts() const { return mAccounts; }
    Account& addAccount(const std::string& email, const std::string& name);
    Account& account(const std::string& email);
    void removeAccount(const std::string& email);
    // Fresh each time, so that a revoked one never comes back.
    void issueRefreshToken(Account& account);

    // id empty: one is made. The account becomes its owner unless members say otherwise.
    Calendar& addCalendar(Account& account, const Json& members);
    void changeCalendar(Account& account, const std::string& calendarId, const Json& members);
    void share(Account& account, const std::string& calendarId, const std::string& accessRole);
    // Takes the calendar off the account's list; the last one to leave takes the calendar along.
    void removeCalendar(Account& account, const std::string& calendarId);
    Calendar& calendar(const std::string& calendarId);
    [[nodiscard]] Json calendarEntry(const Account& account, const CalendarEntry& entry) const;

    // id empty: one is made.
    TaskList& addTaskList(Account& account, const Json& members);
    TaskList& changeTaskList(const std::string& email, const std::string& listId, const Json& members);
    void removeTaskList(Account& account, const std::string& listId);
    TaskList& taskList(const std::string& email, const std::string& listId);

    ContactBook& contacts(const std::string& email) { return *account(email).contacts; }
    // Adds the person or takes the place of the profile that is there.
    Person& putPerson(const std::string& personId, const Json& profile);
    Person& person(const std::string& personId);
    void setPersonPhoto(const std::string& personId, const std::string& bytes, const std::string& type);

    // The whole content, and back; load takes over all or nothing.
    [[nodiscard]] Json dump() const;
    void load(const Json& state);

    std::string clientId = "vantor-pim-provider-client";
    std::string clientSecret = "local-demo-only";

private:
    Account& addBareAccount(const std::string& email, const std::string& name);  // no refresh token yet
    CalendarEntry& addEntry(Account& account, const std::string& calendarId, const std::string& accessRole);
    void loadCalendar(const Json& state);
    void loadAccount(const Json& state);
    void loadTaskList(Account& account, const Json& state);
    void loadPerson(const Json& state);
    void swap(Store& other);
    void touch(Calendar& calendar);

    mutable std::mutex mMutex;
    std::map<std::string, Account> mAccounts;
    std::map<std::string, std::unique_ptr<Calendar>> mCalendars;
    std::map<std::string, Person> mPeople;
    Revisions mRevisions;
};

}  // namespace provider
