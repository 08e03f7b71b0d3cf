#ifndef JSON_PARSE_HPP
#define JSON_PARSE_HPP

#include <json/detail/export.hpp>
#include <json/value.hpp>

#include <algorithm>
#include <cstddef>
#include <istream>
#include <string>
#include <string_view>

namespace json {

/// The outcome of parsing JSON text: SUCCESS, or the step of the grammar where parsing
/// stopped. Scoped, so that the twenty names stay out of namespace json, with fixed values.
enum class ParseResult : int {
    SUCCESS = 0,
    INVALID_NULL = 1,
    INVALID_BOOLEAN = 2,
    EMPTY_INPUT = 3,
    INCOMPLETE_ESCAPE = 4,
    INVALID_ESCAPE = 5,
    INVALID_UNICODE_ESCAPE = 6,
    UNESCAPED_QUOTE = 7,
    MISSING_LEADING_QUOTE = 8,
    MISSING_TRAILING_QUOTE = 9,
    MISSING_QUANTITY_AFTER_SIGN = 10,
    MISSING_LEADING_DIGIT = 11,
    INVALID_FRACTION = 12,
    INVALID_EXPONENT = 13,
    MISSING_LEADING_BRACKET = 14,
    MISSING_TRAILING_BRACKET = 15,
    MISSING_LEADING_BRACE = 16,
    MISSING_TRAILING_BRACE = 17,
    MISSING_COLON = 18,
    UNEXPECTED_END_OF_INPUT = 19,
};

/// The fixed English description of `result`: "No error" for SUCCESS, the code's own text for
/// codes 1 to 19, and "Unrecognized error code" for any other value. The text is constant and
/// owned by the library; the same code always gives the same pointer. Throws nothing.
JSONVALUE_API const char* get_parse_result_description(ParseResult result);

namespace detail {

/// The value of the NUL-terminated number `text`, read by the number-text library: locale
/// independent, plus or minus infinity beyond the range of double, plus or minus zero below
/// it. Reports no failure of its own.
JSONVALUE_API double string_to_double(const char* text);

/// Reads the NUL-terminated JSON number `literal` into `value`, the double string_to_double
/// gives, and tells whether the writer writes that double back as text that denotes the same
/// decimal number (`1.50` and `1.5`, `1E2` and `100`, `-0` and `0` do). The significand is
/// read once for both: a literal whose digits are below 2^53 and whose power of ten is at most
/// 10^22 either way is converted from it with one rounding, others by the number-text library.
/// Constant time for literals of up to nineteen significant digits between 2^-5 and 2^53;
/// other numbers are written out and compared digit by digit. Throws nothing.
JSONVALUE_API bool read_number_exactly(std::string_view literal, double& value) noexcept;

/// The UTF-8 text of the `count` UTF-16 code units at `text` (no terminator needed; a 0 unit
/// is converted like any other), converted by the text-encoding library. An unpaired
/// surrogate becomes U+FFFD. Throws std::logic_error ("basic_string::_M_construct null not
/// valid") for a null `text` with a non-zero `count`, std::length_error for a negative
/// `count`, and std::bad_alloc; nothing is left behind.
JSONVALUE_API std::string u16_to_u8(char16_t* text, int count);

} // namespace detail

/// What json::parse accepts beyond strict JSON, and what it refuses although the text is JSON.
/// Every flag is off by default: strict RFC 8259, with nothing changed silently that the
/// parser can tell (bad UTF-8 and unpaired surrogates are refused), except that a repeated
/// member name keeps the last member (as every common parser does) and numbers are rounded
/// to double as JSON parsers do. An aggregate: C++20 callers can write
/// `{.allow_comments = true}`.
struct ParseOptions {
    /// Arrays and objects nested deeper than this are refused.
    std::size_t max_depth = 512;
    /// `//` comments to the end of the line and `/* ... */` comments wherever whitespace may
    /// stand. An unclosed `/*` or a lone `/` stays an error.
    bool allow_comments = false;
    /// One comma before `]` or `}`. `[,]`, `{,}` and `[1,,]` stay errors.
    bool allow_trailing_commas = false;
    /// Keep strings and member names that are not well-formed UTF-8 byte for byte. Off:
    /// overlong forms, encoded surrogates, code points above U+10FFFF, stray continuation
    /// bytes and sequences cut short are refused.
    bool allow_invalid_utf8 = false;
    /// Turn a `\u` escape of an unpaired surrogate (U+D800 to U+DFFF) into U+FFFD. Off:
    /// refused.
    bool allow_lone_surrogates = false;
    /// Refuse an object that names a member twice. Off: the last member of that name wins.
    bool reject_duplicate_keys = false;
    /// Skip a UTF-8 byte order mark (EF BB BF) before the text. Off: refused, with
    /// Refusal::BYTE_ORDER_MARK (RFC 8259 forbids writing one and lets a parser ignore it).
    bool allow_bom = false;
    /// Refuse a number unless the double it becomes is written back by this library as the
    /// same decimal number (`1.50`, `1E2`, `-0`, `0.1` pass; `1e400`, `1e-400`,
    /// `9007199254740993`, `0.10000000000000001` are refused). Costs nothing extra for numbers
    /// of at most 15 significant digits between 2.2250738585072014e-308 and 2^53.
    bool exact_numbers = false;
};

/// Why a text that is JSON (or that the options admit) was refused all the same.
enum class Refusal {
    NONE,            ///< not refused: parsed, or failed on the grammar
    TOO_DEEP,        ///< nested deeper than ParseOptions::max_depth
    INVALID_UTF8,    ///< a string or member name that is not well-formed UTF-8
    LONE_SURROGATE,  ///< a \u escape of a surrogate without its other half
    DUPLICATE_KEY,   ///< a member name given twice, with reject_duplicate_keys
    INEXACT_NUMBER,  ///< a number a double cannot hold exactly, with exact_numbers
    STOPPED,         ///< a handler of json::parse_events returned false
    BYTE_ORDER_MARK, ///< a UTF-8 byte order mark before the text, without allow_bom
};

/// The detailed outcome of json::parse: the code, and for a failure where it happened and,
/// when the code alone says too little, a plain note on why.
///
/// A refusal is reported with the closest of the twenty codes, always the same one:
/// TOO_DEEP with MISSING_TRAILING_BRACKET or MISSING_TRAILING_BRACE (the container that could
/// not be opened), INVALID_UTF8 with MISSING_TRAILING_QUOTE (as a raw control character in a
/// string is: a byte that cannot stand there), LONE_SURROGATE with INVALID_UNICODE_ESCAPE,
/// DUPLICATE_KEY with MISSING_TRAILING_BRACE (the object cannot be completed as written) and
/// INEXACT_NUMBER with INVALID_EXPONENT (the number's magnitude or precision is beyond a
/// double's), BYTE_ORDER_MARK with MISSING_LEADING_DIGIT (no value starts with it). The
/// position is that of the first byte of the ill-formed UTF-8 sequence, the backslash of the
/// unpaired escape, the opening quote of the second member name, the first character of the
/// number, or the start of the text.
struct ParseReport {
    ParseResult result = ParseResult::SUCCESS; ///< the outcome
    std::size_t offset = 0;                    ///< byte offset of the failure in the text
    std::size_t line = 0;                      ///< 1-based line of the failure (0 on success)
    std::size_t column = 0;                    ///< 1-based column, counted in bytes (0 on success)
    std::string note; ///< e.g. "the document is nested deeper than the maximum depth"
    Refusal refusal = Refusal::NONE; ///< set when valid text was refused, see above

    /// Whether the text parsed.
    explicit operator bool() const { return result == ParseResult::SUCCESS; }

    /// The code's description, followed by the note when there is one.
    std::string message() const {
        std::string text = get_parse_result_description(result);
        if (!note.empty()) {
            text.append(" (").append(note).append(")");
        }
        return text;
    }
};

namespace detail {

/// Where a text read so far stands: how many bytes lie before a point of it, on which line
/// that point is and where that line starts. A line ends with a line feed, a carriage return,
/// or both in that order (one line end). The pieces of a stream are counted as they are left
/// behind, so that a failure in the piece at hand is placed from the start of the text.
struct TextPosition {
    std::size_t offset = 0;     // bytes counted
    std::size_t line = 1;       // the line `offset` is on
    std::size_t line_start = 0; // the offset of that line's first byte
    bool after_return = false;  // the last byte counted was a carriage return

    void advance(std::string_view text) {
        if (text.empty()) {
            return;
        }
        if (text.find('\r') == std::string_view::npos && !after_return) {
            // Line feeds alone, as in most texts: counted at once.
            const std::size_t last_newline = text.rfind('\n');
            if (last_newline != std::string_view::npos) {
                line += static_cast<std::size_t>(std::count(text.begin(), text.end(), '\n'));
                line_start = offset + last_newline + 1;
            }
        } else {
            for (std::size_t at = 0; at < text.size(); ++at) {
                if (text[at] != '\n' && text[at] != '\r') {
                    continue;
                }
                // The line feed of a CR LF pair ends no line of its own.
                const bool pair_end =
                    text[at] == '\n' && (at == 0 ? after_return : text[at - 1] == '\r');
                line += pair_end ? 0 : 1;
                line_start = offset + at + 1;
            }
        }
        after_return = text.back() == '\r';
        offset += text.size();
    }

    /// Places a failure at `at` (from the start of the text) in `report`, `rest` being the
    /// text from `offset` on.
    void locate(ParseReport& report, std::string_view rest, std::size_t at) const {
        TextPosition there = *this;
        there.advance(rest.substr(0, at - offset));
        report.offset = at;
        report.line = there.line;
        report.column = at - there.line_start + 1;
    }
};

/// The report of a grammar that ended with `result`, a failure at its failure_offset().
template <typename Grammar>
ParseReport failure_report(ParseResult result, Grammar& grammar, const TextPosition& position,
                           std::string_view rest) {
    ParseReport report;
    report.result = result;
    report.refusal = grammar.refusal();
    report.note = grammar.take_note();
    position.locate(report, rest, grammar.failure_offset());
    return report;
}

} // namespace detail

} // namespace json

#include <json/detail/document_builder.hpp>
#include <json/detail/grammar.hpp>

namespace json {

/// Parses exactly one JSON text (RFC 8259): one value of any kind, with only whitespace
/// around it (and comments, when `options` allow them). On success stores the document in
/// `out`. On failure or refusal `out` is left exactly as it was and the report says where and
/// why. Iterative, linear in the length of the text. The parser's working stacks start in 4 KiB
/// of the caller's stack, so a small document costs no allocation beyond its own.
///
/// - Numbers become double (alternative 3); a number beyond the range of double becomes plus
///   or minus infinity, one below it plus or minus zero, and digits beyond a double's
///   precision are rounded: ParseOptions::exact_numbers refuses all three instead.
/// - A run of \u escapes is converted as UTF-16, so a surrogate pair becomes one character;
///   an unpaired surrogate is refused (or becomes U+FFFD with allow_lone_surrogates). Strings
///   and member names must be well-formed UTF-8 (or are kept byte for byte with
///   allow_invalid_utf8). Raw control characters in strings are refused.
/// - When an object has a member name twice, the last member wins (or, with
///   reject_duplicate_keys, the second name is refused).
/// - A comment or a trailing comma met while the options do not allow it fails as the
///   grammar says, with a note that names the option.
/// - Text after the value is refused with UNEXPECTED_END_OF_INPUT and a note saying so.
/// - Refusals of valid text set ParseReport::refusal; see ParseReport for their codes.
///
/// Throws std::bad_alloc. When one allocation fails, `out` is left as it was. Handing the
/// document over costs one allocation when `out` must change to an Array or Object from
/// another alternative, and putting its old content back after a failure costs one more: only
/// if memory stays exhausted for both does `out` end up holding `false`, its old content
/// released (never any part of the new document).
inline ParseReport parse(std::string_view text, Value& out, const ParseOptions& options) {
    detail::Workspace workspace;
    detail::DocumentBuilder builder(options, workspace);
    detail::Grammar<detail::DocumentBuilder> grammar(builder, options, workspace);
    const ParseResult result = grammar.feed(text.data(), text.data() + text.size(), true);
    if (result == ParseResult::SUCCESS) {
        builder.take(out);
        return ParseReport();
    }
    ParseReport report = detail::failure_report(result, grammar, detail::TextPosition(), text);
    builder.explain(report);
    return report;
}

/// Reads the rest of `in` and parses it as the text overload does, with the same options, the
/// same report and the same guarantees for `out`. A stream that cannot give the text is a
/// failure too, with `out` left as it was: UNEXPECTED_END_OF_INPUT at 1:1 with the note "the
/// stream was not readable" when failbit or badbit was set before anything was read (a
/// std::ifstream of a missing file), and with the note "the stream failed while it was read",
/// just after the last byte read, when its buffer throws. A stream already at its end (eofbit
/// only) is an empty text. The stream ends with eofbit set; with badbit after its buffer
/// threw, failbit when it was not readable. Exceptions the caller enabled on the stream for
/// those bits propagate, except that with badbit enabled the buffer's own exception passes on
/// (not std::ios::failure), as from the standard input functions. Throws std::bad_alloc.
/// Memory: the document and a piece of 64 KiB of the text (with the longest token), never the
/// whole text; the text is read in pieces as json::parse_events reads it.
JSONVALUE_API ParseReport parse(std::istream& in, Value& out, const ParseOptions& options);

/// Parses as above with the default options and returns the code alone.
inline ParseResult parse(std::string_view text, Value& out) {
    return parse(text, out, ParseOptions()).result;
}

} // namespace json

#endif
