// Router: which handler serves a method and a path. Services put their routes in before the server starts;
// afterwards it is read only, from any thread.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "Http.h"

namespace provider {

enum class Access {
    kOpen,   // the token endpoint
    kToken,  // needs a valid access token
    kAdmin,  // test and demo control, and the page for it; no latency, no faults, not counted
};

struct Route {
    std::string method;
    std::string pattern;  // "/calendar/v3/calendars/*/events"; also the name under which requests are counted
    Access access = Access::kToken;
    std::function<Reply(const Call&)> handler;
    std::vector<std::string> segments;  // of pattern
};

class Router {
public:
    void add(const std::string& method, const std::string& pattern, Access access,
             std::function<Reply(const Call&)> handler);
    // Fills ids. Throws 404 for an unknown path, 405 for a known one with another method.
    const Route& find(const std::string& method, const std::string& path,
                      std::vector<std::string>& ids) const;

private:
    std::vector<Route> mRoutes;
};

// Service: one group of routes, one file. It outlives the server.
class Service {
public:
    virtual ~Service() = default;
    virtual void addRoutes(Router& router) = 0;
};

}  // namespace provider
