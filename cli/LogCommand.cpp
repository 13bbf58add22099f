// log: what the daemon wrote last, of everything or of one account: from its log file below a private root, else from the
// journal.
#include <algorithm>
#include <deque>

#include "Command.h"
#include "DaemonLog.h"
#include "Device.h"
#include "Failure.h"
#include "Output.h"

namespace {

constexpr int kUsualLines = 50;
constexpr int kMostLines = 100'000;

struct Options {
    int account = 0;
    int lines = kUsualLines;
    bool isJson = false;
};

}  // namespace

Action buildLog(CLI::App& app) {
    auto options = std::make_shared<Options>();
    command::addId(app, "ACCOUNT", options->account, "Only lines about this account");
    command::addNumber(app, "--lines", options->lines, 1, kMostLines,
                       "How many at most (" + std::to_string(kUsualLines) + " when nothing is said)");
    command::addJson(app, options->isJson);
    return [options] {
        const std::deque<std::string> lines =
            daemon_log::last(options->account, static_cast<size_t>(options->lines));
        if (options->isJson) {
            output::JsonArray array;
            for (const std::string& line : lines) array.add(daemon_log::plain(line));
            array.end();
            return kExitDone;
        }
        for (const std::string& line : lines) {
            const bool isGrave = line.find(" E/") != std::string::npos;
            output::line(terminal::coloured(output::printable(daemon_log::plain(line)),
                                            isGrave ? terminal::Colour::kBad : terminal::Colour::kNone));
        }
        if (lines.empty()) output::progress("the daemon has written nothing about it");
        return kExitDone;
    };
}
