#ifndef JSON_SERIALIZER_HPP
#define JSON_SERIALIZER_HPP

#include <json/detail/export.hpp>
#include <json/value.hpp>

#include <iosfwd>
#include <string>

namespace json {

/// How JSON text is laid out and escaped. An aggregate: members may be set by name
/// (`{.pretty = true, .indent = 2}` in C++20). The defaults give the library's compact text;
/// with `pretty` alone they give its pretty text (Serializer, json::pretty_print).
struct WriteOptions {
    /// Every element and member on a line of its own, indented by its nesting level; an empty
    /// container stays on one line.
    bool pretty = false;
    /// Spaces per level of indentation in pretty text; 0 gives line breaks and no indentation.
    unsigned indent = 4;
    /// One tab per level of indentation in pretty text instead of `indent` spaces.
    bool indent_with_tab = false;
    /// A space after the colon of each member: `"a": 1`.
    bool space_after_colon = false;
    /// `/` written as `\/`; when false, as itself.
    bool escape_slash = true;
    /// Every character above U+007F written as a `\uXXXX` escape in lower-case hexadecimal
    /// (characters above U+FFFF as a UTF-16 surrogate pair of them), so the text is pure ASCII.
    /// A string that is not well-formed UTF-8 then cannot be written: std::invalid_argument,
    /// naming the offset of the offending byte inside the string. When false, bytes from 0x80
    /// up are written as they are, without checking them.
    bool ascii_only = false;
    /// In pretty text, an empty array or object at level L holds the indentation of level L
    /// (`[    ]` one level down); when false, every empty container is `[]` or `{}`.
    bool pad_empty_containers = true;
    /// json::Writer only: write strings and member names that are not well-formed UTF-8 as
    /// they are, which no strict reader accepts. When false, the Writer refuses them
    /// (std::invalid_argument). json::serialize and json::write never check: they write a
    /// document's strings as they are held (but for ascii_only, which cannot write them).
    bool allow_invalid_utf8 = false;
    /// Refuse NaN and the infinities (std::invalid_argument), which have no JSON number,
    /// instead of writing them as the strings "NaN", "Inf" and "-Inf": a number then never
    /// comes back as a string. For every writer given these options.
    bool reject_non_finite = false;
};

/// The pretty layout most JSON tools write: two spaces per level, `"a": 1`, `[]` and `{}` for
/// empty containers, `/` as itself, other characters than ASCII as they are.
inline constexpr WriteOptions COMMON_PRETTY = [] {
    WriteOptions options;
    options.pretty = true;
    options.indent = 2;
    options.space_after_colon = true;
    options.escape_slash = false;
    options.pad_empty_containers = false;
    return options;
}();

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
/// Documents of any depth are written with a bounded call stack. json::write with WriteOptions
/// writes the same way, in any layout.
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

/// Writes the text of `value` onto `out`, as Serializer::write does, and returns `out`:
/// compact text, or, when the stream's width is set (`std::cout << std::setw(2) << value`),
/// the library's pretty text indented by that many spaces per level, so that `std::setw(4)`
/// gives the text of json::pretty_print. The width is set back to 0 before the text is
/// written, as the standard inserters use it up. Throws what Serializer::write throws.
JSONVALUE_API std::ostream& operator<<(std::ostream& out, const Value& value);

/// The text of `value` laid out as `options` ask; `serialize(value, {})` is `serialize(value)`
/// and with only `pretty` set it is `pretty_print(value)`. Linear in the size of the document,
/// with a bounded call stack. Throws std::invalid_argument when `options.ascii_only` is set and
/// a string (or member name) is not well-formed UTF-8, and std::bad_alloc; nothing is returned
/// then.
JSONVALUE_API std::string serialize(const Value& value, const WriteOptions& options);

/// Writes the text of serialize(value, options) onto `out` as Serializer::write writes onto a
/// stream (a bad stream receives nothing; in pretty text each newline is widened by the
/// stream's locale and flushed; the digits of `\u` escapes follow the stream's formatting
/// flags); returns `out`. With only `pretty` set in `options` it is Serializer::write in pretty
/// mode. Throws what Serializer::write throws, and std::invalid_argument as serialize(value,
/// options) does, leaving the text written so far on the stream (basic guarantee).
JSONVALUE_API std::ostream& write(std::ostream& out, const Value& value,
                                  const WriteOptions& options);

} // namespace json

#endif
