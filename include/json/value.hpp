#ifndef JSON_VALUE_HPP
#define JSON_VALUE_HPP

#include <json/detail/export.hpp>
#include <json/fwd.hpp>
#include <json/kind.hpp>

#include <boost/variant.hpp>

#include <cstddef>
#include <cstdint>
#include <limits>
#include <map>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
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

/// The double that holds `number` exactly; throws std::out_of_range when there is none.
JSONVALUE_API double checked_exact_double(long long number);
/// @copydoc checked_exact_double(long long)
JSONVALUE_API double checked_exact_double(unsigned long long number);

/// The double that holds `number` exactly, converted inline where every value of its type
/// fits in a double's 53 bits or the value is small enough. Throws std::out_of_range when no
/// double holds it.
template <typename Integer>
double exact_double(Integer number) {
    constexpr int double_digits = 53;
    if constexpr (std::numeric_limits<Integer>::digits <= double_digits) {
        return static_cast<double>(number);
    } else {
        constexpr auto exact_limit = static_cast<Integer>(std::uint64_t{1} << double_digits);
        if (number <= exact_limit && (std::is_unsigned_v<Integer> || number >= -exact_limit)) {
            return static_cast<double>(number);
        }
        if constexpr (std::is_signed_v<Integer>) {
            return checked_exact_double(static_cast<long long>(number));
        } else {
            return checked_exact_double(static_cast<unsigned long long>(number));
        }
    }
}

/// Selects the constructor that copies a Value but leaves an Array or Object empty; the deep
/// copy starts from it and fills the containers itself.
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
/// No operation of a Value recurses once per level of nesting beyond a fixed depth: copying,
/// assignment, destruction and comparison work on documents of any depth with a bounded call
/// stack.
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

    // Constructors that take a container or string over instead of copying it: these are
    // conversions from an alternative, not move operations of Value.

    /// Holds the array's elements, taken over without copying them: one allocation for the
    /// Array itself. `items` is left empty. On std::bad_alloc `items` keeps its elements.
    Value(Array&& items);
    /// Holds the object's members, taken over without copying them: one allocation for the
    /// Object itself. `members` is left empty. On std::bad_alloc `members` keeps its members.
    Value(Object&& members);
    /// Holds the string's characters, taken over without copying them. Throws nothing.
    Value(std::string&& text) noexcept : detail::ValueVariant(std::move(text)) {}

    /// A string (alternative 4), never the bool that a pointer would otherwise convert to.
    /// `text` must point to NUL-terminated text.
    Value(const char* text) : detail::ValueVariant(std::string(text)) {}

    /// JSON null (alternative 1).
    Value(std::nullptr_t) : detail::ValueVariant(Null()) {}

    /// Any integer but bool makes a double (alternative 3), when the double holds it exactly:
    /// every integer up to 2^53 in magnitude, and the larger ones that are a multiple of a
    /// high enough power of two. Any other throws std::out_of_range ("1234567890123456789
    /// cannot be held exactly by a double (the nearest is 1234567890123456768): ..."), so that
    /// no 64-bit id is rounded without a word. Constant time.
    template <
        typename Integer,
        std::enable_if_t<std::is_integral_v<Integer> && !std::is_same_v<Integer, bool>, int> = 0>
    Value(Integer number) : detail::ValueVariant(detail::exact_double(number)) {}

    /// Pointers other than character pointers would silently become a bool: refused.
    template <typename T, std::enable_if_t<!std::is_same_v<std::remove_cv_t<T>, char>, int> = 0>
    Value(T*) = delete;

    /// Deep copy, linear in the size of the tree. Each Array is allocated once at its exact
    /// size, its elements built in place; an Object whose members are scalars, strings or
    /// containers of at most eight of those is cloned whole by the copy constructor of
    /// std::map (its tree structure taken over, no key compared), any other gets its members
    /// appended in key order. Nested containers are copied by recursion, in document order, up
    /// to 64 levels deep and, beyond that, from a work list that belongs to this copy, so the
    /// call stack stays bounded whatever the depth. No global or thread-local state is
    /// involved: copies of one Value run on any number of threads at once.
    /// Strong guarantee: on std::bad_alloc no Value comes into being and nothing leaks.
    Value(const Value& other);

    /// Internal: copies `other`, but an Array or Object comes out empty.
    Value(detail::ShallowCopy, const Value& other);

    /// Holds a copy of `content`, made by the variant's own copy constructor; the children of
    /// an Array or Object in it are copied by the copy constructor above. Inline, so that a run
    /// of scalars is copied into a new Array in one loop without a call per element.
    /// Strong guarantee, as for the copy constructor.
    explicit Value(const detail::ValueVariant& content) : detail::ValueVariant(content) {}

    /// Assigns a deep copy of `source`; returns *this. On std::bad_alloc:
    /// - same alternative: the target is left unchanged;
    /// - a string source: the target is left unchanged;
    /// - an Array or Object source onto another alternative: the target's former content is
    ///   released and it holds the bool `false` (alternative 2).
    /// `source` may lie anywhere inside the target's own tree.
    Value& operator=(const Value& source);

    /// Releases the whole tree. Throws nothing.
    ~Value();

    /// Exchanges the contents of the two Values without copying either tree: constant time,
    /// whatever they hold. Allocates nothing when both hold the same alternative (two Arrays,
    /// two Objects, ...) or neither holds an Array or Object. Otherwise a Value that takes an
    /// Array or Object gets a new empty one, into which the content is then swapped: a
    /// container cannot change owner between Values of different alternatives. If that
    /// allocation fails, std::bad_alloc passes on and both Values are as they were; only if
    /// memory stays exhausted, so that a Value's own container cannot be put back either, does
    /// that Value end up holding `false` with its content released, as after a failed
    /// container assignment.
    void swap(Value& other); // NOLINT(bugprone-exception-escape): may throw, as said above

    // Kind queries. Constant time; throw nothing.

    /// Undefined?
    bool is_undefined() const noexcept { return which() == detail::UNDEFINED_INDEX; }
    bool is_null() const noexcept { return which() == detail::NULL_INDEX; } ///< null?
    bool is_bool() const noexcept { return which() == detail::BOOL_INDEX; } ///< a bool?
    /// A double or a float?
    bool is_number() const noexcept {
        return which() == detail::DOUBLE_INDEX || which() == detail::FLOAT_INDEX;
    }
    bool is_string() const noexcept { return which() == detail::STRING_INDEX; } ///< a string?
    bool is_array() const noexcept { return which() == detail::ARRAY_INDEX; }   ///< an Array?
    bool is_object() const noexcept { return which() == detail::OBJECT_INDEX; } ///< an Object?
    /// The kind of JSON value held (a float is a NUMBER).
    Kind kind() const noexcept {
        constexpr Kind KINDS[] = {Kind::UNDEFINED, Kind::NULL_VALUE, Kind::BOOLEAN, Kind::NUMBER,
                                  Kind::STRING,    Kind::ARRAY,      Kind::OBJECT,  Kind::NUMBER};
        return KINDS[which()];
    }

    // Checked access: the value held, of the kind asked for. Constant time. Each throws
    // std::invalid_argument when the Value holds another kind, naming both kinds: "expected
    // JSON number, found JSON string".

    bool as_bool() const; ///< The bool held.
    /// The number held: a double, or a float widened to double.
    double as_number() const;
    std::string& as_string();             ///< The string held.
    const std::string& as_string() const; ///< The string held.
    Array& as_array();                    ///< The Array held.
    const Array& as_array() const;        ///< The Array held.
    Object& as_object();                  ///< The Object held.
    const Object& as_object() const;      ///< The Object held.

    // Subscripts: a member made when missing, an element never.

    /// The member named `key`, created when there is none: for building and editing
    /// (`doc["a"] = 1; doc["b"]["c"] = "x";`). An Undefined Value first becomes an empty
    /// Object. A created member holds Undefined, which is absent for every lookup and left out
    /// by the writer until something is assigned to it (`doc["a"];` alone writes `{}`).
    /// Logarithmic in the number of members. Throws std::invalid_argument naming both kinds
    /// ("expected JSON object, found JSON number") when this is neither an Object nor
    /// Undefined, and std::bad_alloc. Strong guarantee: on failure this Value is unchanged.
    /// There is no const overload: on a const Value, at() reads without inserting.
    Value& operator[](const std::string& key);
    /// The element at `index`, as at(index): an Array never grows through it. Constant time.
    /// Throws std::out_of_range naming the index and the size when it is out of range,
    /// std::invalid_argument when this is no Array. `v[0]` is this overload, never the
    /// member of a key converted from a null pointer.
    Value& operator[](std::size_t index) { return at(index); }
    /// @copydoc operator[](std::size_t)
    const Value& operator[](std::size_t index) const { return at(index); }

    // Lookups. None of them inserts anything, and none allocates except to build a
    // std::string key longer than the small-string buffer. A member that holds Undefined is
    // absent for all of them, for value_or and for value_to (json/convert.hpp), as it is for
    // the writer, which leaves it out: find and find_pointer return null for it, contains
    // false, at and at_pointer throw. An Object's own size() and iteration still count it.

    /// The member named `key`, or null when this is no Object or has no such member.
    /// Logarithmic in the number of members. Throws nothing.
    Value* find(const std::string& key);
    /// The member named `key`, or null when this is no Object or has no such member.
    /// Logarithmic in the number of members. Throws nothing.
    const Value* find(const std::string& key) const;
    /// Whether this is an Object with a member named `key`. Throws nothing.
    bool contains(const std::string& key) const { return find(key) != nullptr; }

    /// The member named `key`. Logarithmic. Throws std::out_of_range naming the key when there
    /// is no such member, std::invalid_argument when this is no Object.
    Value& at(const std::string& key);
    /// @copydoc at(const std::string&)
    const Value& at(const std::string& key) const;
    /// The element at `index`. Constant time. Throws std::out_of_range naming the index and the
    /// size when it is out of range, std::invalid_argument when this is no Array.
    Value& at(std::size_t index);
    /// @copydoc at(std::size_t)
    const Value& at(std::size_t index) const;

    /// The value that the JSON Pointer (RFC 6901) `pointer` refers to, or null when there is
    /// none: json::Pointer(pointer).find(*this) (json/pointer.hpp). "" is this Value itself;
    /// each "/token" goes one level down, into the member of that name (with "~1" standing for
    /// '/' and "~0" for '~') or the element at that index (decimal digits, no leading zero;
    /// "-" refers to no element). Linear in the length of the pointer, logarithmic per Object.
    /// Throws std::invalid_argument when the pointer is malformed: not empty and not starting
    /// with '/', or with '~' not followed by '0' or '1'; and std::bad_alloc.
    Value* find_pointer(std::string_view pointer);
    /// @copydoc find_pointer
    const Value* find_pointer(std::string_view pointer) const;
    /// The value that `pointer` refers to, as find_pointer finds it:
    /// json::Pointer(pointer).at(*this). Throws std::out_of_range when there is none, with a
    /// message that begins with the pointer up to the first token not found ("/servers/3: index 3
    /// out of range for a JSON array of 2 elements"), and std::invalid_argument when the pointer is
    /// malformed.
    Value& at_pointer(std::string_view pointer);
    /// @copydoc at_pointer
    const Value& at_pointer(std::string_view pointer) const;

    /// The member named `key` converted with json::value_to<T>, or `fallback` when there is
    /// no such member. A member that does not convert throws as value_to does, with "/key" at
    /// the start of the message: it is never replaced by the fallback. Throws
    /// std::invalid_argument when this is no Object. Defined with the conversions, in
    /// json/convert.hpp (which json/json.hpp includes), so that this header alone does not
    /// bring them in.
    template <typename T>
    T value_or(const std::string& key, const T& fallback) const;
    /// As above, the member converted with json::value_to<T>(member, options): a struct
    /// fallback for a config section, say, whose members may keep their defaults.
    template <typename T>
    T value_or(const std::string& key, const T& fallback, const ConvertOptions& options) const;
    /// The member named `key` as a std::string, or `fallback`: value_or<std::string>, so that
    /// a string literal (or any `const char*`) can be the fallback. Throws as value_or does.
    /// Needs no other header.
    std::string value_or(const std::string& key, const char* fallback) const;
};

/// Exchanges two Values as Value::swap does; found by argument-dependent lookup, so that
/// `using std::swap; swap(a, b);` and the standard algorithms that swap (std::reverse,
/// std::iter_swap) never copy a tree.
inline void swap(Value& left, Value& right) { // NOLINT(bugprone-exception-escape)
    left.swap(right);
}

/// Deep comparison: equal alternatives and equal content. double and float compare by value,
/// so NaN is unequal to itself; Undefined equals Undefined and Null equals Null. Complexity:
/// linear in the size of the smaller tree. Allocates nothing for scalars, strings and
/// containers of scalars and strings; nested containers go on a work list, which throws
/// std::bad_alloc if it cannot grow.
JSONVALUE_API bool operator==(const Value& left, const Value& right);

/// The negation of operator==.
inline bool operator!=(const Value& left, const Value& right) {
    return !(left == right);
}

/// Comparison with anything a Value is made from (`v == 5`, `v == "text"`,
/// `v == json::Array{}`): the right operand is converted to a Value first. Without these,
/// boost::variant's own comparison templates would make such expressions ill-formed. The left
/// operand must be a Value itself (deduced, never converted), so that two operands of other
/// types, such as a std::string and a char array, keep their own comparison where namespace
/// json is in use.
template <
    typename Left, typename T,
    std::enable_if_t<std::is_same_v<Left, Value> && std::is_constructible_v<Value, const T&> &&
                         !std::is_same_v<T, Value>,
                     int> = 0>
bool operator==(const Left& left, const T& right) {
    return left == Value(right);
}

template <
    typename Left, typename T,
    std::enable_if_t<std::is_same_v<Left, Value> && std::is_constructible_v<Value, const T&> &&
                         !std::is_same_v<T, Value>,
                     int> = 0>
bool operator!=(const Left& left, const T& right) {
    return !(left == Value(right));
}

} // namespace json

#endif
