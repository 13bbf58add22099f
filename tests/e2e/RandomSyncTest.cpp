// Random edits on both sides with syncs in between: after each, both sides hold the same items, once each.
#include <fstream>

#include "e2e/RandomEdits.h"

namespace {

constexpr int kSteps = 300;
constexpr int kStepsBetweenSyncs = 10;
constexpr int kAccounts = 2;

std::string day(int number) {
    return "2026-03-" + std::string(number < 10 ? "0" : "") + std::to_string(number);
}

// Of the provider's seed file, which must be there before the provider.
struct SeedFolder {
    TestRoot mFolder;
};

// Two accounts with a calendar and a task list each, and one calendar that both have.
std::vector<std::string> smallSeed(const std::string& path) {
    std::ofstream(path)
        << R"({"calendars": [{"id": "one@x"}, {"id": "two@x"}, {"id": "both@x"}], "accounts": [
        {"email": "one@x", "calendars": [{"id": "one@x"}, {"id": "both@x", "accessRole": "writer"}],
         "taskLists": [{"id": "list-1", "title": "First"}]},
        {"email": "two@x", "calendars": [{"id": "two@x"}, {"id": "both@x", "accessRole": "writer"}],
         "taskLists": [{"id": "list-2", "title": "Second"}]}]})";
    return {"--seed", path};
}

class RandomCalendarEdits : private SeedFolder, private RandomEdits {
public:
    explicit RandomCalendarEdits(unsigned seed)
        : RandomEdits(seed, kAccounts, smallSeed(mFolder.path() / "seed.json"), "calendar") {}

    using RandomEdits::tellWhatHappened;

    void step(int number) {
        mName = "step " + std::to_string(number);
        static constexpr void (RandomCalendarEdits::*kEdits[])() = {
            &RandomCalendarEdits::addOnDevice,        &RandomCalendarEdits::editOnDevice,
            &RandomCalendarEdits::editOnDevice,       &RandomCalendarEdits::deleteOnDevice,
            &RandomCalendarEdits::instanceOnDevice,   &RandomCalendarEdits::taskOnDevice,
            &RandomCalendarEdits::addOnProvider,      &RandomCalendarEdits::editOnProvider,
            &RandomCalendarEdits::editOnProvider,     &RandomCalendarEdits::deleteOnProvider,
            &RandomCalendarEdits::instanceOnProvider, &RandomCalendarEdits::taskOnProvider};
        (this->*kEdits[below(std::size(kEdits))])();
    }

    // What one account sends to the shared calendar comes down with the next sync of the other.
    void syncAndCompare() {
        syncAll({1, 2, 1, 2});
        for (int account = 1; account <= kAccounts; ++account) mPair.expectSame(account);
    }
    void expectQuiet() {
        for (int account = 1; account <= kAccounts; ++account) mPair.expectQuiet(account);
    }

private:
    // --- the device
    std::string pickBook(const char* kind) {
        std::vector<Json> books = mPair.device.json({"calendars", "list"});
        std::erase_if(books, [&](const Json& book) { return book["kind"] != kind; });
        const Json* book = pick(books);
        return book != nullptr ? std::to_string((*book)["id"].get<int>()) : "";
    }
    void addOnDevice() {
        const std::string book = pickBook("event");
        if (book.empty()) return;
        const std::string date = day(static_cast<int>(below(20)) + 1);
        Json event = {{"summary", mName + " \"o'clock\"\n\xF0\x9F\x98\x80"},
                      {"start", date + "T09:00:00Z"},
                      {"end", date + "T10:00:00Z"},
                      {"visibility", chance() ? "private" : "default"},
                      {"busy", chance()},
                      {"reminders", {10}}};
        if (chance()) event["rrule"] = "FREQ=DAILY;COUNT=9";
        if (chance())
            event["attendees"] = {{{"email", "guest@x"}, {"status", "accepted"}, {"name", "guest@x"}}};
        run({"event", "add", "--calendar", book, "-"}, event.dump());
    }
    std::vector<Json> deviceEvents() { return mPair.device.json({"events", "list"}); }
    void editOnDevice() {
        const std::vector<Json> events = deviceEvents();
        const Json* event = pick(events);
        if (event == nullptr) return;
        const std::string id = std::to_string((*event)["id"].get<int>());
        if (chance())
            return run(
                {"event", "set", id, "summary=" + mName, "busy=" + std::string(chance() ? "true" : "false")});
        run({"event", "set", id, "location=" + mName, "description="});
    }
    void deleteOnDevice() {
        const std::vector<Json> events = deviceEvents();
        if (const Json* event = pick(events))
            run({"event", "delete", std::to_string((*event)["id"].get<int>())});
    }
    void instanceOnDevice() {
        std::vector<Json> series = deviceEvents();
        std::erase_if(series, [](const Json& event) { return event["rrule"] == ""; });
        const Json* event = pick(series);
        if (event == nullptr) return;
        const std::string id = std::to_string((*event)["id"].get<int>());
        const int first = std::stoi((*event)["start"].get<std::string>().substr(8, 2));
        std::string instance = day(first + static_cast<int>(below(9)));
        std::erase(instance, '-');
        instance += "T090000Z";
        if (chance()) return run({"event", "delete", id, "--instance", instance});
        run({"event", "set", id, "--instance", instance, "summary=" + mName});
    }
    void taskOnDevice() {
        const std::vector<Json> todos = mPair.device.json({"todos", "list"});
        const Json* todo = pick(todos);
        const std::string id = todo != nullptr ? std::to_string((*todo)["id"].get<int>()) : "";
        if (todo == nullptr || below(3) == 0) {
            const std::string book = pickBook("todo");
            if (book.empty()) return;
            return run({"todo", "add", "--calendar", book, "-"},
                       Json({{"summary", mName}, {"note", "a\nb"}}).dump());
        }
        if (chance()) return run({"todo", "delete", id});
        if (chance()) return run({"todo", "set", id, "due=2026-04-01T00:00:00Z", "summary=" + mName});
        run({"todo", "set", id, chance() ? "status=completed" : "status=needsAction", "due="});
    }

    // --- the provider
    std::string eventsPath() {
        static constexpr const char* kCalendars[] = {"one@x", "two@x", "both@x"};
        return "/calendars/" + pathText(kCalendars[below(3)]) + "/events";
    }
    void addOnProvider() {
        const std::string date = day(static_cast<int>(below(20)) + 1);
        Json event = {{"summary", mName},
                      {"start", {{"dateTime", date + "T09:00:00Z"}}},
                      {"end", {{"dateTime", date + "T09:45:00Z"}}}};
        if (chance()) event["recurrence"] = {"RRULE:FREQ=DAILY;COUNT=9"};
        onProvider("POST", eventsPath(), event);
    }
    // A random event of the calendar, never a cancelled instance; empty when there is none.
    std::string pickEvent(const std::string& path, bool isSeries) {
        std::vector<Json> events = mPair.provider.admin("GET", path)["items"];
        std::erase_if(events, [&](const Json& event) {
            return event["status"] == "cancelled" || (isSeries && !event.contains("recurrence"));
        });
        const Json* event = pick(events);
        return event != nullptr ? (*event)["id"] : "";
    }
    void editOnProvider() {
        const std::string path = eventsPath();
        const std::string id = pickEvent(path, false);
        if (id.empty()) return;
        onProvider("PATCH", path + "/" + id,
                   chance() ? Json({{"summary", mName}}) : Json({{"location", mName}}));
    }
    void deleteOnProvider() {
        const std::string path = eventsPath();
        if (const std::string id = pickEvent(path, false); !id.empty()) onProvider("DELETE", path + "/" + id);
    }
    void instanceOnProvider() {
        const std::string path = eventsPath();
        const std::string id = pickEvent(path, true);
        if (id.empty()) return;
        const Json series = onProvider("GET", path + "/" + id);
        if (series.is_null()) return;
        const int first = std::stoi(series["start"]["dateTime"].get<std::string>().substr(8, 2));
        std::string instance = day(first + static_cast<int>(below(9)));
        std::erase(instance, '-');
        const std::string target = path + "/" + id + "_" + instance + "T090000Z";
        const std::vector<Json> events = mPair.provider.admin("GET", path)["items"];
        for (const Json& event : events) {
            if (event["id"] == id + "_" + instance + "T090000Z" && event["status"] == "cancelled") return;
        }
        chance() ? onProvider("DELETE", target) : onProvider("PATCH", target, {{"summary", mName}});
    }
    void taskOnProvider() {
        const int account = static_cast<int>(below(kAccounts)) + 1;
        const std::string path = mPair.tasksPath(account, "list-" + std::to_string(account));
        const std::vector<Json> tasks = mPair.provider.admin("GET", path)["items"];
        const Json* task = pick(tasks);
        if (task == nullptr || below(3) == 0) {
            onProvider("POST", path, {{"title", mName}, {"due", "2026-05-01T00:00:00Z"}});
        } else if (chance()) {
            onProvider("DELETE", path + "/" + (*task)["id"].get<std::string>());
        } else {
            onProvider("PATCH", path + "/" + (*task)["id"].get<std::string>(),
                       {{"notes", mName}, {"status", chance() ? "completed" : "needsAction"}});
        }
    }
};

}  // namespace

TEST(RandomSync, BothSidesHoldTheSameAfterEverySync) {
    runRandomEdits<RandomCalendarEdits>(20261125, kSteps, kStepsBetweenSyncs);
}
