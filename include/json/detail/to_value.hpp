#ifndef JSON_DETAIL_TO_VALUE_HPP
#define JSON_DETAIL_TO_VALUE_HPP

// json::value_from's work: the Value of a C++ value, each Value built in its final place.

#include <json/detail/conversion_errors.hpp>
#include <json/detail/conversion_traits.hpp>

#include <boost/describe/enum_to_string.hpp>
#include <boost/mp11/algorithm.hpp>

#include <cstddef>
#include <string>
#include <string_view>
#include <tuple>
#include <type_traits>
#include <utility>

namespace json::detail {

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
    } else if constexpr (category == Category::INTEGER) {
        return exact_double(value); // refuses an integer no double holds
    } else if constexpr (category == Category::FLOATING) {
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

} // namespace json::detail

#endif
