#ifndef JSON_DETAIL_GRAMMAR_LOOP_HPP
#define JSON_DETAIL_GRAMMAR_LOOP_HPP

// The grammar's state and its token loop: values and containers. Literals and numbers are
// read in grammar_scalars.hpp, strings in grammar_strings.hpp, what lies between tokens in
// grammar_gaps.hpp.

#include <json/detail/byte_scan.hpp>
#include <json/detail/utf16.hpp>
#include <json/detail/utf8.hpp>
#include <json/detail/workspace.hpp>
#include <json/parse_options.hpp>

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <vector>

namespace json::detail {

/// Reads JSON text, given whole or in consecutive pieces, and reports its tokens to a handler
/// (see json/events.hpp): scalars, member names, and the beginning and end of each container.
/// Iterative: open containers live on an explicit stack, so the depth a document may have is
/// limited by ParseOptions::max_depth alone. Between pieces it keeps only that stack and what
/// it expects next; a token cut by the end of a piece is read again, whole, from the next one.
///
/// Strings and member names are handed over decoded; a number as its literal, in a
/// NUL-terminated copy (so that it can be converted without another copy). The options that
/// need more than the text of one token (reject_duplicate_keys, exact_numbers) are for the
/// handler: the grammar passes every name and every literal through.
template <typename Handler>
class Grammar {
  public:
    /// The stack of open containers is kept in `workspace`. With `sequence`, the text is one
    /// JSON text or more, each after the one before, directly or after whitespace (JSON Lines,
    /// concatenated JSON): where one is complete, a value may follow.
    Grammar(Handler& handler, const ParseOptions& options, Workspace& workspace,
            bool sequence = false)
        : handler(handler), options(options), sequence(sequence),
          open_containers(workspace, INITIAL_DEPTH) {}

    /// Not a result: the text given so far ends before the document does, or inside a token.
    static constexpr ParseResult NEED_MORE = static_cast<ParseResult>(-1);

    /// Reads [from, to), the text that follows the part of earlier pieces that was consumed;
    /// `last` says that nothing follows `to`. Returns SUCCESS once the document is complete
    /// and only whitespace follows it (only with `last`), NEED_MORE when more text is needed
    /// (the next piece must start with the unconsumed rest of this one, from consumed()
    /// on), or the failure. A handler that returns false stops the parse: UNEXPECTED_END_OF_INPUT
    /// with Refusal::STOPPED, at the token it was told of.
    ParseResult feed(const char* from, const char* to, bool last);

    /// How many bytes of the last piece were consumed.
    std::size_t consumed() const { return static_cast<std::size_t>(cursor - begin); }
    /// Where a failure is, counted from the start of the first piece.
    std::size_t failure_offset() const { return base + consumed(); }
    std::string take_note() { return std::move(failure_note); }
    Refusal refusal() const { return refused; }

  private:
    // What may come next.
    enum class Expect : unsigned char {
        VALUE,         // the document, or a member's value
        FIRST_ELEMENT, // after '[': a value or ']'
        ELEMENT,       // after a comma in an array
        FIRST_NAME,    // after '{': a member name or '}'
        NAME,          // after a comma in an object
        COLON,         // after a member name
        AFTER_VALUE,   // in a container, after a value: a comma or the closing bracket
        END,           // after the document: nothing but whitespace
    };

    // The steps every token takes are inlined into the token loop, whatever the compiler's
    // estimate of their size: calls to them cost more than their bodies.
    [[gnu::always_inline]] ParseResult step();
    [[gnu::always_inline]] ParseResult value();
    [[gnu::always_inline]] ParseResult after_value();
    [[gnu::always_inline]] ParseResult number();
    [[gnu::always_inline]] ParseResult string(bool is_name);
    ParseResult escaped_string(bool is_name);
    ParseResult escape(std::string& text);
    ParseResult unicode_escapes(std::string& text);
    ParseResult literal(std::string_view word, ParseResult mismatch);
    [[gnu::always_inline]] ParseResult open(bool is_object);
    [[gnu::always_inline]] ParseResult close();
    ParseResult trailing_comma(bool in_object);

    // A member name is read: the handler is told, and the colon that follows it directly (as
    // it mostly does) is taken in the same step.
    [[gnu::always_inline]] ParseResult name_read(std::string_view name) {
        expect = Expect::COLON;
        if (const ParseResult result = tell([this, name] { return handler.key(name); });
            result != ParseResult::SUCCESS) {
            return result;
        }
        if (at(':')) {
            ++cursor;
            expect = Expect::VALUE;
        }
        return ParseResult::SUCCESS;
    }
    // A value is read: the handler is told, and a comma that follows it directly (as in
    // compact text) is taken in the same step.
    template <typename Report>
    [[gnu::always_inline]] ParseResult tell_value(Report report) {
        expect = open_containers.empty() ? Expect::END : Expect::AFTER_VALUE;
        if (const ParseResult result = tell(report); result != ParseResult::SUCCESS) {
            return result;
        }
        if (expect == Expect::AFTER_VALUE && at(',')) {
            ++cursor;
            expect = open_containers.back() != 0 ? Expect::NAME : Expect::ELEMENT;
        }
        return ParseResult::SUCCESS;
    }
    // Tells the handler, through `report`, and stops when it says so.
    template <typename Report>
    [[gnu::always_inline]] ParseResult tell(Report report) {
        if (!report()) {
            cursor = token;
            return refuse(Refusal::STOPPED, ParseResult::UNEXPECTED_END_OF_INPUT,
                          "the handler stopped the parse");
        }
        return ParseResult::SUCCESS;
    }
    ParseResult need_more() {
        cursor = token; // the token is read again, whole, from the next piece
        return NEED_MORE;
    }

    // The ways out of the grammar are cold: kept apart from the hot code, so that the token
    // loop stays small enough to be inlined whole.
    [[gnu::cold]] ParseResult fail(ParseResult result, std::string_view note = {});
    [[gnu::cold]] ParseResult refuse(Refusal why, ParseResult result, std::string_view note) {
        refused = why;
        return fail(result, note);
    }

    [[gnu::always_inline]] bool skip_whitespace() {
        // Most tokens follow the previous one directly: one test of the next byte says so. The
        // byte that starts a comment is in the same test, so that where comments are allowed
        // they cost nothing until one is met.
        constexpr std::uint64_t blank_or_slash =
            1ULL << ' ' | 1ULL << '\n' | 1ULL << '\r' | 1ULL << '\t' | 1ULL << '/';
        if (cursor != end && static_cast<unsigned char>(*cursor) < 64 &&
            (blank_or_slash >> static_cast<unsigned char>(*cursor) & 1U) != 0) {
            cursor = detail::skip_whitespace(cursor, end);
            if (options.allow_comments && at('/')) {
                return skip_comments();
            }
        }
        return true;
    }
    bool skip_comments();
    ParseResult byte_order_mark();
    [[gnu::always_inline]] const char* find_string_stop(const char* from) const {
#if defined(__SSE2__)
        // Most strings and names are shorter than sixteen bytes and plain ASCII: when the first
        // byte of the sixteen here that needs attention is not from 0x80 up (the end quote, a
        // backslash, a control character), it is the stop, found without a call.
        if (end - from >= 16) {
            const int hits = special_bytes_of_16<false, true>(from);
            if (hits != 0) {
                const char* const first = from + __builtin_ctz(static_cast<unsigned>(hits));
                if (static_cast<unsigned char>(*first) < 0x80) {
                    return first;
                }
            }
        }
#endif
        return options.allow_invalid_utf8 ? find_special_byte<false>(from, end)
                                          : find_special_or_ill_formed<false>(from, end);
    }
    bool at(char c) const {
        return cursor != end && *cursor == c;
    }

    Handler& handler;
    const ParseOptions options;
    const bool sequence;          // texts one after another, see the constructor
    std::size_t base = 0;         // offset of `begin` from the start of the first piece
    const char* begin = nullptr;  // the piece being read
    const char* cursor = nullptr; // the next byte to read
    const char* end = nullptr;    // the end of the piece
    const char* token = nullptr;  // where the token being read started
    bool last = true;             // nothing follows `end`
    Expect expect = Expect::VALUE;
    bool at_start = true; // nothing of the text is read yet
    // 1 for an object, 0 for an array, innermost last (bytes: a std::vector<bool> costs a bit
    // operation on every access).
    WorkspaceStack<unsigned char> open_containers;
    static constexpr std::size_t INITIAL_DEPTH = 64;
    std::string failure_note;
    Refusal refused = Refusal::NONE;
    std::string decoded;         // reused for a string with escapes
    std::string long_number;     // reused for a number too long for the stack
    std::vector<char16_t> utf16; // reused for a run of \u escapes
    Utf16Decoder decoder;        // converts them
};

template <typename Handler>
ParseResult Grammar<Handler>::feed(const char* from, const char* to, bool is_last) {
    base += consumed();
    begin = from;
    cursor = from;
    token = from;
    end = to;
    last = is_last;
    if (at_start) {
        if (const ParseResult result = byte_order_mark(); result != ParseResult::SUCCESS) {
            return result;
        }
    }
    for (;;) {
        if (!skip_whitespace()) {
            return NEED_MORE; // the cursor is on the comment the piece cuts
        }
        token = cursor;
        if (cursor == end) {
            if (!last) {
                return NEED_MORE;
            }
            if (expect == Expect::END) {
                return ParseResult::SUCCESS;
            }
            // Only before the document has begun is a value expected outside every container.
            const bool nothing_yet = expect == Expect::VALUE && open_containers.empty();
            return fail(nothing_yet ? ParseResult::EMPTY_INPUT
                                    : ParseResult::UNEXPECTED_END_OF_INPUT);
        }
        if (const ParseResult result = step(); result != ParseResult::SUCCESS) {
            return result;
        }
    }
}

template <typename Handler>
inline ParseResult Grammar<Handler>::step() {
    switch (expect) {
    case Expect::VALUE:
        return value();
    case Expect::FIRST_ELEMENT:
    case Expect::ELEMENT:
        if (*cursor == ']') {
            return expect == Expect::ELEMENT ? trailing_comma(false) : (++cursor, close());
        }
        return value();
    case Expect::FIRST_NAME:
    case Expect::NAME:
        if (*cursor == '}') {
            return expect == Expect::NAME ? trailing_comma(true) : (++cursor, close());
        }
        if (*cursor != '"') {
            return fail(ParseResult::MISSING_LEADING_QUOTE, "a member name must be a string");
        }
        return string(true);
    case Expect::COLON:
        if (*cursor != ':') {
            return fail(ParseResult::MISSING_COLON);
        }
        ++cursor;
        expect = Expect::VALUE;
        return ParseResult::SUCCESS;
    case Expect::AFTER_VALUE:
        return after_value();
    case Expect::END:
        if (sequence) {
            return value(); // the next text
        }
        break;
    }
    return fail(ParseResult::UNEXPECTED_END_OF_INPUT, "the text goes on after the JSON value");
}

template <typename Handler>
inline ParseResult Grammar<Handler>::after_value() {
    const bool in_object = open_containers.back() != 0;
    if (*cursor == ',') {
        ++cursor;
        expect = in_object ? Expect::NAME : Expect::ELEMENT;
        return ParseResult::SUCCESS;
    }
    if (*cursor == (in_object ? '}' : ']')) {
        ++cursor;
        return close();
    }
    return fail(in_object ? ParseResult::MISSING_TRAILING_BRACE
                          : ParseResult::MISSING_TRAILING_BRACKET);
}

// A closing bracket right after a comma.
template <typename Handler>
ParseResult Grammar<Handler>::trailing_comma(bool in_object) {
    if (!options.allow_trailing_commas) {
        // The code is the one the grammar gives for what stands there instead of a value.
        return refuse(Refusal::TRAILING_COMMA,
                      in_object ? ParseResult::MISSING_LEADING_QUOTE
                                : ParseResult::MISSING_LEADING_DIGIT,
                      "a trailing comma is not JSON; ParseOptions::allow_trailing_commas accepts "
                      "one");
    }
    ++cursor;
    return close();
}

template <typename Handler>
inline ParseResult Grammar<Handler>::value() {
    switch (*cursor) {
    case '[':
        return open(false);
    case '{':
        return open(true);
    case '"':
        return string(false);
    case 't':
        return literal("true", ParseResult::INVALID_BOOLEAN);
    case 'f':
        return literal("false", ParseResult::INVALID_BOOLEAN);
    case 'n':
        return literal("null", ParseResult::INVALID_NULL);
    default:
        // A number is the last kind of value tried: anything else fails as a number would.
        return number();
    }
}

template <typename Handler>
inline ParseResult Grammar<Handler>::open(bool is_object) {
    if (open_containers.size() >= options.max_depth) {
        return refuse(Refusal::TOO_DEEP,
                      is_object ? ParseResult::MISSING_TRAILING_BRACE
                                : ParseResult::MISSING_TRAILING_BRACKET,
                      "the document is nested deeper than " + std::to_string(options.max_depth) +
                          " levels; ParseOptions::max_depth sets the limit");
    }
    ++cursor;
    open_containers.emplace_back(is_object ? 1 : 0);
    expect = is_object ? Expect::FIRST_NAME : Expect::FIRST_ELEMENT;
    return is_object ? tell([this] { return handler.begin_object(); })
                     : tell([this] { return handler.begin_array(); });
}

template <typename Handler>
inline ParseResult Grammar<Handler>::close() {
    const bool is_object = open_containers.back() != 0;
    open_containers.pop_back();
    return is_object ? tell_value([this] { return handler.end_object(); })
                     : tell_value([this] { return handler.end_array(); });
}

} // namespace json::detail

#endif
