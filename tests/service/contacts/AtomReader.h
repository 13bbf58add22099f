// An Atom entry in the JSON rendering that the contacts feed has, so that what goes up can be compared with what came down.
#pragma once

#include <nlohmann/json.hpp>
#include <string>

using Json = nlohmann::json;

// Elements that may stand several times become arrays. Null when the text is not well-formed.
Json readAtom(const std::string& xml);
