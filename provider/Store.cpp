#include "Store.h"

#include <algorithm>
#include <cctype>

namespace provider {

namespace {

void checkRole(const std::string& role) {
    if (role != "owner" && role != "writer" && role != "reader") invalid("accessRole");
}

void checkColor(const std::string& color) {
    const bool isHex =
        color.size() == 7 && color[0] == '#' &&
        std::all_of(color.begin() + 1, color.end(), [](unsigned char c) { return std::isxdigit(c); });
    if (!isHex) invalid("backgroundColor");
}

struct CalendarMember {
    const char* name;
    std::string Calendar::*member;
};
constexpr CalendarMember kCalendarMembers[] = {{"summary", &Calendar::summary},
                                               {"description", &Calendar::description},
                                               {"timeZone", &Calendar::timeZone},
                                               {"backgroundColor", &Calendar::backgroundColor}};

void setMembers(Calendar& calendar, const Json& members) {
    for (const CalendarMember& row : kCalendarMembers) {
        calendar.*row.member = textOf(members, row.name, calendar.*row.member);
    }
}

void checkMembers(const Json& members) {
    for (const CalendarMember& row : kCalendarMembers) textOf(members, row.name);
    checkColor(textOf(members, "backgroundColor", "#000000"));
    if (!isTimeZone(textOf(members, "timeZone", "UTC"))) invalid("timeZone");
    checkRole(textOf(members, "accessRole", "owner"));
}

const Json& listOf(const Json& object, const char* name) {
    static const Json kNone = Json::array();
    const auto found = object.find(name);
    if (found == object.end()) return kNone;
    if (!found->is_array()) invalid(name);
    return *found;
}

Json dumpAccount(const Account& account) {
    Json entries = Json::array();
    for (const CalendarEntry& entry : account.calendars) {
        entries.push_back({{"id", entry.calendarId}, {"accessRole", entry.accessRole}, {"etag", entry.etag}});
    }
    Json lists = Json::array();
    for (const auto& list : account.taskLists) {
        Json tasks = Json::array();
        for (const auto& task : list->tasks()) {
            if (!task->isDeleted) tasks.push_back(task->body);
        }
        lists.push_back({{"id", list->id}, {"title", list->title}, {"etag", list->etag}, {"tasks", tasks}});
    }
    return {{"email", account.email}, {"name", account.name}, {"refreshToken", account.refreshToken},
            {"calendars", entries},   {"taskLists", lists},   {"contacts", account.contacts->dump()}};
}

}  // namespace

const CalendarEntry* Account::find(const std::string& calendarId) const {
    const auto found = std::find_if(calendars.begin(), calendars.end(), [&](const CalendarEntry& entry) {
        return entry.calendarId == calendarId;
    });
    return found == calendars.end() ? nullptr : &*found;
}

Account& Store::addAccount(const std::string& email, const std::string& name) {
    Account& account = addBareAccount(email, name);
    issueRefreshToken(account);
    return account;
}

Account& Store::addBareAccount(const std::string& email, const std::string& name) {
    if (email.find('@') == std::string::npos || email.find('/') != std::string::npos) invalid("email");
    if (mAccounts.count(email) != 0) throw ApiError{409, "duplicate", "The account exists.", "email"};
    Account& account = mAccounts[email];
    account.email = email;
    account.name = name.empty() ? email.substr(0, email.find('@')) : name;
    account.contacts = std::make_unique<ContactBook>(email, mRevisions);
    return account;
}

Account& Store::account(const std::string& email) {
    const auto found = mAccounts.find(email);
    if (found == mAccounts.end()) throw ApiError{404, "notFound", "No such account", "email"};
    return found->second;
}

void Store::issueRefreshToken(Account& account) {
    std::string name = account.email;
    std::replace_if(
        name.begin(), name.end(), [](unsigned char c) { return std::isalnum(c) == 0; }, '-');
    account.refreshToken = "refresh-" + name + "-" + std::to_string(mRevisions.next());
}

void Store::removeAccount(const std::string& email) {
    Account& removed = account(email);
    while (!removed.calendars.empty()) {
        const std::string calendarId = removed.calendars.back().calendarId;
        removeCalendar(removed, calendarId);
    }
    mAccounts.erase(email);
}

void Store::touch(Calendar& calendar) {
    calendar.etag = etagOf(mRevisions.next());
    calendar.updated = stampOf(mRevisions.last());
    for (auto& [email, account] : mAccounts) {
        for (CalendarEntry& entry : account.calendars) {
            if (entry.calendarId == calendar.id) entry.etag = calendar.etag;
        }
    }
}

Calendar& Store::addCalendar(Account& account, const Json& members) {
    checkMembers(members);
    const std::string madeId = "cal" + std::to_string(mRevisions.last() + 1) + "@group.provider.example";
    const std::string calendarId = textOf(members, "id", madeId);
    if (calendarId.empty() || calendarId.find('/') != std::string::npos) invalid("id");
    if (mCalendars.count(calendarId) != 0) throw ApiError{409, "duplicate", "The calendar exists.", "id"};
    auto& calendar = mCalendars[calendarId] = std::make_unique<Calendar>(calendarId, mRevisions);
    calendar->summary = calendarId;
    setMembers(*calendar, members);
    account.calendars.push_back({calendarId, textOf(members, "accessRole", "owner"), ""});
    touch(*calendar);
    return *calendar;
}

void Store::changeCalendar(Account& account, const std::string& calendarId, const Json& members) {
    if (account.find(calendarId) == nullptr)
        throw ApiError{404, "notFound", "No such calendar", "calendarId"};
    checkMembers(members);
    Calendar& changed = calendar(calendarId);
    setMembers(changed, members);
    touch(changed);
    for (CalendarEntry& entry : account.calendars) {
        if (entry.calendarId == calendarId)
            entry.accessRole = textOf(members, "accessRole", entry.accessRole);
    }
}

void Store::share(Account& account, const std::string& calendarId, const std::string& accessRole) {
    addEntry(account, calendarId, accessRole).etag = etagOf(mRevisions.next());
}

CalendarEntry& Store::addEntry(Account& account, const std::string& calendarId,
                               const std::string& accessRole) {
    checkRole(accessRole);
    calendar(calendarId);
    if (account.find(calendarId) != nullptr) {
        throw ApiError{409, "duplicate", "The account has this calendar.", "id"};
    }
    return account.calendars.emplace_back(CalendarEntry{calendarId, accessRole, ""});
}

void Store::removeCalendar(Account& account, const std::string& calendarId) {
    const auto isIt = [&](const CalendarEntry& entry) { return entry.calendarId == calendarId; };
    if (std::erase_if(account.calendars, isIt) == 0) {
        throw ApiError{404, "notFound", "No such calendar", "calendarId"};
    }
    const bool isUsed = std::any_of(mAccounts.begin(), mAccounts.end(), [&](const auto& item) {
        return item.second.find(calendarId) != nullptr;
    });
    if (!isUsed) mCalendars.erase(calendarId);
}

Calendar& Store::calendar(const std::string& calendarId) {
    const auto found = mCalendars.find(calendarId);
    if (found == mCalendars.end()) throw ApiError{404, "notFound", "No such calendar", "calendarId"};
    return *found->second;
}

Json Store::calendarEntry(const Account& account, const CalendarEntry& entry) const {
    const Calendar& calendar = *mCalendars.at(entry.calendarId);
    Json out = {{"kind", "calendar#calendarListEntry"}, {"etag", entry.etag}, {"id", calendar.id}};
    out["summary"] = calendar.summary;
    if (!calendar.description.empty()) out["description"] = calendar.description;
    out["timeZone"] = calendar.timeZone;
    out["backgroundColor"] = calendar.backgroundColor;
    out["foregroundColor"] = "#000000";
    out["selected"] = true;
    out["accessRole"] = entry.accessRole;
    out["defaultReminders"] = Json::array({{{"method", "popup"}, {"minutes", 10}}});
    if (calendar.id == account.email) out["primary"] = true;
    return out;
}

TaskList& Store::addTaskList(Account& account, const Json& members) {
    const std::string listId = textOf(members, "id", "list" + std::to_string(mRevisions.last() + 1));
    if (listId.empty() || listId.find('/') != std::string::npos) invalid("id");
    const auto isIt = [&](const auto& list) { return list->id == listId; };
    if (std::any_of(account.taskLists.begin(), account.taskLists.end(), isIt))
        throw ApiError{409, "duplicate", "The task list exists.", "id"};
    auto list = std::make_unique<TaskList>(listId, mRevisions);
    list->title = textOf(members, "title", listId);
    list->etag = textOf(members, "etag");
    if (list->etag.empty()) list->etag = etagOf(mRevisions.next());
    return *account.taskLists.emplace_back(std::move(list));
}

TaskList& Store::changeTaskList(const std::string& email, const std::string& listId, const Json& members) {
    TaskList& list = taskList(email, listId);
    list.title = textOf(members, "title", list.title);
    list.etag = etagOf(mRevisions.next());
    return list;
}

void Store::removeTaskList(Account& account, const std::string& listId) {
    if (std::erase_if(account.taskLists, [&](const auto& list) { return list->id == listId; }) == 0)
        throw ApiError{404, "notFound", "No such task list", "tasklist"};
}

TaskList& Store::taskList(const std::string& email, const std::string& listId) {
    for (const auto& list : account(email).taskLists) {
        if (list->id == listId) return *list;
    }
    throw ApiError{404, "notFound", "No such task list", "tasklist"};
}

Person& Store::putPerson(const std::string& personId, const Json& profile) {
    if (personId.empty() || personId == "default" || personId.find('/') != std::string::npos) invalid("id");
    Person& person = mPeople.try_emplace(personId, profile).first->second;
    person.profile = profile;
    return person;
}

Person& Store::person(const std::string& personId) {
    const auto found = mPeople.find(personId);
    if (found == mPeople.end()) throw ApiError{404, "notFound", "No such person", "id"};
    return found->second;
}

void Store::setPersonPhoto(const std::string& personId, const std::string& bytes, const std::string& type) {
    person(personId).photo = {bytes, type, etagOf(mRevisions.next())};
}

Json Store::dump() const {
    Json out = {{"clientId", clientId}, {"clientSecret", clientSecret}, {"revision", mRevisions.last()}};
    out["accounts"] = Json::array();
    for (const auto& [email, account] : mAccounts) out["accounts"].push_back(dumpAccount(account));
    out["calendars"] = Json::array();
    for (const auto& [calendarId, calendar] : mCalendars) {
        Json item = {{"id", calendarId}, {"etag", calendar->etag}, {"updated", calendar->updated}};
        for (const CalendarMember& row : kCalendarMembers) item[row.name] = (*calendar).*row.member;
        item["events"] = Json::array();
        item["deleted"] = Json::array();
        for (const auto& event : calendar->events()) {
            if (event->isDeleted) {
                item["deleted"].push_back(event->id);
            } else {
                item["events"].push_back({{"id", event->id}, {"event", event->text.json()}});
            }
        }
        out["calendars"].push_back(std::move(item));
    }
    out["people"] = Json::array();
    for (const auto& [personId, person] : mPeople) {
        out["people"].push_back({{"id", personId}, {"profile", person.profile}});
        if (person.photo.isThere()) out["people"].back()["photo"] = person.photo.dump();
    }
    return out;
}

void Store::swap(Store& other) {
    std::swap(mAccounts, other.mAccounts);
    std::swap(mCalendars, other.mCalendars);
    std::swap(mPeople, other.mPeople);
    std::swap(mRevisions, other.mRevisions);
    std::swap(clientId, other.clientId);
    std::swap(clientSecret, other.clientSecret);
}

void Store::load(const Json& state) {
    if (!state.is_object()) throw ApiError{400, "invalid", "A state is a JSON object", ""};
    Store fresh;
    fresh.clientId = textOf(state, "clientId", clientId);
    fresh.clientSecret = textOf(state, "clientSecret", clientSecret);
    const auto revision = state.find("revision");
    if (revision != state.end()) {
        if (!revision->is_number_unsigned()) invalid("revision");
        fresh.mRevisions.restore(revision->get<std::uint64_t>());
    }
    // The calendars refer to the revisions of the store that they live in, so they are made here, not moved.
    swap(fresh);
    try {
        for (const Json& calendar : listOf(state, "calendars")) loadCalendar(calendar);
        for (const Json& account : listOf(state, "accounts")) loadAccount(account);
        for (const Json& person : listOf(state, "people")) loadPerson(person);
    } catch (...) {
        swap(fresh);
        throw;
    }
}

// Events stand as {"id","event"}, taken as they are, or as plain event bodies, checked and completed.
void Store::loadCalendar(const Json& state) {
    if (!state.is_object()) invalid("calendars");
    const std::string calendarId = textOf(state, "id");
    if (calendarId.empty() || mCalendars.count(calendarId) != 0) invalid("calendars.id");
    checkMembers(state);
    auto& calendar = mCalendars[calendarId] = std::make_unique<Calendar>(calendarId, mRevisions);
    calendar->summary = calendarId;
    setMembers(*calendar, state);
    for (const Json& event : listOf(state, "events")) {
        if (!event.is_object()) invalid("calendars.events");
        const auto kept = event.find("event");
        if (kept == event.end()) {
            calendar->insert(event, {"", true});
        } else if (!kept->is_object() || textOf(event, "id").empty()) {
            invalid("calendars.events");
        } else {
            calendar->put(textOf(event, "id"), *kept);
        }
    }
    for (const Json& deleted : listOf(state, "deleted")) {
        if (!deleted.is_string()) invalid("calendars.deleted");
        calendar->putDeleted(deleted.get<std::string>());
    }
    calendar->etag = textOf(state, "etag");
    if (calendar->etag.empty()) calendar->etag = etagOf(mRevisions.next());
    calendar->updated = textOf(state, "updated", stampOf(mRevisions.last()));
}

void Store::loadAccount(const Json& state) {
    if (!state.is_object()) invalid("accounts");
    Account& account = addBareAccount(textOf(state, "email"), textOf(state, "name"));
    if (state.contains("refreshToken")) {
        account.refreshToken = textOf(state, "refreshToken");
    } else {
        issueRefreshToken(account);
    }
    for (const Json& item : listOf(state, "calendars")) {
        if (!item.is_object()) invalid("accounts.calendars");
        const std::string calendarId = textOf(item, "id");
        CalendarEntry& entry = addEntry(account, calendarId, textOf(item, "accessRole", "owner"));
        entry.etag = textOf(item, "etag", calendar(calendarId).etag);
    }
    for (const Json& list : listOf(state, "taskLists")) loadTaskList(account, list);
    if (state.contains("contacts")) account.contacts->load(state.at("contacts"));
}

void Store::loadTaskList(Account& account, const Json& state) {
    if (!state.is_object()) invalid("accounts.taskLists");
    TaskList& list = addTaskList(account, state);
    for (const Json& task : listOf(state, "tasks")) {
        if (!task.is_object()) invalid("accounts.taskLists.tasks");
        list.put(task);
    }
}

void Store::loadPerson(const Json& state) {
    if (!state.is_object() || !state.contains("profile") || !state.at("profile").is_object())
        invalid("people");
    Person& person = putPerson(textOf(state, "id"), state.at("profile"));
    if (state.contains("photo")) person.photo = Image::load(state.at("photo"));
}

}  // namespace provider
