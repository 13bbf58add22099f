#include "RruleText.h"

#include <algorithm>
#include <charconv>
#include <set>
#include <vector>

#include "Names.h"
#include "TimeText.h"

namespace rrule_text {

namespace {

constexpr std::string_view kPrefix = "RRULE:";

// A list part: where it is kept, and which numbers may stand in it (BYDAY: before the weekday, where none is fine).
struct ListPart {
    std::string_view key;
    std::string RruleFields::*member;
    int largest;
    bool mayBeNegative;
    bool hasWeekday;
};
constexpr ListPart kListParts[] = {
    {"BYDAY", &RruleFields::byDay, 53, true, true},
    {"BYMONTHDAY", &RruleFields::byMonthDay, 31, true, false},
    {"BYYEARDAY", &RruleFields::byYearDay, 366, true, false},
    {"BYWEEKNO", &RruleFields::byWeekNo, 53, true, false},
    {"BYMONTH", &RruleFields::byMonth, 12, false, false},
    {"BYSETPOS", &RruleFields::bySetPos, 366, true, false},
};

std::vector<std::string_view> split(std::string_view text, char separator) {
    std::vector<std::string_view> parts;
    for (;;) {
        const size_t end = text.find(separator);
        parts.push_back(text.substr(0, end));
        if (end == std::string_view::npos) return parts;
        text.remove_prefix(end + 1);
    }
}

bool positive(std::string_view text, int* out) {
    int value = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc() || end != text.data() + text.size() || value < 1) return false;
    *out = value;
    return true;
}

bool isListItem(const ListPart& part, std::string_view item) {
    if (part.hasWeekday) {
        if (item.size() < 2 || !valueOf(kWeekdays, item.substr(item.size() - 2))) return false;
        item.remove_suffix(2);
        if (item.empty()) return true;
    }
    if (item.starts_with('+') || (part.mayBeNegative && item.starts_with('-'))) item.remove_prefix(1);
    int number = 0;
    return item.size() <= 3 && positive(item, &number) && number <= part.largest;
}

bool isList(const ListPart& part, std::string_view text) {
    const auto items = split(text, ',');
    return std::all_of(items.begin(), items.end(), [&part](auto item) { return isListItem(part, item); });
}

bool parseUntil(std::string_view value, RruleFields& fields) {
    const auto until = time_text::parseCompact(value);
    if (!until) return false;
    fields.rangeType = kRangeUntil;
    fields.until = *until;
    return true;
}

bool parseNamed(std::string_view value, std::span<const NameOf> names, int& out) {
    const auto found = valueOf(names, value);
    if (found) out = *found;
    return found.has_value();
}

// One "KEY=VALUE". False when the value is malformed or the key is none that the record can keep.
bool parsePart(std::string_view key, std::string_view value, RruleFields& fields) {
    for (const ListPart& part : kListParts) {
        if (key != part.key) continue;
        fields.*part.member = value;
        return isList(part, value);
    }
    if (key == "FREQ") return parseNamed(value, kFrequencies, fields.frequency);
    if (key == "WKST") return parseNamed(value, kWeekdays, fields.weekStart);
    if (key == "INTERVAL") return positive(value, &fields.interval);
    if (key == "UNTIL") return parseUntil(value, fields);
    if (key != "COUNT") return false;
    fields.rangeType = kRangeCount;
    return positive(value, &fields.count);
}

}  // namespace

std::string compose(const RruleFields& fields) {
    const std::string_view frequency = nameOf(kFrequencies, fields.frequency);
    if (frequency.empty()) return {};
    std::string text = "FREQ=" + std::string(frequency);
    const auto add = [&text](std::string_view key, const std::string& value) {
        text.append(";").append(key).append("=").append(value);
    };
    if (fields.interval > 1) add("INTERVAL", std::to_string(fields.interval));
    for (const ListPart& part : kListParts) {
        if (!(fields.*part.member).empty()) add(part.key, fields.*part.member);
    }
    const std::string_view weekStart = nameOf(kWeekdays, fields.weekStart);
    if (fields.weekStart != kMonday && !weekStart.empty()) add("WKST", std::string(weekStart));
    if (fields.rangeType == kRangeCount) add("COUNT", std::to_string(fields.count));
    if (fields.rangeType == kRangeUntil) add("UNTIL", time_text::composeCompact(fields.until));
    return text;
}

bool parse(std::string_view text, RruleFields* out, std::string* reason) {
    std::string upper(text);
    std::transform(upper.begin(), upper.end(), upper.begin(),
                   [](char c) { return c >= 'a' && c <= 'z' ? static_cast<char>(c - 'a' + 'A') : c; });
    std::string_view rest = upper;
    if (rest.starts_with(kPrefix)) rest.remove_prefix(kPrefix.size());
    RruleFields fields;
    if (rest.empty()) {
        *out = fields;
        return true;
    }
    std::set<std::string_view> seen;
    for (const std::string_view part : split(rest, ';')) {
        const size_t equals = part.find('=');
        const std::string_view key = part.substr(0, equals);
        if (equals == std::string_view::npos || !parsePart(key, part.substr(equals + 1), fields)) {
            *reason = "the part \"" + std::string(part) + "\" is malformed or cannot be kept";
            return false;
        }
        if (!seen.insert(key).second) {
            *reason = std::string(key) + " stands there twice";
            return false;
        }
    }
    if (!seen.contains("FREQ")) {
        *reason = "FREQ is missing";
        return false;
    }
    if (seen.contains("COUNT") && seen.contains("UNTIL")) {
        *reason = "COUNT and UNTIL exclude each other";
        return false;
    }
    *out = fields;
    return true;
}

}  // namespace rrule_text
