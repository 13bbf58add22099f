// What the tool must print for a contact of the provider: an independent reading of the wire, lossy rows included.
#pragma once

#include <map>
#include <nlohmann/json.hpp>
#include <string>

using Json = nlohmann::json;

// `wire` is an entry as the provider keeps it; `groups` maps the server's ids of groups to their names. Without the photo.
Json expectedContact(const Json& wire, const std::map<std::string, std::string>& groups);
// The comparable fields of a contact as the tool lists it; `groups` maps local ids to names. Without the photo.
Json comparableContact(Json listed, const std::map<int, std::string>& groups);
