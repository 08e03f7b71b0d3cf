#ifndef JSONFMT_DIAGNOSTICS_HPP
#define JSONFMT_DIAGNOSTICS_HPP

// How jsonfmt says what went wrong: its messages, and where a parse failed.

#include <json/parse_options.hpp>

#include <cstddef>
#include <string>
#include <string_view>

namespace jsonfmt {

/// How much of the failing line is shown before and after the failing byte.
constexpr std::size_t SHOWN_BEFORE = 60;
constexpr std::size_t SHOWN_AFTER = 60;

/// Writes "jsonfmt: MESSAGE" on standard error.
void complain(const std::string& message);

/// What a failed parse is reported as, with jsonfmt's flags in place of the library's options.
std::string failure_message(const json::ParseReport& report);

/// What the message of a failure at a second value gets added when that value starts a line of
/// its own after a complete first one, as in JSON Lines: " (the text looks like JSON Lines: try
/// --lines)". `text` is the part of the input that starts at offset `start` and is still at
/// hand, up to the failing byte at least; the line break is looked for in the whitespace there
/// before it. Empty for any other failure.
std::string lines_hint(std::string_view text, std::size_t start, const json::ParseReport& report);

/// Writes the line holding the failure onto standard error with a caret under the failing
/// byte, from `text`, the part of the input that starts at offset `start` and is still at
/// hand: at least from SHOWN_BEFORE bytes before the failure to SHOWN_AFTER + 1 after it
/// (the one more tells whether the line goes on), for the whole window to be shown. A line cut
/// short on either side is marked "..."; nothing is shown when the failure lies outside `text`.
void show_failure_line(std::string_view text, std::size_t start, const json::ParseReport& report);

} // namespace jsonfmt

#endif
