#ifndef JSON_DETAIL_PARSER_HPP
#define JSON_DETAIL_PARSER_HPP

// The strict JSON parser behind json::parse; included by json/parse.hpp, after the
// declarations it uses. Header-level: it is compiled into its users and reaches the library
// only through the Value model and the two exported conversions.

#include <json/detail/byte_scan.hpp>
#include <json/detail/utf8.hpp>
#include <json/value.hpp>

#include <algorithm>
#include <cfloat>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace json {
namespace detail {

/// One parse of one text. Iterative: open containers live on explicit stacks, so the depth a
/// document may have is limited by ParseOptions::max_depth alone, never by the call stack.
class Parser {
  public:
    Parser(std::string_view text, const ParseOptions& options)
        : begin(text.data()), cursor(text.data()), end(text.data() + text.size()),
          options(options) {}

    /// Parses the whole text and hands the document to `out`; on failure leaves `out` as it
    /// was and records where and why.
    ParseResult run(Value& out);

    /// Where parsing stopped, why, and extra wording when the code alone says too little.
    std::size_t failure_offset() const { return static_cast<std::size_t>(cursor - begin); }
    std::string take_note() { return std::move(failure_note); }
    Refusal refusal() const { return refused; }

  private:
    struct OpenContainer {
        bool is_object;
        std::size_t first_value;  // index into `values` of its first child
        std::size_t first_name;   // index into `names` of its first member name
        std::size_t first_array;  // index into `finished_arrays` of its first Array child
        std::size_t first_object; // index into `finished_objects` of its first Object child
    };

    // A finished container other than the document itself waits in `finished_arrays` or
    // `finished_objects` until its parent closes, and stands in `values` as a marker: the
    // parser never makes Undefined or a float from text, so Undefined stands for an Array and
    // a float for an Object. Kept apart like this, the container's content is swapped into
    // the Value that holds it for good, and that Value is the only one ever allocated for it.
    static constexpr int ARRAY_MARKER = UNDEFINED_INDEX;
    static constexpr int OBJECT_MARKER = FLOAT_INDEX;

    // A member of an object being closed, in the order the map wants its keys.
    struct MemberInKeyOrder {
        std::uint64_t name_prefix; // see name_prefix()
        std::size_t child;         // position among the object's children
        std::size_t slot;          // for a marker, index of its finished container
    };

    // The steps every token takes are inlined into the token loop, whatever the compiler's
    // estimate of their size: calls to them cost more than their bodies.
    [[gnu::always_inline]] ParseResult parse_value(bool& completed);
    [[gnu::always_inline]] std::optional<std::string_view> plain_string();
    ParseResult parse_string(std::string& text);
    ParseResult parse_escape(std::string& text);
    ParseResult parse_unicode_escapes(std::string& text);
    [[gnu::always_inline]] ParseResult parse_number();
    static bool held_exactly(std::string_view literal, std::ptrdiff_t digits, double value);
    [[gnu::cold]] ParseResult refuse_inexact(std::string_view literal);
    ParseResult parse_literal(std::string_view literal, ParseResult mismatch);
    ParseResult parse_member_name();
    ParseResult after_comma(bool in_object, bool& closed);
    ParseResult open(bool is_object);
    ParseResult close();
    ParseResult refuse_repeated_name(std::size_t first_name);
    template <typename Container, typename Marker>
    void finish(Container& content, std::vector<Container>& finished, Marker marker);
    template <typename Alternative>
    Value& push_value(Alternative&& value);
    void grow_values();
    // The ways out of the grammar are cold: kept apart from the hot code, so that the token
    // loop stays small enough to be inlined whole.
    [[gnu::cold]] ParseResult fail(ParseResult result, std::string_view note = {});
    [[gnu::cold]] ParseResult refuse(Refusal why, ParseResult result, std::string_view note) {
        refused = why;
        return fail(result, note);
    }
    [[gnu::always_inline]] void skip_whitespace() {
        // Most tokens follow the previous one directly: one test of the next byte says so. The
        // byte that starts a comment is in the same test, so that where comments are allowed
        // they cost nothing until one is met.
        constexpr std::uint64_t blank_or_slash =
            1ULL << ' ' | 1ULL << '\n' | 1ULL << '\r' | 1ULL << '\t' | 1ULL << '/';
        if (cursor != end && static_cast<unsigned char>(*cursor) < 64 &&
            (blank_or_slash >> static_cast<unsigned char>(*cursor) & 1U) != 0) {
            cursor = detail::skip_whitespace(cursor, end);
            if (options.allow_comments && at('/')) {
                skip_comments();
            }
        }
    }
    void skip_comments();
    const char* find_string_stop(const char* from) const {
        return options.allow_invalid_utf8 ? find_special_byte<false>(from, end)
                                          : find_special_or_ill_formed<false>(from, end);
    }
    bool at(char c) const { return cursor != end && *cursor == c; }

    const char* const begin;
    const char* cursor;
    const char* const end;
    const ParseOptions options;
    std::string failure_note;
    Refusal refused = Refusal::NONE;

    std::vector<Value> values; // finished values whose container is still open
    std::vector<Array> finished_arrays;
    std::vector<Object> finished_objects;
    std::vector<std::string> names; // member names of the open objects, in document order
    std::vector<std::size_t>
        name_offsets; // where each of `names` starts, with reject_duplicate_keys
    std::vector<OpenContainer> open_containers;
    std::vector<MemberInKeyOrder> members_in_key_order; // reused by every object closed
    std::string number_text;     // reused buffer for the NUL-terminated number text
    std::vector<char16_t> utf16; // reused buffer for a run of \u escapes
};

inline ParseResult Parser::run(Value& out) {
    skip_whitespace();
    if (cursor == end) {
        return fail(ParseResult::EMPTY_INPUT);
    }
    bool expect_value = true;
    for (;;) {
        if (expect_value) {
            skip_whitespace();
            bool completed = false;
            if (const ParseResult result = parse_value(completed); result != ParseResult::SUCCESS) {
                return result;
            }
            if (!completed) {
                continue; // a container was opened: its first value comes next
            }
        }
        if (open_containers.empty()) {
            skip_whitespace();
            if (cursor != end) {
                return fail(ParseResult::UNEXPECTED_END_OF_INPUT,
                            "the text goes on after the JSON value");
            }
            out.swap(values.back()); // the document changes owner without a copy
            return ParseResult::SUCCESS;
        }
        skip_whitespace();
        const bool in_object = open_containers.back().is_object;
        if (cursor == end) {
            return fail(ParseResult::UNEXPECTED_END_OF_INPUT);
        }
        if (*cursor == ',') {
            ++cursor;
            bool closed = false;
            if (const ParseResult result = after_comma(in_object, closed);
                result != ParseResult::SUCCESS) {
                return result;
            }
            expect_value = !closed;
        } else if (*cursor == (in_object ? '}' : ']')) {
            ++cursor;
            if (const ParseResult result = close(); result != ParseResult::SUCCESS) {
                return result;
            }
            expect_value = false;
        } else {
            return fail(in_object ? ParseResult::MISSING_TRAILING_BRACE
                                  : ParseResult::MISSING_TRAILING_BRACKET);
        }
    }
}

inline ParseResult Parser::parse_value(bool& completed) {
    completed = true;
    if (cursor == end) {
        return fail(ParseResult::UNEXPECTED_END_OF_INPUT);
    }
    switch (*cursor) {
    case '[':
    case '{': {
        const bool is_object = *cursor == '{';
        if (const ParseResult result = open(is_object); result != ParseResult::SUCCESS) {
            return result;
        }
        skip_whitespace();
        if (at(is_object ? '}' : ']')) {
            ++cursor;
            return close();
        }
        completed = false;
        return is_object ? parse_member_name() : ParseResult::SUCCESS;
    }
    case '"':
        if (const std::optional<std::string_view> plain = plain_string()) {
            push_value(std::string(*plain));
            return ParseResult::SUCCESS;
        }
        return parse_string(boost::get<std::string>(push_value(std::string())));
    case 't':
        return parse_literal("true", ParseResult::INVALID_BOOLEAN);
    case 'f':
        return parse_literal("false", ParseResult::INVALID_BOOLEAN);
    case 'n':
        return parse_literal("null", ParseResult::INVALID_NULL);
    default:
        // A number is the last kind of value tried: anything else fails as a number would.
        return parse_number();
    }
}

// After the comma between two elements or members: the next member's name, or (where the
// options allow a trailing comma) the end of the container.
inline ParseResult Parser::after_comma(bool in_object, bool& closed) {
    skip_whitespace();
    if (at(in_object ? '}' : ']')) {
        if (!options.allow_trailing_commas) {
            // The code is the one the grammar gives for what stands there instead of a value.
            return fail(in_object ? ParseResult::MISSING_LEADING_QUOTE
                                  : ParseResult::MISSING_LEADING_DIGIT,
                        "a trailing comma is not JSON; the allow_trailing_commas option accepts "
                        "one");
        }
        ++cursor;
        closed = true;
        return close();
    }
    return in_object ? parse_member_name() : ParseResult::SUCCESS;
}

inline ParseResult Parser::parse_member_name() {
    if (cursor == end) {
        return fail(ParseResult::UNEXPECTED_END_OF_INPUT);
    }
    if (*cursor != '"') {
        return fail(ParseResult::MISSING_LEADING_QUOTE, "a member name must be a string");
    }
    if (options.reject_duplicate_keys) {
        name_offsets.push_back(static_cast<std::size_t>(cursor - begin));
    }
    if (const std::optional<std::string_view> plain = plain_string()) {
        names.emplace_back(*plain);
    } else if (const ParseResult result = parse_string(names.emplace_back());
               result != ParseResult::SUCCESS) {
        return result;
    }
    skip_whitespace();
    if (cursor == end) {
        return fail(ParseResult::UNEXPECTED_END_OF_INPUT);
    }
    if (*cursor != ':') {
        return fail(ParseResult::MISSING_COLON);
    }
    ++cursor;
    return ParseResult::SUCCESS;
}

// The bytes between the quotes of the string at the cursor, when there is nothing to unescape
// or refuse in them (most strings), with the cursor moved past the closing quote; the string
// is then built in one piece. Otherwise nothing, and the cursor stays on the opening quote.
inline std::optional<std::string_view> Parser::plain_string() {
    const char* const first = cursor + 1;
    const char* const stop = find_string_stop(first);
    if (stop == end || *stop != '"') {
        return std::nullopt;
    }
    cursor = stop + 1;
    return std::string_view(first, static_cast<std::size_t>(stop - first));
}

inline ParseResult Parser::parse_string(std::string& text) {
    ++cursor; // the opening quote
    for (;;) {
        // Bytes that need no attention, well-formed UTF-8 included, are copied in one piece.
        const char* const run = cursor;
        cursor = find_string_stop(cursor);
        text.append(run, cursor);
        if (cursor == end) {
            return fail(ParseResult::MISSING_TRAILING_QUOTE, "the string is not closed");
        }
        if (*cursor == '"') {
            ++cursor;
            return ParseResult::SUCCESS;
        }
        if (static_cast<unsigned char>(*cursor) >= 0x80) {
            return refuse(Refusal::INVALID_UTF8, ParseResult::MISSING_TRAILING_QUOTE,
                          "the bytes from here on are not well-formed UTF-8; the "
                          "allow_invalid_utf8 option keeps them as they are");
        }
        if (*cursor != '\\') {
            return fail(ParseResult::MISSING_TRAILING_QUOTE,
                        "a control character inside a string must be escaped");
        }
        if (const ParseResult result = parse_escape(text); result != ParseResult::SUCCESS) {
            return result;
        }
    }
}

inline ParseResult Parser::parse_escape(std::string& text) {
    ++cursor; // the backslash
    if (cursor == end) {
        return fail(ParseResult::INCOMPLETE_ESCAPE);
    }
    static constexpr std::string_view escaped = "\"\\/bfnrt";
    static constexpr std::string_view meant = "\"\\/\b\f\n\r\t";
    const std::size_t which = escaped.find(*cursor);
    if (which != std::string_view::npos) {
        text += meant[which];
        ++cursor;
        return ParseResult::SUCCESS;
    }
    if (*cursor == 'u') {
        return parse_unicode_escapes(text);
    }
    return fail(ParseResult::INVALID_ESCAPE);
}

// A run of \u escapes is converted at once, so that a surrogate pair split over two escapes
// becomes one character. The cursor is on the 'u' of the first escape.
inline ParseResult Parser::parse_unicode_escapes(std::string& text) {
    const char* const first_escape = cursor - 1; // its backslash
    utf16.clear();
    for (;;) {
        ++cursor; // the 'u'
        char16_t unit = 0;
        for (int digit = 0; digit < 4; ++digit, ++cursor) {
            if (cursor == end) {
                return fail(ParseResult::INCOMPLETE_ESCAPE);
            }
            const char c = *cursor;
            const int value = c >= '0' && c <= '9'   ? c - '0'
                              : c >= 'a' && c <= 'f' ? c - 'a' + 10
                              : c >= 'A' && c <= 'F' ? c - 'A' + 10
                                                     : -1;
            if (value < 0) {
                return fail(ParseResult::INVALID_UNICODE_ESCAPE);
            }
            unit = static_cast<char16_t>(unit * 16 + value);
        }
        utf16.push_back(unit);
        if (end - cursor < 2 || cursor[0] != '\\' || cursor[1] != 'u') {
            break;
        }
        ++cursor; // the backslash of the next escape
    }
    if (!options.allow_lone_surrogates) {
        const auto is_high = [](char16_t unit) { return unit >= 0xD800 && unit <= 0xDBFF; };
        const auto is_low = [](char16_t unit) { return unit >= 0xDC00 && unit <= 0xDFFF; };
        for (std::size_t at = 0; at < utf16.size(); ++at) {
            if (is_high(utf16[at]) && at + 1 < utf16.size() && is_low(utf16[at + 1])) {
                ++at; // a pair
            } else if (is_high(utf16[at]) || is_low(utf16[at])) {
                constexpr std::size_t escape_length = 6; // every escape of the run is \uXXXX
                cursor = first_escape + at * escape_length;
                return refuse(Refusal::LONE_SURROGATE, ParseResult::INVALID_UNICODE_ESCAPE,
                              std::string(cursor, escape_length) +
                                  " is half of a surrogate pair without its other half; the "
                                  "allow_lone_surrogates option makes it U+FFFD");
            }
        }
    }
    text += u16_to_u8(utf16.data(), static_cast<int>(utf16.size()));
    return ParseResult::SUCCESS;
}

inline ParseResult Parser::parse_number() {
    // Scanned with a local pointer, which the compiler keeps in a register (the member would
    // be written back at every digit); `cursor` takes it at every exit.
    const char* const start = cursor;
    const char* here = cursor;
    // The number reader wants NUL-terminated text: a short number is copied to the stack,
    // only a longer one goes through the reused string. Where the input has them, its next
    // 32 bytes are copied before the number is scanned (usually all of it), so that those
    // stores have reached the cache when the reader takes the text in wide loads: loads over
    // stores still in flight would wait for them.
    constexpr std::size_t short_number = 64;
    constexpr std::size_t copied_ahead = 32;
    char text[short_number];
    const bool copy_ahead = end - start >= static_cast<std::ptrdiff_t>(copied_ahead);
    if (copy_ahead) {
        std::memcpy(text, start, copied_ahead);
    }
    const auto digit_here = [&here, this] { return here != end && *here >= '0' && *here <= '9'; };
    const auto skip_digits = [&] { here = detail::skip_digits(here, end); };
    const auto here_is = [&here, this](char c) { return here != end && *here == c; };
    const auto fail_here = [&](ParseResult result, std::string_view note = {}) {
        cursor = here;
        return fail(result, note);
    };
    if (here_is('-')) {
        ++here;
        if (!digit_here()) {
            return fail_here(ParseResult::MISSING_QUANTITY_AFTER_SIGN);
        }
    }
    if (!digit_here()) {
        return fail_here(ParseResult::MISSING_LEADING_DIGIT, "no JSON value starts here");
    }
    // Digits of the integer and fraction parts, leading zeros aside but for the fraction's:
    // an upper bound on the significant digits, which is all exact_numbers needs.
    std::ptrdiff_t digits = 0;
    if (*here == '0') {
        ++here; // no further digits after a leading zero
    } else {
        const char* const first_digit = here;
        skip_digits();
        digits = here - first_digit;
    }
    if (here_is('.')) {
        ++here;
        if (!digit_here()) {
            return fail_here(ParseResult::INVALID_FRACTION);
        }
        const char* const first_digit = here;
        skip_digits();
        digits += here - first_digit;
    }
    if (here_is('e') || here_is('E')) {
        ++here;
        if (here_is('+') || here_is('-')) {
            ++here;
        }
        if (!digit_here()) {
            return fail_here(ParseResult::INVALID_EXPONENT);
        }
        skip_digits();
    }
    const auto length = static_cast<std::size_t>(here - start);
    double value = 0;
    if (length < short_number) {
        if (!copy_ahead || length >= copied_ahead) {
            std::memcpy(text, start, length);
        }
        text[length] = '\0';
        value = string_to_double(text);
    } else {
        number_text.assign(start, here);
        value = string_to_double(number_text.c_str());
    }
    if (options.exact_numbers && !held_exactly(std::string_view(start, length), digits, value)) {
        cursor = start;
        return refuse_inexact(std::string_view(start, length));
    }
    cursor = here;
    push_value(value);
    return ParseResult::SUCCESS;
}

// Up to fifteen significant digits come back unchanged from a normal double (DBL_DIG), and the
// writer writes every double below 2^53 with its shortest digits; anything else is checked
// against the text the writer would give.
inline bool Parser::held_exactly(std::string_view literal, std::ptrdiff_t digits, double value) {
    constexpr double exact_integers = 9007199254740992.0; // 2^53
    const double magnitude = std::fabs(value);
    if (digits <= DBL_DIG && magnitude >= DBL_MIN && magnitude <= exact_integers) {
        return true;
    }
    return is_written_back_exactly(literal, value);
}

inline ParseResult Parser::refuse_inexact(std::string_view literal) {
    constexpr std::size_t shown = 40;
    std::string note(literal.substr(0, shown));
    if (literal.size() > shown) {
        note += "...";
    }
    note += " cannot be held exactly by a double; without the exact_numbers option it is "
            "rounded";
    return refuse(Refusal::INEXACT_NUMBER, ParseResult::INVALID_EXPONENT, note);
}

inline ParseResult Parser::parse_literal(std::string_view literal, ParseResult mismatch) {
    if (static_cast<std::size_t>(end - cursor) < literal.size() ||
        std::string_view(cursor, literal.size()) != literal) {
        return fail(mismatch);
    }
    cursor += literal.size();
    if (literal == "null") {
        push_value(Null());
    } else {
        push_value(literal == "true");
    }
    return ParseResult::SUCCESS;
}

inline ParseResult Parser::open(bool is_object) {
    if (open_containers.size() >= options.max_depth) {
        return refuse(Refusal::TOO_DEEP,
                      is_object ? ParseResult::MISSING_TRAILING_BRACE
                                : ParseResult::MISSING_TRAILING_BRACKET,
                      "the document is nested deeper than the maximum depth");
    }
    ++cursor;
    open_containers.push_back(
        {is_object, values.size(), names.size(), finished_arrays.size(), finished_objects.size()});
    return ParseResult::SUCCESS;
}

// The first eight bytes of a name as a big-endian number, zero-padded: where two names' prefixes
// differ, they order the names as the map does (bytes unsigned, a proper prefix first).
inline std::uint64_t name_prefix(const std::string& name) {
    std::uint64_t word = 0;
    // The storage holds capacity() + 1 bytes (with the NUL), so eight can be read at once in
    // every common library (a short string's buffer has sixteen); only the name's are kept.
    if (name.capacity() >= sizeof word - 1) {
        std::memcpy(&word, name.data(), sizeof word);
    } else {
        std::memcpy(&word, name.data(), name.size());
    }
#if __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__
    word = __builtin_bswap64(word);
#endif
    const std::size_t kept = std::min<std::size_t>(name.size(), sizeof word);
    return kept == 0 ? 0 : word & ~std::uint64_t{0} << (8 * (sizeof word - kept));
}

// Builds the innermost open container at its final size from the values parsed for it,
// adopting each one without a copy, and leaves it as one finished value.
inline ParseResult Parser::close() {
    const OpenContainer container = open_containers.back();
    open_containers.pop_back();
    // The finished containers of the children, in document order.
    std::size_t next_array = container.first_array;
    std::size_t next_object = container.first_object;
    const auto slot_of = [&](const Value& child) -> std::size_t {
        switch (child.which()) {
        case ARRAY_MARKER:
            return next_array++;
        case OBJECT_MARKER:
            return next_object++;
        default:
            return 0;
        }
    };
    // Calls `place` with an empty container or string of the child's kind (or a copy of a
    // scalar child) to construct the Value in its final place, then swaps the content in: a
    // subtree changes owner without being copied.
    const auto adopt = [&](Value& child, std::size_t slot, auto place) {
        switch (child.which()) {
        case ARRAY_MARKER:
            boost::get<Array>(place(Array())).swap(finished_arrays[slot]);
            break;
        case OBJECT_MARKER:
            boost::get<Object>(place(Object())).swap(finished_objects[slot]);
            break;
        case STRING_INDEX:
            boost::get<std::string>(place(std::string())).swap(boost::get<std::string>(child));
            break;
        case DOUBLE_INDEX:
            // Scalars are constructed from their alternative, inline: no call to the general
            // copy constructor, which has containers to deal with.
            place(boost::get<double>(child));
            break;
        case BOOL_INDEX:
            place(boost::get<bool>(child));
            break;
        default:
            place(Null()); // the parser makes no other alternative
        }
    };
    const auto children = values.begin() + static_cast<std::ptrdiff_t>(container.first_value);
    const auto release_children = [&] {
        values.erase(children, values.end());
        finished_arrays.erase(finished_arrays.begin() +
                                  static_cast<std::ptrdiff_t>(container.first_array),
                              finished_arrays.end());
        finished_objects.erase(finished_objects.begin() +
                                   static_cast<std::ptrdiff_t>(container.first_object),
                               finished_objects.end());
    };
    if (container.is_object) {
        // The members go into the map in key order, each placed at its end after a single key
        // comparison; the order is found with comparisons of eight-byte prefixes, most of which
        // settle it without comparing the names themselves.
        const auto names_of = names.begin() + static_cast<std::ptrdiff_t>(container.first_name);
        members_in_key_order.clear();
        for (auto child = children; child != values.end(); ++child) {
            const auto position = static_cast<std::size_t>(child - children);
            members_in_key_order.push_back(
                {name_prefix(names_of[static_cast<std::ptrdiff_t>(position)]), position,
                 slot_of(*child)});
        }
        const auto name_of = [&](const MemberInKeyOrder& member) -> const std::string& {
            return names_of[static_cast<std::ptrdiff_t>(member.child)];
        };
        // Equal names keep document order: the later member then replaces the earlier one.
        const auto key_order = [&](const MemberInKeyOrder& left, const MemberInKeyOrder& right) {
            if (left.name_prefix != right.name_prefix) {
                return left.name_prefix < right.name_prefix;
            }
            const int order = name_of(left).compare(name_of(right));
            return order != 0 ? order < 0 : left.child < right.child;
        };
        // Documents written by programs often list names in order already: a check that stops
        // at the first name out of order costs less than sorting what is sorted.
        if (!std::is_sorted(members_in_key_order.begin(), members_in_key_order.end(), key_order)) {
            std::sort(members_in_key_order.begin(), members_in_key_order.end(), key_order);
        }
        if (options.reject_duplicate_keys) {
            if (const ParseResult result = refuse_repeated_name(container.first_name);
                result != ParseResult::SUCCESS) {
                return result;
            }
            name_offsets.resize(container.first_name);
        }
        Object members;
        for (const MemberInKeyOrder& member : members_in_key_order) {
            std::string& name = names_of[static_cast<std::ptrdiff_t>(member.child)];
            adopt(children[static_cast<std::ptrdiff_t>(member.child)], member.slot,
                  [&](const auto& initial) -> Value& {
                      const std::size_t count = members.size();
                      const auto placed =
                          members.emplace_hint(members.end(), std::move(name), initial);
                      if (members.size() == count) {
                          placed->second = initial; // a repeated name: the later member wins
                      }
                      return placed->second;
                  });
        }
        names.resize(container.first_name);
        release_children();
        finish(members, finished_objects, 0.0F); // OBJECT_MARKER
        return ParseResult::SUCCESS;
    }
    Array items;
    items.reserve(values.size() - container.first_value);
    for (auto child = children; child != values.end(); ++child) {
        adopt(*child, slot_of(*child),
              [&items](const auto& initial) -> Value& { return items.emplace_back(initial); });
    }
    release_children();
    finish(items, finished_arrays, Undefined()); // ARRAY_MARKER
    return ParseResult::SUCCESS;
}

// With the members of the object being closed in key order (equal names in document order),
// refuses the object at the earliest member whose name an earlier member had.
inline ParseResult Parser::refuse_repeated_name(std::size_t first_name) {
    std::size_t earliest_repeat = SIZE_MAX;
    for (std::size_t at = 1; at < members_in_key_order.size(); ++at) {
        const MemberInKeyOrder& previous = members_in_key_order[at - 1];
        const MemberInKeyOrder& member = members_in_key_order[at];
        if (member.name_prefix == previous.name_prefix &&
            names[first_name + member.child] == names[first_name + previous.child]) {
            earliest_repeat = std::min(earliest_repeat, member.child);
        }
    }
    if (earliest_repeat == SIZE_MAX) {
        return ParseResult::SUCCESS;
    }
    cursor = begin + name_offsets[first_name + earliest_repeat];
    return refuse(Refusal::DUPLICATE_KEY, ParseResult::MISSING_TRAILING_BRACE,
                  "the object already has a member of this name; without the "
                  "reject_duplicate_keys option the last one wins");
}

// Records the note of a failure at the cursor. A failure on a '/' that starts what looks like
// a comment is about that comment, whatever the grammar expected there.
inline ParseResult Parser::fail(ParseResult result, std::string_view note) {
    if (at('/')) {
        const bool comment_like = end - cursor >= 2 && (cursor[1] == '/' || cursor[1] == '*');
        if (!options.allow_comments && comment_like) {
            note = "comments are not JSON; the allow_comments option accepts them";
        } else if (options.allow_comments) {
            note = comment_like ? "the comment is not closed" : "a comment starts with // or /*";
        }
    }
    failure_note = note;
    return result;
}

// Skips comments, each with the whitespace after it. Stops at anything else, or on a '/' that
// starts no complete comment, where the caller then fails.
inline void Parser::skip_comments() {
    while (end - cursor >= 2 && *cursor == '/') {
        if (cursor[1] == '/') {
            cursor = std::find_if(cursor + 2, end, [](char c) { return c == '\n' || c == '\r'; });
        } else if (cursor[1] == '*') {
            static constexpr std::string_view closing = "*/";
            const char* const closed = std::search(cursor + 2, end, closing.begin(), closing.end());
            if (closed == end) {
                return;
            }
            cursor = closed + closing.size();
        } else {
            return;
        }
        cursor = detail::skip_whitespace(cursor, end);
    }
}

// Leaves a closed container as the last finished value: as the document itself once no
// container is open any more, otherwise set aside, behind its marker, for its parent.
template <typename Container, typename Marker>
void Parser::finish(Container& content, std::vector<Container>& finished, Marker marker) {
    if (open_containers.empty()) {
        boost::get<Container>(push_value(Container())).swap(content);
    } else {
        finished.push_back(std::move(content));
        push_value(marker);
    }
}

template <typename Alternative>
Value& Parser::push_value(Alternative&& value) {
    if (values.size() == values.capacity()) {
        grow_values();
    }
    return values.emplace_back(std::forward<Alternative>(value));
}

// std::vector would copy the values when it grows (a Value has no move constructor), so they
// are swapped into the larger storage instead: no string is copied. Only scalars, strings
// and markers live here, so none of the swaps can fail.
inline void Parser::grow_values() {
    std::vector<Value> larger;
    larger.reserve(std::max<std::size_t>(64, 2 * values.capacity()));
    for (Value& value : values) {
        larger.emplace_back().swap(value);
    }
    values.swap(larger);
}

} // namespace detail
} // namespace json

#endif
