// VCardWriter.h: contacts as cards (vCard 4.0, RFC 6350).
#pragma once

#include <string>
#include <vector>

#include "Output.h"
#include "exchange/ContentLine.h"
#include "exchange/NotHeld.h"

namespace exchange {

struct CardExtras {
    std::string uid;
    std::vector<std::string> groups;  // by name
    std::string photo;                // the image itself; empty for none
};

class VCardWriter {
public:
    explicit VCardWriter(NotHeld& losses) : mLosses(losses) {}

    // `contact` is the JSON that scripts rely on.
    std::string card(const Json& contact, const CardExtras& extras);

private:
    void add(const ContentLine& line) { mText += content_line::compose(line); }
    void addText(std::string_view property, const std::string& text);
    // With the type, the label and the mark that the object has.
    void addItem(ContentLine line, const Json& object, std::string_view types);
    void addNames(const Json& contact);
    void addLists(const Json& contact);
    void addAddresses(const Json& contact);
    void addCompanies(const Json& contact);
    void addMessengers(const Json& contact);
    void addDates(const Json& contact);
    void addRelations(const Json& contact);
    void addExtras(const Json& contact, const CardExtras& extras);
    std::string nextGroup() { return "item" + std::to_string(++mGroups); }
    std::string escaped(const std::string& text);

    NotHeld& mLosses;
    std::string mText;  // of the card that is being written
    int mGroups = 0;
};

}  // namespace exchange
