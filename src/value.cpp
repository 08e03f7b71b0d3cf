#include <json/value.hpp>

#include <cstdlib>
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

Value& child_value(Value& item) {
    return item;
}
Value& child_value(Object::value_type& member) {
    return member.second;
}

// What a shallow copy of `source` copies: `source` itself, or for a container a constant
// variant holding an empty one of its kind (made on first use, kept until exit). Copying that
// variant costs one allocation; a prvalue variant would not do, since initialising a base class
// from one moves it, and moving a recursive_wrapper allocates once more.
const detail::ValueVariant& shallow_source(const Value& source) {
    static const detail::ValueVariant empty_array{Array()};
    static const detail::ValueVariant empty_object{Object()};
    switch (source.which()) {
    case ARRAY_INDEX:
        return empty_array;
    case OBJECT_INDEX:
        return empty_object;
    default:
        return source;
    }
}

struct CopyJob {
    const Value* source;
    Value* target;
};

// Fills the empty container of `target` with shallow copies of the children of `source`'s
// container, and lists each non-empty container child for a later fill.
void copy_level(const Value& source, Value& target, std::vector<CopyJob>& nested) {
    auto note_nested = [&nested](const Value& from, Value& to) {
        if (is_container(from) && !is_empty_container(from)) {
            nested.push_back({&from, &to});
        }
    };
    if (source.which() == ARRAY_INDEX) {
        const Array& from = boost::get<Array>(source);
        Array& to = boost::get<Array>(target);
        to.reserve(from.size()); // no reallocation below: the pointers noted stay valid
        for (const Value& item : from) {
            to.emplace_back(detail::ShallowCopy{}, item);
            note_nested(item, to.back());
        }
    } else {
        const Object& from = boost::get<Object>(source);
        Object& to = boost::get<Object>(target);
        for (const auto& [key, value] : from) {
            // Keys arrive in order, so the end hint makes each insertion constant time.
            auto inserted =
                to.emplace_hint(to.end(), std::piecewise_construct, std::forward_as_tuple(key),
                                std::forward_as_tuple(detail::ShallowCopy{}, value));
            note_nested(value, inserted->second);
        }
    }
}

// Fills the empty container of `target` with a deep copy of the container of `source`, level
// by level from an explicit work list, so deep documents never deepen the call stack. On
// std::bad_alloc the owner of `target` destroys it, which releases every level built so far.
void copy_contents(const Value& source, Value& target) {
    std::vector<CopyJob> nested; // allocates only once a nested container turns up
    copy_level(source, target, nested);
    while (!nested.empty()) {
        const CopyJob job = nested.back();
        nested.pop_back();
        copy_level(*job.source, *job.target, nested);
    }
}

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

Value::Value(detail::ShallowCopy, const Value& other)
    : detail::ValueVariant(shallow_source(other)) {}

Value::Value(const Value& other) : Value(detail::ShallowCopy{}, other) {
    if (is_container(other) && !is_empty_container(other)) {
        copy_contents(other, *this);
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
        if (which() == detail::BOOL_INDEX) {
            // boost::variant fell back to bool, constructed without a value.
            boost::get<bool>(*this) = false;
        } else {
            // A string source is copied before the target changes: give the content back.
            detach_container(*this, old_items, old_members);
        }
        throw;
    }
    return *this;
}

Value::~Value() {
    if (which() == ARRAY_INDEX) {
        TreeReleaser().release_children_of(boost::get<Array>(*this));
    } else if (which() == OBJECT_INDEX) {
        TreeReleaser().release_children_of(boost::get<Object>(*this));
    }
}

namespace {

template <typename Alternative>
bool same_content(const Value& left, const Value& right) {
    return boost::get<Alternative>(left) == boost::get<Alternative>(right);
}

} // namespace

bool operator==(const Value& left, const Value& right) {
    std::vector<std::pair<const Value*, const Value*>> pending{{&left, &right}};
    while (!pending.empty()) {
        const auto [a, b] = pending.back();
        pending.pop_back();
        if (a->which() != b->which()) {
            return false;
        }
        switch (a->which()) {
        case detail::UNDEFINED_INDEX:
        case detail::NULL_INDEX:
            break;
        case detail::BOOL_INDEX:
            if (!same_content<bool>(*a, *b)) {
                return false;
            }
            break;
        case detail::DOUBLE_INDEX:
            if (!same_content<double>(*a, *b)) {
                return false;
            }
            break;
        case detail::FLOAT_INDEX:
            if (!same_content<float>(*a, *b)) {
                return false;
            }
            break;
        case detail::STRING_INDEX:
            if (!same_content<std::string>(*a, *b)) {
                return false;
            }
            break;
        case ARRAY_INDEX: {
            const Array& x = boost::get<Array>(*a);
            const Array& y = boost::get<Array>(*b);
            if (x.size() != y.size()) {
                return false;
            }
            for (std::size_t i = 0; i < x.size(); ++i) {
                pending.emplace_back(&x[i], &y[i]);
            }
            break;
        }
        case OBJECT_INDEX: {
            const Object& x = boost::get<Object>(*a);
            const Object& y = boost::get<Object>(*b);
            if (x.size() != y.size()) {
                return false;
            }
            for (auto i = x.begin(), j = y.begin(); i != x.end(); ++i, ++j) {
                if (i->first != j->first) {
                    return false;
                }
                pending.emplace_back(&i->second, &j->second);
            }
            break;
        }
        default:
            std::abort();
        }
    }
    return true;
}

} // namespace json
