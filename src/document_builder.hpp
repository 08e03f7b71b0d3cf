#ifndef JSON_SRC_DOCUMENT_BUILDER_HPP
#define JSON_SRC_DOCUMENT_BUILDER_HPP

// The handler behind json::parse: builds a Value from the grammar's events.

#include "document_checks.hpp"
#include "number.hpp"

#include <json/detail/workspace.hpp>
#include <json/value.hpp>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
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
        : options(options), pending(workspace), strings(workspace), finished_arrays(workspace),
          finished_objects(workspace), names(workspace), open_containers(workspace),
          members_in_key_order(workspace) {
        pending.reserve(INITIAL_VALUES);
        strings.reserve(INITIAL_VALUES);
        names.reserve(INITIAL_VALUES);
        members_in_key_order.reserve(INITIAL_VALUES);
        open_containers.reserve(INITIAL_CONTAINERS);
        finished_arrays.reserve(INITIAL_CONTAINERS);
        finished_objects.reserve(INITIAL_CONTAINERS);
    }

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
        strings.emplace_back(text);
        push(Kind::STRING).slot = strings.size() - 1;
        return true;
    }
    bool key(std::string_view name) {
        if (options.reject_duplicate_keys && !repeated.add(name)) {
            return refusal.repeated_name(name);
        }
        names.emplace_back(name);
        return true;
    }
    bool begin_array() { return open(false); }
    bool begin_object() {
        if (options.reject_duplicate_keys) {
            repeated.open_object();
        }
        return open(true);
    }
    bool end_array() { return close(); }
    bool end_object() {
        if (options.reject_duplicate_keys) {
            repeated.close_object();
        }
        return close();
    }

    /// Hands the finished document to `out`, without a copy.
    void take(Value& out) {
        std::optional<Value> document;
        take_into([&document](auto&& initial) -> Value& {
            return document.emplace(std::forward<decltype(initial)>(initial));
        });
        out.swap(*document);
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
    // A finished value whose container is still open. A string or a container waits in a stack
    // of its own at `slot` until its parent closes, and is then swapped into the Value that
    // holds it for good: that Value is the only one ever made for it, and the values waiting
    // here are plain data, copied and dropped without a call.
    enum class Kind : unsigned char { NULL_VALUE, BOOLEAN, NUMBER, STRING, ARRAY, OBJECT };
    struct Pending {
        Kind kind = Kind::NULL_VALUE;
        bool truth = false;   // a BOOLEAN's
        double number = 0.0;  // a NUMBER's
        std::size_t slot = 0; // a STRING's index in `strings`, a container's in its stack
    };

    struct OpenContainer {
        bool is_object;
        std::size_t first_value;  // index into `pending` of its first child
        std::size_t first_name;   // index into `names` of its first member name
        std::size_t first_string; // index into `strings` of its first string child
        std::size_t first_array;  // index into `finished_arrays` of its first Array child
        std::size_t first_object; // index into `finished_objects` of its first Object child
    };

    // A member of an object being closed, in the order the map wants its keys.
    struct MemberInKeyOrder {
        std::uint64_t name_prefix; // see name_prefix()
        std::size_t child;         // position among the object's children
    };

    // The fields are stored where the value stays: a Pending made on the stack and copied would
    // be loaded whole just after its fields were stored, a load the processor cannot forward
    // from those stores (a stall on every value).
    Pending& push(Kind kind) {
        Pending& value = pending.emplace_back();
        value.kind = kind;
        return value;
    }
    bool open(bool is_object) {
        open_containers.push_back({is_object, pending.size(), names.size(), strings.size(),
                                   finished_arrays.size(), finished_objects.size()});
        return true;
    }
    bool close();
    void close_object(const OpenContainer& container);
    void close_array(const OpenContainer& container);
    void release_children(const OpenContainer& container);
    template <typename Place>
    void adopt(const Pending& child, Place place);

    const ParseOptions options;
    DocumentRefusal refusal;
    MemberNames repeated;

    WorkspaceVector<Pending> pending; // finished values whose container is still open
    WorkspaceVector<std::string> strings;
    WorkspaceVector<Array> finished_arrays;
    WorkspaceVector<Object> finished_objects;
    WorkspaceVector<std::string> names; // member names of the open objects, in document order
    WorkspaceVector<OpenContainer> open_containers;
    WorkspaceVector<MemberInKeyOrder> members_in_key_order; // reused by every object closed
    // The first capacities, which fill about four fifths of a Workspace (see there).
    static constexpr std::size_t INITIAL_VALUES = 24;
    static constexpr std::size_t INITIAL_CONTAINERS = 8;
};

// The first eight bytes of a name as a big-endian number, zero-padded: where two names' prefixes
// differ, they order the names as the map does (bytes unsigned, a proper prefix first).
inline std::uint64_t name_prefix(const std::string& name) {
    std::uint64_t word = 0;
    // The storage holds capacity() + 1 bytes (with the NUL), so eight can be read at once in
    // every common library (a short string's buffer has sixteen); only the name's are kept.
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

// Calls `place` with the child's string (to be moved from) or scalar, or with an empty container
// of its kind, to construct the Value in its final place; a container's content is then swapped
// in: a subtree changes owner without being copied. Each Value is constructed from its
// alternative, inline: no call to the general copy constructor, which has containers to deal
// with.
template <typename Place>
void DocumentBuilder::adopt(const Pending& child, Place place) {
    switch (child.kind) {
    case Kind::ARRAY:
        boost::get<Array>(place(Array())).swap(finished_arrays[child.slot]);
        break;
    case Kind::OBJECT:
        boost::get<Object>(place(Object())).swap(finished_objects[child.slot]);
        break;
    case Kind::STRING:
        place(std::move(strings[child.slot]));
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
// leaves it as one finished value.
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
    finished_arrays.push_back(std::move(items));
    push(Kind::ARRAY).slot = finished_arrays.size() - 1;
}

// The members go into the map in key order, each placed at its end after a single key
// comparison; the order is found with comparisons of eight-byte prefixes, most of which settle
// it without comparing the names themselves.
inline void DocumentBuilder::close_object(const OpenContainer& container) {
    const auto children = pending.begin() + static_cast<std::ptrdiff_t>(container.first_value);
    const auto names_of = names.begin() + static_cast<std::ptrdiff_t>(container.first_name);
    members_in_key_order.clear();
    for (std::size_t child = 0; child != pending.size() - container.first_value; ++child) {
        members_in_key_order.push_back(
            {name_prefix(names_of[static_cast<std::ptrdiff_t>(child)]), child});
    }
    const auto name_of = [&](const MemberInKeyOrder& member) -> const std::string& {
        return names_of[static_cast<std::ptrdiff_t>(member.child)];
    };
    // Equal names keep document order, so that the last of them can be told apart.
    const auto key_order = [&](const MemberInKeyOrder& left, const MemberInKeyOrder& right) {
        if (left.name_prefix != right.name_prefix) {
            return left.name_prefix < right.name_prefix;
        }
        const int order = name_of(left).compare(name_of(right));
        return order != 0 ? order < 0 : left.child < right.child;
    };
    // Documents written by programs often list names in order already: a check that stops at
    // the first name out of order costs less than sorting what is sorted.
    if (!std::is_sorted(members_in_key_order.begin(), members_in_key_order.end(), key_order)) {
        std::sort(members_in_key_order.begin(), members_in_key_order.end(), key_order);
    }
    Object members;
    for (auto member = members_in_key_order.begin(); member != members_in_key_order.end();
         ++member) {
        // Equal names stand next to each other, in document order: the last of them wins.
        const auto next = member + 1;
        if (next != members_in_key_order.end() && next->name_prefix == member->name_prefix &&
            name_of(*next) == name_of(*member)) {
            continue;
        }
        std::string& name = names_of[static_cast<std::ptrdiff_t>(member->child)];
        adopt(children[static_cast<std::ptrdiff_t>(member->child)], [&](auto&& initial) -> Value& {
            return members
                .emplace_hint(members.end(), std::move(name),
                              std::forward<decltype(initial)>(initial))
                ->second;
        });
    }
    names.resize(container.first_name);
    release_children(container);
    finished_objects.push_back(std::move(members));
    push(Kind::OBJECT).slot = finished_objects.size() - 1;
}

// Drops what the children of a closed container left behind in the stacks.
inline void DocumentBuilder::release_children(const OpenContainer& container) {
    pending.resize(container.first_value);
    strings.resize(container.first_string);
    finished_arrays.resize(container.first_array);
    finished_objects.resize(container.first_object);
}

} // namespace json::detail

#endif
