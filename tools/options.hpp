#ifndef JSONFMT_OPTIONS_HPP
#define JSONFMT_OPTIONS_HPP

// jsonfmt's command line.

#include "settings.hpp"

namespace jsonfmt {

/// Fills `settings` from the command line. Returns an exit status when the program is done
/// (--help, --version, a usage error, said on standard error), nothing when it is to run.
std::optional<ExitStatus> read_arguments(int argc, char** argv, Settings& settings);

} // namespace jsonfmt

#endif
