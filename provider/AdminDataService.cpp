#include "ListPart.h"
#include "Seed.h"
#include "Services.h"

namespace provider {

namespace {

WriteOptions adminWrite(const Call& call) {
    return {call.header("If-Match"), true};
}

Reply eventReply(const EventText& text) {
    Reply reply;
    reply.body = text.text();
    return reply;
}

bool isRaw(const Call& call) {
    return call.param("raw") == "true";
}

std::string textOf(const Event& event, std::string_view name) {
    const Json value = event.text.member(name);
    return value.is_string() ? value.get<std::string>() : "";
}

// When the event is, or would be when it was cancelled; empty for one that no check has seen.
std::string timeOf(const Event& event) {
    for (const char* name : {"start", "originalStartTime"}) {
        const Json value = event.text.member(name);
        if (value.is_null()) continue;
        try {
            return formatDateTime(readTime(value, name).utc(), 0);
        } catch (const ApiError&) {
            return "";
        }
    }
    return "";
}

using Titles = std::map<std::string, std::string>;

// Titles of the series by id: a cancelled instance has none of its own.
Titles seriesTitles(const Calendar& calendar) {
    Titles titles;
    for (const auto& event : calendar.events()) {
        if (event->isSeries && !event->isDeleted) titles[event->id] = textOf(*event, "summary");
    }
    return titles;
}

Reply eventsPart(const Call& call, const Calendar& calendar) {
    const auto& events = calendar.events();
    const Titles titles = seriesTitles(calendar);
    const auto title = [&titles](const std::string& series) {
        const auto found = titles.find(series);
        return found == titles.end() ? std::string() : found->second;
    };
    const auto words = [&](std::size_t i) {
        std::string out = title(events[i]->series);
        for (const char* name : {"summary", "location", "description"})
            out += "\n" + textOf(*events[i], name);
        return out;
    };
    const ListPart part = partOf(call, {events.size(), [&](std::size_t i) { return !events[i]->isDeleted; },
                                        [&](std::size_t i) { return events[i]->etag; },
                                        [&](std::size_t i) { return timeOf(*events[i]); }, words});
    Json series = Json::object();
    for (const std::size_t i : part.indexes) {
        if (!events[i]->series.empty()) series[events[i]->series] = title(events[i]->series);
    }
    Reply reply = partReply(part, [&](std::size_t i) { return events[i]->text.json(); });
    reply.body.insert(1, "\"series\":" + series.dump(-1, ' ', false, Json::error_handler_t::replace) + ",");
    return reply;
}

}  // namespace

void AdminDataService::addRoutes(Router& router) {
    addAccountRoutes(router);
    addCalendarRoutes(router);
    addEventRoutes(router);
    router.add("POST", "/admin/seed", Access::kAdmin, [this](const Call& call) { return seed(call); });
    router.add("GET", "/admin/dump", Access::kAdmin, [this](const Call&) {
        const auto lock = mContext.store.guard();
        return jsonReply(mContext.store.dump());
    });
}

Json AdminDataService::accountJson(const Account& account) const {
    Json calendars = Json::array();
    for (const CalendarEntry& entry : account.calendars) {
        calendars.push_back(mContext.store.calendarEntry(account, entry));
    }
    return {{"email", account.email},
            {"name", account.name},
            {"refreshToken", account.refreshToken},
            {"calendars", calendars}};
}

void AdminDataService::addAccountRoutes(Router& router) {
    router.add("GET", "/admin/accounts", Access::kAdmin, [this](const Call&) {
        const auto lock = mContext.store.guard();
        Json body;
        body["accounts"] = Json::array();
        for (const auto& [email, account] : mContext.store.accounts()) {
            body["accounts"].push_back(accountJson(account));
        }
        return jsonReply(body);
    });
    router.add("POST", "/admin/accounts", Access::kAdmin, [this](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        return jsonReply(accountJson(mContext.store.addAccount(textOf(body, "email"), textOf(body, "name"))));
    });
    router.add("GET", "/admin/accounts/*", Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        return jsonReply(accountJson(mContext.store.account(call.ids[0])));
    });
    router.add("DELETE", "/admin/accounts/*", Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        mContext.store.removeAccount(call.ids[0]);
        mContext.tokens.expire(call.ids[0]);
        return done();
    });
}

void AdminDataService::addCalendarRoutes(Router& router) {
    const std::string calendars = "/admin/accounts/*/calendars";
    const auto entry = [this](Account& account, const std::string& calendarId) {
        return jsonReply(mContext.store.calendarEntry(account, *account.find(calendarId)));
    };
    router.add("GET", calendars, Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        Json body;
        body["calendars"] = accountJson(mContext.store.account(call.ids[0])).at("calendars");
        return jsonReply(body);
    });
    router.add("POST", calendars, Access::kAdmin, [this, entry](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        Account& account = mContext.store.account(call.ids[0]);
        return entry(account, mContext.store.addCalendar(account, body).id);
    });
    router.add("POST", calendars + "/share", Access::kAdmin, [this, entry](const Call& call) {
        const Json body = jsonBody(call);
        const std::string role = textOf(body, "accessRole");
        const auto lock = mContext.store.guard();
        Account& account = mContext.store.account(call.ids[0]);
        mContext.store.share(account, textOf(body, "id"), role.empty() ? "writer" : role);
        return entry(account, textOf(body, "id"));
    });
    router.add("PATCH", calendars + "/*", Access::kAdmin, [this, entry](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        Account& account = mContext.store.account(call.ids[0]);
        mContext.store.changeCalendar(account, call.ids[1], body);
        return entry(account, call.ids[1]);
    });
    router.add("DELETE", calendars + "/*", Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        mContext.store.removeCalendar(mContext.store.account(call.ids[0]), call.ids[1]);
        return done();
    });
}

// An event that no check has seen, for tests of clients.
Reply AdminDataService::putRaw(const Call& call, const std::string& eventId, const Json& body) {
    if (eventId.empty()) throw ApiError{400, "required", "Required: id", "id"};
    return eventReply(mContext.store.calendar(call.ids[0]).put(eventId, body).text);
}

void AdminDataService::addEventRoutes(Router& router) {
    const std::string events = "/admin/calendars/*/events";
    router.add("GET", events, Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        const Calendar& calendar = mContext.store.calendar(call.ids[0]);
        if (asksForPart(call)) return eventsPart(call, calendar);
        Reply reply;
        reply.body = "{\"items\":[";
        bool first = true;
        for (const auto& event : calendar.events()) {
            if (event->isDeleted) continue;
            if (!first) reply.body += ',';
            first = false;
            reply.body += event->text.text();
        }
        reply.body += "]}";
        return reply;
    });
    router.add("POST", events, Access::kAdmin, [this](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        if (isRaw(call)) return putRaw(call, call.param("id", textOf(body, "id")), body);
        return eventReply(mContext.store.calendar(call.ids[0]).insert(body, adminWrite(call)).text);
    });
    router.add("GET", events + "/*", Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        return eventReply(mContext.store.calendar(call.ids[0]).get(call.ids[1], false));
    });
    router.add("PATCH", events + "/*", Access::kAdmin, [this](const Call& call) {
        const Json body = jsonBody(call);
        const auto lock = mContext.store.guard();
        if (isRaw(call)) return putRaw(call, call.ids[1], body);
        return eventReply(
            mContext.store.calendar(call.ids[0]).patch(call.ids[1], body, adminWrite(call)).text);
    });
    router.add("DELETE", events + "/*", Access::kAdmin, [this](const Call& call) {
        const auto lock = mContext.store.guard();
        mContext.store.calendar(call.ids[0]).remove(call.ids[1], adminWrite(call));
        return done();
    });
}

Reply AdminDataService::seed(const Call& call) {
    const Json body = jsonBody(call);
    const auto count = body.find("events");
    if (count == body.end() || !count->is_number_unsigned()) {
        invalid("events");
    }
    const auto lock = mContext.store.guard();
    std::string calendarId = textOf(body, "calendarId");
    if (calendarId.empty()) {
        const auto& accounts = mContext.store.accounts();
        if (accounts.empty() || accounts.begin()->second.calendars.empty()) {
            throw ApiError{400, "required", "Required: calendarId", "calendarId"};
        }
        calendarId = accounts.begin()->second.calendars.front().calendarId;
    }
    addBulkEvents(mContext.store.calendar(calendarId), count->get<std::size_t>());
    return jsonReply({{"calendarId", calendarId}, {"events", *count}});
}

}  // namespace provider
