// The names of the contact feeds on the wire.
#pragma once

namespace provider {

#define PROVIDER_KIND_NAMESPACE "http://schemas.provider.example/g/2005"
#define PROVIDER_CONTACT_NAMESPACE "http://schemas.provider.example/contact/2008"

inline constexpr const char* kAtomNamespace = "http://www.w3.org/2005/Atom";
inline constexpr const char* kKindNamespace = PROVIDER_KIND_NAMESPACE;
inline constexpr const char* kContactNamespace = PROVIDER_CONTACT_NAMESPACE;
inline constexpr const char* kKindScheme = PROVIDER_KIND_NAMESPACE "#kind";
inline constexpr const char* kContactTerm = PROVIDER_CONTACT_NAMESPACE "#contact";
inline constexpr const char* kGroupTerm = PROVIDER_CONTACT_NAMESPACE "#group";
inline constexpr const char* kPhotoRel = PROVIDER_CONTACT_NAMESPACE "/rel#photo";
// What the kind namespace's rels begin with.
inline constexpr const char* kKindRel = PROVIDER_KIND_NAMESPACE "#";

#undef PROVIDER_KIND_NAMESPACE
#undef PROVIDER_CONTACT_NAMESPACE

inline constexpr const char* kFeeds = "/m8/feeds/";
// Stands in stored texts for the scheme and host that a client uses.
inline constexpr const char* kBasePlace = "{base}";

}  // namespace provider
