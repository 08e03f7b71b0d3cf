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

#include <json/value.hpp>

#include <boost/describe/enum.hpp>
#include <boost/describe/enum_to_string.hpp>
#include <boost/describe/enumerators.hpp>
#include <boost/describe/members.hpp>
#include <boost/mp11/algorithm.hpp>

#include <array>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <tuple>
#include <type_traits>
#include <utility>

namespace json {

template <typename T>
Value value_from(const T& value);

template <typename T>
T value_to(const Value& value);

namespace detail {

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

// Converting to a Value goes in two steps: `to_alternative` makes what the Value is built from
// (an Array, an Object, a string, a number, ...), and the Value is constructed from it in its
// final place, an element or member slot, so that no tree is copied on the way up.

template <typename T, typename Place>
Value& place_from(const T& value, Place&& place);

// A place that constructs each Value as the next element of `items`.
inline auto next_element_of(Array& items) {
    return [&items](auto&& init) -> Value& {
        return items.emplace_back(std::forward<decltype(init)>(init));
    };
}

template <typename T, typename = void>
struct has_size : std::false_type {};
template <typename T>
struct has_size<T, std::void_t<decltype(std::declval<const T&>().size())>> : std::true_type {};

// How many items a range has: its size(), or counted where it has none (std::forward_list).
template <typename Range>
std::size_t size_of(const Range& range) {
    if constexpr (has_size<Range>::value) {
        return static_cast<std::size_t>(range.size());
    } else {
        std::size_t size = 0;
        for (auto item = range.begin(); item != range.end(); ++item) {
            ++size;
        }
        return size;
    }
}

template <typename Range>
Array array_from(const Range& range, std::size_t size) {
    Array items;
    items.reserve(size);
    for (const auto& item : range) {
        place_from(item, next_element_of(items));
    }
    return items;
}

template <typename T>
void member_from(Object& members, const std::string& key, const T& value) {
    place_from(value, [&members, &key](auto&& init) -> Value& {
        return members.try_emplace(key, std::forward<decltype(init)>(init)).first->second;
    });
}

template <typename T>
auto to_alternative(const T& value) {
    constexpr Category category = CATEGORY<T>;
    if constexpr (category == Category::BOOLEAN || category == Category::STRING ||
                  category == Category::NULLPTR || std::is_same_v<T, float>) {
        return value;
    } else if constexpr (category == Category::INTEGER || category == Category::FLOATING) {
        return static_cast<double>(value);
    } else if constexpr (category == Category::TEXT) {
        return std::string(std::string_view(value));
    } else if constexpr (category == Category::ENUM) {
        const char* name = boost::describe::enum_to_string(value, nullptr);
        if (name == nullptr) {
            throw_unnamed_enum_value(static_cast<long long>(value));
        }
        return std::string(name);
    } else if constexpr (category == Category::STRUCT) {
        Object members;
        boost::mp11::mp_for_each<described_members<T>>(
            [&](auto member) { member_from(members, member.name, value.*member.pointer); });
        return members;
    } else if constexpr (category == Category::TUPLE) {
        Array items;
        items.reserve(std::tuple_size_v<T>);
        std::apply(
            [&items](const auto&... item) { (place_from(item, next_element_of(items)), ...); },
            value);
        return items;
    } else if constexpr (category == Category::MAP) {
        Object members;
        for (const auto& [key, item] : value) {
            member_from(members, key, item);
        }
        return members;
    } else if constexpr (category == Category::FIXED_SIZE || category == Category::SEQUENCE) {
        return array_from(value, size_of(value));
    } else {
        static_assert(always_false<T>,
                      "no conversion to json::Value: describe the type with Boost.Describe or "
                      "declare to_json(json::Value&, const T&) beside it");
    }
}

/// Constructs the Value of `value` with `place`, which builds a Value from its argument in
/// the Value's final place and returns it.
template <typename T, typename Place>
Value& place_from(const T& value, Place&& place) {
    if constexpr (hooks::has_to_json<T>::value) {
        Value& out = place(Undefined());
        hooks::call_to_json(out, value);
        return out;
    } else if constexpr (CATEGORY<T> == Category::VALUE) {
        return place(value);
    } else if constexpr (CATEGORY<T> == Category::OPTIONAL) {
        return value ? place_from(*value, place) : place(Null());
    } else {
        return place(to_alternative(value));
    }
}

template <typename T>
T to_integer(const Value& in) {
    const double number = in.as_number();
    // Every integer type's range is [min, 2^digits): both ends are exact doubles, and NaN fails
    // both tests.
    constexpr double upper =
        static_cast<double>(std::uintmax_t{1} << (std::numeric_limits<T>::digits - 1)) * 2;
    const double lower = static_cast<double>(std::numeric_limits<T>::min());
    if (!(number >= lower && number < upper) ||
        static_cast<double>(static_cast<T>(number)) != number) {
        throw_not_in_range(number, static_cast<std::intmax_t>(std::numeric_limits<T>::min()),
                           static_cast<std::uintmax_t>(std::numeric_limits<T>::max()));
    }
    return static_cast<T>(number);
}

// 2^exponent, for 0 <= exponent < 1024. Kept here rather than std::ldexp: <cmath> would be the
// largest header this one brings in.
constexpr double power_of_two(int exponent) {
    double power = 1.0;
    for (int i = 0; i < exponent; ++i) {
        power *= 2.0;
    }
    return power;
}

template <typename T>
T to_floating(const Value& in) {
    const double number = in.as_number();
    if constexpr (sizeof(T) < sizeof(double)) {
        // Narrowing a finite double that does not round to a finite T is undefined: refuse it.
        // Doubles round to T's largest value up to halfway to the next power of two; halfway
        // rounds to even, which is that power, beyond the range. So the shortest text of the
        // largest float, 3.4028235e+38, which is above FLT_MAX, converts back to it.
        using limits = std::numeric_limits<T>;
        constexpr double halfway =
            static_cast<double>(limits::max()) +
            power_of_two(limits::max_exponent - limits::digits - 1); // half its last step
        constexpr double infinity = std::numeric_limits<double>::infinity();
        if ((number >= halfway || number <= -halfway) && number != infinity &&
            number != -infinity) {
            throw_not_a_float(number);
        }
    }
    return static_cast<T>(number);
}

// Compares whole strings, not NUL-terminated prefixes: "red\u0000junk" names no enumerator.
template <typename T>
T to_enum(const Value& in) {
    const std::string& name = in.as_string();
    T value{};
    bool found = false;
    boost::mp11::mp_for_each<boost::describe::describe_enumerators<T>>([&](auto enumerator) {
        if (!found && name == enumerator.name) {
            value = enumerator.value;
            found = true;
        }
    });
    if (!found) {
        throw_unknown_enumerator(name);
    }
    return value;
}

template <typename T>
T to_struct(const Value& in) {
    static_cast<void>(in.as_object()); // throws when `in` is no Object
    T value{};
    boost::mp11::mp_for_each<described_members<T>>([&](auto member) {
        using Member = std::remove_reference_t<decltype(value.*member.pointer)>;
        const std::string_view name = member.name;
        const Value* const found = in.find(member.name);
        if (found == nullptr) {
            if constexpr (is_optional<Member>::value) {
                value.*member.pointer = std::nullopt;
            } else {
                below(name, [] { throw_missing_member(); });
            }
        } else {
            value.*member.pointer = below(name, [&] { return value_to<Member>(*found); });
        }
    });
    return value;
}

// Too short an Array fails at the first missing element, too long a one at the Array.
inline void check_size(const Array& items, std::size_t size) {
    if (items.size() < size) {
        below(items.size(), [&] { throw_wrong_size(size, items.size()); });
    }
    if (items.size() > size) {
        throw_wrong_size(size, items.size());
    }
}

template <typename T, std::size_t... I>
T to_tuple(const Array& items, std::index_sequence<I...>) {
    return T(below(I, [&] { return value_to<std::tuple_element_t<I, T>>(items[I]); })...);
}

template <typename T>
T to_tuple(const Value& in) {
    constexpr std::size_t size = std::tuple_size_v<T>;
    check_size(in.as_array(), size);
    return to_tuple<T>(in.as_array(), std::make_index_sequence<size>());
}

template <typename T>
T to_fixed_size(const Value& in) {
    const Array& items = in.as_array();
    T result{};
    check_size(items, result.size());
    for (std::size_t i = 0; i < result.size(); ++i) {
        result[i] = below(i, [&] { return value_to<typename T::value_type>(items[i]); });
    }
    return result;
}

template <typename T>
T to_sequence(const Value& in) {
    T result;
    std::size_t index = 0;
    for (const Value& item : in.as_array()) {
        result.insert(result.end(),
                      below(index++, [&] { return value_to<typename T::value_type>(item); }));
    }
    return result;
}

template <typename T>
T to_map(const Value& in) {
    T result;
    for (const auto& member : in.as_object()) {
        result.emplace(member.first, below(member.first, [&] {
                           return value_to<typename T::mapped_type>(member.second);
                       }));
    }
    return result;
}

} // namespace detail

/// The Value that represents `value`; see the top of this header for the types it takes.
/// Linear in the size of `value`. Throws std::bad_alloc, std::invalid_argument for an enum
/// value that has no enumerator, and whatever a user's to_json throws; nothing leaks.
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
/// errors it reports. Linear in the size of `value`. Throws std::invalid_argument and
/// std::out_of_range with the place of the failure, std::bad_alloc, and whatever a user's
/// from_json throws; nothing leaks.
template <typename T>
T value_to(const Value& value) {
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
        return value_to<typename T::value_type>(value);
    } else if constexpr (category == Category::ENUM) {
        return detail::to_enum<T>(value);
    } else if constexpr (category == Category::STRUCT) {
        return detail::to_struct<T>(value);
    } else if constexpr (category == Category::TUPLE) {
        return detail::to_tuple<T>(value);
    } else if constexpr (category == Category::MAP) {
        return detail::to_map<T>(value);
    } else if constexpr (category == Category::FIXED_SIZE) {
        return detail::to_fixed_size<T>(value);
    } else if constexpr (category == Category::SEQUENCE) {
        return detail::to_sequence<T>(value);
    } else {
        static_assert(detail::always_false<T>,
                      "no conversion from json::Value: describe the type with Boost.Describe or "
                      "declare from_json(const json::Value&, T&) beside it");
    }
}

template <typename T>
T Value::value_or(const std::string& key, const T& fallback) const {
    static_cast<void>(as_object()); // throws when this is no Object
    const Value* const member = find(key);
    if (member == nullptr) {
        return fallback;
    }
    return detail::below(key, [&] { return value_to<T>(*member); });
}

} // namespace json

#endif
