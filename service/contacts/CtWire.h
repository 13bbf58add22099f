// The names of the contacts service on the wire.
#pragma once

namespace ct_wire {

// Namespaces of the entries. They name, they are never fetched.
#define CT_ATOM_NAMESPACE "http://www.w3.org/2005/Atom"
#define CT_KIND_NAMESPACE "http://schemas.provider.example/g/2005"
#define CT_CONTACT_NAMESPACE "http://schemas.provider.example/contact/2008"

inline constexpr const char* kAtomNamespace = CT_ATOM_NAMESPACE;
inline constexpr const char* kKindNamespace = CT_KIND_NAMESPACE;
inline constexpr const char* kContactNamespace = CT_CONTACT_NAMESPACE;
inline constexpr const char* kKindScheme = CT_KIND_NAMESPACE "#kind";
inline constexpr const char* kContactTerm = CT_CONTACT_NAMESPACE "#contact";
inline constexpr const char* kGroupTerm = CT_CONTACT_NAMESPACE "#group";
// What a photo link's rel ends with, whatever namespace stands before it.
inline constexpr const char* kPhotoRelEnd = "rel#photo";

#undef CT_ATOM_NAMESPACE
#undef CT_KIND_NAMESPACE
#undef CT_CONTACT_NAMESPACE

// Paths below the contacts server.
inline constexpr const char* kFeeds = "/m8/feeds";
inline constexpr const char* kPhotos = "/photos/media/default/";
// Paths below the people server.
inline constexpr const char* kPeople = "/orbit/v1/people/";
inline constexpr const char* kProfiles = "/profiles/";
inline constexpr const char* kDefaultAvatar = "/img/default";
// Identifies the program to the people endpoint; public, it gives access to nothing of an account.
inline constexpr const char* kPeopleKey = "u8jzPde0IgxLd6GncfBAepfJBd0Kh8oOOL8dKLz";

// The title of the group that stands for the device's favourites.
inline constexpr const char* kStarredGroup = "Starred in Merrow";

// Extension records of a contact: the server's entry as it was read, and fields that users define themselves.
inline constexpr int kOriginExtension = 100;
inline constexpr const char* kOriginName = "origin";
inline constexpr int kUserDefinedExtension = 321;

// Types of the device's dates that stand for themselves.
inline constexpr int kBirthday = 2;

}  // namespace ct_wire
