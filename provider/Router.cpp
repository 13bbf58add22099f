#include "Router.h"

#include <utility>

namespace provider {

namespace {

bool matches(const std::vector<std::string>& pattern, const std::vector<std::string>& path) {
    if (pattern.size() != path.size()) return false;
    for (std::size_t i = 0; i < pattern.size(); ++i) {
        const bool same = pattern[i] == "*" ? !path[i].empty() : pattern[i] == path[i];
        if (!same) return false;
    }
    return true;
}

}  // namespace

void Router::add(const std::string& method, const std::string& pattern, Access access,
                 std::function<Reply(const Call&)> handler) {
    mRoutes.push_back({method, pattern, access, std::move(handler), splitText(pattern, '/')});
}

const Route& Router::find(const std::string& method, const std::string& path,
                          std::vector<std::string>& ids) const {
    const std::vector<std::string> segments = splitText(path, '/');
    bool known = false;
    for (const Route& route : mRoutes) {
        if (!matches(route.segments, segments)) continue;
        known = true;
        if (route.method != method) continue;
        ids.clear();
        for (std::size_t i = 0; i < segments.size(); ++i) {
            if (route.segments[i] == "*") ids.push_back(decodeSegment(segments[i]));
        }
        return route;
    }
    if (known) throw ApiError{405, "httpMethodNotAllowed", "Method not allowed: " + method, ""};
    throw ApiError{404, "notFound", "Not Found", ""};
}

}  // namespace provider
