// BulkContent: what the benchmark's account holds. The same numbers give the same content at every start.
#pragma once

#include <cstddef>
#include <string>

#include "Store.h"

namespace bench {

struct ItemCounts {
    std::size_t events = 0;
    std::size_t contacts = 0;
    std::size_t tasks = 0;
};

inline constexpr const char* kEmail = "bench@provider.example";

// One account with one calendar, one address book and one task list. An event is about 1.5 kB of the provider's JSON, every tenth
// a weekly series; a contact is about 1 kB and has no photo.
void fill(provider::Store& store, const ItemCounts& counts);

// Gives the item in the middle of its list a new text and thereby a new etag. `kind`: "event", "contact" or "task". Throws
// provider::ApiError where there is none.
void touch(provider::Store& store, const std::string& kind);

// Text that compresses about as well as what people write.
std::string filler(std::size_t seed, std::size_t bytes);

}  // namespace bench
