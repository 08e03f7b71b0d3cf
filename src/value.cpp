// The Value itself: the names of the types it deals in, its constructors, assignment and swap.
#include "value_tree.hpp"

#include <json/value.hpp>

#include <utility>

namespace json {

template <>
const char* const traits<Undefined>::name = "undefined";
template <>
const char* const traits<Null>::name = "JSON null";
template <>
const char* const traits<bool>::name = "JSON boolean";
template <>
const char* const traits<double>::name = "JSON number";
template <>
const char* const traits<std::string>::name = "JSON string";
template <>
const char* const traits<Array>::name = "JSON array";
template <>
const char* const traits<Object>::name = "JSON object";
template <>
const char* const traits<float>::name = "float";
template <>
const char* const traits<int>::name = "int";

// Building Undefined allocates nothing and cannot fail; its constructor is merely not
// declared noexcept (see Undefined).
const Value Value::UNDEFINED; // NOLINT(cert-err58-cpp)

using detail::ARRAY_INDEX;
using detail::is_container;
using detail::OBJECT_INDEX;

namespace {

// Moves the content of a container Value into `items` or `members` without copying, leaving
// an empty container of the same alternative behind; does nothing for other alternatives.
void detach_container(Value& value, Array& items, Object& members) {
    if (value.which() == ARRAY_INDEX) {
        items.swap(boost::get<Array>(value));
    } else if (value.which() == OBJECT_INDEX) {
        members.swap(boost::get<Object>(value));
    }
}

} // namespace

Value::Value(const Array& items) : detail::ValueVariant(items) {}

Value::Value(const Object& members) : detail::ValueVariant(members) {}

// The variant constructs its recursive_wrapper in place from the moved container: one
// allocation for the container object, none for its elements.
Value::Value(Array&& items) : detail::ValueVariant(std::move(items)) {}

Value::Value(Object&& members) : detail::ValueVariant(std::move(members)) {}

Value::Value(detail::ShallowCopy, const Value& other)
    : detail::ValueVariant(detail::shallow_copy_of(other)) {}

Value& Value::operator=(const Value& source) {
    if (this == &source) {
        return *this;
    }
    detail::ValueVariant& target = *this;
    if (which() == source.which()) {
        // Containers are copied before the old content goes, so a source inside the target
        // stays valid; the copy is then swapped in without a further copy.
        if (which() == ARRAY_INDEX) {
            Array copy(boost::get<Array>(source));
            boost::get<Array>(*this).swap(copy);
        } else if (which() == OBJECT_INDEX) {
            Object copy(boost::get<Object>(source));
            boost::get<Object>(*this).swap(copy);
        } else {
            target = source;
        }
        return *this;
    }
    // The target's old container content is kept alive, detached, until the variant has
    // changed alternative: `source` may lie inside it. It is released when this function
    // returns or throws, which is the released state the failure cases call for.
    Array old_items;
    Object old_members;
    detach_container(*this, old_items, old_members);
    try {
        target = static_cast<const detail::ValueVariant&>(source);
    } catch (...) {
        // Only a container or a string copy can fail. A container is built in place after the
        // old content is gone, so boost::variant fell back to a bool without a value; a string
        // is copied before the target changes, so the target is as it was but for the content
        // set aside. (Testing for index 2 instead would also hit a target that was a bool.)
        if (is_container(source)) {
            boost::get<bool>(*this) = false;
        } else {
            detach_container(*this, old_items, old_members);
        }
        throw;
    }
    return *this;
}

namespace {

// Moves what `from` holds into `to` without copying it. Swap uses it only with a `to` whose
// content is worth nothing (Undefined, or what an earlier move left behind): that content is
// released or, for a container of `from`'s kind, swapped into `from`. Allocates only when `to`
// must take a container of another alternative (an empty one, then swapped with `from`'s); on
// std::bad_alloc `from` is unchanged.
void move_content(Value& from, Value& to) {
    if (is_container(from)) {
        if (to.which() != from.which()) {
            to = Value(detail::ShallowCopy{}, from);
        }
        static_cast<detail::ValueVariant&>(to).swap(from);
    } else {
        // Scalars and strings move without allocating.
        static_cast<detail::ValueVariant&>(to) =
            std::move(static_cast<detail::ValueVariant&>(from));
    }
}

// Undoes a step of a failed swap. If even that cannot allocate, `to` holds false and the
// content is released with `from`: a Value never ends up holding the other's content.
void put_back(Value& from, Value& to) noexcept { // NOLINT(bugprone-exception-escape)
    try {
        move_content(from, to);
    } catch (...) {
        to = Value(false); // a scalar assignment: cannot fail
    }
}

// One Value holds a container, the other a scalar or a string. The plain content steps aside
// (moved, which cannot fail), the container's wrapper moves over (the one allocation: a new
// wrapper takes the content without copying it), and the plain content takes the emptied
// wrapper's place. If the allocation fails, the plain content goes back: both as they were.
void swap_container_with_plain(detail::ValueVariant& container, detail::ValueVariant& plain) {
    detail::ValueVariant aside(std::move(plain));
    try {
        plain = std::move(container);
    } catch (...) {
        plain = std::move(aside);
        throw;
    }
    container = std::move(aside);
}

} // namespace

void Value::swap(Value& other) { // NOLINT(bugprone-exception-escape): may throw, see value.hpp
    detail::ValueVariant& mine = *this;
    if (which() == other.which() || (!is_container(*this) && !is_container(other))) {
        // Same alternative: the contents (wrapper pointers, string buffers) are exchanged.
        // Otherwise boost::variant moves scalars and strings through a temporary.
        mine.swap(other);
        return;
    }
    if (is_container(*this) != is_container(other)) {
        swap_container_with_plain(is_container(*this) ? mine : other,
                                  is_container(*this) ? other : mine);
        return;
    }
    Value held;
    move_content(*this, held);
    try {
        move_content(other, *this);
    } catch (...) {
        put_back(held, *this);
        throw;
    }
    try {
        move_content(held, other);
    } catch (...) {
        put_back(*this, other);
        put_back(held, *this);
        throw;
    }
}

} // namespace json
