// Terminal.h: what standard output can show to a person: its width and its colours. A file or a pipe has neither.
#pragma once

#include <cstddef>
#include <string>

namespace terminal {

enum class Colour { kNone, kGood, kBusy, kBad, kDim };

bool isTerminal();
// Characters in a line; 0 without a terminal: as long as it needs to be.
size_t columns();
// As it is without a terminal, on one that knows no colours, and when NO_COLOR is set.
std::string coloured(const std::string& text, Colour colour);

}  // namespace terminal
