// doctor: looks at everything that a sync needs, and tells what is wrong and how to mend it. Changes nothing.
#include <cstring>

#include "Command.h"
#include "Failure.h"
#include "Output.h"
#include "doctor/Checks.h"

namespace {

constexpr size_t kIndent = 9;  // the longest word and a gap

struct Check {
    const char* name;
    void (*run)(std::vector<Finding>* all);
};
constexpr Check kChecks[] = {
    {"folders", doctor::checkFolders},   {"keys", doctor::checkKeys},
    {"disk", doctor::checkDisk},         {"stores", doctor::checkStores},
    {"settings", doctor::checkSettings}, {"daemon", doctor::checkDaemon},
    {"accounts", doctor::checkAccounts}, {"tokens", doctor::checkTokens},
    {"servers", doctor::checkServers},   {"syncs", doctor::checkSyncs},
};

struct Word {
    Health health;
    const char* name;
    terminal::Colour colour;
};
constexpr Word kWords[] = {
    {Health::kGood, "good", terminal::Colour::kGood},
    {Health::kNotice, "notice", terminal::Colour::kBusy},
    {Health::kProblem, "problem", terminal::Colour::kBad},
};

const Word& wordOf(Health health) {
    for (const Word& word : kWords) {
        if (word.health == health) return word;
    }
    return kWords[0];
}

// What keeps a check from being made is a finding, and does not keep the others.
std::vector<Finding> runAll() {
    std::vector<Finding> all;
    for (const Check& check : kChecks) {
        output::passingProgress(std::string("looking at: ") + check.name);
        try {
            check.run(&all);
        } catch (const Failure& failure) {
            all.push_back({check.name, Health::kProblem, failure.what(), ""});
        }
    }
    output::passingProgress("");
    return all;
}

void show(const Finding& finding) {
    const Word& word = wordOf(finding.health);
    const size_t columns = terminal::columns();
    const std::string text =
        output::wrapped(finding.check + ": " + output::printable(finding.text), columns, kIndent);
    const std::string head =
        terminal::coloured(word.name, word.colour) + std::string(kIndent - strlen(word.name), ' ');
    output::line(head + text.substr(kIndent));
    if (!finding.advice.empty())
        output::line(output::wrapped("-> " + output::printable(finding.advice), columns, kIndent));
}

}  // namespace

Action buildDoctor(CLI::App& app) {
    auto isJson = std::make_shared<bool>(false);
    command::addJson(app, *isJson);
    return [isJson] {
        const std::vector<Finding> all = runAll();
        size_t problems = 0;
        std::unique_ptr<output::JsonArray> array = *isJson ? std::make_unique<output::JsonArray>() : nullptr;
        for (const Finding& finding : all) {
            problems += finding.health == Health::kProblem ? 1 : 0;
            if (array == nullptr) {
                show(finding);
            } else {
                array->add({{"check", finding.check},
                            {"health", wordOf(finding.health).name},
                            {"text", finding.text},
                            {"advice", finding.advice}});
            }
        }
        if (array != nullptr) array->end();
        if (problems == 0) return kExitDone;
        throw Failure(std::to_string(problems) + (problems == 1 ? " problem was" : " problems were") +
                      " found; each is told above with how to mend it");
    };
}
