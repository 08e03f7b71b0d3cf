#ifndef JSON_DETAIL_CONVERSION_ERRORS_HPP
#define JSON_DETAIL_CONVERSION_ERRORS_HPP

// The errors of the conversions, thrown by the library, and the place of a child put in front of
// their messages.

#include <json/detail/export.hpp>
#include <json/fwd.hpp>

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace json::detail {

/// Throws std::invalid_argument "expected EXPECTED, found KIND", KIND being the JSON kind
/// `found` holds ("JSON number" for a float too, "no value" for Undefined).
[[noreturn]] JSONVALUE_API void throw_wrong_kind(const char* expected, const Value& found);

/// Throws std::invalid_argument "expected an integer from MIN to MAX, found NUMBER".
[[noreturn]] JSONVALUE_API void throw_not_in_range(double number, std::intmax_t min,
                                                   std::uintmax_t max);

/// Throws std::invalid_argument "expected a number within the range of float, found NUMBER".
[[noreturn]] JSONVALUE_API void throw_not_a_float(double number);

/// Throws std::out_of_range "missing member".
[[noreturn]] JSONVALUE_API void throw_missing_member();

/// Throws std::invalid_argument "unknown member (the struct has no member of this name)".
[[noreturn]] JSONVALUE_API void throw_unknown_member();

/// Throws std::out_of_range "missing element (expected SIZE, found FOUND)" for too short an
/// Array, std::invalid_argument "expected JSON array of SIZE elements, found FOUND" for too
/// long a one.
[[noreturn]] JSONVALUE_API void throw_wrong_size(std::size_t size, std::size_t found);

/// Throws std::invalid_argument naming the unknown enumerator.
[[noreturn]] JSONVALUE_API void throw_unknown_enumerator(const std::string& name);

/// Throws std::invalid_argument for an enum value without an enumerator.
[[noreturn]] JSONVALUE_API void throw_unnamed_enum_value(long long value);

/// Rethrows the std::invalid_argument or std::out_of_range being handled with "/token" (escaped
/// as a JSON Pointer token) in front of its message's pointer; anything else unchanged.
[[noreturn]] JSONVALUE_API void rethrow_below(std::string_view token);
/// The same for an element index.
[[noreturn]] JSONVALUE_API void rethrow_below(std::size_t index);

/// Runs `convert` for the child at `token` (a member name or an index) and puts the child's
/// place in front of the message of any conversion error.
template <typename Token, typename Convert>
decltype(auto) below(const Token& token, Convert&& convert) {
    try {
        return convert();
    } catch (...) {
        rethrow_below(token);
    }
}

} // namespace json::detail

#endif
