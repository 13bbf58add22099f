#include "Recurrence.h"

#include <algorithm>
#include <charconv>
#include <set>

#include "Http.h"
#include "Times.h"

namespace provider {

namespace {

enum class Kind { kWord, kNumber, kNumbers, kDays, kUntil };

// One part of a rule: the numbers lie between low and high, also negative where isSigned; never 0 then.
struct RulePart {
    std::string_view name;
    Kind kind;
    std::string_view words;  // allowed words, each in front of a blank
    int low = 0;
    int high = 0;
    bool isSigned = false;
};

constexpr RulePart kRuleParts[] = {
    {"FREQ", Kind::kWord, "DAILY WEEKLY MONTHLY YEARLY ", 0, 0, false},
    {"WKST", Kind::kWord, "MO TU WE TH FR SA SU ", 0, 0, false},
    {"UNTIL", Kind::kUntil, "", 0, 0, false},
    {"COUNT", Kind::kNumber, "", 1, 100000, false},
    {"INTERVAL", Kind::kNumber, "", 1, 100000, false},
    {"BYDAY", Kind::kDays, "", 0, 0, false},
    {"BYMONTHDAY", Kind::kNumbers, "", 1, 31, true},
    {"BYYEARDAY", Kind::kNumbers, "", 1, 366, true},
    {"BYWEEKNO", Kind::kNumbers, "", 1, 53, true},
    {"BYMONTH", Kind::kNumbers, "", 1, 12, false},
    {"BYSETPOS", Kind::kNumbers, "", 1, 366, true},
    {"BYHOUR", Kind::kNumbers, "", 0, 23, false},
    {"BYMINUTE", Kind::kNumbers, "", 0, 59, false},
    {"BYSECOND", Kind::kNumbers, "", 0, 59, false},
};

bool isWord(std::string_view value, std::string_view words) {
    return !value.empty() && value.find(' ') == std::string_view::npos &&
           (" " + std::string(words)).find(" " + std::string(value) + " ") != std::string::npos;
}

bool isNumber(std::string_view value, int low, int high, bool isSigned) {
    if (value.starts_with('+')) {
        value.remove_prefix(1);
        if (!isSigned || value.starts_with('-')) return false;
    }
    int number = 0;
    const auto [end, error] = std::from_chars(value.data(), value.data() + value.size(), number);
    if (error != std::errc() || end != value.data() + value.size()) return false;
    // Not by its absolute value: the least number has none.
    return (number >= low && number <= high) || (isSigned && number >= -high && number <= -low);
}

bool isDay(std::string_view value) {
    if (value.size() < 2) return false;
    const std::string_view prefix = value.substr(0, value.size() - 2);
    return isWord(value.substr(prefix.size()), "MO TU WE TH FR SA SU ") &&
           (prefix.empty() || isNumber(prefix, 1, 53, true));
}

bool isGood(const RulePart& part, std::string_view value) {
    const auto each = [&](const auto& test) {
        const auto values = splitText(value, ',');
        return std::all_of(values.begin(), values.end(), test);
    };
    switch (part.kind) {
        case Kind::kWord:
            return isWord(value, part.words);
        case Kind::kNumber:
            return isNumber(value, part.low, part.high, part.isSigned);
        case Kind::kNumbers:
            return each(
                [&](const std::string& v) { return isNumber(v, part.low, part.high, part.isSigned); });
        case Kind::kDays:
            return each([](const std::string& v) { return isDay(v); });
        case Kind::kUntil:
            return parseCompact(value).has_value();
    }
    return false;
}

std::string ruleFault(std::string_view rule) {
    std::set<std::string> seen;
    for (const std::string& text : splitText(rule, ';')) {
        const std::size_t equals = text.find('=');
        const std::string name = text.substr(0, equals);
        const auto part = std::find_if(std::begin(kRuleParts), std::end(kRuleParts),
                                       [&](const RulePart& row) { return row.name == name; });
        if (equals == std::string::npos || part == std::end(kRuleParts))
            return "unknown rule part '" + text + "'";
        if (!isGood(*part, std::string_view(text).substr(equals + 1))) return "bad rule part '" + text + "'";
        if (!seen.insert(name).second) return "repeated rule part '" + name + "'";
    }
    if (seen.count("FREQ") == 0) return "a rule needs FREQ";
    if (seen.count("COUNT") + seen.count("UNTIL") == 2) return "COUNT and UNTIL exclude each other";
    return "";
}

// The parameters and values of RDATE and EXDATE: ";VALUE=DATE:20260501,20260508" or ";TZID=Zone:20260501T090000".
std::string datesFault(std::string_view rest) {
    const std::size_t colon = rest.find(':');
    if (colon == std::string_view::npos) return "dates need a ':'";
    bool isLocal = false;
    if (colon > 0) {
        for (const std::string& parameter : splitText(rest.substr(1, colon - 1), ';')) {
            const bool isZone = parameter.starts_with("TZID=") && isTimeZone(parameter.substr(5));
            if (!isZone && parameter != "VALUE=DATE" && parameter != "VALUE=DATE-TIME") {
                return "bad parameter '" + parameter + "'";
            }
            isLocal = isLocal || isZone;
        }
    }
    for (const std::string& value : splitText(rest.substr(colon + 1), ',')) {
        if (!parseCompact(value) && !(isLocal && parseCompact(value + "Z")))
            return "bad date '" + value + "'";
    }
    return "";
}

}  // namespace

std::string recurrenceFault(std::string_view line) {
    if (line.starts_with("RRULE:")) return ruleFault(line.substr(6));
    for (const std::string_view name : {"RDATE", "EXDATE"}) {
        if (!line.starts_with(name) || line.size() == name.size()) continue;
        const char next = line[name.size()];
        if (next == ':' || next == ';') return datesFault(line.substr(name.size()));
    }
    return "only RRULE, RDATE and EXDATE lines are accepted";
}

}  // namespace provider
