#ifndef JSON_PARSE_HPP
#define JSON_PARSE_HPP

#include <json/detail/export.hpp>

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

namespace detail {

/// The value of the NUL-terminated number `text`, read by the number-text library: locale
/// independent, plus or minus infinity beyond the range of double, plus or minus zero below
/// it. Reports no failure of its own.
JSONVALUE_API double string_to_double(const char* text);

/// The UTF-8 text of the `count` UTF-16 code units at `text` (no terminator needed; a 0 unit
/// is converted like any other), converted by the text-encoding library. An unpaired
/// surrogate becomes U+FFFD. Throws std::logic_error ("basic_string::_M_construct null not
/// valid") for a null `text` with a non-zero `count`, std::length_error for a negative
/// `count`, and std::bad_alloc; nothing is left behind.
JSONVALUE_API std::string u16_to_u8(char16_t* text, int count);

} // namespace detail

} // namespace json

#endif
