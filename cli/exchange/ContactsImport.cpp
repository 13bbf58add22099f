#include "exchange/ContactsImport.h"

#include <algorithm>

#include "ContactFields.h"
#include "ContactJson.h"
#include "ContactsStore.h"
#include "Failure.h"
#include "RecordAccess.h"
#include "exchange/GroupNames.h"
#include "exchange/Identity.h"

namespace exchange {

namespace {

using record_access::intOf;

constexpr BulkWriter::Calls kContactsCalls{
    [](contacts_list_h list, const record_write_options_s& options) {
        return contacts_db_insert_records(list, options);
    },
    [](contacts_record_h record, int* id, const record_write_options_s& options) {
        return contacts_db_insert_record(record, id, options);
    }};

// What a contact says, with its groups by name and its photo by digest.
Json sayWith(Json contact, std::vector<std::string> groups, const std::string& photoDigest) {
    std::sort(groups.begin(), groups.end());
    contact[contact_json::kGroups] = std::move(groups);
    contact[contact_json::kPhoto] = photoDigest;
    return contact;
}

Json say(const Card& card) {
    const contact_json::NewContact contact = contact_json::parse(card.contact);
    return sayWith(contact_json::compose(contact.record.get(), 0), card.groups,
                   card.photo.empty() ? "" : identity::sha256(card.photo));
}

// One that cannot be read is like no other.
std::string digestOfPhoto(const std::string& path) {
    if (path.empty()) return {};
    try {
        return identity::sha256(photo_file::read(path));
    } catch (const Failure&) {
        return path;
    }
}

}  // namespace

ContactsImport::ContactsImport(const ImportOptions& options, ImportReport& report)
    : mOptions(options), mReport(report), mBook(ContactsStore::bookOf(options.account)) {
    for (const auto& [id, name] : groupNames(options.account)) mGroups.try_emplace(name, id);
}

KnownItems ContactsImport::known() const {
    std::map<int, std::string> names;
    for (const auto& [id, name] : groupNames(mOptions.account)) names[id] = name;
    KnownItems known;
    const ContactsList list =
        ContactsStore::find(_contacts_contact, {{CONTACTS_CONTACT_ADDRESS_BOOK_ID, mBook}},
                            CONTACTS_CONTACT_ID, contact_json::projection());
    record_access::forEach(list, [&](contacts_record_h record) {
        Json contact = contact_json::compose(record, 0);
        std::vector<std::string> groups;
        for (const Json& id : contact[contact_json::kGroups]) groups.push_back(names[id.get<int>()]);
        const int id = contact["id"];
        contact =
            sayWith(std::move(contact), std::move(groups), digestOfPhoto(contact_json::photoOf(record)));
        known.add(id, {identity::uidOf("contact", id)}, identity::digestOf(contact),
                  identity::contactKeys(contact));
    });
    return known;
}

void ContactsImport::run(ItemReader& reader) {
    KnownItems known = this->known();
    BulkWriter writer(kContactsCalls, mReport, mOptions.isDryRun);
    RawItem raw;
    while (reader.next(&raw)) take(raw, known, writer);
    for (const Card& card : mUndecided)
        settle(card, known.findByKeys(identity::contactKeys(say(card))), writer);
    writer.flush();
    if (reader.cutAt() > 0) mReport.noteCut(reader.cutAt());
}

void ContactsImport::take(const RawItem& raw, KnownItems& known, BulkWriter& writer) {
    if (raw.name != "VCARD") {
        mReport.notHeld().add(content_line::isName(raw.name) ? raw.name : "components");
        return;
    }
    mReport.countRead();
    NotHeld losses;
    Card card;
    Json said;
    try {
        card = mReader.read(raw, losses);
        said = say(card);
    } catch (const Failure& problem) {
        mReport.skip(Skip::kUnread, titleOf(raw), raw.firstLine, problem.what());
        return;
    }
    if (card.isList) {
        mReport.skip(Skip::kOther, titleOf(raw), raw.firstLine, "it is a list of contacts, not a contact");
        return;
    }
    mReport.notHeld().merge(losses);
    const std::string digest = identity::digestOf(said);
    if (known.isRepeated(card.uid, digest)) {
        mReport.skip(Skip::kSame, contact_json::displayNameOf(said), card.line,
                     "it stands in the file twice");
        return;
    }
    const KnownItems::Found found = known.find(card.uid, digest, identity::contactKeys(said));
    const bool saysNothing = card.contact.empty() && card.photo.empty();
    if (saysNothing && found.match != Match::kSame) {
        mReport.skip(Skip::kOther, titleOf(raw), raw.firstLine, "it says nothing");
    } else if (found.match == Match::kUndecided) {
        mUndecided.push_back(std::move(card));
    } else {
        settle(card, found, writer);
    }
}

void ContactsImport::settle(const Card& card, const KnownItems::Found& found, BulkWriter& writer) {
    const std::string title = contact_json::displayNameOf(say(card));
    switch (found.match) {
        case Match::kSame:
            mReport.skip(Skip::kSame, title, card.line, "");
            return;
        case Match::kDiffers:
            if (!mOptions.replaces) {
                mReport.skip(Skip::kDiffers, title, card.line,
                             "it differs from contact " + std::to_string(found.id) +
                                 " there; --replace takes the file's");
                return;
            }
            if (!mOptions.isDryRun) replace(found.id, card);
            mReport.countReplaced();
            return;
        case Match::kNew:
        case Match::kUndecided:
            add(card, writer);
            return;
    }
}

std::vector<int> ContactsImport::groupsOf(const Card& card) {
    std::vector<int> ids;
    for (const std::string& name : card.groups) {
        const auto [group, isNew] = mGroups.try_emplace(name, 0);
        if (isNew) mReport.countGroup();
        if (isNew && !mOptions.isDryRun) {
            contacts_record_h raw = nullptr;
            check(contacts_record_create(_contacts_group, &raw), "making a group");
            const ContactsRecord record(raw);
            record_access::setInt(raw, CONTACTS_GROUP_ADDRESS_BOOK_ID, mBook, "account");
            record_access::setText(raw, CONTACTS_GROUP_NAME, name, "name");
            check(contacts_db_insert_record(raw, &group->second), "making the group \"" + name + "\"");
        }
        ids.push_back(group->second);
    }
    return ids;
}

void ContactsImport::add(const Card& card, BulkWriter& writer) {
    contact_json::NewContact contact = contact_json::parse(card.contact);
    contacts_record_h record = contact.record.get();
    record_access::setInt(record, CONTACTS_CONTACT_ADDRESS_BOOK_ID, mBook, "account");
    const std::vector<int> groups = groupsOf(card);
    std::shared_ptr<StagedPhoto> photo;
    if (!mOptions.isDryRun) {
        contact_json::setGroups(record, groups);
        if (!card.photo.empty()) photo = std::make_shared<StagedPhoto>(StagedPhoto::Bytes{card.photo});
        if (photo != nullptr) contact_json::setPhoto(record, photo->path());
    }
    const std::string title = contact_json::displayNameOf(say(card));
    writer.add({CalendarRecord(contact.record.release()), title, card.line, photo, card.photo.size()});
}

// Groups and photo stay when the card has none: many programs leave them out.
void ContactsImport::replace(int id, const Card& card) {
    contacts_record_h raw = nullptr;
    check(contacts_db_get_record(_contacts_contact, id, &raw), "reading the contact " + std::to_string(id));
    const ContactsRecord record(raw);
    const int version = intOf(raw, CONTACTS_CONTACT_VERSION);
    const Json said = say(card);
    for (const ContactText& text : contact_fields::kTexts) {
        const Json::json_pointer place("/" + [&] {
            std::string path(text.name);
            std::replace(path.begin(), path.end(), '.', '/');
            return path;
        }());
        contact_json::apply(raw, {std::string(text.name), said[place]});
    }
    for (const ContactItems& list : contact_fields::kLists) {
        const std::string name(list.name);
        contact_json::apply(raw, {name, said[name].dump()});
    }
    if (!card.groups.empty()) contact_json::setGroups(raw, groupsOf(card));
    std::unique_ptr<StagedPhoto> photo;
    if (!card.photo.empty()) photo = std::make_unique<StagedPhoto>(StagedPhoto::Bytes{card.photo});
    if (photo != nullptr) contact_json::setPhoto(raw, photo->path());
    record_write_options_s options;
    options.expected_versions = {&version, 1};
    check(contacts_db_update_record(raw, options), "replacing the contact " + std::to_string(id));
}

}  // namespace exchange
