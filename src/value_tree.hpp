#ifndef JSON_SRC_VALUE_TREE_HPP
#define JSON_SRC_VALUE_TREE_HPP

// What the operations on a whole tree of Values (copy, release, comparison, swap) ask of a
// Value: is it a container, has it children, and what is a copy of it built from.

#include <json/value.hpp>

#include <cstdlib>
#include <utility>

namespace json::detail {

inline bool is_container(const Value& value) {
    return value.which() == ARRAY_INDEX || value.which() == OBJECT_INDEX;
}

inline bool is_empty_container(const Value& value) {
    return value.which() == ARRAY_INDEX ? boost::get<Array>(value).empty()
                                        : boost::get<Object>(value).empty();
}

// A non-empty Array or Object. Always inlined: the copy asks this of every element, and an
// out-of-line call would cost as much as copying a number.
[[gnu::always_inline]] inline bool has_nested_content(const Value& value) {
    return is_container(value) && !is_empty_container(value);
}

// An element of an Array, or the value of a member of an Object: the child either way.
inline Value& child_value(Value& item) {
    return item;
}
inline Value& child_value(Object::value_type& member) {
    return member.second;
}
inline const Value& child_value(const Value& item) {
    return item;
}
inline const Value& child_value(const Object::value_type& member) {
    return member.second;
}

// Calls `make` with what a copy of `source` is built from: its scalar or string, or an empty
// container of its kind; returns what `make` returns. Each case names its alternative, so a
// copy of a number or a bool is two stores, without the visitation of a variant copy.
template <typename Make>
decltype(auto) with_shallow_content(const Value& source, Make&& make) {
    switch (source.which()) {
    case UNDEFINED_INDEX:
        return make(Undefined());
    case NULL_INDEX:
        return make(Null());
    case BOOL_INDEX:
        return make(boost::get<bool>(source));
    case DOUBLE_INDEX:
        return make(boost::get<double>(source));
    case STRING_INDEX:
        return make(boost::get<std::string>(source));
    case ARRAY_INDEX:
        return make(Array());
    case OBJECT_INDEX:
        return make(Object());
    case FLOAT_INDEX:
        return make(boost::get<float>(source));
    default:
        std::abort();
    }
}

// The variant of a shallow copy of `source`. Returned as a prvalue, it initialises a Value's
// base in place (guaranteed copy elision), so an empty container costs exactly one allocation.
inline ValueVariant shallow_copy_of(const Value& source) {
    return with_shallow_content(source, [](auto&& content) {
        return ValueVariant(std::forward<decltype(content)>(content));
    });
}

} // namespace json::detail

#endif
