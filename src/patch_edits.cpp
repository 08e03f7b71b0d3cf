#include "patch_edits.hpp"

#include <algorithm>
#include <tuple>
#include <utility>

namespace json::detail {

namespace {

bool holds_container(const Value& value) {
    return value.is_array() || value.is_object();
}

// Whether two values exchange their contents without allocating.
bool swappable(const Value& first, const Value& second) {
    return first.which() == second.which() || (!holds_container(first) && !holds_container(second));
}

// Whether every element of `array` from `begin` to `end` swaps with `like` (and so with each
// other) without allocating.
bool all_swappable(const Array& array, std::size_t begin, std::size_t end, const Value& like) {
    return std::all_of(array.begin() + static_cast<std::ptrdiff_t>(begin),
                       array.begin() + static_cast<std::ptrdiff_t>(end),
                       [&like](const Value& element) { return swappable(element, like); });
}

// Calls `place` with what makes an empty value that swaps with `like` without allocating:
// an empty Array or Object for a container (one allocation), Undefined for anything else.
template <typename Place>
void place_shell(const Value& like, Place place) {
    if (like.is_array()) {
        place(Array());
    } else if (like.is_object()) {
        place(Object());
    } else {
        place(Undefined());
    }
}

void append_shell(Array& array, const Value& like) {
    place_shell(
        like, [&array](auto&& empty) { array.emplace_back(std::forward<decltype(empty)>(empty)); });
}

// A node of its own for a member `name` whose value is a shell for `like`.
Object::node_type shell_member(const std::string& name, const Value& like) {
    Object scratch;
    place_shell(like, [&](auto&& empty) {
        scratch.emplace(std::piecewise_construct, std::forward_as_tuple(name),
                        std::forward_as_tuple(std::forward<decltype(empty)>(empty)));
    });
    return scratch.extract(scratch.begin());
}

// Moves the element at `from` to `to`, the ones between moving up or down by one.
void rotate(Array& array, std::size_t from, std::size_t to) noexcept {
    for (; from > to; --from) {
        array[from].swap(array[from - 1]);
    }
    for (; from < to; ++from) {
        array[from].swap(array[from + 1]);
    }
}

} // namespace

void Edits::Swapped::undo() noexcept {
    first->swap(*second);
}

void Edits::Inserted::undo() noexcept {
    node = object->extract(member);
}

void Edits::Extracted::undo() noexcept {
    object->insert(std::move(node));
}

void Edits::Rotated::undo() noexcept {
    rotate(*array, to, from);
}

void Edits::Appended::undo() noexcept {
    array->pop_back();
}

// The array kept its capacity when the element went: emplacing Undefined cannot fail.
void Edits::Dropped::undo() noexcept {
    array->emplace_back();
}

// What element `k` of the new array takes: `incoming`, or an element of the former array
// `from`.
Value& Edits::Rebuilt::source(Array& from, std::size_t k) const noexcept {
    if (k < index || (k > index && change == Change::REPLACE)) {
        return from[k];
    }
    if (k == index && change != Change::REMOVE) {
        return *incoming;
    }
    return from[change == Change::INSERT ? k - 1 : k + 1];
}

// Swapping is symmetric: the same exchanges move the elements back.
void Edits::Rebuilt::move_elements(Array& to, Array& from) const noexcept {
    for (std::size_t k = 0; k < to.size(); ++k) {
        to[k].swap(source(from, k));
    }
}

void Edits::Rebuilt::undo() noexcept {
    array->swap(old);
    move_elements(old, *array);
}

Edits::Edits(Value& document) : document(document) {
    append_shell(box, document);
    box.front().swap(document);
}

// NOLINTNEXTLINE(bugprone-exception-escape): the first swap cannot fail, the second is caught
Edits::~Edits() {
    if (committed) {
        return;
    }
    undo_all();
    if (swappable(document, root())) {
        document.swap(root());
        return;
    }
    // Only after a commit that failed while memory was exhausted: see apply_patch.
    try {
        document.swap(root());
    } catch (...) { // NOLINT(bugprone-empty-catch): nothing is left to try
    }
}

Value& Edits::keep(const Value& value) {
    return kept.emplace_back(value);
}

// A document that changes alternative does so as an empty value first: should that fail with
// memory exhausted, Value::swap may release what it was swapping, which must not be the edited
// content that the log points into.
void Edits::commit() {
    if (!swappable(document, root())) {
        Value shell(ShallowCopy{}, root());
        document.swap(shell);
    }
    document.swap(root());
    committed = true;
}

// Room for `count` more steps, so that recording them cannot fail; grows geometrically.
void Edits::make_room(std::size_t more) {
    if (steps.capacity() - steps.size() < more) {
        steps.reserve(std::max(2 * steps.capacity(), steps.size() + more));
    }
}

void Edits::record(Step&& step) noexcept {
    steps.push_back(std::move(step));
}

// Every step's undo swaps values that cannot fail to swap, and no step is ever valueless.
void Edits::undo_all() noexcept { // NOLINT(bugprone-exception-escape)
    for (auto step = steps.rbegin(); step != steps.rend(); ++step) {
        std::visit([](auto& made) { made.undo(); }, *step);
    }
}

void Edits::put_member(Object& object, const std::string& name, Value& incoming) {
    const auto member = object.find(name);
    if (member != object.end() && swappable(member->second, incoming)) {
        make_room(1);
        member->second.swap(incoming);
        record(Swapped{&member->second, &incoming});
        return;
    }
    Object::node_type node = shell_member(name, incoming);
    make_room(3);
    node.mapped().swap(incoming);
    record(Swapped{&node.mapped(), &incoming});
    if (member != object.end()) {
        record(Extracted{&object, object.extract(member)});
    }
    const auto placed = object.insert(std::move(node)).position;
    record(Inserted{&object, placed, {}});
}

void Edits::insert_element(Array& array, std::size_t index, Value& incoming) {
    const std::size_t size = array.size();
    if (size == array.capacity() || !all_swappable(array, index, size, incoming)) {
        rebuild(array, index, Change::INSERT, &incoming);
        return;
    }
    make_room(3);
    append_shell(array, incoming); // within the capacity: nothing moves
    record(Appended{&array});
    rotate(array, size, index);
    record(Rotated{&array, size, index});
    array[index].swap(incoming);
    record(Swapped{&array[index], &incoming});
}

void Edits::replace_element(Array& array, std::size_t index, Value& incoming) {
    if (!swappable(array[index], incoming)) {
        rebuild(array, index, Change::REPLACE, &incoming);
        return;
    }
    make_room(1);
    array[index].swap(incoming);
    record(Swapped{&array[index], &incoming});
}

Value& Edits::remove_member(Object& object, Object::iterator member) {
    make_room(1);
    record(Extracted{&object, object.extract(member)});
    return std::get<Extracted>(steps.back()).node.mapped();
}

// An element that holds no container, among others that hold none, moves to the end and out
// into a kept value; an Undefined takes its place again when undone. Any other is removed by
// rebuilding, as the end of the array cannot get a container back without allocating.
Value& Edits::remove_element(Array& array, std::size_t index) {
    const std::size_t size = array.size();
    if (holds_container(array[index]) || !all_swappable(array, index, size, array[index])) {
        rebuild(array, index, Change::REMOVE, nullptr);
        return std::get<Rebuilt>(steps.back()).old[index];
    }
    Value& removed = kept.emplace_back();
    make_room(3);
    rotate(array, index, size - 1);
    record(Rotated{&array, index, size - 1});
    removed.swap(array.back());
    record(Swapped{&removed, &array.back()});
    array.pop_back();
    record(Dropped{&array});
    return removed;
}

// The new array gets a shell for each of its elements, then the elements; the former array,
// left with the shells (and the removed or replaced element), goes into the log. An array
// that was full gets room to grow, so that the next insertion need not rebuild it.
void Edits::rebuild(Array& array, std::size_t index, Change change, Value* incoming) {
    const std::size_t size = change == Change::INSERT   ? array.size() + 1
                             : change == Change::REMOVE ? array.size() - 1
                                                        : array.size();
    Rebuilt rebuilt{&array, Array(), index, change, incoming};
    Array& fresh = rebuilt.old; // the new elements, until the arrays are exchanged
    fresh.reserve(size > array.capacity() ? size + size / 2 : array.capacity());
    for (std::size_t k = 0; k < size; ++k) {
        append_shell(fresh, rebuilt.source(array, k));
    }
    make_room(1);
    rebuilt.move_elements(fresh, array);
    array.swap(fresh);
    record(std::move(rebuilt));
}

} // namespace json::detail
