#ifndef JSONFMT_RUN_HPP
#define JSONFMT_RUN_HPP

// What jsonfmt does with its files once its command line is read.

#include "settings.hpp"

namespace jsonfmt {

/// Formats or checks every file as `settings` say, onto standard output, a file or back into
/// each file, saying on standard error what went wrong; returns the exit status.
ExitStatus run(const Settings& settings);

} // namespace jsonfmt

#endif
