// Comparing two Values: deep equality, with a bounded call stack.
#include "value_tree.hpp"

#include <json/value.hpp>

#include <cstdlib>
#include <utility>
#include <vector>

namespace json {

using detail::ARRAY_INDEX;
using detail::is_container;
using detail::is_empty_container;
using detail::OBJECT_INDEX;

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
