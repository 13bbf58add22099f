// Commands.h: all commands of the tool, and how a command line becomes one of them.
#pragma once

#include <span>

#include "Command.h"

std::span<const Command> allCommands();

// Reads the command line and runs the command. Returns the exit status; a problem is one line on standard error.
int runCommandLine(int argc, const char* const* argv);
