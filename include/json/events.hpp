#ifndef JSON_EVENTS_HPP
#define JSON_EVENTS_HPP

// Reading JSON as events: the grammar of json::parse, reporting to a handler of the caller's
// instead of building a document, from text or from a stream read in pieces; and validation.

#include <json/detail/export.hpp>
#include <json/detail/run_parser.hpp>
#include <json/parse_options.hpp>

#include <cstddef>
#include <iosfwd>
#include <string>
#include <string_view>

namespace json {

// A handler is any type with these members, each returning true to go on or false to stop
// the parse (json::Writer is one, so parse_events(text, writer) reformats text):
//
//     bool null();
//     bool boolean(bool value);
//     bool number(std::string_view literal); // the number as written: "1e400", "1.50"
//     bool string(std::string_view utf8);     // escapes resolved
//     bool key(std::string_view utf8);        // a member name, escapes resolved
//     bool begin_array();
//     bool end_array();
//     bool begin_object();
//     bool end_object();
//
// The views are valid until the call returns. Numbers arrive as their literal text, so a
// handler can read a 64-bit integer exactly (std::from_chars into a std::int64_t, say).

/// A handler that accepts every event and keeps nothing. Derive from it and declare only the
/// events you want: the parser calls them by name, so yours hide these (nothing is virtual).
struct NoOpHandler {
    bool null() { return true; }                   ///< Accepts null.
    bool boolean(bool) { return true; }            ///< Accepts true or false.
    bool number(std::string_view) { return true; } ///< Accepts a number's literal.
    bool string(std::string_view) { return true; } ///< Accepts a string.
    bool key(std::string_view) { return true; }    ///< Accepts a member name.
    bool begin_array() { return true; }            ///< Accepts an array's beginning.
    bool end_array() { return true; }              ///< Accepts an array's end.
    bool begin_object() { return true; }           ///< Accepts an object's beginning.
    bool end_object() { return true; }             ///< Accepts an object's end.
};

/// Reads one JSON text with the grammar of json::parse and reports its tokens to `handler`
/// in document order, building nothing. The options act as for json::parse, except the two
/// that concern a document: member names are reported as they come, repeated or not
/// (reject_duplicate_keys is for the handler to apply), and numbers as their literals
/// (exact_numbers likewise). A handler that returns false stops the parse: the report says
/// UNEXPECTED_END_OF_INPUT with Refusal::STOPPED, at the token that was being reported. A
/// failure is reported after the events of every token before it, but a text longer than
/// ParseOptions::max_size is refused before any event. Linear in the length of the text;
/// iterative. Throws std::bad_alloc and what the handler throws.
template <typename Handler>
ParseReport parse_events(std::string_view text, Handler& handler,
                         const ParseOptions& options = {}) {
    detail::Workspace workspace;
    return detail::run_parser(handler, options, workspace, text);
}

/// As above, reading the rest of `in` in pieces of 64 KiB: memory is bounded by the nesting
/// depth and the longest string or number, never by the length of the text. Offsets, lines
/// and columns count from where the stream was. A stream that cannot give the text is a
/// failure, reported as json::parse(std::istream&) reports it; the stream ends as it does. A
/// text longer than ParseOptions::max_size is refused once max_size + 1 bytes are read; the
/// events of the pieces read before that one have been reported by then.
template <typename Handler>
ParseReport parse_events(std::istream& in, Handler& handler, const ParseOptions& options = {}) {
    detail::Workspace workspace;
    return detail::run_parser(handler, options, workspace, in);
}

/// The report json::parse would give for `text` with `options`, without building anything:
/// the same outcome, code, place and note on every input. exact_numbers checks each number
/// as it comes; reject_duplicate_keys holds the member names of the open objects. Linear in
/// the length of the text. Throws std::bad_alloc.
JSONVALUE_API ParseReport validate(std::string_view text, const ParseOptions& options = {});

/// As above for the rest of `in`, read in pieces as parse_events reads it: memory bounded by
/// the nesting depth and the longest token (and, with reject_duplicate_keys, the names of the
/// open objects).
JSONVALUE_API ParseReport validate(std::istream& in, const ParseOptions& options = {});

} // namespace json

#endif
