#include "ContactsStore.h"

#include "Names.h"
#include "RecordAccess.h"

namespace {

using record_access::intOf;
using store_access::Filter;
using ContactsService =
    store_access::Service<contacts_query_create, contacts_db_get_records_with_query, ContactsList>;

}  // namespace

ContactsStore::ContactsStore() {
    check(contacts_connect_with_flags(0), "the contacts store");
}

ContactsStore::~ContactsStore() {
    contacts_disconnect();
}

ContactsList ContactsStore::find(const char* view, const std::vector<Filter>& filters, unsigned sortBy,
                                 std::span<const unsigned> projection) {
    return store_access::find<ContactsService>("the contacts store", view, filters, sortBy, projection);
}

std::vector<ContactsList> ContactsStore::ofAccount(const View& view, std::optional<int> account,
                                                   std::span<const unsigned> projection) {
    std::vector<ContactsList> lists;
    for (const auto& [bookId, ofBook] : accounts(account))
        lists.push_back(find(view.uri, {{view.bookId, bookId}}, view.id, projection));
    return lists;
}

BookAccounts ContactsStore::accounts(std::optional<int> account) {
    std::vector<Filter> filters;
    if (account) filters.push_back({CONTACTS_ADDRESS_BOOK_ACCOUNT_ID, *account});
    const ContactsList books = find(_contacts_address_book, filters, CONTACTS_ADDRESS_BOOK_ID);
    BookAccounts accounts;
    record_access::forEach(books, [&accounts](contacts_record_h book) {
        accounts[intOf(book, CONTACTS_ADDRESS_BOOK_ID)] = intOf(book, CONTACTS_ADDRESS_BOOK_ACCOUNT_ID);
    });
    return accounts;
}

int ContactsStore::bookOf(int account) {
    const BookAccounts books = accounts(account);
    if (books.empty()) {
        throw Failure("the account " + std::to_string(account) +
                      " has no address book on this device; see: vantor-pim-syncctl account show " +
                      std::to_string(account));
    }
    checkWritable(books.begin()->first);
    return books.begin()->first;
}

void ContactsStore::checkWritable(int bookId) {
    const ContactsList books =
        find(_contacts_address_book, {{CONTACTS_ADDRESS_BOOK_ID, bookId}}, CONTACTS_ADDRESS_BOOK_ID);
    contacts_record_h book = nullptr;
    if (contacts_list_first(books.get()) != PLATFORM_ERROR_NONE ||
        contacts_list_get_current_record_p(books.get(), &book) != PLATFORM_ERROR_NONE) {
        throw Failure("the address book " + std::to_string(bookId) + " is gone; list the contacts again");
    }
    if (intOf(book, CONTACTS_ADDRESS_BOOK_MODE) == kModeReadOnly)
        throw Failure("the address book " + std::to_string(bookId) + " is read-only");
}

FoundContact ContactsStore::contact(int id, std::span<const unsigned> projection) {
    return store_access::one(
        find(_contacts_contact, {{CONTACTS_CONTACT_ID, id}}, CONTACTS_CONTACT_ID, projection), "contact", id);
}

FoundContact ContactsStore::group(int id) {
    return store_access::one(find(_contacts_group, {{CONTACTS_GROUP_ID, id}}, CONTACTS_GROUP_ID), "group",
                             id);
}
