#ifndef JSON_PARSE_HPP
#define JSON_PARSE_HPP

// Parsing JSON text into a document.

#include <json/detail/export.hpp>
#include <json/fwd.hpp>
#include <json/parse_options.hpp>
#include <json/value.hpp>

#include <iosfwd>
#include <string_view>

namespace json {

/// Parses exactly one JSON text (RFC 8259): one value of any kind, with only whitespace
/// around it (and comments, when `options` allow them). On success stores the document in
/// `out`. On failure or refusal `out` is left exactly as it was and the report says where and
/// why. Iterative, linear in the length of the text. The parser's working stacks start in 4 KiB
/// of the caller's stack, so a small document costs no allocation beyond its own.
///
/// - Numbers become double (alternative 3). An integer that a double cannot hold exactly and a
///   number beyond the range of double are refused (ParseOptions::allow_inexact_integers
///   rounds the one, allow_overflow makes the other plus or minus infinity); a number below
///   the range becomes plus or minus zero and a fraction's digits beyond a double's precision
///   are rounded. ParseOptions::exact_numbers refuses every number a double changes.
/// - A run of \u escapes is converted as UTF-16, so a surrogate pair becomes one character;
///   an unpaired surrogate is refused (or becomes U+FFFD with allow_lone_surrogates). Strings
///   and member names must be well-formed UTF-8 (or are kept byte for byte with
///   allow_invalid_utf8). Raw control characters in strings are refused.
/// - When an object has a member name twice, the last member wins (or, with
///   reject_duplicate_keys, the second name is refused).
/// - A comment or a trailing comma met while the options do not allow it fails as the
///   grammar says, with a note that names the option.
/// - Text after the value is refused with UNEXPECTED_END_OF_INPUT and a note saying so.
/// - A text longer than ParseOptions::max_size is refused before it is read.
/// - Refusals of valid text set ParseReport::refusal; see ParseReport for their codes.
///
/// Throws std::bad_alloc. When one allocation fails, `out` is left as it was. Handing the
/// document over costs one allocation when `out` must change to an Array or Object from
/// another alternative, and putting its old content back after a failure costs one more: only
/// if memory stays exhausted for both does `out` end up holding `false`, its old content
/// released (never any part of the new document).
JSONVALUE_API ParseReport parse(std::string_view text, Value& out, const ParseOptions& options);

/// Reads the rest of `in` and parses it as the text overload does, with the same options, the
/// same report and the same guarantees for `out`. A stream that cannot give the text is a
/// failure too, with `out` left as it was: UNEXPECTED_END_OF_INPUT at 1:1 with the note "the
/// stream was not readable" when failbit or badbit was set before anything was read (a
/// std::ifstream of a missing file), and with the note "the stream failed while it was read",
/// just after the last byte read, when its buffer throws. A stream already at its end (eofbit
/// only) is an empty text. The stream ends with eofbit set; with badbit after its buffer
/// threw, failbit when it was not readable. Exceptions the caller enabled on the stream for
/// those bits propagate, except that with badbit enabled the buffer's own exception passes on
/// (not std::ios::failure), as from the standard input functions. A text longer than
/// ParseOptions::max_size is refused once max_size + 1 bytes are read; the stream is left just
/// after them. Throws std::bad_alloc.
/// Memory: the document and a piece of 64 KiB of the text (with the longest token), never the
/// whole text; the text is read in pieces as json::parse_events reads it.
JSONVALUE_API ParseReport parse(std::istream& in, Value& out, const ParseOptions& options);

/// Parses as above with the default options and returns the code alone.
inline ParseResult parse(std::string_view text, Value& out) {
    return parse(text, out, ParseOptions()).result;
}

/// Parses `text` as the overloads above do and returns the document:
/// `auto config = json::parse(text);`. Throws std::invalid_argument on a failure or refusal,
/// whose what() is "LINE:COLUMN: " followed by ParseReport::message() ("1:5: Unexpected end of
/// input"), and std::bad_alloc. The document is handed over without a copy.
JSONVALUE_API Value parse(std::string_view text, const ParseOptions& options = {});

/// Reads the rest of `in` as json::parse(in, out, options) does and returns the document:
/// `auto config = json::parse(file);`. Throws std::invalid_argument "LINE:COLUMN: message" on
/// a failure or refusal (a stream that was not readable included), what the stream throws as
/// said there, and std::bad_alloc.
JSONVALUE_API Value parse(std::istream& in, const ParseOptions& options = {});

/// Reads a document from the rest of `in` as json::parse(in, value, ParseOptions()) does: the
/// whole rest of the stream is one JSON text, so `std::cin >> value` reads to the end of the
/// input, and a second value after the first is a failure. On a failure or refusal sets
/// failbit (which throws std::ios::failure if the caller enabled exceptions for it) and leaves
/// `value` as it was; json::parse(in, value, options) tells why, json::parse(in) throws it.
/// Returns `in`. Throws what json::parse(std::istream&, ...) throws.
JSONVALUE_API std::istream& operator>>(std::istream& in, Value& value);

} // namespace json

#endif
