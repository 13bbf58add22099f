#include "RecordJson.h"

#include "EventFields.h"
#include "InputFile.h"
#include "RecordAccess.h"
#include "TimeText.h"

namespace record_json {

namespace {

using record_access::intOf;
using record_access::textOf;
using record_access::timeOf;

constexpr size_t kMostFileBytes = size_t{16} * 1024 * 1024;

int64_t instantFrom(const std::string& text, const std::string& member) {
    const calendar_time_s time = timeFrom(text, member);
    if (time_text::isDate(time)) refuse(member, "must be a time as 2014-05-01T10:00:00Z");
    return time.utime;
}

}  // namespace

Json scalarOf(calendar_record_h record, const ScalarField& field) {
    switch (field.kind) {
        case FieldKind::kText:
        case FieldKind::kZone:
            return textOf(record, field.property);
        case FieldKind::kTime:
            return time_text::composeRfc3339(timeOf(record, field.property));
        case FieldKind::kOptionalTime:
            return intOf(record, field.flag) != 0 ? time_text::composeRfc3339(timeOf(record, field.property))
                                                  : "";
        case FieldKind::kInstant: {
            int64_t seconds = 0;
            check(calendar_record_get_lli(record, field.property, &seconds),
                  "\"" + std::string(field.name) + "\"");
            return seconds != 0 ? time_text::composeRfc3339(seconds) : "";
        }
        case FieldKind::kWord:
            return std::string(nameOf(field.words, intOf(record, field.property)));
        case FieldKind::kFlag:
            return intOf(record, field.property) != 0;
        case FieldKind::kRule:
            return rrule_text::compose(event_fields::ruleOf(record));
    }
    return nullptr;
}

[[noreturn]] void refuse(const std::string& member, const std::string& why) {
    throw Failure("the member \"" + member + "\" " + why);
}

std::string textFrom(const Json& value, const std::string& member) {
    if (value.is_null()) return {};
    if (!value.is_string()) refuse(member, "must be a text");
    const auto& text = value.get_ref<const std::string&>();
    if (text.find('\0') != std::string::npos) refuse(member, "holds a NUL character");
    return text;
}

const Json& listFrom(const Json& value, const std::string& member) {
    static const Json kEmpty = Json::array();
    if (value.is_null()) return kEmpty;
    if (!value.is_array()) refuse(member, "must be a list");
    return value;
}

int numberFrom(const Json& value, const std::string& member, int least, int most) {
    if (!value.is_number_integer()) refuse(member, "must be a whole number");
    const bool isHuge = value.is_number_unsigned() && value.get<uint64_t>() > static_cast<uint64_t>(most);
    if (isHuge || value.get<int64_t>() < least || value.get<int64_t>() > most) {
        refuse(member, "must be between " + std::to_string(least) + " and " + std::to_string(most));
    }
    return value.get<int>();
}

std::optional<int> idFrom(const Json& value, const std::string& member) {
    if (value.is_null()) return std::nullopt;
    return numberFrom(value, member, 1, INT32_MAX);
}

calendar_time_s timeFrom(const std::string& text, const std::string& member) {
    const auto time = time_text::parseRfc3339(text);
    if (!time) refuse(member, "must be a time as 2014-05-01T10:00:00Z or a date as 2014-05-01");
    return *time;
}

int wordFrom(std::span<const NameOf> words, const std::string& text, const std::string& member) {
    const auto value = valueOf(words, text);
    if (value) return *value;
    std::string known;
    for (const NameOf& row : words) {
        if (!row.name.empty()) known += (known.empty() ? "" : ", ") + std::string(row.name);
    }
    refuse(member, "must be one of " + known);
}

void setFromText(calendar_record_h record, const ScalarField& field, const std::string& text) {
    const std::string name(field.name);
    switch (field.kind) {
        case FieldKind::kZone:
            if (!text.empty() && !event_fields::isTimeZone(text)) refuse(name, "is no known time zone");
            [[fallthrough]];
        case FieldKind::kText:
            record_access::setText(record, field.property, text, name);
            return;
        case FieldKind::kTime:
            record_access::setTime(record, field.property, timeFrom(text, name), name);
            return;
        case FieldKind::kOptionalTime:
            if (!text.empty()) record_access::setTime(record, field.property, timeFrom(text, name), name);
            record_access::setInt(record, field.flag, text.empty() ? 0 : 1, name);
            return;
        case FieldKind::kInstant: {
            const int64_t seconds = text.empty() ? 0 : instantFrom(text, name);
            check(calendar_record_set_lli(record, field.property, seconds), "\"" + name + "\"");
            return;
        }
        case FieldKind::kWord:
            record_access::setInt(record, field.property, wordFrom(field.words, text, name), name);
            return;
        case FieldKind::kFlag:
            if (text != "true" && text != "false") refuse(name, "must be true or false");
            record_access::setInt(record, field.property, text == "true" ? 1 : 0, name);
            return;
        case FieldKind::kRule: {
            RruleFields rule;
            std::string reason;
            if (!rrule_text::parse(text, &rule, &reason)) refuse(name, "is no rule: " + reason);
            event_fields::setRule(record, rule);
            return;
        }
    }
}

// Null is absent, and so is an empty word that has no meaning of its own ("visibility": "").
void setFromJson(calendar_record_h record, const ScalarField& field, const Json& value) {
    if (value.is_null()) return;
    const std::string name(field.name);
    if (field.kind == FieldKind::kFlag) {
        if (!value.is_boolean()) refuse(name, "must be true or false");
        setFromText(record, field, value.get<bool>() ? "true" : "false");
        return;
    }
    const std::string text = textFrom(value, name);
    if (text.empty() && field.kind == FieldKind::kWord) return;
    setFromText(record, field, text);
}

void refuseUnknown(const Json& object, std::initializer_list<std::string_view> known,
                   const std::string& member) {
    if (!object.is_object()) refuse(member, "must be an object");
    for (const auto& item : object.items()) {
        bool isKnown = false;
        for (const std::string_view name : known) isKnown = isKnown || name == item.key();
        if (!isKnown) refuse(member + "." + item.key(), "is not known");
    }
}

const ScalarField* findScalar(std::span<const ScalarField> fields, std::string_view name) {
    for (const ScalarField& field : fields) {
        if (field.name == name) return &field;
    }
    return nullptr;
}

Json readFile(const std::string& path) {
    const std::string text = input_file::read(path, kMostFileBytes);
    try {
        return Json::parse(text);
    } catch (const Json::parse_error& error) {
        throw Failure((path == "-" ? "standard input" : path) + " is no JSON (byte " +
                      std::to_string(error.byte) + ")");
    }
}

std::vector<Assignment> readAssignments(std::span<const ScalarField> fields,
                                        const std::vector<std::string>& texts) {
    std::vector<Assignment> assignments;
    std::set<std::string> seen;
    for (const std::string& text : texts) {
        const size_t equals = text.find('=');
        const std::string name = text.substr(0, equals);
        const ScalarField* field = findScalar(fields, name);
        if (equals == std::string::npos) throw Misuse("\"" + text + "\" is not FIELD=VALUE");
        if (field == nullptr) throw Misuse("\"" + name + "\" is no field that can be set (see --help)");
        if (!seen.insert(name).second) throw Misuse("\"" + name + "\" is set twice");
        assignments.push_back({field, text.substr(equals + 1)});
    }
    return assignments;
}

}  // namespace record_json
