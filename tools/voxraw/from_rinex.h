// voxraw from-rinex: turns a RINEX observation file and its navigation files into a raw
// observation file (see from_rinex.cpp for the mapping of observables and ephemerides).
#pragma once

#include <CLI/CLI.hpp>

namespace voxraw {

// Adds the from-rinex subcommand to app. The conversion runs when the subcommand has been
// parsed, and ends the parse with the command's exit code (CLI::Success for 0, a
// CLI::RuntimeError carrying the code otherwise), so main needs no further line for it.
void AddFromRinex(CLI::App& app);

}  // namespace voxraw
