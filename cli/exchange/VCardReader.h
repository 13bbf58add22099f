// VCardReader.h: cards (vCard 4.0 and 3.0, and what 2.1 commonly holds) as the contact's JSON that scripts rely on.
#pragma once

#include <map>
#include <set>
#include <span>
#include <string>
#include <vector>

#include "Output.h"
#include "exchange/ContentLine.h"
#include "exchange/ItemReader.h"
#include "exchange/NotHeld.h"
#include "exchange/VCardMapping.h"

namespace exchange {

struct Card {
    Json contact = Json::object();
    std::string uid;
    std::vector<std::string> groups;  // by name
    std::string photo;                // the image itself; empty for none
    size_t line = 0;
    bool isList = false;  // of contacts, not one
};

class VCardReader {
public:
    // A Failure with the reason when it cannot be taken; `losses` gets what is left out of it.
    Card read(const RawItem& raw, NotHeld& losses);

private:
    struct Company {
        std::string group;
        std::set<std::string> properties;
        Json fields = Json::object();
    };

    std::vector<ContentLine> linesOf(const RawItem& raw);
    void readLine(const ContentLine& line, Card& card);
    bool readText(const ContentLine& line, Card& card);
    bool readList(const ContentLine& line, Card& card);
    bool readCompany(const ContentLine& line);
    bool readMessenger(const ContentLine& line, Card& card);
    bool readDate(const ContentLine& line, Card& card);
    bool readRelation(const ContentLine& line, Card& card);
    bool readExtra(const ContentLine& line, Card& card);
    void readName(const ContentLine& line, Card& card);
    void readAddress(const ContentLine& line, Card& card);
    void readPhoto(const ContentLine& line, Card& card);
    // Sets type, label and mark of the object.
    void setType(const ContentLine& line, std::span<const CardType> rows, Json& object);
    void setPrimary(const ContentLine& line, Json& object);
    [[nodiscard]] std::string labelOf(const ContentLine& line) const;
    Company& companyOf(const ContentLine& line);
    void finish(const std::vector<ContentLine>& lines, Card& card);

    NotHeld* mpLosses = nullptr;                 // of the card that is being read
    std::map<std::string, std::string> mLabels;  // by group
    std::vector<Company> mCompanies;
};

}  // namespace exchange
