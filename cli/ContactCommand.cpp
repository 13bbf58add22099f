// contacts, contact: lists contacts; shows, adds, changes and deletes one. What the tool writes is a user's edit.
#include <algorithm>

#include "Command.h"
#include "ContactJson.h"
#include "ContactsStore.h"
#include "ItemCommand.h"
#include "PhotoFile.h"
#include "RecordAccess.h"
#include "RecordJson.h"

namespace {

using contact_json::Change;
using record_access::intOf;

constexpr ContactsStore::View kView{_contacts_contact, CONTACTS_CONTACT_ID, CONTACTS_CONTACT_ADDRESS_BOOK_ID};

std::string named(int id) {
    return "the contact " + std::to_string(id);
}

Json composeOf(contacts_record_h contact, const BookAccounts& accounts) {
    const auto book = accounts.find(intOf(contact, CONTACTS_CONTACT_ADDRESS_BOOK_ID));
    return contact_json::compose(contact, book != accounts.end() ? book->second : 0);
}

// --- list -----------------------------------------------------------------------------------------------------------

template <class Use>
void forEachContact(std::optional<int> account, Use use) {
    const BookAccounts accounts = ContactsStore::accounts(account);
    for (const ContactsList& list : ContactsStore::ofAccount(kView, account, contact_json::projection())) {
        record_access::forEach(list, [&](contacts_record_h contact) { use(composeOf(contact, accounts)); });
    }
}

void listJson(std::optional<int> account) {
    output::JsonArray array;
    forEachContact(account, [&array](const Json& contact) { array.add(contact); });
    array.end();
}

std::string firstOf(const Json& items) {
    return items.empty() ? std::string() : items[0]["value"].get<std::string>();
}

void listTable(std::optional<int> account) {
    output::Table table({"ID", "ACCOUNT", "NAME", "PHONE", "EMAIL"});
    forEachContact(account, [&table](const Json& contact) {
        table.add({contact["id"].dump(), contact["account"].dump(), contact_json::displayNameOf(contact),
                   firstOf(contact["phones"]), firstOf(contact["emails"])});
    });
    table.print();
}

// --- one contact ------------------------------------------------------------------------------------------------

void showContact(int id, bool isJson) {
    const Json contact =
        composeOf(ContactsStore::contact(id, contact_json::projection()).get(), ContactsStore::accounts());
    isJson ? output::json(contact) : output::fields(contact);
}

void checkGroups(const std::vector<int>& groups, int bookId) {
    for (const int id : groups) {
        if (intOf(ContactsStore::group(id).get(), CONTACTS_GROUP_ADDRESS_BOOK_ID) == bookId) continue;
        throw Failure("the group " + std::to_string(id) +
                      " is another account's; see: vantor-pim-syncctl groups list");
    }
}

int addContact(const std::string& path, int chosenAccount) {
    const contact_json::NewContact contact = contact_json::parse(record_json::readFile(path));
    const int account = chosenAccount > 0 ? chosenAccount : contact.account.value_or(0);
    if (account == 0) throw Failure("the member \"account\" is missing; add it or give --account ID");
    const int bookId = ContactsStore::bookOf(account);
    checkGroups(contact.groups, bookId);
    const StagedPhoto photo(contact.photo);
    contacts_record_h record = contact.record.get();
    record_access::setInt(record, CONTACTS_CONTACT_ADDRESS_BOOK_ID, bookId, "account");
    contact_json::setGroups(record, contact.groups);
    contact_json::setPhoto(record, photo.path());
    int id = 0;
    check(contacts_db_insert_record(record, &id), "adding the contact");
    return id;
}

// The parts of the contact that the changes write and no other, so that nothing else is touched.
std::vector<unsigned> projectionOf(const std::vector<Change>& changes) {
    std::vector<unsigned> properties = {CONTACTS_CONTACT_ID, CONTACTS_CONTACT_ADDRESS_BOOK_ID,
                                        CONTACTS_CONTACT_VERSION};
    for (const Change& change : changes) {
        if (std::find(properties.begin(), properties.end(), change.children()) == properties.end())
            properties.push_back(change.children());
    }
    return properties;
}

void apply(contacts_record_h contact, const Change& change, const std::string& photo) {
    if (change.field == contact_json::kPhoto) {
        contact_json::setPhoto(contact, photo);
    } else if (change.field == contact_json::kGroups) {
        const std::vector<int> groups = contact_json::groupsFrom(contact_json::parseValue(change));
        checkGroups(groups, intOf(contact, CONTACTS_CONTACT_ADDRESS_BOOK_ID));
        contact_json::setGroups(contact, groups);
    } else {
        contact_json::apply(contact, change);
    }
}

int tryToSet(int id, const std::vector<Change>& changes, const std::string& photo) {
    const FoundContact contact = ContactsStore::contact(id, projectionOf(changes));
    ContactsStore::checkWritable(intOf(contact.get(), CONTACTS_CONTACT_ADDRESS_BOOK_ID));
    for (const Change& change : changes) apply(contact.get(), change, photo);
    const int version = intOf(contact.get(), CONTACTS_CONTACT_VERSION);
    record_write_options_s options;
    options.expected_versions = {&version, 1};
    return contacts_db_update_record(contact.get(), options);
}

void setContact(int id, const std::vector<Change>& changes) {
    std::string source;
    for (const Change& change : changes) {
        if (change.field == contact_json::kPhoto) source = change.value;
    }
    const ContactsStore store;
    const StagedPhoto photo(source);
    item_command::write("changing " + named(id), [&] { return tryToSet(id, changes, photo.path()); });
}

void savePhoto(int id, const std::string& target) {
    const unsigned images[] = {CONTACTS_CONTACT_ID, CONTACTS_CONTACT_IMAGES};
    const std::string photo = contact_json::photoOf(ContactsStore::contact(id, images).get());
    if (photo.empty()) throw Failure(named(id) + " has no photo");
    photo_file::save(photo, target);
}

void deleteContact(int id) {
    const unsigned book[] = {CONTACTS_CONTACT_ID, CONTACTS_CONTACT_ADDRESS_BOOK_ID};
    const FoundContact contact = ContactsStore::contact(id, book);
    ContactsStore::checkWritable(intOf(contact.get(), CONTACTS_CONTACT_ADDRESS_BOOK_ID));
    check(contacts_db_delete_record(_contacts_contact, id), "deleting " + named(id));
}

}  // namespace

Action buildContactsList(CLI::App& app) {
    return item_command::buildAccountList<ContactsStore>(app, listJson, listTable);
}

Action buildContactShow(CLI::App& app) {
    return item_command::buildShow<ContactsStore>(app, "The contact", showContact);
}

Action buildContactAdd(CLI::App& app) {
    return item_command::buildAdd<ContactsStore>(
        app,
        {"JSON as 'contact show --json' prints it; '-' reads standard input", "--account",
         "The account, instead of the file's"},
        addContact, showContact);
}

Action buildContactSet(CLI::App& app) {
    auto options = std::make_shared<ItemOptions>();
    item_command::addSetOptions(
        app, *options, "The contact",
        "name.first and the like, nickname, note, photo (a file; empty removes it), or "
        "a list as JSON (emails, phones, groups ...), which replaces the former one");
    return [options] {
        setContact(options->id, contact_json::readChanges(options->assignments));
        return kExitDone;
    };
}

Action buildContactPhoto(CLI::App& app) {
    auto options = std::make_shared<ItemOptions>();
    command::addId(app, "ID", options->id, "The contact")->required();
    app.add_option("FILE", options->file, "Where the photo goes; '-' is standard output")->required();
    return [options] {
        const ContactsStore store;
        savePhoto(options->id, options->file);
        return kExitDone;
    };
}

Action buildContactDelete(CLI::App& app) {
    return item_command::buildDelete<ContactsStore>(app, "The contact", deleteContact);
}
