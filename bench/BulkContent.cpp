#include "BulkContent.h"

#include <array>
#include <cstdint>
#include <string_view>

#include "FeedNames.h"
#include "Times.h"

namespace bench {

using provider::Json;

namespace {

constexpr std::size_t kEventBytes = 1500;
constexpr std::size_t kContactBytes = 1000;
// What the provider adds to a stored item: ids, addresses, dates, links.
constexpr std::size_t kEventOwnBytes = 440;
constexpr std::size_t kContactOwnBytes = 500;
constexpr std::size_t kRecurringEach = 10;
constexpr std::int64_t kFirstStart = 1767254400;  // 2026-01-01T08:00:00Z
constexpr std::int64_t kStep = 1800;

std::size_t rest(std::size_t wanted, std::size_t used) {
    return used < wanted ? wanted - used : 0;
}

Json eventBody(std::size_t i) {
    const std::int64_t start = kFirstStart + static_cast<std::int64_t>(i) * kStep;
    Json body;
    body["summary"] = "Event " + std::to_string(i);
    body["location"] = "Room " + std::to_string(i % 40);
    body["start"] = {{"dateTime", provider::formatDateTime(start, 0)}, {"timeZone", "UTC"}};
    body["end"] = {{"dateTime", provider::formatDateTime(start + kStep, 0)}, {"timeZone", "UTC"}};
    if (i % kRecurringEach == 0) body["recurrence"] = Json::array({"RRULE:FREQ=WEEKLY;COUNT=10"});
    body["attendees"] = Json::array();
    for (const char* name : {"Ada", "Benno"}) {
        body["attendees"].push_back({{"email", name + std::to_string(i % 50) + "@provider.example"},
                                     {"displayName", name},
                                     {"responseStatus", "accepted"}});
    }
    body["reminders"]["useDefault"] = false;
    body["reminders"]["overrides"] = Json::array();
    body["reminders"]["overrides"].push_back({{"method", "popup"}, {"minutes", 15}});
    body["description"] = filler(i, rest(kEventBytes, body.dump().size() + kEventOwnBytes));
    return body;
}

Json contactFields(std::size_t i) {
    const std::string kind = provider::kKindRel;
    const std::string number = std::to_string(i);
    Json fields;
    fields["gd$name"]["gd$givenName"]["$t"] = "Person";
    fields["gd$name"]["gd$familyName"]["$t"] = "Number " + number;
    fields["gd$email"].push_back({{"rel", kind + "home"}, {"address", "p" + number + "@provider.example"}});
    fields["gd$phoneNumber"].push_back({{"rel", kind + "mobile"}, {"$t", "+1 555 " + number}});
    fields["gContact$groupMembershipInfo"].push_back({{"href", "/m8/feeds/groups/default/base/6"}});
    fields["content"]["$t"] = filler(i, rest(kContactBytes, fields.dump().size() + kContactOwnBytes));
    return fields;
}

Json taskBody(std::size_t i) {
    Json body;
    body["title"] = "Task " + std::to_string(i);
    body["notes"] = filler(i, 120);
    body["due"] = provider::formatDateTime(kFirstStart + static_cast<std::int64_t>(i) * 86400, 0);
    return body;
}

// The id of the item in the middle. Throws as `touch`.
template <class Items>
std::string middleOf(const Items& items) {
    if (items.empty()) throw provider::ApiError{404, "notFound", "There is no such item", ""};
    return items[items.size() / 2]->id;
}

}  // namespace

std::string filler(std::size_t seed, std::size_t bytes) {
    constexpr std::array<std::string_view, 16> kWords = {
        "agenda ", "notes ", "room ",   "please ", "bring ", "draft ", "budget ", "review ",
        "plan ",   "call ",  "travel ", "ticket ", "lunch ", "team ",  "spring ", "update "};
    std::string text;
    auto state = static_cast<std::uint32_t>(seed) * 2654435761U + 1;
    while (text.size() < bytes) {
        state = state * 1664525U + 1013904223U;
        text += kWords[state >> 28U];
        text += std::to_string((state >> 16U) & 0xffU) + " ";
    }
    text.resize(bytes);
    return text;
}

void fill(provider::Store& store, const ItemCounts& counts) {
    const auto lock = store.guard();
    provider::Account& account = store.addAccount(kEmail, "Bench");
    provider::Calendar& calendar =
        store.addCalendar(account, {{"id", kEmail}, {"summary", "Bench"}, {"timeZone", "UTC"}});
    for (std::size_t i = 0; i < counts.events; ++i) calendar.insert(eventBody(i));
    for (std::size_t i = 0; i < counts.contacts; ++i)
        account.contacts->insert(provider::FeedKind::kContact, contactFields(i));
    provider::TaskList& tasks = store.addTaskList(account, {{"id", "bench"}, {"title", "Bench"}});
    for (std::size_t i = 0; i < counts.tasks; ++i) tasks.insert(taskBody(i), /*canName=*/false);
}

void touch(provider::Store& store, const std::string& kind) {
    static int count = 0;
    const auto lock = store.guard();
    const std::string text = "Changed " + std::to_string(++count);
    if (kind == "event") {
        provider::Calendar& calendar = store.calendar(kEmail);
        calendar.patch(middleOf(calendar.events()), {{"summary", text}});
    } else if (kind == "contact") {
        provider::ContactBook& book = store.contacts(kEmail);
        const auto contact = provider::FeedKind::kContact;
        book.patch(contact, middleOf(book.entries(contact)),
                   {{"gd$name", {{"gd$givenName", {{"$t", text}}}}}});
    } else if (kind == "task") {
        provider::TaskList& tasks = store.taskList(kEmail, "bench");
        tasks.patch(middleOf(tasks.tasks()), {{"title", text}});
    } else {
        throw provider::ApiError{400, "invalid", "kind is event, contact or task", "kind"};
    }
}

}  // namespace bench
