#ifndef JSON_VALUE_HPP
#define JSON_VALUE_HPP

#include <json/detail/export.hpp>

#include <boost/variant.hpp>

#include <cstddef>
#include <map>
#include <string>
#include <type_traits>
#include <vector>

namespace json {

/// Tag type of alternative 0: the Value holds no JSON value at all (not the same as null).
class JSONVALUE_API Undefined {
  public:
    // User-provided and not noexcept on purpose: boost::variant falls back to the first
    // alternative whose default constructor cannot throw, and that has to be bool.
    Undefined() {} // NOLINT(modernize-use-equals-default)
};

/// Tag type of alternative 1: the JSON literal null.
class JSONVALUE_API Null {
  public:
    // Not noexcept, for the same reason as Undefined().
    Null() {} // NOLINT(modernize-use-equals-default)
};

class Value;

/// A JSON array: elements in insertion order.
using Array = std::vector<Value>;

/// A JSON object: each key once, members in ascending byte-wise (unsigned) key order.
using Object = std::map<std::string, Value>;

namespace detail {

/// The eight alternatives of a Value, in their fixed order; the containers live on the heap.
using ValueVariant =
    boost::variant<Undefined, Null, bool, double, std::string, boost::recursive_wrapper<Array>,
                   boost::recursive_wrapper<Object>, float>;

/// The index that Value::which() returns for each alternative.
enum Alternative : int {
    UNDEFINED_INDEX = 0,
    NULL_INDEX = 1,
    BOOL_INDEX = 2,
    DOUBLE_INDEX = 3,
    STRING_INDEX = 4,
    ARRAY_INDEX = 5,
    OBJECT_INDEX = 6,
    FLOAT_INDEX = 7,
};

/// Selects the constructor that copies a Value but leaves an Array or Object empty; the deep
/// copy uses it to build a tree level by level instead of recursing.
struct ShallowCopy {};

} // namespace detail

/// Display names of the types a Value deals in. `name` is defined, once for the whole process,
/// for Undefined, Null, bool, double, std::string, Array, Object, float and int only.
template <typename T>
struct traits {
    /// The type's display name, e.g. "JSON number" for double; defined in the library.
    static const char* const name;
};

/// @cond
template <>
JSONVALUE_API const char* const traits<Undefined>::name;
template <>
JSONVALUE_API const char* const traits<Null>::name;
template <>
JSONVALUE_API const char* const traits<bool>::name;
template <>
JSONVALUE_API const char* const traits<double>::name;
template <>
JSONVALUE_API const char* const traits<std::string>::name;
template <>
JSONVALUE_API const char* const traits<Array>::name;
template <>
JSONVALUE_API const char* const traits<Object>::name;
template <>
JSONVALUE_API const char* const traits<float>::name;
template <>
JSONVALUE_API const char* const traits<int>::name;
/// @endcond

/// A JSON value: exactly one of the eight alternatives of detail::ValueVariant.
///
/// `which()`, `boost::get` and `boost::apply_visitor` work on a Value as on the variant. A Value
/// owns its whole tree; every copy is deep. There are copy operations only: a temporary Value
/// is copied like any other.
///
/// No operation of a Value recurses once per level of nesting: copying, assignment,
/// destruction and comparison work on documents of any depth with a bounded call stack.
class JSONVALUE_API Value : public detail::ValueVariant {
  public:
    /// The shared constant holding Undefined.
    static const Value UNDEFINED;

    /// Holds Undefined. Throws nothing.
    Value() = default;

    // One constructor per alternative; the Value holds a (deep) copy of the argument. Strings
    // and containers may throw std::bad_alloc; nothing is left behind.

    /// Holds Undefined.
    Value(const Undefined& tag) : detail::ValueVariant(tag) {}
    /// Holds JSON null.
    Value(const Null& tag) : detail::ValueVariant(tag) {}
    /// Holds a boolean.
    Value(const bool& boolean) : detail::ValueVariant(boolean) {}
    /// Holds a double-precision number.
    Value(const double& number) : detail::ValueVariant(number) {}
    /// Holds a copy of the string.
    Value(const std::string& text) : detail::ValueVariant(text) {}
    /// Holds a deep copy of the array.
    Value(const Array& items);
    /// Holds a deep copy of the object.
    Value(const Object& members);
    /// Holds a single-precision number (alternative 7, never converted to double).
    Value(const float& number) : detail::ValueVariant(number) {}

    /// A string (alternative 4), never the bool that a pointer would otherwise convert to.
    /// `text` must point to NUL-terminated text.
    Value(const char* text) : detail::ValueVariant(std::string(text)) {}

    /// JSON null (alternative 1).
    Value(std::nullptr_t) : detail::ValueVariant(Null()) {}

    /// Any integer but bool makes a double (alternative 3). Integers beyond 2^53 in magnitude
    /// are rounded to the nearest double and so may lose precision.
    template <
        typename Integer,
        std::enable_if_t<std::is_integral_v<Integer> && !std::is_same_v<Integer, bool>, int> = 0>
    Value(Integer number) : detail::ValueVariant(static_cast<double>(number)) {}

    /// Pointers other than character pointers would silently become a bool: refused.
    template <typename T, std::enable_if_t<!std::is_same_v<std::remove_cv_t<T>, char>, int> = 0>
    Value(T*) = delete;

    /// Deep copy. Strong guarantee: on std::bad_alloc no Value comes into being and nothing
    /// leaks.
    Value(const Value& other);

    /// Internal: copies `other`, but an Array or Object comes out empty.
    Value(detail::ShallowCopy, const Value& other);

    /// Assigns a deep copy of `source`; returns *this. On std::bad_alloc:
    /// - same alternative: the target is left unchanged;
    /// - a string source: the target is left unchanged;
    /// - an Array or Object source onto another alternative: the target's former content is
    ///   released and it holds the bool `false` (alternative 2).
    /// `source` may lie anywhere inside the target's own tree.
    Value& operator=(const Value& source);

    /// Releases the whole tree. Throws nothing.
    ~Value();
};

/// Deep comparison: equal alternatives and equal content. double and float compare by value,
/// so NaN is unequal to itself; Undefined equals Undefined and Null equals Null. Complexity:
/// linear in the size of the smaller tree. Throws std::bad_alloc only when its work list
/// cannot grow.
JSONVALUE_API bool operator==(const Value& left, const Value& right);

/// The negation of operator==.
inline bool operator!=(const Value& left, const Value& right) {
    return !(left == right);
}

/// Comparison with anything a Value is made from (`v == 5`, `v == "text"`,
/// `v == json::Array{}`): the right operand is converted to a Value first. Without these,
/// boost::variant's own comparison templates would make such expressions ill-formed.
template <typename T,
          std::enable_if_t<std::is_constructible_v<Value, const T&> && !std::is_same_v<T, Value>,
                           int> = 0>
bool operator==(const Value& left, const T& right) {
    return left == Value(right);
}

template <typename T,
          std::enable_if_t<std::is_constructible_v<Value, const T&> && !std::is_same_v<T, Value>,
                           int> = 0>
bool operator!=(const Value& left, const T& right) {
    return !(left == Value(right));
}

} // namespace json

#endif
