// RecordJson.h: the fields of records as the JSON that scripts rely on, and back: what the kinds of records share. A text of another
// shape is a Failure that names the member.
#pragma once

#include <optional>
#include <set>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "Names.h"
#include "Output.h"
#include "platform/calendar.h"

namespace record_json {

enum class FieldKind {
    kText,
    kZone,
    kTime,
    kOptionalTime,  // `flag` tells whether there is one
    kInstant,       // seconds since 1970, 0 for none
    kWord,
    kFlag,
    kRule,  // of an event; the property is its frequency
};

// A field with one value, which `set` can write.
struct ScalarField {
    std::string_view name;
    FieldKind kind;
    unsigned property;
    std::span<const NameOf> words;
    unsigned flag = 0;
};

// NULL for a name that is no field.
const ScalarField* findScalar(std::span<const ScalarField> fields, std::string_view name);

Json scalarOf(calendar_record_h record, const ScalarField& field);
void setFromText(calendar_record_h record, const ScalarField& field, const std::string& text);
// Null is absent, and so is an empty word that has no meaning of its own ("visibility": "").
void setFromJson(calendar_record_h record, const ScalarField& field, const Json& value);

// FIELD=VALUE texts of a command line.
struct Assignment {
    const ScalarField* field;
    std::string value;
};
std::vector<Assignment> readAssignments(std::span<const ScalarField> fields,
                                        const std::vector<std::string>& texts);

// The JSON of a file, '-' for standard input.
Json readFile(const std::string& path);

[[noreturn]] void refuse(const std::string& member, const std::string& why);
std::string textFrom(const Json& value, const std::string& member);
const Json& listFrom(const Json& value, const std::string& member);
int numberFrom(const Json& value, const std::string& member, int least, int most);
std::optional<int> idFrom(const Json& value, const std::string& member);
calendar_time_s timeFrom(const std::string& text, const std::string& member);
int wordFrom(std::span<const NameOf> words, const std::string& text, const std::string& member);
void refuseUnknown(const Json& object, std::initializer_list<std::string_view> known,
                   const std::string& member);

}  // namespace record_json
