// FloorWork: the requests of a sync and what must be kept of their answers, and nothing else.
#pragma once

#include "FloorHttp.h"
#include "FloorStore.h"

namespace bench {

class FloorWork {
public:
    FloorWork(FloorHttp* http, FloorStore* store) : mHttp(*http), mStore(*store) {}

    // Everything that the kind ("calendar" or "contacts") has: what is known with the same etag is left, the rest is written.
    void sync(const std::string& kind);
    // `count` new events, one after the other.
    void upload(int count);
    [[nodiscard]] long written() const { return mWritten; }

private:
    using Take = FloorItem (*)(JsonObject*);
    void syncCalendars();
    void syncTasks();
    void syncFeed(const std::string& path);
    // The items of one page that are to be written; an item without an etag of its own is skipped.
    std::vector<FloorItem> changed(JsonArray* items, Take take) const;
    void write(const std::vector<FloorItem>& items);

    FloorHttp& mHttp;
    FloorStore& mStore;
    std::unordered_map<std::string, std::string> mKnown;
    long mWritten = 0;
};

}  // namespace bench
