// Seed: content to start with. The same words give the same content, whatever the day.
#pragma once

#include <cstddef>

#include "Store.h"

namespace provider {

// Two accounts with four calendars, one of them shared, several hundred events of all kinds, and contacts.
void seedSample(Store& store);
// A dozen contacts with every kind of field, groups, photos and a profile, for an account that has none.
void seedContacts(Store& store, const std::string& email);
// One account with one calendar of so many events, and as many contacts.
void seedBulk(Store& store, std::size_t events);
// Events of about 1 kB, every tenth recurring.
void addBulkEvents(Calendar& calendar, std::size_t events);
// Contacts of about 1 kB, each in the group that every account has.
void addBulkContacts(ContactBook& book, std::size_t contacts);

}  // namespace provider
