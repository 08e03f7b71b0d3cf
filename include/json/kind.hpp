#ifndef JSON_KIND_HPP
#define JSON_KIND_HPP

// The kinds of JSON value, as messages and readers tell them apart.

#include <json/detail/export.hpp>

namespace json {

/// The kind of JSON value a Value holds: a double and a float are both NUMBER, and UNDEFINED is
/// no JSON value at all.
enum class Kind { UNDEFINED, NULL_VALUE, BOOLEAN, NUMBER, STRING, ARRAY, OBJECT };

/// The kind's name in messages: "no value" for UNDEFINED, otherwise "JSON " and the kind in
/// lower case ("JSON null", "JSON boolean", "JSON number", "JSON string", "JSON array",
/// "JSON object"). The text is constant and owned by the library. Throws nothing.
JSONVALUE_API const char* kind_name(Kind kind) noexcept;

} // namespace json

#endif
