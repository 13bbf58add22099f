// CalendarFixture: a device with one calendar of account 7, for tests that write pages of server events without a server.
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "calendar/CalDataManager.h"
#include "calendar/CalItemWriter.h"
#include "support/TestRoot.h"

using Json = nlohmann::json;

inline constexpr int kAccount = 7;
inline constexpr const char* kCalendarUri = "work@provider.example";

// Server events.
Json event(const std::string& id, const std::string& etag, const Json& more = Json::object());
Json series(const std::string& id, const std::string& etag);
// An instance of `seriesId` on 2026-03-DAY at 09:00 UTC.
Json instance(const std::string& seriesId, int day, const std::string& etag,
              const Json& more = Json::object());
Json cancelled(const std::string& seriesId, int day, const std::string& etag);
std::string recurrenceId(int day);

class CalendarFixture {
public:
    CalendarFixture();

    // Writes the pages as one complete list would be: pages, waiting instances, deletion.
    CalItemWriter::Counts download(const std::vector<std::vector<Json>>& pages);
    // Only the pages: a list that was not read to its end.
    void downloadPart(const std::vector<std::vector<Json>>& pages);

    // --- what the device holds
    [[nodiscard]] std::vector<std::string> summaries();  // of all events and exceptions, sorted
    [[nodiscard]] CalendarRecord record(const std::string& uid);
    [[nodiscard]] std::string text(const std::string& uid, unsigned property);
    [[nodiscard]] int number(const std::string& uid, unsigned property);
    [[nodiscard]] CalEventMetaData row(const std::string& uri);
    [[nodiscard]] size_t rowCount();
    [[nodiscard]] int storeVersion();

    // --- what a user does (plain writes)
    void userSets(const std::string& uid, unsigned property, const std::string& value);
    void userDeletes(const std::string& uid);
    int userAdds(const std::string& summary);

    TestRoot root;
    CalDataManager manager;
    CalBookMetaData book;
};
