#ifndef JSON_SERIALIZER_HPP
#define JSON_SERIALIZER_HPP

#include <json/detail/export.hpp>
#include <json/value.hpp>

#include <ostream>
#include <string>

namespace json {

/// Writes a Value as JSON text onto a std::ostream, compact or pretty.
///
/// Text produced:
/// - numbers in the shortest form that reads back to the same value; NaN and the infinities,
///   which JSON cannot express as numbers, as the strings "NaN", "Inf" and "-Inf";
/// - strings between double quotes with `\b` `\t` `\n` `\f` `\r` `\"` `\/` `\\` escaped (the
///   slash always), other bytes below 0x20 as `\u00XX`, and every other byte unchanged: UTF-8
///   is not validated, so writing never fails on bad text;
/// - the four digits of a `\u` escape are written with the stream's own number formatting:
///   the writer sets the base field to hexadecimal, the fill to '0' and the width to 4, and
///   leaves every other flag as the caller set it. So a caller's `std::uppercase` gives
///   `\u001F`, `std::left` turns byte 0x01 into `\u1000` and `std::showbase` into `\u00x1`.
///   The base field is restored afterwards; the fill stays '0'. json::serialize and
///   json::pretty_print use a stream of their own and always write `\u0001`;
/// - pretty mode puts every element and member on a line of its own, indented four spaces per
///   level, with no space after the colon; every newline is put and flushed as std::endl does;
/// - an Undefined array element is written as null and an object member whose value is
///   Undefined is left out with its separator, so the text is always valid JSON; an Undefined
///   top-level value writes nothing.
///
/// Documents of any depth are written with a bounded call stack.
class JSONVALUE_API Serializer {
  public:
    /// Compact mode.
    Serializer();
    // Defined in the library, which exports it.
    ~Serializer(); // NOLINT(performance-trivially-destructible)

    /// Sets the mode: true for pretty text, false for compact text.
    void pretty_print(bool on);
    /// The mode.
    bool pretty_print() const;

    /// Writes `value` onto `out` in the current mode, with nothing before or after it.
    /// Reports nothing: a stream that has gone bad receives nothing further. Exceptions the
    /// caller enabled on the stream, std::bad_cast from a locale without std::ctype<char>, and
    /// std::bad_alloc propagate, leaving the text written so far (basic guarantee).
    void write(std::ostream& out, const Value& value);

  private:
    bool pretty;
};

/// The compact text of `value`. Throws std::bad_alloc.
JSONVALUE_API std::string serialize(const Value& value);

/// The pretty text of `value`, with no newline at its end. Throws std::bad_alloc.
JSONVALUE_API std::string pretty_print(const Value& value);

/// Writes the compact text of `value` onto `out`, as Serializer::write does; returns `out`.
JSONVALUE_API std::ostream& operator<<(std::ostream& out, const Value& value);

} // namespace json

#endif
