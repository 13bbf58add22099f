// CtPagePlan: what one page of a feed changes, decided before anything is fetched or written.
//
//   listed          row              device's record       plan
//   listed          none             none                  insert
//   listed          sent, no answer  says the same         update, and the row takes id and etag
//   listed          sent, no answer  edited or deleted     the row takes id and etag: the device's change wins
//   listed          none             own, untouched        update
//   listed          none             own, user edited it   the row is taken over as dirty: the device's change wins
//   etag equal      any              any                   nothing, but for a photo or a membership that is still missing; a lost
//                                                          record is made again
//   etag differs    clean            as the sync left it   update
//   etag differs    dirty or deleted, or a change not examined   the row takes the etag: the device's change wins
#pragma once

#include <string>
#include <unordered_map>
#include <vector>

#include "contacts/CtBulkItem.h"
#include "contacts/CtGroupMap.h"
#include "contacts/CtSnapshot.h"

// Contacts and groups that an earlier run sent without an answer, by their marks: of what was sent, and of what they say now.
template <class Kind>
struct CtSentRow {
    typename Kind::Row row;
    bool isEdited = false;  // since it was sent
};
template <class Kind>
using CtSentRows = std::unordered_multimap<std::string, CtSentRow<Kind>>;

[[nodiscard]] CtSentRows<CtContactKind> readSentContacts(const CtSnapshot<CtContactKind>& snapshot,
                                                         const ContactComposer& composer);
[[nodiscard]] CtSentRows<CtGroupKind> readSentGroups(const CtSnapshot<CtGroupKind>& snapshot);

// Rows that are recognised are taken out of `sent`.
[[nodiscard]] CtContactBatch planContacts(const CtContactPage& page,
                                          const CtSnapshot<CtContactKind>& snapshot, const CtGroupMap& groups,
                                          const ContactComposer& composer, CtSentRows<CtContactKind>* sent);
[[nodiscard]] std::vector<CtGroupItem> planGroups(const CtGroupPage& page,
                                                  const CtSnapshot<CtGroupKind>& snapshot,
                                                  CtSentRows<CtGroupKind>* sent);
