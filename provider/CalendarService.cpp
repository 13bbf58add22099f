#include <algorithm>

#include "Paging.h"
#include "Services.h"

namespace provider {

namespace {

constexpr long long kDefaultCalendars = 100;
constexpr long long kMaxCalendars = 250;
constexpr long long kDefaultEvents = 250;
constexpr long long kMaxEvents = 2500;

bool flag(const Call& call, const char* name) {
    const std::string text = call.param(name, "false");
    if (text != "true" && text != "false") {
        throw ApiError{400, "invalidParameter", std::string("Invalid boolean value: '") + text + "'.", name};
    }
    return text == "true";
}

Reply textReply(const EventText& text, const Fields& fields) {
    Reply reply;
    text.append(reply.body, fields);
    return reply;
}

// The members around the items, in front of which the list is put by hand.
std::string openList(const Json& head, const Fields& fields) {
    std::string text = fields.apply(head).dump(-1, ' ', false, Json::error_handler_t::replace);
    text.pop_back();
    if (fields.below("items") == nullptr) return text;
    return text + (text.size() > 1 ? ",\"items\":[" : "\"items\":[");
}

}  // namespace

void CalendarService::addRoutes(Router& router) {
    const std::string events = "/calendar/v3/calendars/*/events";
    const auto add = [&](const char* method, const std::string& pattern,
                         Reply (CalendarService::*serve)(const Call&)) {
        router.add(method, pattern, Access::kToken,
                   [this, serve](const Call& call) { return (this->*serve)(call); });
    };
    add("GET", "/calendar/v3/users/me/calendarList", &CalendarService::listCalendars);
    add("GET", events, &CalendarService::listEvents);
    add("POST", events, &CalendarService::insertEvent);
    add("GET", events + "/*", &CalendarService::getEvent);
    add("PATCH", events + "/*", &CalendarService::patchEvent);
    add("PUT", events + "/*", &CalendarService::replaceEvent);
    add("DELETE", events + "/*", &CalendarService::deleteEvent);
}

Calendar& CalendarService::calendar(const Call& call, Need need) {
    const std::string& calendarId = call.ids[0] == "primary" ? call.account : call.ids[0];
    const CalendarEntry* entry = mContext.store.account(call.account).find(calendarId);
    if (entry == nullptr) throw ApiError{404, "notFound", "Not Found", ""};
    if (need == Need::kWrite && entry->accessRole == "reader") {
        throw ApiError{403, "requiredAccessLevel", "You need to have writer access to this calendar.", ""};
    }
    return mContext.store.calendar(calendarId);
}

Reply CalendarService::listCalendars(const Call& call) {
    call.allowOnly({"maxResults", "pageToken", "fields", "showHidden", "showDeleted"});
    const Fields fields = Fields::parse(call.param("fields"));
    fields.allowOnly({"kind", "etag", "nextPageToken", "nextSyncToken", "items"});
    const auto max =
        static_cast<std::size_t>(std::min(call.number("maxResults", kDefaultCalendars, 1), kMaxCalendars));
    const std::size_t first = readPageToken("calendarList " + call.account, call.param("pageToken"));

    const auto lock = mContext.store.guard();
    const Account& account = mContext.store.account(call.account);
    std::string etag = "\"0\"";
    for (const CalendarEntry& entry : account.calendars) etag = std::max(etag, entry.etag);
    Json body = {{"kind", "calendar#calendarList"}, {"etag", etag}};
    const std::size_t end = std::min(first + max, account.calendars.size());
    if (end < account.calendars.size())
        body["nextPageToken"] = pageToken("calendarList " + call.account, end);
    body["items"] = Json::array();
    for (std::size_t i = first; i < end; ++i) {
        body["items"].push_back(mContext.store.calendarEntry(account, account.calendars[i]));
    }
    return jsonReply(fields.apply(body));
}

Reply CalendarService::listEvents(const Call& call) {
    call.allowOnly(
        {"maxResults", "pageToken", "fields", "showDeleted", "maxAttendees", "alwaysIncludeEmail"});
    const Fields fields = Fields::parse(call.param("fields"));
    fields.allowOnly({"kind", "etag", "summary", "description", "updated", "timeZone", "accessRole",
                      "defaultReminders", "nextPageToken", "nextSyncToken", "items"});
    const auto max =
        static_cast<std::size_t>(std::min(call.number("maxResults", kDefaultEvents, 1), kMaxEvents));
    const bool showDeleted = flag(call, "showDeleted");

    const auto lock = mContext.store.guard();
    Calendar& calendar = this->calendar(call, Need::kRead);
    const auto& events = calendar.events();
    const auto isListed = [&](std::size_t i) { return showDeleted || !events[i]->isDeleted; };
    std::size_t at = readPageToken("events " + calendar.id, call.param("pageToken"));
    std::vector<const EventText*> page;
    for (; at < events.size() && page.size() < max; ++at) {
        if (isListed(at)) page.push_back(&events[at]->text);
    }
    while (at < events.size() && !isListed(at)) ++at;

    const Account& account = mContext.store.account(call.account);
    Json head = mContext.store.calendarEntry(account, *account.find(calendar.id));
    Json body = {{"kind", "calendar#events"}, {"etag", "\"" + calendar.updated + "\""}};
    for (const char* name : {"summary", "description", "timeZone", "accessRole", "defaultReminders"}) {
        if (head.contains(name)) body[name] = head.at(name);
    }
    body["updated"] = calendar.updated;
    if (at < events.size()) body["nextPageToken"] = pageToken("events " + calendar.id, at);

    Reply reply;
    reply.body = openList(body, fields);
    const Fields* itemFields = fields.below("items");
    if (itemFields != nullptr) {
        for (std::size_t i = 0; i < page.size(); ++i) {
            if (i > 0) reply.body += ',';
            page[i]->append(reply.body, *itemFields);
        }
        reply.body += ']';
    }
    reply.body += '}';
    return reply;
}

Reply CalendarService::getEvent(const Call& call) {
    call.allowOnly({"fields", "showDeleted", "maxAttendees", "alwaysIncludeEmail", "timeZone"});
    const Fields fields = Fields::parse(call.param("fields"));
    const auto lock = mContext.store.guard();
    return textReply(calendar(call, Need::kRead).get(call.ids[1], flag(call, "showDeleted")), fields);
}

Reply CalendarService::insertEvent(const Call& call) {
    call.allowOnly({"fields", "sendNotifications", "maxAttendees"});
    const Fields fields = Fields::parse(call.param("fields"));
    const Json body = jsonBody(call);
    const auto lock = mContext.store.guard();
    const Event& event = calendar(call, Need::kWrite).insert(body, {call.header("If-Match"), false});
    return textReply(event.text, fields);
}

Reply CalendarService::patchEvent(const Call& call) {
    call.allowOnly({"fields", "sendNotifications", "maxAttendees", "alwaysIncludeEmail"});
    const Fields fields = Fields::parse(call.param("fields"));
    const Json body = jsonBody(call);
    const auto lock = mContext.store.guard();
    const Event& event =
        calendar(call, Need::kWrite).patch(call.ids[1], body, {call.header("If-Match"), false});
    return textReply(event.text, fields);
}

Reply CalendarService::replaceEvent(const Call& call) {
    call.allowOnly({"fields", "sendNotifications", "maxAttendees", "alwaysIncludeEmail"});
    const Fields fields = Fields::parse(call.param("fields"));
    const Json body = jsonBody(call);
    const auto lock = mContext.store.guard();
    const Event& event =
        calendar(call, Need::kWrite).replace(call.ids[1], body, {call.header("If-Match"), false});
    return textReply(event.text, fields);
}

Reply CalendarService::deleteEvent(const Call& call) {
    call.allowOnly({"sendNotifications"});
    const auto lock = mContext.store.guard();
    calendar(call, Need::kWrite).remove(call.ids[1], {call.header("If-Match"), false});
    Reply reply;
    reply.status = 204;
    return reply;
}

}  // namespace provider
