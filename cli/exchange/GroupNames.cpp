#include "exchange/GroupNames.h"

#include "ContactsStore.h"
#include "RecordAccess.h"

namespace exchange {

std::map<int, std::string> groupNames(std::optional<int> account) {
    constexpr ContactsStore::View kGroups{_contacts_group, CONTACTS_GROUP_ID, CONTACTS_GROUP_ADDRESS_BOOK_ID};
    std::map<int, std::string> names;
    for (const ContactsList& list : ContactsStore::ofAccount(kGroups, account)) {
        record_access::forEach(list, [&names](contacts_record_h group) {
            names[record_access::intOf(group, CONTACTS_GROUP_ID)] =
                record_access::textOf(group, CONTACTS_GROUP_NAME);
        });
    }
    return names;
}

}  // namespace exchange
