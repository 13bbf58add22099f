// Calendar: the events of one calendar and what may be done to them. Instances of a series exist as soon as they
// are asked for; they become events of their own when they are changed or cancelled.
// Owner: Store, whose mutex guards it. Errors: ApiError; nothing has changed then.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <unordered_map>
#include <vector>

#include "EventText.h"
#include "Revisions.h"
#include "Times.h"

namespace provider {

// How a write is made.
struct WriteOptions {
    std::string ifMatch;   // etag that the event must have; empty: any
    bool isAdmin = false;  // may also set creator and organizer, and ids of any form
};

struct Event {
    std::string id;
    std::string etag;
    std::string series;  // id of the series when this is a changed or cancelled instance
    EventText text;
    bool isDeleted = false;
    bool isCancelled = false;  // a cancelled instance, which is still listed
    bool isSeries = false;
};

class Calendar {
public:
    Calendar(std::string calendarId, Revisions& revisions)
        : id(std::move(calendarId)), mRevisions(revisions) {}

    const std::string id;
    std::string summary;
    std::string description;
    std::string timeZone = "UTC";
    std::string backgroundColor = "#9fe1e7";
    std::string etag;     // of the calendar's own members
    std::string updated;  // of the calendar or any of its events

    // Adds an event (or changes the instance that the body names by series and original start).
    const Event& insert(const Json& body, const WriteOptions& options = {});
    // Merges the body into the event; null removes a member.
    const Event& patch(const std::string& eventId, const Json& body, const WriteOptions& options = {});
    const Event& replace(const std::string& eventId, const Json& body, const WriteOptions& options = {});
    void remove(const std::string& eventId, const WriteOptions& options = {});
    // The event or instance; a deleted one only when asked for.
    [[nodiscard]] EventText get(const std::string& eventId, bool showDeleted) const;

    // For control and loading: stores the object as it is, unchecked, under this id.
    const Event& put(const std::string& eventId, const Json& body);
    void putDeleted(const std::string& eventId);

    // Events in order of creation, deleted ones included; a place never changes.
    [[nodiscard]] const std::vector<std::unique_ptr<Event>>& events() const { return mEvents; }

private:
    // An event that may be changed: stored, or an instance that still follows its series.
    struct Current {
        Json body;
        std::string etag;
    };
    [[nodiscard]] Event* find(const std::string& eventId) const;
    [[nodiscard]] Current current(const std::string& eventId) const;
    [[nodiscard]] std::optional<Json> instance(const std::string& eventId) const;
    const Event& write(const std::string& eventId, Json body, const Json& before,
                       const WriteOptions& options);
    const Event& store(const std::string& eventId, Json body);
    void cancel(const std::string& eventId, const Json& body);
    void completeNew(Json& body, const WriteOptions& options);
    Event& place(const std::string& eventId);

    std::vector<std::unique_ptr<Event>> mEvents;
    std::unordered_map<std::string, Event*> mById;
    Revisions& mRevisions;
};

}  // namespace provider
