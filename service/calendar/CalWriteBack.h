// What the device's record learns once the server has it: what the server calls it and what it alone knows of it.
#pragma once

#include <string>

#include "calendar/CalItemKind.h"

struct CalWriteBack {
    int itemId = 0;
    int expectedVersion = kAnyVersion;
    std::string uri;
    std::string etag;
};

// Writes it by the sync, inside the thread's open transaction. `server` is the item as the server has it, NULL when it did not say.
// A record that was changed or deleted meanwhile is left alone. False when the store cannot be written.
[[nodiscard]] bool writeBack(const CalItemKind& kind, const CalWriteBack& sent, calendar_record_h server);
