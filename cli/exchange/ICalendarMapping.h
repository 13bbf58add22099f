// ICalendarMapping.h: the properties of a calendar file beside the members of the JSON of events and to-dos, for both
// directions.
#pragma once

#include <span>
#include <string_view>

namespace exchange {

// A text of its own.
struct TextProperty {
    std::string_view property;
    std::string_view member;
};
inline constexpr TextProperty kEventTexts[] = {
    {"SUMMARY", "summary"}, {"DESCRIPTION", "description"}, {"LOCATION", "location"}};
inline constexpr TextProperty kTodoTexts[] = {{"SUMMARY", "summary"}, {"DESCRIPTION", "note"}};

// A word of the file and the member's value for it. A row that is only read is a loss, and counted.
struct WordRow {
    std::string_view word;
    std::string_view value;
    bool isLoss = false;
};
struct WordProperty {
    std::string_view property;
    std::string_view member;
    std::span<const WordRow> rows;
};
inline constexpr WordRow kEventStatusRows[] = {
    {"TENTATIVE", "tentative"}, {"CONFIRMED", "confirmed"}, {"CANCELLED", "cancelled"}};
// What is confidential goes nowhere that private does not go.
inline constexpr WordRow kClassRows[] = {
    {"PUBLIC", "public"}, {"PRIVATE", "private"}, {"CONFIDENTIAL", "private", true}};
// `busy` as a word.
inline constexpr WordRow kTransparencyRows[] = {{"TRANSPARENT", "false"}, {"OPAQUE", "true"}};
inline constexpr WordProperty kEventWords[] = {{"STATUS", "status", kEventStatusRows},
                                               {"CLASS", "visibility", kClassRows},
                                               {"TRANSP", "busy", kTransparencyRows}};
inline constexpr WordRow kTodoStatusRows[] = {{"NEEDS-ACTION", "needsAction"},
                                              {"COMPLETED", "completed"},
                                              {"IN-PROCESS", "needsAction", true},
                                              {"CANCELLED", "needsAction", true}};
inline constexpr WordProperty kTodoWords[] = {{"STATUS", "status", kTodoStatusRows}};

// PARTSTAT of an attendee.
inline constexpr WordRow kPartStatRows[] = {{"NEEDS-ACTION", "needsAction"},
                                            {"ACCEPTED", "accepted"},
                                            {"DECLINED", "declined"},
                                            {"TENTATIVE", "tentative"},
                                            {"DELEGATED", "needsAction", true}};

constexpr const WordRow* rowOfWord(std::span<const WordRow> rows, std::string_view word) {
    for (const WordRow& row : rows) {
        if (row.word == word) return &row;
    }
    return nullptr;
}
constexpr const WordRow* rowOfValue(std::span<const WordRow> rows, std::string_view value) {
    for (const WordRow& row : rows) {
        if (row.value == value) return &row;
    }
    return nullptr;
}

// Bookkeeping of whoever wrote the file; nobody misses it.
inline constexpr std::string_view kSilent[] = {"UID",      "DTSTAMP", "CREATED",          "LAST-MODIFIED",
                                               "SEQUENCE", "END",     "X-MOZ-GENERATION", "X-MOZ-LASTACK"};

// The zone of an event that its times cannot name (an all-day event, an hour that comes twice).
inline constexpr std::string_view kZoneProperty = "X-VANTOR-TIME-ZONE";

}  // namespace exchange
