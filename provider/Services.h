// Services: the groups of routes of this provider. A further one is a file, a class here and a line in
// makeServices.
#pragma once

#include <memory>
#include <vector>

#include "Context.h"
#include "Router.h"

namespace provider {

// POST /o/oauth2/token: the refresh-token grant.
class TokenService : public Service {
public:
    explicit TokenService(Context& context) : mContext(context) {}
    void addRoutes(Router& router) override;

private:
    Reply grant(const Call& call);
    Context& mContext;
};

// /calendar/v3: calendar list and events.
class CalendarService : public Service {
public:
    explicit CalendarService(Context& context) : mContext(context) {}
    void addRoutes(Router& router) override;

private:
    enum class Need { kRead, kWrite };
    // The account's calendar that the call's first id names; the store is guarded by the caller.
    Calendar& calendar(const Call& call, Need need);
    Reply listCalendars(const Call& call);
    Reply listEvents(const Call& call);
    Reply getEvent(const Call& call);
    Reply insertEvent(const Call& call);
    Reply patchEvent(const Call& call);
    Reply replaceEvent(const Call& call);
    Reply deleteEvent(const Call& call);
    Context& mContext;
};

// /tasks: task lists and tasks.
class TaskService : public Service {
public:
    explicit TaskService(Context& context) : mContext(context) {}
    void addRoutes(Router& router) override;

private:
    Reply listLists(const Call& call);
    Reply listTasks(const Call& call);
    Reply getTask(const Call& call);
    Reply insertTask(const Call& call);
    Reply patchTask(const Call& call);
    Reply deleteTask(const Call& call);
    Context& mContext;
};

// /m8/feeds: contacts, their groups and photos.
class ContactService : public Service {
public:
    explicit ContactService(Context& context) : mContext(context) {}
    void addRoutes(Router& router) override;

private:
    void addFeedRoutes(Router& router, FeedKind kind);
    Reply list(const Call& call, FeedKind kind);
    Reply get(const Call& call, FeedKind kind);
    Reply insert(const Call& call, FeedKind kind);
    Reply replace(const Call& call, FeedKind kind);
    Reply remove(const Call& call, FeedKind kind);
    Reply getPhoto(const Call& call);
    Reply putPhoto(const Call& call);
    Reply deletePhoto(const Call& call);
    Context& mContext;
};

// /orbit and /img: profiles that people show to everybody.
class PeopleService : public Service {
public:
    explicit PeopleService(Context& context) : mContext(context) {}
    void addRoutes(Router& router) override;

private:
    Reply profile(const Call& call);
    Reply image(const Call& call);
    Context& mContext;
};

// /admin: the content, for tests and people.
class AdminDataService : public Service {
public:
    explicit AdminDataService(Context& context) : mContext(context) {}
    void addRoutes(Router& router) override;

private:
    void addAccountRoutes(Router& router);
    void addCalendarRoutes(Router& router);
    void addEventRoutes(Router& router);
    [[nodiscard]] Json accountJson(const Account& account) const;
    Reply putRaw(const Call& call, const std::string& eventId, const Json& body);
    Reply seed(const Call& call);
    Context& mContext;
};

// /admin: task lists and tasks.
class AdminTaskService : public Service {
public:
    explicit AdminTaskService(Context& context) : mContext(context) {}
    void addRoutes(Router& router) override;

private:
    void addTaskRoutes(Router& router, const std::string& tasks);
    Context& mContext;
};

// /admin: contacts, groups, photos and people.
class AdminContactService : public Service {
public:
    explicit AdminContactService(Context& context) : mContext(context) {}
    void addRoutes(Router& router) override;

private:
    void addFeedRoutes(Router& router, FeedKind kind, const std::string& feed);
    void addPhotoRoutes(Router& router, const std::string& photo);
    void addPeopleRoutes(Router& router);
    Context& mContext;
};

// / and /page: the page in which people look at the content and change it.
class PageService : public Service {
public:
    void addRoutes(Router& router) override;
};

// /admin: requests, news, tokens, faults and holds.
class AdminControlService : public Service {
public:
    explicit AdminControlService(Context& context) : mContext(context) {}
    void addRoutes(Router& router) override;

private:
    Reply held(const Call& call);
    Context& mContext;
};

std::vector<std::unique_ptr<Service>> makeServices(Context& context);

}  // namespace provider
