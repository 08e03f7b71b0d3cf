#ifndef JSON_SRC_PATCH_EDITS_HPP
#define JSON_SRC_PATCH_EDITS_HPP

// The changes JSON Patch makes to a document, each recorded so that it can be taken back
// without allocating: what makes json::apply_patch all or nothing even when memory runs out.

#include <json/value.hpp>

#include <cstddef>
#include <deque>
#include <string>
#include <variant>
#include <vector>

namespace json::detail {

/// Edits of one document, taken back in reverse order by the destructor unless commit() made
/// them final.
///
/// A Value that takes a container of another alternative must allocate it (a Value has no
/// move operations), so nothing here ever changes a value's alternative in place. Content
/// moves only by Value::swap between two values of the same alternative, or two that hold
/// no container: such swaps cannot fail. A place that is to hold another alternative is
/// prepared first, as an empty "shell" of the right alternative, before anything changes;
/// an object member then changes by exchanging its map node, an array element by moving all
/// elements into a new array of shells. Whatever is replaced or removed stays in the log
/// (the old node, the old array with its shells) until the Edits end, so that undoing is
/// swapping back.
///
/// The document itself is kept as the single element of an array of the log's own while it
/// is edited, so that replacing it is replacing an element.
class Edits {
  public:
    /// Takes the content of `document` into the Edits' keeping; `document` holds an empty
    /// value of its own alternative until commit() or the destructor. Throws std::bad_alloc,
    /// `document` unchanged.
    explicit Edits(Value& document);
    /// Takes back every edit unless committed, and gives `document` its content back.
    ~Edits(); // NOLINT(bugprone-exception-escape): see the definition
    Edits(const Edits&) = delete;
    Edits& operator=(const Edits&) = delete;

    /// The document being edited.
    Value& root() { return box.front(); }

    /// A copy of `value` that lives as long as the Edits, to be put into the document. Throws
    /// std::bad_alloc.
    Value& keep(const Value& value);

    // Each of these takes the content of `incoming`, which must live as long as the Edits
    // (kept, or removed by an edit), and leaves in it what it replaced or an empty value.
    // Each throws std::bad_alloc before anything has changed.

    /// Sets the member `name` of `object`, a member already there included.
    void put_member(Object& object, const std::string& name, Value& incoming);
    /// Inserts an element at `index` (at most the size) of `array`.
    void insert_element(Array& array, std::size_t index, Value& incoming);
    /// Replaces the element at `index` of `array`.
    void replace_element(Array& array, std::size_t index, Value& incoming);
    /// Replaces the whole document.
    void replace_root(Value& incoming) { replace_element(box, 0, incoming); }

    /// Removes `member` of `object`; returns the removed value, which lives as long as the
    /// Edits. Throws std::bad_alloc before anything has changed.
    Value& remove_member(Object& object, Object::iterator member);
    /// Removes the element at `index` of `array`; returns the removed value, as above.
    Value& remove_element(Array& array, std::size_t index);

    /// Gives `document` the edited content; the edits are final. Throws std::bad_alloc only
    /// when the document must change between array, object and the rest (see
    /// json::apply_patch); the Edits are then taken back by the destructor.
    void commit();

  private:
    // Two values that exchanged their contents.
    struct Swapped {
        Value* first;
        Value* second;
        void undo() noexcept;
    };
    // A node put into an object; taken out again, it is kept (its value is swapped back).
    struct Inserted {
        Object* object;
        Object::iterator member;
        Object::node_type node;
        void undo() noexcept;
    };
    // A node taken out of an object.
    struct Extracted {
        Object* object;
        Object::node_type node;
        void undo() noexcept;
    };
    // The element at `from` moved to `to` by swapping neighbours.
    struct Rotated {
        Array* array;
        std::size_t from;
        std::size_t to;
        void undo() noexcept;
    };
    // An element appended to an array (a shell), or the last one removed (one that held no
    // container: it comes back as Undefined, and its content by the swap before).
    struct Appended {
        Array* array;
        void undo() noexcept;
    };
    struct Dropped {
        Array* array;
        void undo() noexcept;
    };
    // How an array changed when its elements moved into a new one.
    enum class Change { INSERT, REMOVE, REPLACE };
    // An array whose elements moved into a new one; `old` holds their former places (shells),
    // and the removed or replaced element at `index`, if any. `incoming` gave the new element.
    struct Rebuilt {
        Array* array;
        Array old;
        std::size_t index;
        Change change;
        Value* incoming;
        void undo() noexcept;
        Value& source(Array& from, std::size_t k) const noexcept;
        void move_elements(Array& to, Array& from) const noexcept;
    };

    using Step = std::variant<Swapped, Inserted, Extracted, Rotated, Appended, Dropped, Rebuilt>;

    void record(Step&& step) noexcept;
    void make_room(std::size_t more);
    void rebuild(Array& array, std::size_t index, Change change, Value* incoming);
    void undo_all() noexcept; // NOLINT(bugprone-exception-escape): see the definition

    Value& document;
    Array box;               // the document being edited, as its only element
    std::deque<Value> kept;  // values to be put in, and plain values removed
    std::vector<Step> steps; // in the order they were made
    bool committed = false;
};

} // namespace json::detail

#endif
