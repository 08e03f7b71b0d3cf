#include <json/value.hpp>

#include <algorithm>
#include <cstdlib>
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

Value& child_value(Value& item) {
    return item;
}
Value& child_value(Object::value_type& member) {
    return member.second;
}

// The variant of a shallow copy of `source`: its scalar or string, or an empty container of its
// kind. Returned as a prvalue, it initialises a Value's base in place (guaranteed copy
// elision), so an empty container costs exactly one allocation and nothing is built ahead of
// use.
detail::ValueVariant shallow_copy_of(const Value& source) {
    switch (source.which()) {
    case ARRAY_INDEX:
        return detail::ValueVariant(Array());
    case OBJECT_INDEX:
        return detail::ValueVariant(Object());
    default:
        return static_cast<const detail::ValueVariant&>(source);
    }
}

struct CopyJob {
    const Value* source;
    Value* target;
};
using CopyJobs = std::vector<CopyJob>;

// The containers a deep copy running on this thread has yet to fill, or null. While it is
// set, the Value copy constructor copies shallowly and lists a container child here instead
// of descending into it; that lets the copy constructors of std::vector and std::map clone a
// whole container at once (exact size, tree structure taken over without comparing a key or
// rebalancing) while the depth of the call stack stays bounded.
// A constant-initialised pointer: nothing is constructed on first use or destroyed at exit.
// The initial-exec model makes each access a single load. It costs eight bytes of static
// TLS, which glibc's reserve for libraries loaded later provides (dlopen checked).
thread_local CopyJobs* pending_copies __attribute__((tls_model("initial-exec"))) = nullptr;

// Sets the list of pending containers for the lifetime of one deep copy.
class CopyInProgress {
  public:
    explicit CopyInProgress(CopyJobs& pending) { pending_copies = &pending; }
    ~CopyInProgress() { pending_copies = nullptr; }
    CopyInProgress(const CopyInProgress&) = delete;
    CopyInProgress& operator=(const CopyInProgress&) = delete;
};

// Fills the empty container of `target` with a copy of `source`'s container whose own
// container children are still empty (and listed as pending).
void copy_level(const Value& source, Value& target) {
    if (source.which() == ARRAY_INDEX) {
        Array level(boost::get<Array>(source));
        boost::get<Array>(target).swap(level); // elements (and pointers to them) stay put
    } else {
        Object level(boost::get<Object>(source));
        boost::get<Object>(target).swap(level); // so do map nodes
    }
}

// Fills the empty container of `target` with a deep copy of the container of `source`, one
// container at a time from an explicit work list, so deep documents never deepen the call
// stack. On std::bad_alloc the owner of `target` destroys it, which releases everything built
// so far.
void copy_contents(const Value& source, Value& target) {
    CopyJobs pending; // allocates only once a nested container turns up
    const CopyInProgress in_progress(pending);
    CopyJob job{&source, &target};
    for (;;) {
        const std::size_t listed = pending.size();
        copy_level(*job.source, *job.target);
        // The children just listed are taken first to last: the copy then reads and writes
        // memory in document order (depth first), which the caches reward.
        std::reverse(pending.begin() + static_cast<std::ptrdiff_t>(listed), pending.end());
        if (pending.empty()) {
            return;
        }
        job = pending.back();
        pending.pop_back();
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

// The variant constructs its recursive_wrapper in place from the moved container: one
// allocation for the container object, none for its elements.
Value::Value(Array&& items) : detail::ValueVariant(std::move(items)) {}

Value::Value(Object&& members) : detail::ValueVariant(std::move(members)) {}

Value::Value(detail::ShallowCopy, const Value& other)
    : detail::ValueVariant(shallow_copy_of(other)) {}

Value::Value(const Value& other) : Value(detail::ShallowCopy{}, other) {
    if (!is_container(other)) {
        return;
    }
    if (pending_copies != nullptr) {
        // Part of a deep copy further up: filled from its work list, not from here. Empty
        // containers are listed too, so that their content is not looked at twice.
        pending_copies->push_back({&other, this});
    } else if (!is_empty_container(other)) {
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

} // namespace

void Value::swap(Value& other) { // NOLINT(bugprone-exception-escape): may throw, see value.hpp
    detail::ValueVariant& mine = *this;
    if (which() == other.which() || (!is_container(*this) && !is_container(other))) {
        // Same alternative: the contents (wrapper pointers, string buffers) are exchanged.
        // Otherwise boost::variant moves scalars and strings through a temporary.
        mine.swap(other);
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
