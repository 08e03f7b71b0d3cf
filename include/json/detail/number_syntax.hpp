#ifndef JSON_DETAIL_NUMBER_SYNTAX_HPP
#define JSON_DETAIL_NUMBER_SYNTAX_HPP

// The syntax of a JSON number, for every reader and writer that checks one: the grammar's
// scan and json::Writer::number(literal).

#include <json/detail/byte_scan.hpp>
#include <json/parse_options.hpp>

namespace json::detail {

/// Where the JSON number at the start of a text ends, or where and how it is malformed.
struct NumberScan {
    const char* end;   ///< the first byte after the number, or the byte where it went wrong
    ParseResult error; ///< SUCCESS, or the step that failed
};

/// Scans -?(0|[1-9][0-9]*)(\.[0-9]+)?([eE][+-]?[0-9]+)? from `from`, reading nothing at or past
/// `end`: the longest number there, or the first place where a number cannot go on as it must
/// (MISSING_QUANTITY_AFTER_SIGN after a lone '-', MISSING_LEADING_DIGIT where no number starts,
/// INVALID_FRACTION after a '.', INVALID_EXPONENT after an 'e'); that place may be `end` when
/// the text stops short. A leading zero ends the number: "01" is the number 0, then "1".
/// Linear; digits sixteen at a time (see skip_digits). Throws nothing.
[[gnu::always_inline]] inline NumberScan scan_number(const char* from, const char* end) noexcept {
    const auto digit_at = [end](const char* at) { return at != end && *at >= '0' && *at <= '9'; };
    const auto is_at = [end](const char* at, char c) { return at != end && *at == c; };
    const char* here = from;
    if (is_at(here, '-')) {
        ++here;
        if (!digit_at(here)) {
            return {here, ParseResult::MISSING_QUANTITY_AFTER_SIGN};
        }
    }
    if (!digit_at(here)) {
        return {here, ParseResult::MISSING_LEADING_DIGIT};
    }
    here = *here == '0' ? here + 1 : skip_digits(here, end);
    if (is_at(here, '.')) {
        ++here;
        if (!digit_at(here)) {
            return {here, ParseResult::INVALID_FRACTION};
        }
        here = skip_digits(here, end);
    }
    if (is_at(here, 'e') || is_at(here, 'E')) {
        ++here;
        if (is_at(here, '+') || is_at(here, '-')) {
            ++here;
        }
        if (!digit_at(here)) {
            return {here, ParseResult::INVALID_EXPONENT};
        }
        here = skip_digits(here, end);
    }
    return {here, ParseResult::SUCCESS};
}

} // namespace json::detail

#endif
