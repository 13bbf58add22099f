// SentMark: the etag of a row whose item may have reached the server: it was sent, or was about to be, and no answer told. The mark
// names what was sent by its digest, so that the item is known in the server's list although a user has edited or deleted the
// device's since.
#pragma once

#include <glib.h>

#include <string>

#include "common/Handles.h"

namespace sent_mark {

inline constexpr const char* kNamesNothing = "unconfirmed";

[[nodiscard]] inline bool isOn(const std::string& etag) {
    return etag.starts_with(kNamesNothing);
}

// Of an item that says `says`, as the data kind compares its items; an empty text names nothing.
[[nodiscard]] inline std::string of(const std::string& says) {
    if (says.empty()) return kNamesNothing;
    const GChars digest(
        g_compute_checksum_for_string(G_CHECKSUM_SHA256, says.data(), static_cast<gssize>(says.size())));
    return std::string(kNamesNothing) + " " + digest.get();
}

}  // namespace sent_mark
