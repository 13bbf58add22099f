// ContactsImport.h: cards into the address book of one account.
#pragma once

#include <map>
#include <memory>
#include <vector>

#include "PhotoFile.h"
#include "exchange/BulkWriter.h"
#include "exchange/ImportOptions.h"
#include "exchange/ImportReport.h"
#include "exchange/KnownItems.h"
#include "exchange/VCardReader.h"
#include "platform/contacts.h"

namespace exchange {

class ContactsImport {
public:
    // The contacts store must be open. A Failure when the account has no address book that can be written.
    ContactsImport(const ImportOptions& options, ImportReport& report);

    // Writes while it reads, so that photos are not all kept at once. A Failure when the file or the store fails; the
    // report then tells what was done.
    void run(ItemReader& reader);

private:
    [[nodiscard]] KnownItems known() const;
    void take(const RawItem& raw, KnownItems& known, BulkWriter& writer);
    void settle(const Card& card, const KnownItems::Found& found, BulkWriter& writer);
    void add(const Card& card, BulkWriter& writer);
    void replace(int id, const Card& card);
    // Their ids; those that are not there are made.
    std::vector<int> groupsOf(const Card& card);

    const ImportOptions& mOptions;
    ImportReport& mReport;
    const int mBook;
    std::map<std::string, int> mGroups;  // by name
    VCardReader mReader;
    std::vector<Card> mUndecided;
};

}  // namespace exchange
