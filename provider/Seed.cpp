#include "Seed.h"

#include <array>
#include <cstdio>

#include "FeedNames.h"

namespace provider {

namespace {

constexpr std::size_t kBulkBytes = 1000;
constexpr std::size_t kRecurringEach = 10;
constexpr std::int64_t kBulkStart = 1767254400;  // 2026-01-01T08:00:00Z
constexpr std::int64_t kBulkStep = 1800;

// Filler that compresses about as well as what people write.
std::string filler(std::size_t seed, std::size_t bytes) {
    constexpr std::array<std::string_view, 16> kWords = {
        "agenda ", "notes ", "room ",   "please ", "bring ", "draft ", "budget ", "review ",
        "plan ",   "call ",  "travel ", "ticket ", "lunch ", "team ",  "spring ", "update "};
    std::string text;
    std::uint32_t state = static_cast<std::uint32_t>(seed) * 2654435761U + 1;
    while (text.size() < bytes) {
        state = state * 1664525U + 1013904223U;
        text += kWords[state >> 28U];
        text += std::to_string((state >> 16U) & 0xffU) + " ";
    }
    text.resize(bytes);
    return text;
}

}  // namespace

void addBulkEvents(Calendar& calendar, std::size_t events) {
    const std::size_t before = calendar.events().size();
    for (std::size_t i = before; i < before + events; ++i) {
        const std::int64_t start = kBulkStart + static_cast<std::int64_t>(i) * kBulkStep;
        Json body;
        body["summary"] = "Event " + std::to_string(i);
        body["location"] = "Room " + std::to_string(i % 40);
        body["start"] = {{"dateTime", formatDateTime(start, 0)}, {"timeZone", "UTC"}};
        body["end"] = {{"dateTime", formatDateTime(start + kBulkStep, 0)}, {"timeZone", "UTC"}};
        if (i % kRecurringEach == 0) body["recurrence"] = Json::array({"RRULE:FREQ=WEEKLY;COUNT=10"});
        body["attendees"] = Json::array();
        body["attendees"].push_back({{"email", "guest@provider.example"}, {"responseStatus", "accepted"}});
        body["reminders"]["useDefault"] = false;
        body["reminders"]["overrides"] = Json::array();
        body["reminders"]["overrides"].push_back({{"method", "popup"}, {"minutes", 15}});
        // What the provider adds to a stored event.
        constexpr std::size_t kOwnBytes = 440;
        const std::size_t used = body.dump().size() + kOwnBytes;
        body["description"] = filler(i, used < kBulkBytes ? kBulkBytes - used : 0);
        calendar.insert(body);
    }
}

void addBulkContacts(ContactBook& book, std::size_t contacts) {
    // What the provider adds to a stored contact: addresses, dates, links.
    constexpr std::size_t kOwnBytes = 700;
    const std::string kind = kKindRel;
    const std::size_t before = book.entries(FeedKind::kContact).size();
    for (std::size_t i = before; i < before + contacts; ++i) {
        const std::string number = std::to_string(i);
        Json fields;
        fields["gd$name"]["gd$givenName"]["$t"] = "Person";
        fields["gd$name"]["gd$familyName"]["$t"] = "Number " + number;
        fields["gd$email"].push_back(
            {{"rel", kind + "home"}, {"address", "p" + number + "@provider.example"}});
        fields["gd$phoneNumber"].push_back({{"rel", kind + "mobile"}, {"$t", "+1 555 " + number}});
        fields["gContact$groupMembershipInfo"].push_back({{"href", "/m8/feeds/groups/default/base/6"}});
        const std::size_t used = fields.dump().size() + kOwnBytes;
        fields["content"]["$t"] = filler(i, used < kBulkBytes ? kBulkBytes - used : 0);
        book.insert(FeedKind::kContact, fields);
    }
}

void seedBulk(Store& store, std::size_t events) {
    Account& account = store.addAccount("bulk@provider.example", "Bulk");
    Json members;
    members["id"] = account.email;
    members["summary"] = "Bulk";
    addBulkEvents(store.addCalendar(account, members), events);
    addBulkContacts(*account.contacts, events);
}

}  // namespace provider
