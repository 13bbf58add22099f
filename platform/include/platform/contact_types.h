// contact_types.h: the type codes that the records of a contact keep, and the words that services use for them. 0 is none and 1 is
// custom in every vocabulary; a code or a word without a row has no counterpart.
#pragma once

#include <span>
#include <string_view>

struct contact_type_word_s {
    int code;
    const char* word;
};

namespace contact_types {

inline constexpr contact_type_word_s kPhone[] = {
    {64, "mobile"},         {2, "home"},      {4, "work"},
    {20, "work_fax"},       {18, "home_fax"}, {128, "pager"},
    {1 << 30, "assistant"}, {1024, "car"},    {16, "fax"},
    {2048, "isdn"},         {0, "other"},     {68, "work_mobile"},
    {132, "work_pager"}};
inline constexpr contact_type_word_s kEmail[] = {{2, "home"}, {4, "work"}, {8, "mobile"}};
inline constexpr contact_type_word_s kAddress[] = {{2, "home"}, {4, "work"}};
inline constexpr contact_type_word_s kCompany[] = {{2, "work"}};
inline constexpr contact_type_word_s kProtocol[] = {{2, "VANTOR_TALK"}, {3, "MSN"},   {4, "YAHOO"},
                                                    {6, "ICQ"},         {7, "AIM"},   {8, "QQ"},
                                                    {9, "JABBER"},      {10, "SKYPE"}};
inline constexpr contact_type_word_s kRelationship[] = {
    {1, "assistant"},    {2, "brother"},   {3, "child"},   {4, "domestic-partner"}, {5, "father"},
    {6, "friend"},       {7, "manager"},   {8, "mother"},  {9, "parent"},           {10, "partner"},
    {11, "referred-by"}, {12, "relative"}, {13, "sister"}, {14, "spouse"}};
inline constexpr contact_type_word_s kUrl[] = {{2, "home"}, {3, "work"}, {0, "other"}};

// What stands for the code: NULL when the vocabulary has no word.
constexpr const char* wordOf(std::span<const contact_type_word_s> words, int code) {
    for (const contact_type_word_s& row : words) {
        if (row.code == code) return row.word;
    }
    return nullptr;
}

// The row with the word, NULL when there is none.
constexpr const contact_type_word_s* rowOf(std::span<const contact_type_word_s> words,
                                           std::string_view word) {
    for (const contact_type_word_s& row : words) {
        if (row.word == word) return &row;
    }
    return nullptr;
}

}  // namespace contact_types
