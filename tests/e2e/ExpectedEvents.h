// What the tool must print for an event of the provider: an independent reading of the wire, lossy rows included.
#pragma once

#include <map>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

using Json = nlohmann::json;

// By server id. `wire` holds the calendar's items as the provider keeps them. Cancelled instances become exception dates of
// their series; an instance whose series is not there is left out.
std::map<std::string, Json> expectedEvents(const std::vector<Json>& wire);

// The same of one task.
Json expectedTodo(const Json& wire);
Json comparableTodo(const Json& listed);

// The comparable fields of an event as the tool lists it. `uidOf` maps local ids to server ids.
Json comparable(const Json& listed, const std::map<int, std::string>& uidOf);
