#ifndef JSON_SRC_DOCUMENT_BUILDER_HPP
#define JSON_SRC_DOCUMENT_BUILDER_HPP

// The handler behind json::parse: builds a Value from the grammar's events.

#include "document_checks.hpp"
#include "number.hpp"
#include "value_tree.hpp"

#include <json/detail/workspace.hpp>
#include <json/value.hpp>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <new>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

namespace json::detail {

/// Builds the document of one parse from the grammar's events, every container once at its
/// final size, its children handed over without a copy. Here, where the document is made,
/// the options that concern it act: a number is refused unless a double holds it exactly
/// (exact_numbers), an object that names a member twice (reject_duplicate_keys).
class DocumentBuilder {
  public:
    /// The builder's stacks are kept in `workspace`, each with room for a small document from
    /// the start.
    DocumentBuilder(const ParseOptions& options, Workspace& workspace)
        : options(options), pending(workspace, INITIAL_VALUES), texts(workspace, INITIAL_VALUES),
          finished_arrays(workspace, INITIAL_CONTAINERS),
          finished_objects(workspace, INITIAL_CONTAINERS),
          open_containers(workspace, INITIAL_CONTAINERS) {}

    // The handler's events; false when the document is refused (see refusal()).
    bool null() {
        push(Kind::NULL_VALUE);
        return true;
    }
    bool boolean(bool truth) {
        push(Kind::BOOLEAN).truth = truth;
        return true;
    }
    // The literal is NUL-terminated (the grammar's copy), so it is read in place.
    bool number(std::string_view literal) {
        double value = 0.0;
        if (!read_kept_number(literal, options, refusal, value)) {
            return false;
        }
        push(Kind::NUMBER).number = value;
        return true;
    }
    bool string(std::string_view text) {
        texts.emplace_back(text);
        push(Kind::STRING).slot = texts.size() - 1;
        return true;
    }
    bool key(std::string_view name) {
        if (options.reject_duplicate_keys && !repeated.add(name)) {
            return refusal.repeated_name(name);
        }
        member_name = texts.size();
        member_prefix = name_prefix(texts.emplace_back(name));
        return true;
    }
    bool begin_array() { return open(Kind::ARRAY); }
    bool begin_object() {
        if (options.reject_duplicate_keys) {
            repeated.open_object();
        }
        return open(Kind::OBJECT);
    }
    bool end_array() { return close(); }
    bool end_object() {
        if (options.reject_duplicate_keys) {
            repeated.close_object();
        }
        return close();
    }

    /// Hands the finished document to `out`, without a copy. When one allocation fails, `out`
    /// is left as it was (see json::parse).
    void take(Value& out) {
        if (is_container(out)) {
            std::optional<Value> made;
            take_into([&made](auto&& initial) -> Value& {
                return made.emplace(std::forward<decltype(initial)>(initial));
            });
            out.swap(*made);
            return;
        }
        // `out` holds a scalar or a string, which is set aside (moved: nothing to allocate) and
        // put back if the document cannot be made. The document is made in `out`'s place, as
        // std::optional::emplace makes its value: a Value constructed from a container takes
        // one allocation, where assigning one to a Value of another alternative takes two (the
        // variant wraps a temporary of its own first) and a swap one more.
        ValueVariant aside(std::move(static_cast<ValueVariant&>(out)));
        out.~Value();
        try {
            take_into([&out](auto&& initial) -> Value& {
                return *::new (static_cast<void*>(&out))
                    Value(std::forward<decltype(initial)>(initial));
            });
        } catch (...) {
            // Only a container's allocation fails, before `out` is made anew.
            static_cast<ValueVariant&>(*::new (static_cast<void*>(&out)) Value()) =
                std::move(aside);
            throw;
        }
    }
    /// Hands the finished document to the Value that `place` constructs, as adopt() does, and
    /// leaves the stacks empty for another document (a record reader builds one after another).
    template <typename Place>
    void take_into(Place place) {
        adopt(pending.back(), place);
        release_children(OpenContainer{});
    }

    /// Puts a refusal of the document in `report`, see DocumentRefusal.
    void explain(ParseReport& report) { refusal.explain(report); }

  private:
    // A value whose container is still open: finished, or a container being read. A string or
    // a finished container waits in a stack of its own at `slot` until its parent closes, and
    // is then swapped into the Value that holds it for good: that Value is the only one ever
    // made for it, and the values waiting here are plain data, copied and dropped without a
    // call.
    enum class Kind : unsigned char { NULL_VALUE, BOOLEAN, NUMBER, STRING, ARRAY, OBJECT };
    struct Pending {
        Kind kind;
        bool truth;                // a BOOLEAN's
        std::size_t name;          // a member's: the index of its name in `texts`
        std::uint64_t name_prefix; // a member's: see name_prefix()
        union {
            double number;    // a NUMBER's
            std::size_t slot; // a STRING's index in `texts`, a container's in its stack
        };
    };

    // An open container; its own Pending stands just before its first child's.
    struct OpenContainer {
        bool is_object;
        std::size_t first_value;  // index into `pending` of its first child
        std::size_t first_text;   // index into `texts` of its first member name or string
        std::size_t first_array;  // index into `finished_arrays` of its first Array child
        std::size_t first_object; // index into `finished_objects` of its first Object child
    };

    // The first eight bytes of a name as a big-endian number, zero-padded: where two names'
    // prefixes differ, they order the names as the map does (bytes unsigned, a proper prefix
    // first).
    static std::uint64_t name_prefix(const std::string& name) {
        std::uint64_t word = 0;
        // The storage holds capacity() + 1 bytes (with the NUL), so eight can be read at once
        // in every common library (a short string's buffer has sixteen); only the name's are
        // kept.
        if (name.capacity() >= sizeof word - 1) {
            std::memcpy(&word, name.data(), sizeof word);
        } else {
            std::memcpy(&word, name.data(), name.size());
        }
#if __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__
        word = __builtin_bswap64(word);
#endif
        const std::size_t kept = std::min<std::size_t>(name.size(), sizeof word);
        return kept == 0 ? 0 : word & ~std::uint64_t{0} << (8 * (sizeof word - kept));
    }

    // A value is pushed as the member of the last name read (inside an array, that name is
    // not looked at). The fields are stored where the value stays: a Pending made on the stack
    // and copied would be loaded whole just after its fields were stored, a load the processor
    // cannot forward from those stores (a stall on every value).
    Pending& push(Kind kind) {
        Pending& value = pending.emplace_back();
        value.kind = kind;
        value.name = member_name;
        value.name_prefix = member_prefix;
        return value;
    }
    // A container's own Pending is pushed when it opens, while its name is the last one read.
    bool open(Kind kind) {
        push(kind);
        open_containers.emplace_back(OpenContainer{kind == Kind::OBJECT, pending.size(),
                                                   texts.size(), finished_arrays.size(),
                                                   finished_objects.size()});
        return true;
    }
    bool close();
    void close_object(const OpenContainer& container);
    void close_array(const OpenContainer& container);
    void release_children(const OpenContainer& container);
    template <typename Place>
    [[gnu::always_inline]] void adopt(const Pending& child, Place place);

    const ParseOptions options;
    DocumentRefusal refusal;
    MemberNames repeated;

    WorkspaceStack<Pending> pending; // the values of the open containers, in document order
    // The member names and strings of the open containers, in document order.
    WorkspaceStack<std::string> texts;
    WorkspaceStack<Array> finished_arrays;
    WorkspaceStack<Object> finished_objects;
    WorkspaceStack<OpenContainer> open_containers;
    std::size_t member_name = 0;     // the index in `texts` of the last member name read
    std::uint64_t member_prefix = 0; // and its name_prefix()
    // The first capacities, which fill about three fifths of a Workspace (see there).
    static constexpr std::size_t INITIAL_VALUES = 24;
    static constexpr std::size_t INITIAL_CONTAINERS = 8;
};

// Calls `place` with the child's string (to be moved from) or scalar, or with an empty container
// of its kind, to construct the Value in its final place; a container's content is then swapped
// in: a subtree changes owner without being copied. Each Value is constructed from its
// alternative, inline: no call to the general copy constructor, which has containers to deal
// with.
template <typename Place>
inline void DocumentBuilder::adopt(const Pending& child, Place place) {
    switch (child.kind) {
    case Kind::ARRAY:
        boost::get<Array>(place(Array())).swap(finished_arrays[child.slot]);
        break;
    case Kind::OBJECT:
        boost::get<Object>(place(Object())).swap(finished_objects[child.slot]);
        break;
    case Kind::STRING:
        place(std::move(texts[child.slot]));
        break;
    case Kind::NUMBER:
        place(child.number);
        break;
    case Kind::BOOLEAN:
        place(child.truth);
        break;
    case Kind::NULL_VALUE:
        place(Null());
        break;
    }
}

// Builds the innermost open container at its final size from the values given for it, and
// leaves it as a finished value in its own Pending.
inline bool DocumentBuilder::close() {
    const OpenContainer container = open_containers.back();
    open_containers.pop_back();
    if (container.is_object) {
        close_object(container);
    } else {
        close_array(container);
    }
    return true;
}

inline void DocumentBuilder::close_array(const OpenContainer& container) {
    Array items;
    items.reserve(pending.size() - container.first_value);
    for (auto child = pending.begin() + static_cast<std::ptrdiff_t>(container.first_value);
         child != pending.end(); ++child) {
        adopt(*child, [&items](auto&& initial) -> Value& {
            return items.emplace_back(std::forward<decltype(initial)>(initial));
        });
    }
    release_children(container);
    finished_arrays.emplace_back(std::move(items));
    pending.back().slot = finished_arrays.size() - 1;
}

// The members go into the map in key order, from the last key to the first, each placed at
// the map's beginning: one key comparison each, where placing each at the end takes two. The
// order is found with comparisons of eight-byte prefixes, most of which settle it without
// comparing the names themselves.
inline void DocumentBuilder::close_object(const OpenContainer& container) {
    Pending* const first = pending.begin() + container.first_value;
    Pending* const last = pending.begin() + pending.size();
    const std::string* const names = texts.begin();
    // Equal names keep document order, so that the last of them can be told apart.
    const auto key_order = [names](const Pending& left, const Pending& right) {
        if (left.name_prefix != right.name_prefix) {
            return left.name_prefix < right.name_prefix;
        }
        const int order = names[left.name].compare(names[right.name]);
        return order != 0 ? order < 0 : left.name < right.name;
    };
    // Documents written by programs often list names in order already: a check that stops at
    // the first name out of order costs less than sorting what is sorted.
    if (!std::is_sorted(first, last, key_order)) {
        std::sort(first, last, key_order);
    }
    Object members;
    for (Pending* member = last; member != first;) {
        Pending& kept = *--member;
        // Equal names stand next to each other, in document order: the last of them wins.
        while (member != first && member[-1].name_prefix == kept.name_prefix &&
               names[member[-1].name] == names[kept.name]) {
            --member;
        }
        std::string& name = texts[kept.name];
        adopt(kept, [&members, &name](auto&& initial) -> Value& {
            return members
                .emplace_hint(members.begin(), std::move(name),
                              std::forward<decltype(initial)>(initial))
                ->second;
        });
    }
    release_children(container);
    finished_objects.emplace_back(std::move(members));
    pending.back().slot = finished_objects.size() - 1;
}

// Drops what the children of a closed container left behind in the stacks.
inline void DocumentBuilder::release_children(const OpenContainer& container) {
    pending.shrink_to(container.first_value);
    texts.shrink_to(container.first_text);
    finished_arrays.shrink_to(container.first_array);
    finished_objects.shrink_to(container.first_object);
}

} // namespace json::detail

#endif
