// Destroying a Value: its whole tree released level by level, with a bounded call stack.
#include "value_tree.hpp"

#include <json/value.hpp>

#include <vector>

namespace json {

namespace {

using detail::ARRAY_INDEX;
using detail::child_value;
using detail::OBJECT_INDEX;

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

} // namespace

Value::~Value() {
    if (which() == ARRAY_INDEX) {
        TreeReleaser().release_children_of(boost::get<Array>(*this));
    } else if (which() == OBJECT_INDEX) {
        TreeReleaser().release_children_of(boost::get<Object>(*this));
    }
}

} // namespace json
