#include "calendar/CalWriteBack.h"

#include <vector>

#include "common/SyncResult.h"
#include "platform/calendar_read.h"

using sync_result::kOk;

bool writeBack(const CalItemKind& kind, const CalWriteBack& sent, calendar_record_h server) {
    std::vector<unsigned> properties = {kind.id, kind.uid, kind.etag};
    properties.insert(properties.end(), kind.serverFields.begin(), kind.serverFields.end());
    CalendarList list;
    calendar_record_h record = nullptr;
    const int found = calendar_read::readPart(kind.view, kind.id, sent.itemId, properties, &list, &record);
    if (found == PLATFORM_ERROR_NOT_FOUND) return true;
    const auto set = [record](unsigned property, const std::string& text) {
        return calendar_record_set_str(record, property, text.c_str()) == PLATFORM_ERROR_NONE;
    };
    if (found != PLATFORM_ERROR_NONE || !set(kind.uid, sent.uri) || !set(kind.etag, sent.etag)) return false;
    if (server != nullptr && !kind.takeServerFields(server, record)) return false;
    const record_write_options_s options{.by_sync = true,
                                         .expected_versions = std::span(&sent.expectedVersion, 1)};
    const int code = calendar_db_update_record(record, options);
    // Changed again meanwhile: the next run sends it and comes back here, or the next download finds it behind its row.
    return code == PLATFORM_ERROR_NONE || code == PLATFORM_ERROR_CONFLICT || code == PLATFORM_ERROR_NOT_FOUND;
}
