#ifndef JSON_TEXT_CONVERSION_HPP
#define JSON_TEXT_CONVERSION_HPP

// The text conversions a JSON parser relies on: a number's text to a double, and UTF-16 to
// UTF-8, done by the number-text and text-encoding libraries.

#include <json/detail/export.hpp>

#include <string>

namespace json::detail {

/// The value of the NUL-terminated number `text`, read by the number-text library: locale
/// independent, plus or minus infinity beyond the range of double, plus or minus zero below
/// it. Reports no failure of its own.
JSONVALUE_API double string_to_double(const char* text);

/// The UTF-8 text of the `count` UTF-16 code units at `text` (no terminator needed; a 0 unit
/// is converted like any other), converted by a text-encoding converter made for the call.
/// An unpaired surrogate becomes U+FFFD. Throws std::logic_error ("basic_string::_M_construct
/// null not valid") for a null `text` with a non-zero `count`, std::length_error for a
/// negative `count`, and std::bad_alloc; nothing is left behind.
JSONVALUE_API std::string u16_to_u8(char16_t* text, int count);

} // namespace json::detail

#endif
