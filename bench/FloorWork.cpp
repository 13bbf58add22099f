#include "FloorWork.h"

namespace bench {

namespace {

JsonObject* rootOf(const JsonNodePtr& node) {
    return json_node_get_object(node.get());
}

JsonArray* arrayOf(JsonObject* object, const char* member) {
    return json_object_has_member(object, member) != FALSE ? json_object_get_array_member(object, member)
                                                           : nullptr;
}

JsonObject* objectOf(JsonObject* object, const char* member) {
    return object != nullptr && json_object_has_member(object, member) != FALSE
               ? json_object_get_object_member(object, member)
               : nullptr;
}

template <class Use>
void forEach(JsonArray* items, Use use) {
    for (guint i = 0; items != nullptr && i < json_array_get_length(items); ++i)
        use(json_array_get_object_element(items, i));
}

FloorItem eventOf(JsonObject* event) {
    return {textOf(event, "id"),
            textOf(event, "etag"),
            {textOf(event, "summary"), textOf(event, "description"), textOf(event, "location"),
             textOf(objectOf(event, "start"), "dateTime"), textOf(objectOf(event, "end"), "dateTime")}};
}

FloorItem taskOf(JsonObject* task) {
    return {textOf(task, "id"),
            textOf(task, "etag"),
            {textOf(task, "title"), textOf(task, "notes"), textOf(task, "status"), textOf(task, "due"), ""}};
}

std::string firstOf(JsonObject* entry, const char* member, const char* text) {
    JsonArray* list = arrayOf(entry, member);
    return list != nullptr && json_array_get_length(list) > 0
               ? textOf(json_array_get_object_element(list, 0), text)
               : "";
}

FloorItem entryOf(JsonObject* entry) {
    JsonObject* name = objectOf(entry, "gd$name");
    return {textOf(objectOf(entry, "id"), "$t"),
            textOf(entry, "gd$etag"),
            {textOf(objectOf(name, "gd$givenName"), "$t"), textOf(objectOf(entry, "content"), "$t"),
             textOf(objectOf(name, "gd$familyName"), "$t"), firstOf(entry, "gd$email", "address"),
             firstOf(entry, "gd$phoneNumber", "$t")}};
}

std::string withToken(const std::string& path, const std::string& token) {
    return token.empty() ? path : path + "&pageToken=" + token;
}

}  // namespace

void FloorWork::sync(const std::string& kind) {
    mKnown = mStore.etags();
    if (kind == "calendar") {
        syncCalendars();
        syncTasks();
    } else {
        syncFeed("/m8/feeds/groups/default/full?alt=json");
        syncFeed("/m8/feeds/contacts/default/full?alt=json");
    }
}

std::vector<FloorItem> FloorWork::changed(JsonArray* items, Take take) const {
    std::vector<FloorItem> result;
    forEach(items, [&](JsonObject* object) {
        FloorItem item = take(object);
        const auto known = mKnown.find(item.uid);
        if (known == mKnown.end() || known->second != item.etag) result.push_back(std::move(item));
    });
    return result;
}

void FloorWork::write(const std::vector<FloorItem>& items) {
    mWritten += static_cast<long>(items.size());
    mStore.write(items);
}

void FloorWork::syncCalendars() {
    const JsonNodePtr calendars = mHttp.get("/calendar/v3/users/me/calendarList?maxResults=100000000");
    forEach(arrayOf(rootOf(calendars), "items"), [&](JsonObject* calendar) {
        const std::string path = "/calendar/v3/calendars/" + textOf(calendar, "id") + "/events?maxResults=50";
        std::string token;
        do {
            const JsonNodePtr page = mHttp.get(withToken(path, token));
            write(changed(arrayOf(rootOf(page), "items"), eventOf));
            token = textOf(rootOf(page), "nextPageToken");
        } while (!token.empty());
    });
}

void FloorWork::syncTasks() {
    const JsonNodePtr lists = mHttp.get("/tasks/v1/users/@me/lists");
    forEach(arrayOf(rootOf(lists), "items"), [&](JsonObject* list) {
        const std::string tasks = "/tasks/v1/lists/" + textOf(list, "id") + "/tasks";
        const std::string path = tasks + "?fields=items(etag%2Cid%2Ctitle)%2CnextPageToken&maxResults=50";
        std::string token;
        do {
            const JsonNodePtr page = mHttp.get(withToken(path, token));
            std::vector<FloorItem> items = changed(arrayOf(rootOf(page), "items"), taskOf);
            for (FloorItem& item : items) item = taskOf(rootOf(mHttp.get(tasks + "/" + item.uid)));
            write(items);
            token = textOf(rootOf(page), "nextPageToken");
        } while (!token.empty());
    });
}

void FloorWork::syncFeed(const std::string& path) {
    std::string next = path;
    while (!next.empty()) {
        const JsonNodePtr page = mHttp.get(next);
        JsonObject* feed = objectOf(rootOf(page), "feed");
        write(changed(arrayOf(feed, "entry"), entryOf));
        next.clear();
        forEach(arrayOf(feed, "link"), [&next](JsonObject* link) {
            if (textOf(link, "rel") == "next") next = textOf(link, "href");
        });
    }
}

void FloorWork::upload(int count) {
    for (int i = 0; i < count; ++i) {
        const std::string number = std::to_string(i);
        const std::string body =
            R"({"summary":"Uploaded )" + number +
            R"(","description":"Made on the device","location":"Room 2",)"
            R"("start":{"dateTime":"2026-06-01T10:00:00Z"},"end":{"dateTime":"2026-06-01T11:00:00Z"}})";
        const JsonNodePtr reply = mHttp.post("/calendar/v3/calendars/bench@provider.example/events", body);
        mStore.writeRow({textOf(rootOf(reply), "id"), textOf(rootOf(reply), "etag"), {}});
        ++mWritten;
    }
}

}  // namespace bench
