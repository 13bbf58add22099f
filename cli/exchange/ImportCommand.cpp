// import: a calendar file into a calendar, cards into the address book of an account. What it writes is a user's edit.
#include <memory>

#include "CalendarStore.h"
#include "Command.h"
#include "ContactsStore.h"
#include "Failure.h"
#include "exchange/CalendarImport.h"
#include "exchange/ContactsImport.h"

namespace {

using namespace exchange;  // NOLINT(google-build-using-namespace): the command of that folder

// What was done before a failure is told as well.
template <class Store, class Import>
void run(const ImportOptions& options, ItemReader& reader, ImportReport& report) {
    const Store store;
    Import import(options, report);
    try {
        import.run(reader);
    } catch (const Failure&) {
        report.print(options.isJson, options.isDryRun);
        throw;
    }
    report.print(options.isJson, options.isDryRun);
}

int importFile(const ImportOptions& options) {
    ItemReader reader(options.file);
    const bool isCards = reader.kind() == FileKind::kCards;
    if (isCards && options.account == 0)
        throw Misuse("the file holds contacts; give --account N (see --help)");
    if (!isCards && options.calendar == 0)
        throw Misuse("the file holds a calendar; give --calendar ID (see --help)");
    ImportReport report;
    isCards ? run<ContactsStore, ContactsImport>(options, reader, report)
            : run<CalendarStore, CalendarImport>(options, reader, report);
    if (!report.isWhole())
        throw Failure("some of the file was not taken, as listed above; mend it and import it again");
    return kExitDone;
}

}  // namespace

Action buildImport(CLI::App& app) {
    auto options = std::make_shared<ImportOptions>();
    app.add_option("FILE", options->file, "iCalendar or vCard; '-' reads standard input")->required();
    auto* calendar =
        command::addId(app, "--calendar", options->calendar, "The calendar that events or to-dos go to");
    command::addId(app, "--account", options->account, "The account whose address book contacts go to")
        ->excludes(calendar);
    app.add_flag("--replace", options->replaces, "Write what differs over what is there");
    app.add_flag("--dry-run", options->isDryRun, "Show what would be done, and write nothing");
    app.add_option("--time-zone", options->timeZone,
                   "The zone of times that name none, instead of this machine's");
    command::addJson(app, options->isJson);
    return [options] { return importFile(*options); };
}
