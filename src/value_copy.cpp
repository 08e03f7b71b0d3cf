// Copying a Value: a deep copy of its whole tree, with a bounded call stack.
#include "value_tree.hpp"

#include <json/value.hpp>

#include <boost/iterator/transform_iterator.hpp>

#include <algorithm>
#include <cstddef>
#include <tuple>
#include <type_traits>
#include <utility>
#include <vector>

namespace json {

namespace {

using detail::ARRAY_INDEX;
using detail::child_value;
using detail::has_nested_content;
using detail::OBJECT_INDEX;
using detail::with_shallow_content;

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

} // namespace

Value::Value(const Value& other) : Value(detail::ShallowCopy{}, other) {
    if (has_nested_content(other)) {
        TreeCopier().copy(other, *this);
    }
}

} // namespace json
