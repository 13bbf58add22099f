// ContentLine.h: the content line that iCalendar and vCard share: GROUP.NAME;PARAMETER=VALUE:VALUE. Pure functions.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace exchange {

struct Parameter {
    std::string name;  // in capitals
    std::vector<std::string> values;
};

struct ContentLine {
    std::string group;
    std::string name;  // in capitals
    std::vector<Parameter> parameters;
    std::string value;  // as it stands in the file, still escaped

    // The first value, "" when there is none.
    [[nodiscard]] std::string parameter(std::string_view wanted) const;
};

namespace content_line {

// An unfolded line; nothing when it is none. Words without a name are types or encodings, as older cards have them.
std::optional<ContentLine> parse(std::string_view text);
// Folded, with its line end.
std::string compose(const ContentLine& line);

std::string upper(std::string_view text);
std::string lower(std::string_view text);
bool isName(std::string_view text);

// A line break is written as "\n"; other control characters have no spelling and are left out.
std::string escape(std::string_view text);
std::string unescape(std::string_view value);
// The raw parts between separators that are not escaped.
std::vector<std::string_view> split(std::string_view value, char separator);
// Whether escape() leaves something out.
bool losesControls(std::string_view text);

}  // namespace content_line

}  // namespace exchange
