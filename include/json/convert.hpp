#ifndef JSON_CONVERT_HPP
#define JSON_CONVERT_HPP

// Conversions between Values and C++ types: json::value_from and json::value_to.
//
// Supported both ways: bool, every arithmetic type, std::string, std::nullptr_t, json::Value,
// std::optional, sequences (std::vector, std::deque, std::list, std::array, std::set,
// std::unordered_set, and any other container with begin(), end() and insert(end, value)),
// maps with std::string keys (std::map, std::unordered_map), std::pair and std::tuple, enums
// and structs described with Boost.Describe, and every type with the two functions
//
//     void to_json(json::Value& out, const T& value);
//     void from_json(const json::Value& in, T& value);
//
// declared where argument-dependent lookup finds them (in T's namespace). Those take
// precedence over everything else. Only value_from takes const char* and std::string_view.
//
// Conversions recurse once per level of the C++ type (bounded by the type, never by the
// document). A failure of value_to throws std::out_of_range for something missing (a member,
// an element of a fixed-size type) and std::invalid_argument for anything else (a value of the
// wrong kind, a number out of range, an unknown enumerator name), with a message that begins
// with the JSON Pointer of the offending value relative to the Value converted:
// "/items/1/price: expected JSON number, found JSON string". A failure at the Value itself has
// no pointer in front. A user's from_json may throw what it likes; std::invalid_argument and
// std::out_of_range from it get the pointer in front too (as the same standard type).
//
// json::ConvertOptions (json/convert_options.hpp) lets a missing struct member keep its
// default and refuses members a struct does not describe, for config files.

#include <json/convert_options.hpp>
#include <json/detail/conversion_traits.hpp>
#include <json/detail/from_value.hpp>
#include <json/detail/to_value.hpp>
#include <json/value.hpp>

// The macros that describe a struct or an enum, for the programs that convert them.
#include <boost/describe/class.hpp>
#include <boost/describe/enum.hpp>

#include <optional>
#include <string>

namespace json {

/// The Value that represents `value`; see the top of this header for the types it takes.
/// Linear in the size of `value`. Throws std::bad_alloc, std::invalid_argument for an enum
/// value that has no enumerator, std::out_of_range for an integer that a double cannot hold
/// exactly, and whatever a user's to_json throws; nothing leaks.
template <typename T>
Value value_from(const T& value) {
    if constexpr (detail::hooks::has_to_json<T>::value) {
        Value out;
        detail::hooks::call_to_json(out, value);
        return out;
    } else if constexpr (detail::CATEGORY<T> == detail::Category::VALUE) {
        return value;
    } else if constexpr (detail::CATEGORY<T> == detail::Category::OPTIONAL) {
        return value ? value_from(*value) : Value(nullptr);
    } else {
        return Value(detail::to_alternative(value));
    }
}

/// The T that `value` represents; see the top of this header for the types it makes and the
/// errors it reports. `options` say how described structs take their members, at every level
/// of T but inside a user's from_json, which gets none. Linear in the size of `value` (with
/// reject_unknown_members, each member of a struct's Object is looked for among the struct's
/// described members). Throws std::invalid_argument and std::out_of_range with the place of
/// the failure, std::bad_alloc, and whatever a user's from_json throws; nothing leaks.
template <typename T>
T value_to(const Value& value, const ConvertOptions& options) {
    using detail::Category;
    constexpr Category category = detail::CATEGORY<T>;
    if constexpr (detail::hooks::has_from_json<T>::value) {
        T result{};
        detail::hooks::call_from_json(value, result);
        return result;
    } else if constexpr (category == Category::VALUE) {
        return value;
    } else if constexpr (category == Category::BOOLEAN) {
        return value.as_bool();
    } else if constexpr (category == Category::INTEGER) {
        return detail::to_integer<T>(value);
    } else if constexpr (category == Category::FLOATING) {
        return detail::to_floating<T>(value);
    } else if constexpr (category == Category::STRING) {
        return value.as_string();
    } else if constexpr (category == Category::NULLPTR) {
        if (!value.is_null()) {
            detail::throw_wrong_kind(traits<Null>::name, value);
        }
        return nullptr;
    } else if constexpr (category == Category::OPTIONAL) {
        if (value.is_null() || value.is_undefined()) {
            return std::nullopt;
        }
        return value_to<typename T::value_type>(value, options);
    } else if constexpr (category == Category::ENUM) {
        return detail::to_enum<T>(value);
    } else if constexpr (category == Category::STRUCT) {
        return detail::to_struct<T>(value, options);
    } else if constexpr (category == Category::TUPLE) {
        return detail::to_tuple<T>(value, options);
    } else if constexpr (category == Category::MAP) {
        return detail::to_map<T>(value, options);
    } else if constexpr (category == Category::FIXED_SIZE) {
        return detail::to_fixed_size<T>(value, options);
    } else if constexpr (category == Category::SEQUENCE) {
        return detail::to_sequence<T>(value, options);
    } else {
        static_assert(detail::always_false<T>,
                      "no conversion from json::Value: describe the type with Boost.Describe or "
                      "declare from_json(const json::Value&, T&) beside it");
    }
}

/// value_to with the default options: every described member but a std::optional one must be
/// there, and members a struct does not describe are ignored.
template <typename T>
T value_to(const Value& value) {
    return value_to<T>(value, ConvertOptions());
}

template <typename T>
T Value::value_or(const std::string& key, const T& fallback, const ConvertOptions& options) const {
    static_cast<void>(as_object()); // throws when this is no Object
    const Value* const member = find(key);
    if (member == nullptr) {
        return fallback;
    }
    return detail::below(key, [&] { return value_to<T>(*member, options); });
}

template <typename T>
T Value::value_or(const std::string& key, const T& fallback) const {
    return value_or(key, fallback, ConvertOptions());
}

} // namespace json

#endif
