#ifndef JSON_DETAIL_FROM_VALUE_HPP
#define JSON_DETAIL_FROM_VALUE_HPP

// json::value_to's work: the C++ value a Value represents, checked as it is made.

#include <json/detail/conversion_errors.hpp>
#include <json/detail/conversion_traits.hpp>

#include <boost/mp11/algorithm.hpp>

#include <cstddef>
#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <string_view>
#include <tuple>
#include <type_traits>
#include <utility>

namespace json::detail {

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

// Whether T describes a public member named `name`. Linear in the number of T's members.
template <typename T>
bool describes_member(std::string_view name) {
    bool found = false;
    boost::mp11::mp_for_each<described_members<T>>(
        [&](auto member) { found = found || name == member.name; });
    return found;
}

template <typename T>
T to_struct(const Value& in, const ConvertOptions& options) {
    const Object& members = in.as_object(); // throws when `in` is no Object
    if (options.reject_unknown_members) {
        for (const auto& [name, member] : members) {
            if (!member.is_undefined() && !describes_member<T>(name)) {
                below(name, [] { throw_unknown_member(); });
            }
        }
    }
    T value{};
    boost::mp11::mp_for_each<described_members<T>>([&](auto member) {
        using Member = std::remove_reference_t<decltype(value.*member.pointer)>;
        const std::string_view name = member.name;
        const Value* const found = in.find(member.name);
        if (found != nullptr) {
            value.*member.pointer = below(name, [&] { return value_to<Member>(*found, options); });
        } else if (!options.missing_members_keep_defaults) { // else it keeps what T{} gave it
            if constexpr (is_optional<Member>::value) {
                value.*member.pointer = std::nullopt;
            } else {
                below(name, [] { throw_missing_member(); });
            }
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
T to_tuple(const Array& items, const ConvertOptions& options, std::index_sequence<I...>) {
    return T(below(I, [&] { return value_to<std::tuple_element_t<I, T>>(items[I], options); })...);
}

template <typename T>
T to_tuple(const Value& in, const ConvertOptions& options) {
    constexpr std::size_t size = std::tuple_size_v<T>;
    check_size(in.as_array(), size);
    return to_tuple<T>(in.as_array(), options, std::make_index_sequence<size>());
}

template <typename T>
T to_fixed_size(const Value& in, const ConvertOptions& options) {
    const Array& items = in.as_array();
    T result{};
    check_size(items, result.size());
    for (std::size_t i = 0; i < result.size(); ++i) {
        result[i] = below(i, [&] { return value_to<typename T::value_type>(items[i], options); });
    }
    return result;
}

template <typename T>
T to_sequence(const Value& in, const ConvertOptions& options) {
    T result;
    std::size_t index = 0;
    for (const Value& item : in.as_array()) {
        result.insert(result.end(), below(index++, [&] {
                          return value_to<typename T::value_type>(item, options);
                      }));
    }
    return result;
}

template <typename T>
T to_map(const Value& in, const ConvertOptions& options) {
    T result;
    for (const auto& member : in.as_object()) {
        result.emplace(member.first, below(member.first, [&] {
                           return value_to<typename T::mapped_type>(member.second, options);
                       }));
    }
    return result;
}

} // namespace json::detail

#endif
