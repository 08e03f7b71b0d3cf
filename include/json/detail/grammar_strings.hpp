#ifndef JSON_DETAIL_GRAMMAR_STRINGS_HPP
#define JSON_DETAIL_GRAMMAR_STRINGS_HPP

// How the grammar reads strings and member names: in one piece when nothing in them needs
// attention, otherwise decoded, escapes and runs of \u escapes included.

#include <json/detail/grammar_loop.hpp>

#include <json/detail/utf8.hpp>

#include <cstddef>
#include <string>
#include <string_view>

namespace json::detail {

// The bytes between the quotes of the string at the cursor, in one piece when there is
// nothing to unescape or refuse in them (most strings); otherwise decoded.
template <typename Handler>
inline ParseResult Grammar<Handler>::string(bool is_name) {
    const char* const first = cursor + 1;
    const char* const stop = find_string_stop(first);
    if (stop == end || *stop != '"') {
        return escaped_string(is_name);
    }
    cursor = stop + 1;
    const std::string_view text(first, static_cast<std::size_t>(stop - first));
    if (is_name) {
        return name_read(text);
    }
    return tell_value([this, text] { return handler.string(text); });
}

template <typename Handler>
ParseResult Grammar<Handler>::escaped_string(bool is_name) {
    decoded.clear();
    ++cursor; // the opening quote
    for (;;) {
        // Bytes that need no attention, well-formed UTF-8 included, are copied in one piece.
        const char* const run = cursor;
        cursor = find_string_stop(cursor);
        decoded.append(run, cursor);
        if (cursor == end) {
            return last ? fail(ParseResult::MISSING_TRAILING_QUOTE, "the string is not closed")
                        : need_more();
        }
        if (*cursor == '"') {
            break;
        }
        if (static_cast<unsigned char>(*cursor) >= 0x80) {
            // A sequence the piece cuts short is read again with the bytes that complete it.
            constexpr std::ptrdiff_t longest_sequence = 4;
            if (!last && end - cursor < longest_sequence) {
                return need_more();
            }
            return refuse(Refusal::INVALID_UTF8, ParseResult::MISSING_TRAILING_QUOTE,
                          "a string holds bytes that are not well-formed UTF-8; "
                          "ParseOptions::allow_invalid_utf8 keeps them as they are");
        }
        if (*cursor != '\\') {
            return fail(ParseResult::MISSING_TRAILING_QUOTE,
                        "a control character inside a string must be escaped");
        }
        if (const ParseResult result = escape(decoded); result != ParseResult::SUCCESS) {
            return result;
        }
    }
    ++cursor; // the closing quote
    const std::string_view text = decoded;
    if (is_name) {
        return name_read(text);
    }
    return tell_value([this, text] { return handler.string(text); });
}

template <typename Handler>
ParseResult Grammar<Handler>::escape(std::string& text) {
    ++cursor; // the backslash
    if (cursor == end) {
        return last ? fail(ParseResult::INCOMPLETE_ESCAPE) : need_more();
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
        return unicode_escapes(text);
    }
    return fail(ParseResult::INVALID_ESCAPE);
}

// A run of \u escapes is converted at once, so that a surrogate pair split over two escapes
// becomes one character. The cursor is on the 'u' of the first escape.
template <typename Handler>
ParseResult Grammar<Handler>::unicode_escapes(std::string& text) {
    constexpr std::size_t escape_length = 6;     // every escape of the run is \uXXXX
    const char* const first_escape = cursor - 1; // its backslash
    utf16.clear();
    for (;;) {
        ++cursor; // the 'u'
        char16_t unit = 0;
        for (int digit = 0; digit < 4; ++digit, ++cursor) {
            if (cursor == end) {
                return last ? fail(ParseResult::INCOMPLETE_ESCAPE) : need_more();
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
        // Whether another escape follows may be known only from the next piece.
        if (!last && static_cast<std::size_t>(end - cursor) < escape_length) {
            return need_more();
        }
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
                cursor = first_escape + at * escape_length;
                return refuse(Refusal::LONE_SURROGATE, ParseResult::INVALID_UNICODE_ESCAPE,
                              std::string(cursor, escape_length) +
                                  " is half of a surrogate pair without its other half; "
                                  "ParseOptions::allow_lone_surrogates makes it U+FFFD");
            }
        }
    }
    decoder.append(text, utf16.data(), utf16.size());
    return ParseResult::SUCCESS;
}

} // namespace json::detail

#endif
