#include <json/value.hpp>

#include <boost/iterator/transform_iterator.hpp>

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <tuple>
#include <type_traits>
#include <utility>
#include <vector>

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

namespace {

using detail::ARRAY_INDEX;
using detail::OBJECT_INDEX;

bool is_container(const Value& value) {
    return value.which() == ARRAY_INDEX || value.which() == OBJECT_INDEX;
}

bool is_empty_container(const Value& value) {
    return value.which() == ARRAY_INDEX ? boost::get<Array>(value).empty()
                                        : boost::get<Object>(value).empty();
}

// A non-empty Array or Object. Always inlined: the copy asks this of every element, and an
// out-of-line call would cost as much as copying a number.
[[gnu::always_inline]] inline bool has_nested_content(const Value& value) {
    return is_container(value) && !is_empty_container(value);
}

Value& child_value(Value& item) {
    return item;
}
Value& child_value(Object::value_type& member) {
    return member.second;
}
const Value& child_value(const Value& item) {
    return item;
}
const Value& child_value(const Object::value_type& member) {
    return member.second;
}

// Calls `make` with what a copy of `source` is built from: its scalar or string, or an empty
// container of its kind; returns what `make` returns. Each case names its alternative, so a
// copy of a number or a bool is two stores, without the visitation of a variant copy.
template <typename Make>
decltype(auto) with_shallow_content(const Value& source, Make&& make) {
    switch (source.which()) {
    case detail::UNDEFINED_INDEX:
        return make(Undefined());
    case detail::NULL_INDEX:
        return make(Null());
    case detail::BOOL_INDEX:
        return make(boost::get<bool>(source));
    case detail::DOUBLE_INDEX:
        return make(boost::get<double>(source));
    case detail::STRING_INDEX:
        return make(boost::get<std::string>(source));
    case ARRAY_INDEX:
        return make(Array());
    case OBJECT_INDEX:
        return make(Object());
    case detail::FLOAT_INDEX:
        return make(boost::get<float>(source));
    default:
        std::abort();
    }
}

// The variant of a shallow copy of `source`. Returned as a prvalue, it initialises a Value's
// base in place (guaranteed copy elision), so an empty container costs exactly one allocation.
detail::ValueVariant shallow_copy_of(const Value& source) {
    return with_shallow_content(source, [](auto&& content) {
        return detail::ValueVariant(std::forward<decltype(content)>(content));
    });
}

// The most elements an Array may have for its copy to look through them first: when none is a
// non-empty container, the copy is built in one loop without a call per element. A longer
// Array would no longer be in the cache for the second pass, which would then cost more than it
// saves: such Arrays are copied in one pass.
constexpr std::size_t LEAF_COPY_SIZE = 256;

// The most children a container may have to count as shallow.
constexpr std::size_t SHALLOW_SIZE = 8;

// Whether `container` has at most `most_children` children, none of them a non-empty
// container. Checking costs at most `most_children` steps.
template <typename Container>
bool holds_no_nested_content(const Container& container, std::size_t most_children) {
    return container.size() <= most_children &&
           std::none_of(container.begin(), container.end(),
                        [](const auto& item) { return has_nested_content(child_value(item)); });
}

// Whether `value` is a scalar, a string, an empty container, or a container of at most
// SHALLOW_SIZE children that are none of them non-empty containers. Checking costs at most
// SHALLOW_SIZE steps.
bool is_shallow(const Value& value) {
    switch (value.which()) {
    case ARRAY_INDEX:
        return holds_no_nested_content(boost::get<Array>(value), SHALLOW_SIZE);
    case OBJECT_INDEX:
        return holds_no_nested_content(boost::get<Object>(value), SHALLOW_SIZE);
    default:
        return true;
    }
}

// One deep copy: fills an empty container with copies of a source container's children, and
// theirs. It recurses into nested containers, in document order, up to MAX_RECURSION levels,
// and lists deeper ones on its own work list, filled when the recursion has returned; so documents
// of any depth copy with a bounded call stack, and a document of ordinary depth never touches
// the list. Every container is allocated once at its final size.
class TreeCopier {
  public:
    // `target` holds an empty container of the kind `source` holds. On std::bad_alloc, what was
    // built so far stays in `target`, whose owner releases it.
    void copy(const Value& source, Value& target) {
        fill(source, target, 0);
        while (!deferred.empty()) {
            const CopyJob job = deferred.back();
            deferred.pop_back();
            fill(*job.source, *job.target, 0);
        }
    }

  private:
    // Deep enough for any document written by hand, shallow enough for any thread's stack.
    static constexpr int MAX_RECURSION = 64;

    struct CopyJob {
        const Value* source;
        Value* target;
    };

    void fill(const Value& source, Value& target, int depth) {
        if (source.which() == ARRAY_INDEX) {
            copy_items(boost::get<Array>(source), boost::get<Array>(target), depth);
        } else {
            copy_members(boost::get<Object>(source), boost::get<Object>(target), depth);
        }
    }

    // Reserving first makes one allocation of the exact size, and keeps each element where it
    // is built: a listed job may point to it. A nested container is filled as soon as its
    // element is in, while the source element is still in the cache; walking the source a
    // second time for them cost more than it saved in the order of allocations.
    void copy_items(const Array& from, Array& to, int depth) {
        if (holds_no_nested_content(from, LEAF_COPY_SIZE)) {
            const auto as_variant = [](const Value& item) -> const detail::ValueVariant& {
                return item;
            };
            Array copy(boost::make_transform_iterator(from.begin(), as_variant),
                       boost::make_transform_iterator(from.end(), as_variant));
            to.swap(copy);
            return;
        }
        to.reserve(from.size());
        for (const Value& item : from) {
            with_shallow_content(item, [this, &to, &item, depth](auto&& content) {
                to.emplace_back(std::forward<decltype(content)>(content));
                using Content = std::decay_t<decltype(content)>;
                if constexpr (std::is_same_v<Content, Array> || std::is_same_v<Content, Object>) {
                    descend(item, to.back(), depth);
                }
            });
        }
    }

    // An object whose members are all shallow is cloned whole by the copy constructor of
    // std::map, which takes over the tree's shape without comparing a key. The copy
    // constructor of Value that it calls for each member copies a shallow container without
    // going further down, so this recursion is two levels deep at most. Any other object gets
    // its members one at a time; they come in ascending key order, so each goes after the last.
    // As for an Array, a nested container is filled as soon as its member is in.
    void copy_members(const Object& from, Object& to, int depth) {
        if (std::all_of(from.begin(), from.end(),
                        [](const auto& member) { return is_shallow(member.second); })) {
            Object copy(from);
            to.swap(copy);
            return;
        }
        for (const auto& source : from) {
            const auto member = with_shallow_content(source.second, [&to, &source](auto&& content) {
                return to.emplace_hint(
                    to.end(), std::piecewise_construct, std::forward_as_tuple(source.first),
                    std::forward_as_tuple(std::forward<decltype(content)>(content)));
            });
            descend(source.second, member->second, depth);
        }
    }

    // Fills the child `target` now or later if `source` is a non-empty container.
    void descend(const Value& source, Value& target, int depth) {
        if (!has_nested_content(source)) {
            return;
        }
        if (depth < MAX_RECURSION) {
            fill(source, target, depth + 1);
        } else {
            deferred.push_back({&source, &target});
        }
    }

    std::vector<CopyJob> deferred; // allocates only for documents deeper than MAX_RECURSION
};

// Releases a tree level by level: the contents of nested containers are swapped onto work
// lists (no copy, no recursion) and destroyed from there once their own children have been
// taken out the same way.
class TreeReleaser {
  public:
    template <typename Container>
    void release_children_of(Container& container) noexcept {
        try {
            take_children(container);
            drain();
        } catch (...) {
            // Only std::bad_alloc from a work list can get here. Whatever was not taken out is
            // released by the ordinary destructors, which recurse only where memory ran out.
        }
    }

  private:
    template <typename Container>
    void take_children(Container& container) {
        for (auto& item : container) {
            Value& child = child_value(item);
            if (child.which() == ARRAY_INDEX) {
                take(boost::get<Array>(child), arrays);
            } else if (child.which() == OBJECT_INDEX) {
                take(boost::get<Object>(child), objects);
            }
        }
    }

    template <typename Container>
    static void take(Container& container, std::vector<Container>& work) {
        if (!container.empty()) {
            work.emplace_back();
            work.back().swap(container);
        }
    }

    void drain() {
        while (!arrays.empty() || !objects.empty()) {
            if (!arrays.empty()) {
                Array items;
                items.swap(arrays.back());
                arrays.pop_back();
                take_children(items);
            } else {
                Object members;
                members.swap(objects.back());
                objects.pop_back();
                take_children(members);
            }
        }
    }

    std::vector<Array> arrays;
    std::vector<Object> objects;
};

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
    : detail::ValueVariant(shallow_copy_of(other)) {}

Value::Value(const Value& other) : Value(detail::ShallowCopy{}, other) {
    if (has_nested_content(other)) {
        TreeCopier().copy(other, *this);
    }
}

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

Value::~Value() {
    if (which() == ARRAY_INDEX) {
        TreeReleaser().release_children_of(boost::get<Array>(*this));
    } else if (which() == OBJECT_INDEX) {
        TreeReleaser().release_children_of(boost::get<Object>(*this));
    }
}

namespace {

using PendingPairs = std::vector<std::pair<const Value*, const Value*>>;

template <typename Alternative>
bool same_content(const Value& left, const Value& right) {
    return boost::get<Alternative>(left) == boost::get<Alternative>(right);
}

// Whether two Values are equal as far as can be told without looking at children: the same
// alternative and equal scalars or strings, or containers of the same size.
bool shallow_equal(const Value& a, const Value& b) {
    if (a.which() != b.which()) {
        return false;
    }
    switch (a.which()) {
    case detail::UNDEFINED_INDEX:
    case detail::NULL_INDEX:
        return true;
    case detail::BOOL_INDEX:
        return same_content<bool>(a, b);
    case detail::DOUBLE_INDEX:
        return same_content<double>(a, b);
    case detail::FLOAT_INDEX:
        return same_content<float>(a, b);
    case detail::STRING_INDEX:
        return same_content<std::string>(a, b);
    case ARRAY_INDEX:
        return boost::get<Array>(a).size() == boost::get<Array>(b).size();
    case OBJECT_INDEX:
        return boost::get<Object>(a).size() == boost::get<Object>(b).size();
    default:
        std::abort();
    }
}

// Compares the children of two containers of the same kind and size; pairs of non-empty
// containers among them are noted in `nested` to be compared later, not descended into.
bool children_equal(const Value& a, const Value& b, PendingPairs& nested) {
    const auto note = [&nested](const Value& x, const Value& y) {
        if (!shallow_equal(x, y)) {
            return false;
        }
        if (is_container(x) && !is_empty_container(x)) {
            nested.emplace_back(&x, &y);
        }
        return true;
    };
    if (a.which() == ARRAY_INDEX) {
        const Array& y = boost::get<Array>(b);
        auto j = y.begin();
        for (const Value& x : boost::get<Array>(a)) {
            if (!note(x, *j++)) {
                return false;
            }
        }
        return true;
    }
    const Object& y = boost::get<Object>(b);
    auto j = y.begin();
    for (const auto& [key, x] : boost::get<Object>(a)) {
        if (key != j->first || !note(x, j->second)) {
            return false;
        }
        ++j;
    }
    return true;
}

} // namespace

bool operator==(const Value& left, const Value& right) {
    if (!shallow_equal(left, right)) {
        return false;
    }
    if (!is_container(left)) {
        return true;
    }
    PendingPairs nested; // allocates only once a nested container turns up
    bool equal = children_equal(left, right, nested);
    while (equal && !nested.empty()) {
        const auto [a, b] = nested.back();
        nested.pop_back();
        equal = children_equal(*a, *b, nested);
    }
    return equal;
}

} // namespace json
