#include "Calendar.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <string_view>

#include "EventCheck.h"
#include "Merge.h"

namespace provider {

namespace {

constexpr std::int64_t kFirstStamp = 1767225600;  // 2026-01-01

// Set by the provider alone; what a client sends for them is not taken.
struct OwnMember {
    std::string_view name;
    bool isAdminWritable;
};
constexpr OwnMember kOwnMembers[] = {{"kind", false},     {"etag", false},    {"id", false},
                                     {"htmlLink", false}, {"created", false}, {"updated", false},
                                     {"creator", true},   {"organizer", true}};
constexpr const char* kInstanceMembers[] = {"recurringEventId", "originalStartTime", "iCalUID"};
// A change of these is a new version of the meeting.
constexpr const char* kSequenceMembers[] = {"start", "end", "recurrence"};

bool isOwn(std::string_view name, const WriteOptions& options) {
    return std::any_of(std::begin(kOwnMembers), std::end(kOwnMembers), [&](const OwnMember& row) {
        return row.name == name && !(row.isAdminWritable && options.isAdmin);
    });
}

void keepMember(Json& body, const Json& before, const std::string& name) {
    if (before.contains(name)) {
        body[name] = before.at(name);
    } else {
        body.erase(name);
    }
}

bool differs(const Json& a, const Json& b, const char* name) {
    return (a.contains(name) ? a.at(name) : Json()) != (b.contains(name) ? b.at(name) : Json());
}

std::string textMember(const Json& body, const char* name) {
    const auto found = body.find(name);
    return found != body.end() && found->is_string() ? found->get<std::string>() : "";
}

Json cancelledItem(const Json& body) {
    Json item = {{"kind", "calendar#event"}, {"etag", ""}, {"id", body.at("id")}, {"status", "cancelled"}};
    for (const char* name : {"recurringEventId", "originalStartTime"}) {
        if (body.contains(name)) item[name] = body.at(name);
    }
    return item;
}

void checkMatch(const std::string& ifMatch, const std::string& etag) {
    if (!ifMatch.empty() && ifMatch != "*" && ifMatch != etag) {
        throw ApiError{412, "conditionNotMet", "Precondition Failed", "If-Match"};
    }
}

[[noreturn]] void notFound() {
    throw ApiError{404, "notFound", "Not Found", ""};
}
[[noreturn]] void gone() {
    throw ApiError{410, "deleted", "Resource has been deleted", ""};
}

void checkNewId(const std::string& id) {
    const auto allowed = [](char c) { return (c >= 'a' && c <= 'v') || (c >= '0' && c <= '9'); };
    if (id.size() < 5 || id.size() > 1024 || !std::all_of(id.begin(), id.end(), allowed)) {
        throw ApiError{400, "invalid", "Invalid resource id value.", "id"};
    }
}

bool repeats(const Json& body) {
    const auto found = body.find("recurrence");
    return found != body.end() && found->is_array() && !found->empty();
}

}  // namespace

std::string etagOf(std::uint64_t revision) {
    return "\"" + std::to_string(3400000000000000ULL + revision * 2000) + "\"";
}

std::string stampOf(std::uint64_t revision) {
    std::string text = formatDateTime(kFirstStamp + static_cast<std::int64_t>(revision), 0);
    return text.insert(text.size() - 1, ".000");
}

Event* Calendar::find(const std::string& eventId) const {
    const auto found = mById.find(eventId);
    return found == mById.end() ? nullptr : found->second;
}

// An instance as its series tells it. Offsets are those of the series' start: the instant is what counts.
std::optional<Json> Calendar::instance(const std::string& eventId) const {
    const std::size_t line = eventId.rfind('_');
    if (line == std::string::npos) return std::nullopt;
    const Event* series = find(eventId.substr(0, line));
    const auto when = parseCompact(std::string_view(eventId).substr(line + 1));
    if (series == nullptr || series->isDeleted || !series->isSeries || !when) return std::nullopt;
    Json body = series->text.json();
    const EventTime start = readTime(body.at("start"), "start");
    const EventTime end = readTime(body.at("end"), "end");
    if (start.allDay != when->allDay) return std::nullopt;
    // Of a wall time without an offset the instant is not known here, so only the others can be too early.
    if ((start.offset || start.allDay) && when->utc() < start.utc()) return std::nullopt;
    EventTime from = *when;
    from.zone = start.zone;
    from.offset = start.allDay ? std::nullopt : std::optional<int>(start.offset.value_or(0));
    from.local = when->local + from.offset.value_or(0);
    EventTime to = from;
    to.zone = end.zone;
    to.local += end.local - start.local;
    if (end.offset && start.offset) {
        to.offset = end.offset;
        to.local = from.utc() + (end.utc() - start.utc()) + *end.offset;
    }
    body.erase("recurrence");
    body["id"] = eventId;
    body["start"] = timeJson(from);
    body["end"] = timeJson(to);
    body["recurringEventId"] = series->id;
    body["originalStartTime"] = timeJson(from);
    return body;
}

Calendar::Current Calendar::current(const std::string& eventId) const {
    const Event* event = find(eventId);
    if (event != nullptr && event->isDeleted) gone();
    if (event != nullptr && !event->isCancelled) return {event->text.json(), event->etag};
    auto body = instance(eventId);
    if (!body) {
        if (event == nullptr) notFound();
        return {event->text.json(), event->etag};  // cancelled, and the series is elsewhere
    }
    const Event* source = event != nullptr ? event : find(textMember(*body, "recurringEventId"));
    if (event != nullptr) (*body)["status"] = "cancelled";
    return {std::move(*body), source->etag};
}

EventText Calendar::get(const std::string& eventId, bool showDeleted) const {
    const Event* event = find(eventId);
    if (event != nullptr) {
        if (event->isDeleted && !showDeleted) gone();
        return event->text;
    }
    const auto body = instance(eventId);
    if (!body) notFound();
    return EventText(*body);
}

const Event& Calendar::insert(const Json& sent, const WriteOptions& options) {
    Json body = sent;
    dropNulls(body);
    const bool namesSeries = body.contains("recurringEventId");
    if (namesSeries != body.contains("originalStartTime")) {
        throw ApiError{400, "invalid", "recurringEventId and originalStartTime belong together.",
                       "recurringEventId"};
    }
    if (namesSeries) {
        const EventTime start = readTime(body.at("originalStartTime"), "originalStartTime");
        if (!start.allDay && !start.offset) {
            throw ApiError{400, "invalid", "Invalid value for: originalStartTime: needs an offset",
                           "originalStartTime"};
        }
        return patch(textMember(body, "recurringEventId") + "_" + compactText(start), sent, options);
    }
    if (body.contains("id")) {
        const Event* known = find(textMember(body, "id"));
        if (!options.isAdmin) checkNewId(textMember(body, "id"));
        if (known != nullptr && !(options.isAdmin && known->isDeleted)) {
            throw ApiError{409, "duplicate", "The requested identifier already exists.", "id"};
        }
    }
    checkEvent(body);
    completeNew(body, options);
    const std::string eventId = textMember(body, "id");
    return store(eventId, std::move(body));
}

// The members that every stored event has, in the order in which a service writes them.
void Calendar::completeNew(Json& body, const WriteOptions& options) {
    const std::uint64_t revision = mRevisions.last() + 1;
    std::array<char, 32> number{};
    std::snprintf(number.data(), number.size(), "ev%010llu", static_cast<unsigned long long>(revision));
    const std::string eventId = body.value("id", std::string(number.data()));
    Json full = {{"kind", "calendar#event"},     {"etag", ""},   {"id", eventId}, {"status", "confirmed"},
                 {"created", stampOf(revision)}, {"updated", ""}};
    const Json owner = {{"email", id}, {"displayName", summary}, {"self", true}};
    for (const auto& [name, value] : body.items()) {
        if (!isOwn(name, options)) full[name] = value;
    }
    for (const char* name : {"creator", "organizer"}) {
        if (!full.contains(name)) full[name] = owner;
    }
    if (!full.contains("iCalUID")) full["iCalUID"] = eventId + "@provider.example";
    full["sequence"] = 0;
    if (!full.contains("reminders")) full["reminders"] = {{"useDefault", true}};
    body = std::move(full);
}

const Event& Calendar::patch(const std::string& eventId, const Json& body, const WriteOptions& options) {
    const Current before = current(eventId);
    checkMatch(options.ifMatch, before.etag);
    Json merged = before.body;
    mergeInto(merged, body);
    return write(eventId, std::move(merged), before.body, options);
}

const Event& Calendar::replace(const std::string& eventId, const Json& body, const WriteOptions& options) {
    const Current before = current(eventId);
    checkMatch(options.ifMatch, before.etag);
    Json full = before.body;
    // The provider's own members come first, as in every other reply.
    for (const auto& [name, value] : before.body.items()) {
        if (!isOwn(name, options) && name != "sequence") full.erase(name);
    }
    mergeInto(full, body);
    if (!full.contains("status")) full["status"] = "confirmed";
    return write(eventId, std::move(full), before.body, options);
}

const Event& Calendar::write(const std::string& eventId, Json body, const Json& before,
                             const WriteOptions& options) {
    for (const OwnMember& row : kOwnMembers) {
        if (isOwn(row.name, options)) keepMember(body, before, std::string(row.name));
    }
    for (const char* name : kInstanceMembers) keepMember(body, before, name);
    body["id"] = eventId;
    checkEvent(body);
    if (textMember(body, "status") == "cancelled") {
        cancel(eventId, body);
        return *find(eventId);
    }
    const bool isMoved = std::any_of(std::begin(kSequenceMembers), std::end(kSequenceMembers),
                                     [&](const char* name) { return differs(body, before, name); });
    const auto sequence = before.find("sequence");
    const bool hasSequence = sequence != before.end() && sequence->is_number_integer();
    body["sequence"] = (hasSequence ? sequence->get<int>() : 0) + (isMoved ? 1 : 0);
    return store(eventId, std::move(body));
}

void Calendar::remove(const std::string& eventId, const WriteOptions& options) {
    const Current before = current(eventId);
    checkMatch(options.ifMatch, before.etag);
    const Event* event = find(eventId);
    if (event != nullptr && event->isCancelled) gone();
    cancel(eventId, before.body);
}

// An instance stays listed as cancelled; anything else leaves the list, a series together with its instances.
void Calendar::cancel(const std::string& eventId, const Json& body) {
    if (body.contains("recurringEventId")) {
        store(eventId, cancelledItem(body));
        return;
    }
    const bool isSeries = find(eventId) != nullptr && find(eventId)->isSeries;
    putDeleted(eventId);
    if (!isSeries) return;
    for (const auto& event : mEvents) {
        if (event->series == eventId && !event->isDeleted) putDeleted(event->id);
    }
}

void Calendar::putDeleted(const std::string& eventId) {
    Json item;
    item["id"] = eventId;
    item = cancelledItem(item);
    Event& event = place(eventId);
    event.etag = etagOf(mRevisions.next());
    item["etag"] = event.etag;
    event.text = EventText(item);
    event.isDeleted = true;
    event.isSeries = event.isCancelled = false;
    updated = stampOf(mRevisions.last());
}

const Event& Calendar::store(const std::string& eventId, Json body) {
    const std::uint64_t revision = mRevisions.next();
    body["etag"] = etagOf(revision);
    if (body.contains("updated")) body["updated"] = stampOf(revision);
    updated = stampOf(revision);
    return put(eventId, body);
}

const Event& Calendar::put(const std::string& eventId, const Json& body) {
    Event& event = place(eventId);
    event.text = EventText(body);
    event.etag = textMember(body, "etag");
    event.series = textMember(body, "recurringEventId");
    event.isDeleted = false;
    event.isCancelled = !event.series.empty() && textMember(body, "status") == "cancelled";
    event.isSeries = repeats(body);
    return event;
}

Event& Calendar::place(const std::string& eventId) {
    Event*& event = mById[eventId];
    if (event == nullptr) {
        mEvents.push_back(std::make_unique<Event>());
        event = mEvents.back().get();
        event->id = eventId;
    }
    return *event;
}

}  // namespace provider
