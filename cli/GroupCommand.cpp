// groups, group: lists groups of contacts; shows, adds, renames and deletes one. A group of the server is read-only.
#include "Command.h"
#include "ContactsStore.h"
#include "ItemCommand.h"
#include "RecordAccess.h"
#include "RecordJson.h"

namespace {

using record_access::intOf;
using record_access::textOf;
using record_json::Assignment;

constexpr ContactsStore::View kView{_contacts_group, CONTACTS_GROUP_ID, CONTACTS_GROUP_ADDRESS_BOOK_ID};
constexpr record_json::ScalarField kFields[] = {
    {"name", record_json::FieldKind::kText, CONTACTS_GROUP_NAME, {}}};

Json composeOf(contacts_record_h group, const BookAccounts& accounts) {
    const auto book = accounts.find(intOf(group, CONTACTS_GROUP_ADDRESS_BOOK_ID));
    return {{"id", intOf(group, CONTACTS_GROUP_ID)},
            {"account", book != accounts.end() ? book->second : 0},
            {"name", textOf(group, CONTACTS_GROUP_NAME)},
            {"readOnly", intOf(group, CONTACTS_GROUP_IS_READ_ONLY) != 0}};
}

template <class Use>
void forEachGroup(std::optional<int> account, Use use) {
    const BookAccounts accounts = ContactsStore::accounts(account);
    for (const ContactsList& list : ContactsStore::ofAccount(kView, account))
        record_access::forEach(list, [&](contacts_record_h group) { use(composeOf(group, accounts)); });
}

void listJson(std::optional<int> account) {
    output::JsonArray array;
    forEachGroup(account, [&array](const Json& group) { array.add(group); });
    array.end();
}

void listTable(std::optional<int> account) {
    output::Table table({"ID", "ACCOUNT", "MODE", "NAME"});
    forEachGroup(account, [&table](const Json& group) {
        table.add({group["id"].dump(), group["account"].dump(), group["readOnly"] ? "read-only" : "",
                   group["name"]});
    });
    table.print();
}

void showGroup(int id, bool isJson) {
    const Json group = composeOf(ContactsStore::group(id).get(), ContactsStore::accounts());
    isJson ? output::json(group) : output::fields(group);
}

void setName(contacts_record_h group, const std::string& name) {
    if (name.empty()) record_json::refuse("name", "must not be empty");
    record_access::setText(group, CONTACTS_GROUP_NAME, name, "name");
}

int addGroup(const std::string& path, int chosenAccount) {
    const Json object = record_json::readFile(path);
    if (!object.is_object()) throw Failure("the file must hold one group as a JSON object");
    contacts_record_h raw = nullptr;
    check(contacts_record_create(_contacts_group, &raw), "making a record");
    const ContactsRecord group(raw);
    std::optional<int> account;
    std::string name;
    for (const auto& member : object.items()) {
        if (member.key() == "name") {
            name = record_json::textFrom(member.value(), member.key());
        } else if (member.key() == "account") {
            account = record_json::idFrom(member.value(), member.key());
        } else if (member.key() == "id") {
            static_cast<void>(record_json::idFrom(member.value(), member.key()));
        } else if (member.key() != "readOnly") {  // a copy of a group of the server is the user's own
            record_json::refuse(member.key(), "is not known");
        }
    }
    setName(raw, name);
    if (chosenAccount > 0) account = chosenAccount;
    if (!account) throw Failure("the member \"account\" is missing; add it or give --account ID");
    record_access::setInt(raw, CONTACTS_GROUP_ADDRESS_BOOK_ID, ContactsStore::bookOf(*account), "account");
    int id = 0;
    check(contacts_db_insert_record(raw, &id), "adding the group");
    return id;
}

void checkWritable(contacts_record_h group) {
    if (intOf(group, CONTACTS_GROUP_IS_READ_ONLY) != 0) {
        throw Failure("the group " + std::to_string(intOf(group, CONTACTS_GROUP_ID)) +
                      " is the server's own and stays as it is");
    }
    ContactsStore::checkWritable(intOf(group, CONTACTS_GROUP_ADDRESS_BOOK_ID));
}

int tryToSet(int id, const std::vector<Assignment>& assignments) {
    const FoundContact group = ContactsStore::group(id);
    checkWritable(group.get());
    for (const Assignment& assignment : assignments) setName(group.get(), assignment.value);
    const int version = intOf(group.get(), CONTACTS_GROUP_VERSION);
    record_write_options_s options;
    options.expected_versions = {&version, 1};
    return contacts_db_update_record(group.get(), options);
}

void deleteGroup(int id) {
    checkWritable(ContactsStore::group(id).get());
    check(contacts_db_delete_record(_contacts_group, id), "deleting the group " + std::to_string(id));
}

}  // namespace

Action buildGroupsList(CLI::App& app) {
    return item_command::buildAccountList<ContactsStore>(app, listJson, listTable);
}

Action buildGroupShow(CLI::App& app) {
    return item_command::buildShow<ContactsStore>(app, "The group", showGroup);
}

Action buildGroupAdd(CLI::App& app) {
    return item_command::buildAdd<ContactsStore>(
        app,
        {"JSON as 'group show --json' prints it; '-' reads standard input", "--account",
         "The account, instead of the file's"},
        addGroup, showGroup);
}

Action buildGroupSet(CLI::App& app) {
    auto options = std::make_shared<ItemOptions>();
    item_command::addSetOptions(app, *options, "The group", "name");
    return [options] {
        const auto assignments = record_json::readAssignments(kFields, options->assignments);
        const ContactsStore store;
        item_command::write("changing the group " + std::to_string(options->id),
                            [&] { return tryToSet(options->id, assignments); });
        return kExitDone;
    };
}

Action buildGroupDelete(CLI::App& app) {
    return item_command::buildDelete<ContactsStore>(app, "The group", deleteGroup);
}
