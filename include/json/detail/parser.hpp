#ifndef JSON_DETAIL_PARSER_HPP
#define JSON_DETAIL_PARSER_HPP

// The strict JSON parser behind json::parse; included by json/parse.hpp, after the
// declarations it uses. Header-level: it is compiled into its users and reaches the library
// only through the Value model and the two exported conversions.

#include <json/detail/byte_scan.hpp>
#include <json/value.hpp>

#include <algorithm>
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
    Parser(std::string_view text, std::size_t max_depth)
        : begin(text.data()), cursor(text.data()), end(text.data() + text.size()),
          max_depth(max_depth) {}

    /// Parses the whole text and hands the document to `out`; on failure leaves `out` as it
    /// was and records where and why.
    ParseResult run(Value& out);

    /// Where parsing stopped, why, and extra wording when the code alone says too little.
    std::size_t failure_offset() const { return static_cast<std::size_t>(cursor - begin); }
    const char* note() const { return failure_note; }
    bool nesting_too_deep() const { return too_deep; }

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

    ParseResult parse_value(bool& completed);
    std::optional<std::string_view> plain_string();
    ParseResult parse_string(std::string& text);
    ParseResult parse_escape(std::string& text);
    ParseResult parse_unicode_escapes(std::string& text);
    ParseResult parse_number();
    ParseResult parse_literal(std::string_view literal, ParseResult mismatch);
    ParseResult parse_member_name();
    ParseResult open(bool is_object);
    void close();
    template <typename Container, typename Marker>
    void finish(Container& content, std::vector<Container>& finished, Marker marker);
    template <typename Alternative>
    Value& push_value(Alternative&& value);
    void grow_values();
    ParseResult fail(ParseResult result, const char* note = nullptr) {
        failure_note = note;
        return result;
    }
    void skip_whitespace() {
        // Most tokens follow the previous one directly: no scan is set up for them.
        if (cursor != end && is_whitespace(*cursor)) {
            cursor = detail::skip_whitespace(cursor + 1, end);
        }
    }
    bool at(char c) const { return cursor != end && *cursor == c; }

    const char* const begin;
    const char* cursor;
    const char* const end;
    const std::size_t max_depth;
    const char* failure_note = nullptr;
    bool too_deep = false;

    std::vector<Value> values; // finished values whose container is still open
    std::vector<Array> finished_arrays;
    std::vector<Object> finished_objects;
    std::vector<std::string> names; // member names of the open objects, in document order
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
            expect_value = true;
            if (in_object) {
                skip_whitespace();
                if (const ParseResult result = parse_member_name();
                    result != ParseResult::SUCCESS) {
                    return result;
                }
            }
        } else if (*cursor == (in_object ? '}' : ']')) {
            ++cursor;
            close();
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
            close();
            return ParseResult::SUCCESS;
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

inline ParseResult Parser::parse_member_name() {
    if (cursor == end) {
        return fail(ParseResult::UNEXPECTED_END_OF_INPUT);
    }
    if (*cursor != '"') {
        return fail(ParseResult::MISSING_LEADING_QUOTE, "a member name must be a string");
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
    const char* const stop = find_special_byte<false>(first, end);
    if (stop == end || *stop != '"') {
        return std::nullopt;
    }
    cursor = stop + 1;
    return std::string_view(first, static_cast<std::size_t>(stop - first));
}

inline ParseResult Parser::parse_string(std::string& text) {
    ++cursor; // the opening quote
    for (;;) {
        // Bytes that need no attention are copied in one piece; bytes from 0x80 up are kept
        // as they are.
        const char* const run = cursor;
        cursor = find_special_byte<false>(cursor, end);
        text.append(run, cursor);
        if (cursor == end) {
            return fail(ParseResult::MISSING_TRAILING_QUOTE, "the string is not closed");
        }
        if (*cursor == '"') {
            ++cursor;
            return ParseResult::SUCCESS;
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
    const auto fail_here = [&](ParseResult result, const char* note = nullptr) {
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
    if (*here == '0') {
        ++here; // no further digits after a leading zero
    } else {
        skip_digits();
    }
    if (here_is('.')) {
        ++here;
        if (!digit_here()) {
            return fail_here(ParseResult::INVALID_FRACTION);
        }
        skip_digits();
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
    cursor = here;
    const auto length = static_cast<std::size_t>(cursor - start);
    if (length < short_number) {
        if (!copy_ahead || length >= copied_ahead) {
            std::memcpy(text, start, length);
        }
        text[length] = '\0';
        push_value(string_to_double(text));
    } else {
        number_text.assign(start, cursor);
        push_value(string_to_double(number_text.c_str()));
    }
    return ParseResult::SUCCESS;
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
    if (open_containers.size() >= max_depth) {
        too_deep = true;
        return fail(is_object ? ParseResult::MISSING_TRAILING_BRACE
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
inline void Parser::close() {
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
    } else {
        Array items;
        items.reserve(values.size() - container.first_value);
        for (auto child = children; child != values.end(); ++child) {
            adopt(*child, slot_of(*child),
                  [&items](const auto& initial) -> Value& { return items.emplace_back(initial); });
        }
        release_children();
        finish(items, finished_arrays, Undefined()); // ARRAY_MARKER
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
