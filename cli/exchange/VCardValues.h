// VCardValues.h: values of cards that are more than a text: encodings, types, dates, images, messengers. Pure
// functions.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "exchange/ContentLine.h"

namespace exchange::vcard_values {

// Undoes quoted-printable and other character sets; false when the value is then no text.
bool decode(ContentLine& line);

// The words of TYPE, in capitals.
std::vector<std::string> typesOf(const ContentLine& line);
// A label that an address book of another maker brings with it ("_$!<Home>!$_"), without its frame; "" for a label of
// the user's.
std::string commonLabel(const std::string& label);
// The parts of a list as one text.
std::string joined(std::string_view list, std::string_view joint);
// "2014-05-01"; "" when it has no year, month and day.
std::string dateOf(const ContentLine& line);
// Nothing when the value is no image.
std::optional<std::string> imageOf(const ContentLine& line);
bool isLink(std::string_view value);

struct Messenger {
    std::string value;
    std::string protocol;
    std::string label;
};
Messenger messengerOf(const ContentLine& line);

}  // namespace exchange::vcard_values
