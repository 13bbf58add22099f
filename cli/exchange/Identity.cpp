#include "exchange/Identity.h"

#include <glib.h>

#include "ContactJson.h"
#include "Handles.h"
#include "exchange/ContentLine.h"
#include "platform/settings.h"

namespace exchange::identity {

namespace {

constexpr const char* kDeviceKey = "db/vantor-pim-sync/device_uid";
constexpr char kApart = '\x1f';

// Without a place to keep it the name is good for this run alone.
const std::string& deviceUid() {
    static const std::string kUid = [] {
        std::string uid;
        if (vconf_get_str(kDeviceKey, &uid) == 0 && !uid.empty()) return uid;
        uid = GChars(g_uuid_string_random()).get();
        static_cast<void>(vconf_set_str(kDeviceKey, uid.c_str()));
        return uid;
    }();
    return kUid;
}

// A file has no place for some control characters; an item is the same without them.
void asFilesHold(Json& value) {
    if (value.is_string()) {
        auto& text = value.get_ref<std::string&>();
        if (content_line::losesControls(text)) text = content_line::unescape(content_line::escape(text));
    } else if (value.is_structured()) {
        for (Json& part : value) asFilesHold(part);
    }
}

constexpr const char* kIds[] = {"id", "calendar", "account", "uid", "originalEvent"};

}  // namespace

std::string sha256(const std::string& bytes) {
    const GChars text(g_compute_checksum_for_data(
        G_CHECKSUM_SHA256, reinterpret_cast<const guchar*>(bytes.data()), bytes.size()));
    return text.get();
}

std::string uidOf(const std::string& kind, int id) {
    std::string hex = sha256(deviceUid() + kApart + kind + kApart + std::to_string(id)).substr(0, 32);
    hex[12] = '8';  // a UUID of a making of its own
    hex[16] = "89ab"[hex[16] % 4];
    for (const size_t at : {8, 13, 18, 23}) hex.insert(at, "-");
    return "urn:uuid:" + hex;
}

std::string digestOf(const Json& item) {
    Json plain = item;
    for (const char* id : kIds) plain.erase(id);
    asFilesHold(plain);
    return sha256(plain.dump(-1, ' ', false, Json::error_handler_t::replace));
}

std::vector<std::string> eventKeys(const Json& event) {
    constexpr size_t kToTheMinute = 16;
    const std::string recurs = event.value("rrule", "").empty() ? "once" : "series";
    return {event.value("summary", "") + kApart + event.value("start", "").substr(0, kToTheMinute) + kApart +
            recurs};
}

std::vector<std::string> todoKeys(const Json& todo) {
    constexpr size_t kToTheDay = 10;
    return {todo.value("summary", "") + kApart + todo.value("due", "").substr(0, kToTheDay)};
}

std::vector<std::string> contactKeys(const Json& contact) {
    std::vector<std::string> keys;
    const std::string name = contact_json::displayNameOf(contact);
    for (const char* list : {"emails", "phones"}) {
        for (const Json& item : contact.value(list, Json::array()))
            keys.push_back(name + kApart + item.value("value", ""));
    }
    if (keys.empty()) keys.push_back(name);
    return keys;
}

}  // namespace exchange::identity
