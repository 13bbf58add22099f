// ContactsStore.h: the device's contacts store as the commands need it. Works whether the daemon runs or not.
#pragma once

#include <map>
#include <optional>
#include <span>
#include <vector>

#include "StoreAccess.h"
#include "platform/contacts.h"

// One contact or group of the store.
using FoundContact = store_access::Found<ContactsList>;

// The accounts of the address books, by the id of the book.
using BookAccounts = std::map<int, int>;

// Open while the object lives.
class ContactsStore {
public:
    ContactsStore();
    ~ContactsStore();
    ContactsStore(const ContactsStore&) = delete;
    ContactsStore& operator=(const ContactsStore&) = delete;

    static ContactsList find(const char* view, const std::vector<store_access::Filter>& filters,
                             unsigned sortBy, std::span<const unsigned> projection = {});
    // The items of all accounts or of one, one list an address book.
    struct View {
        const char* uri;
        unsigned id;
        unsigned bookId;
    };
    static std::vector<ContactsList> ofAccount(const View& view, std::optional<int> account,
                                               std::span<const unsigned> projection = {});
    static BookAccounts accounts(std::optional<int> account = std::nullopt);
    // The address book that new records of the account go to. A Failure when there is none that can be written.
    static int bookOf(int account);
    // A Failure when the address book is missing or read-only.
    static void checkWritable(int bookId);
    // A Failure when there is none.
    static FoundContact contact(int id, std::span<const unsigned> projection);
    static FoundContact group(int id);
};
