// DeletionProof: when a complete list is believed that says that items are gone. An empty or shrunken list is far more often
// a fault of the server than the wish of a user, so a list that would delete much is fetched a second time.
#pragma once

#include <cstddef>

namespace deletion_proof {

inline constexpr size_t kFewItems = 10;  // up to so many may go at the first look

// `known` items before, `gone` of them no longer listed (counting what goes with a calendar); `emptied`: nothing is left.
constexpr bool needsSecondLook(size_t known, size_t gone, bool emptied) {
    if (gone == 0) return false;
    return emptied || (gone > kFewItems && gone * 2 > known);
}

}  // namespace deletion_proof
