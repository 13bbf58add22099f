#include "Terminal.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <cstdlib>
#include <string_view>

namespace terminal {

namespace {

constexpr size_t kUsualColumns = 80;
constexpr const char* kReset = "\033[0m";

const char* codeOf(Colour colour) {
    switch (colour) {
        case Colour::kGood:
            return "\033[32m";
        case Colour::kBusy:
            return "\033[36m";
        case Colour::kBad:
            return "\033[31m";
        case Colour::kDim:
            return "\033[2m";
        case Colour::kNone:
            break;
    }
    return "";
}

bool hasColours() {
    const char* unwanted = std::getenv("NO_COLOR");
    const char* kind = std::getenv("TERM");
    if (unwanted != nullptr && *unwanted != '\0') return false;
    return isTerminal() && kind != nullptr && std::string_view(kind) != "dumb";
}

}  // namespace

bool isTerminal() {
    return isatty(STDOUT_FILENO) == 1;
}

size_t columns() {
    if (!isTerminal()) return 0;
    winsize size{};
    const bool isKnown = ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0;
    return isKnown ? size.ws_col : kUsualColumns;
}

std::string coloured(const std::string& text, Colour colour) {
    if (colour == Colour::kNone || text.empty() || !hasColours()) return text;
    return codeOf(colour) + text + kReset;
}

}  // namespace terminal
