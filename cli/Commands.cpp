#include "Commands.h"

#include <charconv>
#include <cstdio>
#include <map>

#include "Failure.h"
#include "Output.h"

namespace {

constexpr const char* kProgram = "vantor-pim-syncctl";

struct Noun {
    const char* name;
    const char* summary;
};
// Nouns with verbs below them.
constexpr Noun kNouns[] = {
    {"key", "Secrets of this device"},
    {"setting", "Settings of this device"},
    {"account", "Accounts that are kept in step"},
    {"daemon", "The daemon of a private root folder"},
    {"calendars", "Calendars of this device"},
    {"events", "Events of this device"},
    {"event", "One event"},
    {"todos", "To-dos of this device"},
    {"todo", "One to-do"},
    {"contacts", "Contacts of this device"},
    {"contact", "One contact"},
    {"groups", "Groups of contacts of this device"},
    {"group", "One group of contacts"},
    {"export", "Events and to-dos as iCalendar, contacts as vCard"},
};

constexpr Command kCommands[] = {
    {"init", nullptr, "Make the folders, notification files and stores of this root", "init", buildInit},
    {"key", "set", "Store a secret that is read from standard input", "key set client_id < client-id.txt",
     buildKeySet},
    {"setting", "get", "Print a setting", "setting get db/account/auto_sync", buildSettingGet},
    {"setting", "set", "Store a setting (a whole number, true or false, or a text)",
     "setting set db/account/auto_sync 1\nsetting set db/vantor-pim-sync/token_server https://token.example",
     buildSettingSet},
    {"account", "add", "Register an account and keep it in step",
     "account add --id 7 --email me@example.com --server https://pim.example --refresh-token-file token.txt\n"
     "account add --id 7 --email me@example.com --server http://127.0.0.1:8080 --refresh-token-file - < "
     "token.txt",
     buildAccountAdd},
    {"account", "list", "List the accounts", "account list\naccount list --json", buildAccountList},
    {"account", "show", "Show one account", "account show 7", buildAccountShow},
    {"account", "update", "Change an account; what is not named stays as it is",
     "account update 7 --calendar-period 30\naccount update 7 --refresh-token-file token.txt",
     buildAccountUpdate},
    {"account", "remove", "Stop an account's syncs and remove it with its data on this device",
     "account remove 7", buildAccountRemove},
    {"sync", nullptr, "Bring both sides together now", "sync 7\nsync 7 calendar --wait", buildSync},
    {"stop", nullptr, "Stop a running sync", "stop 7\nstop 7 calendar", buildStop},
    {"status", nullptr, "Show how the syncs stand", "status\nstatus 7 --json", buildStatus},
    {"watch", nullptr, "Show how the syncs stand, again at every change", "watch\nwatch 7\nwatch --json",
     buildWatch},
    {"log", nullptr, "Show the daemon's recent lines", "log\nlog 7\nlog 7 --lines 200", buildLog},
    {"doctor", nullptr, "Look for what is wrong and tell how to mend it", "doctor\ndoctor --json",
     buildDoctor},
    {"daemon", "start", "Start the daemon and wait until it answers", "daemon start", buildDaemonStart},
    {"daemon", "stop", "End the daemon and wait until it is gone", "daemon stop", buildDaemonStop},
    {"daemon", "status", "Tell whether the daemon answers (exit status 0) or not (1)",
     "daemon status\ndaemon status --json", buildDaemonStatus},
    {"calendars", "list", "List calendars", "calendars list\ncalendars list --account 7 --json",
     buildCalendarsList},
    {"events", "list", "List events", "events list --calendar 3\nevents list --account 7 --json",
     buildEventsList},
    {"event", "show", "Show one event", "event show 12\nevent show 12 --json > event.json", buildEventShow},
    {"event", "add", "Add the event of a JSON file",
     "event add event.json\nevent add --calendar 3 - < event.json", buildEventAdd},
    {"event", "set", "Change fields of an event",
     "event set 12 summary=Lunch location=Canteen\nevent set 12 start=2014-05-01T10:00:00Z "
     "end=2014-05-01T11:00:00Z\nevent set 12 --instance 20140503T100000Z location=Canteen",
     buildEventSet},
    {"event", "delete", "Delete an event, a series, or one instance of a series",
     "event delete 12\nevent delete 12 --instance 20140503T100000Z", buildEventDelete},
    {"todos", "list", "List to-dos", "todos list --calendar 4\ntodos list --account 7 --json",
     buildTodosList},
    {"todo", "show", "Show one to-do", "todo show 12\ntodo show 12 --json > todo.json", buildTodoShow},
    {"todo", "add", "Add the to-do of a JSON file", "todo add todo.json\ntodo add --calendar 4 - < todo.json",
     buildTodoAdd},
    {"todo", "set", "Change fields of a to-do",
     "todo set 12 status=completed\ntodo set 12 due=2014-05-01T10:00:00Z summary=Post", buildTodoSet},
    {"todo", "delete", "Delete a to-do", "todo delete 12", buildTodoDelete},
    {"contacts", "list", "List contacts", "contacts list\ncontacts list --account 7 --json",
     buildContactsList},
    {"contact", "show", "Show one contact", "contact show 12\ncontact show 12 --json > contact.json",
     buildContactShow},
    {"contact", "add", "Add the contact of a JSON file",
     "contact add contact.json\ncontact add --account 7 - < contact.json", buildContactAdd},
    {"contact", "set", "Change fields of a contact",
     "contact set 12 name.first=Mira nickname=Mi\ncontact set 12 photo=mira.jpg\ncontact set 12 photo=\n"
     "contact set 12 groups=[3,5] 'phones=[{\"value\": \"+49 30 1234\", \"type\": \"mobile\"}]'",
     buildContactSet},
    {"contact", "photo", "Save a contact's photo to a file",
     "contact photo 12 mira.jpg\ncontact photo 12 - > mira.jpg", buildContactPhoto},
    {"contact", "delete", "Delete a contact", "contact delete 12", buildContactDelete},
    {"groups", "list", "List groups of contacts", "groups list\ngroups list --account 7 --json",
     buildGroupsList},
    {"group", "show", "Show one group", "group show 3\ngroup show 3 --json > group.json", buildGroupShow},
    {"group", "add", "Add the group of a JSON file",
     "group add group.json\ngroup add --account 7 - < group.json", buildGroupAdd},
    {"group", "set", "Change a group's name", "group set 3 name=Choir", buildGroupSet},
    {"group", "delete", "Delete a group; its contacts stay", "group delete 3", buildGroupDelete},
    {"export", "events", "Write events as iCalendar (RFC 5545)",
     "export events --calendar 3 work.ics\nexport events --account 7 > events.ics", buildExportEvents},
    {"export", "todos", "Write to-dos as iCalendar (RFC 5545)",
     "export todos --calendar 4 tasks.ics\nexport todos > todos.ics", buildExportTodos},
    {"export", "contacts", "Write contacts with their photos as vCard 4.0 (RFC 6350)",
     "export contacts --account 7 contacts.vcf\nexport contacts > contacts.vcf", buildExportContacts},
    {"import", nullptr, "Add the events or to-dos of an iCalendar file, or the contacts of a vCard file",
     "import work.ics --calendar 3\nimport contacts.vcf --account 7 --dry-run\n"
     "import - --calendar 3 --replace --json < work.ics",
     buildImport},
};

const std::string kExamplesTitle = "Examples:\n";

std::string examplesOf(const Command& command) {
    std::string text = std::string("  ") + kProgram + " ";
    for (const char* at = command.examples; *at != '\0'; ++at) {
        text += *at;
        if (*at == '\n') text += std::string("  ") + kProgram + " ";
    }
    return text;
}

const char* summaryOf(const std::string& name) {
    for (const Noun& noun : kNouns) {
        if (name == noun.name) return noun.summary;
    }
    return "";
}

constexpr const char* kMainExamples =
    "Examples:\n"
    "  vantor-pim-syncctl init\n"
    "  vantor-pim-syncctl account add --id 7 --email me@example.com --server https://pim.example \\\n"
    "      --refresh-token-file token.txt\n"
    "  vantor-pim-syncctl sync 7 --wait\n"
    "  vantor-pim-syncctl events list\n\n"
    "Exit status: 0 done, 1 failed, 2 misused. VANTOR_PIM_SYNC_ROOT names the root folder of a private "
    "device.";

void declare(CLI::App& app, Action& chosen) {
    app.require_subcommand(1);
    app.footer(kMainExamples);
    app.set_version_flag("--version", VPS_VERSION);
    std::map<std::string, CLI::App*> nouns;
    std::map<std::string, std::string> nounExamples;
    for (const Command& command : kCommands) {
        if (command.verb != nullptr && !nouns.contains(command.noun)) {
            nouns[command.noun] = app.add_subcommand(command.noun, summaryOf(command.noun));
            nouns[command.noun]->require_subcommand(1);
        }
        CLI::App* sub = command.verb == nullptr
                            ? app.add_subcommand(command.noun, command.summary)
                            : nouns[command.noun]->add_subcommand(command.verb, command.summary);
        sub->footer(kExamplesTitle + examplesOf(command));
        if (command.verb != nullptr) nounExamples[command.noun] += "\n" + examplesOf(command);
        sub->callback([&chosen, action = command.build(*sub)] { chosen = action; });
    }
    for (const auto& [noun, examples] : nounExamples)
        nouns[noun]->footer(kExamplesTitle + examples.substr(1));
}

int complain(std::string_view problem, int status) {
    std::fprintf(stderr, "%s: %s\n", kProgram, output::printable(problem).c_str());
    return status;
}

// A word that is no command is named; the parser itself only misses a command.
std::string describe(const CLI::App& app, const CLI::ParseError& error) {
    const std::vector<std::string> rest = app.remaining(/*recurse=*/true);
    const bool isUnknown =
        error.get_exit_code() == static_cast<int>(CLI::ExitCodes::RequiredError) && !rest.empty();
    return (isUnknown ? "\"" + rest.front() + "\" is no command" : std::string(error.what())) +
           " (see --help)";
}

int parse(CLI::App& app, int argc, const char* const* argv) {
    try {
        app.parse(argc, argv);
        return kExitDone;
    } catch (const CLI::Success& wanted) {  // --help, --version
        app.exit(wanted);
        return kExitDone;
    } catch (const CLI::ParseError& error) {
        return complain(describe(app, error), kExitMisused);
    }
}

}  // namespace

namespace command {

bool readNumber(const std::string& text, int least, int most, int* out) {
    int value = 0;
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, value);
    if (text.empty() || error != std::errc() || stop != end || value < least || value > most) return false;
    *out = value;
    return true;
}

CLI::Option* addNumber(CLI::App& app, const std::string& name, int& value, int least, int most,
                       const std::string& help) {
    const auto read = [&value, least, most, name](const std::string& text) {
        if (readNumber(text, least, most, &value)) return;
        throw CLI::ValidationError(name, "\"" + text + "\" is not a whole number from " +
                                             std::to_string(least) + " to " + std::to_string(most));
    };
    return app.add_option_function<std::string>(name, read, help);
}

CLI::Option* addId(CLI::App& app, const std::string& name, int& id, const std::string& help) {
    return addNumber(app, name, id, 1, INT32_MAX, help);
}

CLI::Option* addJson(CLI::App& app, bool& isJson) {
    return app.add_flag("--json", isJson, "Print JSON for scripts");
}

}  // namespace command

std::span<const Command> allCommands() {
    return kCommands;
}

int runCommandLine(int argc, const char* const* argv) {
    CLI::App app("Keeps calendars, to-dos and contacts of this device in step with an account's services.",
                 kProgram);
    Action chosen;
    try {
        declare(app, chosen);
        const int status = parse(app, argc, argv);
        if (status != kExitDone || !chosen) return status;
        return chosen();
    } catch (const Misuse& problem) {
        return complain(problem.what(), kExitMisused);
    } catch (const std::exception& problem) {
        return complain(problem.what(), kExitFailed);
    }
}
