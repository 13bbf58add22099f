// CtJsonOrbitPeopleConverter: a person's public profile. It fills what the contact itself leaves open. Stateless.   Threads: any.
#pragma once

#include <string>

#include "platform/contacts.h"

class CtJsonOrbitPeopleConverter {
public:
    // `peopleBase`: where the default avatar lives. Empty for a profile without an image of its own; -1 for what is no profile.
    [[nodiscard]] static int getPhotoUrl(const std::string& profile, const std::string& peopleBase,
                                         std::string* url);

    // Adds name, nickname and birthday where the contact has none. -1 (logged) when that fails.
    [[nodiscard]] static int convert(const std::string& profile, contacts_record_h contact);

    // What an earlier profile gave: what the contact has of it and the server's entry that is kept with the contact has not. As a
    // profile; empty when there is nothing.
    [[nodiscard]] static std::string formerProfile(contacts_record_h contact);
};
