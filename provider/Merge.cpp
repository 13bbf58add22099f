#include "Merge.h"

namespace provider {

void mergeInto(Json& target, const Json& patch) {
    if (!target.is_object()) target = Json::object();
    if (patch.contains("date") && !patch.contains("dateTime")) {
        target.erase("dateTime");
        target.erase("timeZone");
    }
    if (patch.contains("dateTime") && !patch.contains("date")) target.erase("date");
    for (const auto& [name, value] : patch.items()) {
        if (value.is_null()) {
            target.erase(name);
        } else if (value.is_object()) {
            mergeInto(target[name], value);
        } else {
            target[name] = value;
        }
    }
}

void dropNulls(Json& body) {
    Json kept = Json::object();
    mergeInto(kept, body);
    body = std::move(kept);
}

}  // namespace provider
