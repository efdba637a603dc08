#pragma once

#include <span>
#include <string>

#include "Program/QVCommand.h"

/// Runs what the command line asks for: a sub-command, without display; or the application. `arguments` are
/// those after the program's name. Installs the environment (clock) first.
QVExitStatus QVRunProgram(int argc, char** argv, std::span<const std::string> arguments);
