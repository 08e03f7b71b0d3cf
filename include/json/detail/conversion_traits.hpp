#ifndef JSON_DETAIL_CONVERSION_TRAITS_HPP
#define JSON_DETAIL_CONVERSION_TRAITS_HPP

// How the conversions tell C++ types apart: the user's hooks, then the kinds of type they take.

#include <json/convert_options.hpp>
#include <json/value.hpp>

#include <boost/describe/enumerators.hpp>
#include <boost/describe/members.hpp>

#include <array>
#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <tuple>
#include <type_traits>
#include <utility>

namespace json {

template <typename T>
Value value_from(const T& value);

template <typename T>
T value_to(const Value& value, const ConvertOptions& options);

namespace detail {

// The user's hooks are looked up by argument-dependent lookup only: these deleted
// declarations stop ordinary lookup from finding anything else of the name.
namespace hooks {

void to_json() = delete;
void from_json() = delete;

template <typename T, typename = void>
struct has_to_json : std::false_type {};
template <typename T>
struct has_to_json<T,
                   std::void_t<decltype(to_json(std::declval<Value&>(), std::declval<const T&>()))>>
    : std::true_type {};

template <typename T, typename = void>
struct has_from_json : std::false_type {};
template <typename T>
struct has_from_json<
    T, std::void_t<decltype(from_json(std::declval<const Value&>(), std::declval<T&>()))>>
    : std::true_type {};

template <typename T>
void call_to_json(Value& out, const T& value) {
    to_json(out, value);
}

template <typename T>
void call_from_json(const Value& in, T& value) {
    from_json(in, value);
}

} // namespace hooks

template <typename T>
struct is_optional : std::false_type {};
template <typename T>
struct is_optional<std::optional<T>> : std::true_type {};

template <typename T>
struct is_std_array : std::false_type {};
template <typename T, std::size_t N>
struct is_std_array<std::array<T, N>> : std::true_type {};

template <typename T>
struct is_tuple_like : std::false_type {};
template <typename... Ts>
struct is_tuple_like<std::tuple<Ts...>> : std::true_type {};
template <typename A, typename B>
struct is_tuple_like<std::pair<A, B>> : std::true_type {};

template <typename T, typename = void>
struct is_range : std::false_type {};
template <typename T>
struct is_range<T, std::void_t<typename T::value_type, decltype(std::declval<const T&>().begin()),
                               decltype(std::declval<const T&>().end())>> : std::true_type {};

template <typename T, typename = void>
struct is_string_map : std::false_type {};
template <typename T>
struct is_string_map<T, std::void_t<typename T::key_type, typename T::mapped_type>>
    : std::is_same<typename T::key_type, std::string> {};

/// The kinds of C++ type the conversions tell apart, in the order they are tried (the user's
/// hooks come before all of them).
enum class Category {
    VALUE,      // json::Value itself
    BOOLEAN,    // bool
    INTEGER,    // any other integral type
    FLOATING,   // float, double, long double
    STRING,     // std::string
    NULLPTR,    // std::nullptr_t
    TEXT,       // const char*, char arrays, std::string_view: value_from only
    OPTIONAL,   // std::optional
    ENUM,       // described enums
    STRUCT,     // described structs
    TUPLE,      // std::pair, std::tuple
    MAP,        // maps with std::string keys
    FIXED_SIZE, // std::array
    SEQUENCE,   // other ranges
    UNSUPPORTED,
};

template <typename T>
constexpr Category category_of() {
    if constexpr (std::is_same_v<T, Value>) {
        return Category::VALUE;
    } else if constexpr (std::is_same_v<T, bool>) {
        return Category::BOOLEAN;
    } else if constexpr (std::is_integral_v<T>) {
        return Category::INTEGER;
    } else if constexpr (std::is_floating_point_v<T>) {
        return Category::FLOATING;
    } else if constexpr (std::is_same_v<T, std::string>) {
        return Category::STRING;
    } else if constexpr (std::is_same_v<T, std::nullptr_t>) {
        return Category::NULLPTR; // before TEXT: a null pointer converts to std::string_view
    } else if constexpr (std::is_convertible_v<const T&, std::string_view>) {
        return Category::TEXT;
    } else if constexpr (is_optional<T>::value) {
        return Category::OPTIONAL;
    } else if constexpr (boost::describe::has_describe_enumerators<T>::value) {
        return Category::ENUM;
    } else if constexpr (boost::describe::has_describe_members<T>::value) {
        return Category::STRUCT;
    } else if constexpr (is_tuple_like<T>::value) {
        return Category::TUPLE;
    } else if constexpr (is_string_map<T>::value) {
        return Category::MAP;
    } else if constexpr (is_std_array<T>::value) {
        return Category::FIXED_SIZE;
    } else if constexpr (is_range<T>::value) {
        return Category::SEQUENCE;
    } else {
        return Category::UNSUPPORTED;
    }
}

template <typename T>
inline constexpr Category CATEGORY = category_of<T>();

template <typename T>
inline constexpr bool always_false = false;

template <typename T>
using described_members = boost::describe::describe_members<T, boost::describe::mod_public |
                                                                   boost::describe::mod_inherited>;

} // namespace detail

} // namespace json

#endif
