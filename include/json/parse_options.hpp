#ifndef JSON_PARSE_OPTIONS_HPP
#define JSON_PARSE_OPTIONS_HPP

// What every reader of JSON text shares: the outcome codes, the options, and the report of
// where and why a text was refused.

#include <json/detail/export.hpp>

#include <cstddef>
#include <limits>
#include <string>

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

/// What json::parse accepts beyond strict JSON, and what it refuses although the text is JSON.
/// Every flag is off by default: strict RFC 8259, with nothing changed silently that the
/// parser can tell: bad UTF-8, unpaired surrogates, integers a double cannot hold exactly and
/// numbers beyond the range of double are refused. Two changes stay, as with every common
/// parser: a repeated member name keeps the last member, and a number with a fraction or an
/// exponent is rounded to the nearest double (1e-400 to 0). An aggregate: C++20 callers can
/// write `{.allow_comments = true}`.
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
    /// Round an integer literal (no fraction, no exponent) that a double cannot hold exactly
    /// to the nearest double: `1234567890123456789` becomes 1234567890123456768. Off: refused
    /// with Refusal::INEXACT_NUMBER (`9007199254740993` is refused, `9007199254740994` and
    /// `100000000000000000000` are held exactly). json::parse_events hands every literal over
    /// as written, which is how a caller reads such an id exactly.
    bool allow_inexact_integers = false;
    /// Read a number beyond the range of double (`1e400`, `-1e400`) as plus or minus
    /// infinity, which the writer writes as the string "Inf" or "-Inf". Off: refused with
    /// Refusal::INEXACT_NUMBER.
    bool allow_overflow = false;
    /// Refuse a number unless the double it becomes is written back by this library as the
    /// same decimal number (`1.50`, `1E2`, `-0`, `0.1` pass; `1e400`, `1e-400`,
    /// `9007199254740993`, `0.10000000000000001` are refused), whatever the two options above
    /// say. Costs nothing extra for numbers of at most 15 significant digits between
    /// 2.2250738585072014e-308 and 2^53.
    bool exact_numbers = false;
    /// A text longer than this many bytes is refused with Refusal::TOO_LARGE before anything
    /// is built: a text given whole at once, without reading it; a stream as soon as more
    /// bytes than this have been read from it, without reading further. The default, the
    /// largest std::size_t, sets no limit.
    std::size_t max_size = std::numeric_limits<std::size_t>::max();
};

/// Why a text that is JSON (or that the options admit) was refused all the same.
enum class Refusal {
    NONE,            ///< not refused: parsed, or failed on the grammar
    TOO_DEEP,        ///< nested deeper than ParseOptions::max_depth
    INVALID_UTF8,    ///< a string or member name that is not well-formed UTF-8
    LONE_SURROGATE,  ///< a \u escape of a surrogate without its other half
    DUPLICATE_KEY,   ///< a member name given twice, with reject_duplicate_keys
    INEXACT_NUMBER,  ///< a number a double cannot hold as written (see ParseOptions)
    STOPPED,         ///< a handler of json::parse_events returned false
    BYTE_ORDER_MARK, ///< a UTF-8 byte order mark before the text, without allow_bom
    COMMENT,         ///< a comment, without allow_comments
    TRAILING_COMMA,  ///< a comma before `]` or `}`, without allow_trailing_commas
    TOO_LARGE,       ///< a text longer than ParseOptions::max_size
};

/// The detailed outcome of json::parse: the code, and for a failure where it happened and,
/// when the code alone says too little, a plain note on why.
///
/// A refusal is reported with the closest of the twenty codes, always the same one:
/// TOO_DEEP with MISSING_TRAILING_BRACKET or MISSING_TRAILING_BRACE (the container that could
/// not be opened), INVALID_UTF8 with MISSING_TRAILING_QUOTE (as a raw control character in a
/// string is: a byte that cannot stand there), LONE_SURROGATE with INVALID_UNICODE_ESCAPE,
/// DUPLICATE_KEY with MISSING_TRAILING_BRACE (the object cannot be completed as written),
/// INEXACT_NUMBER with INVALID_EXPONENT (the number's magnitude or precision is beyond a
/// double's), STOPPED with UNEXPECTED_END_OF_INPUT, BYTE_ORDER_MARK with MISSING_LEADING_DIGIT
/// (no value starts with it), COMMENT with the code of what the grammar expected where the
/// comment starts, TRAILING_COMMA with MISSING_LEADING_DIGIT in an array and
/// MISSING_LEADING_QUOTE in an object (what stands there instead of a value or a name),
/// TOO_LARGE with UNEXPECTED_END_OF_INPUT (the text is not read to its end). The position is
/// that of the first byte of the ill-formed UTF-8 sequence, the backslash of the unpaired
/// escape, the opening quote of the second member name, the first character of the number,
/// the comment or the closing bracket, or the start of the text (a byte order mark; a text too
/// large, refused as a whole).
struct ParseReport {
    ParseResult result = ParseResult::SUCCESS; ///< the outcome
    std::size_t offset = 0;                    ///< byte offset of the failure in the text
    std::size_t line = 0;                      ///< 1-based line of the failure (0 on success)
    std::size_t column = 0;                    ///< 1-based column, counted in bytes (0 on success)
    std::string note; ///< why, e.g. "the document is nested deeper than 512 levels; ..."
    Refusal refusal = Refusal::NONE; ///< set when valid text was refused, see above

    /// Whether the text parsed.
    explicit operator bool() const { return result == ParseResult::SUCCESS; }

    /// What a person reads first: for a refusal, the note alone, which says why and names the
    /// option that would accept the text ("the object already has a member named \"a\"; ...");
    /// for a failure on the grammar, the code's description, followed by the note in
    /// parentheses when there is one ("No error" on success). Throws std::bad_alloc.
    std::string message() const {
        if (refusal != Refusal::NONE) {
            return note;
        }
        std::string text = get_parse_result_description(result);
        if (!note.empty()) {
            text.append(" (").append(note).append(")");
        }
        return text;
    }
};

} // namespace json

#endif
