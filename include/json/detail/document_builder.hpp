#ifndef JSON_DETAIL_DOCUMENT_BUILDER_HPP
#define JSON_DETAIL_DOCUMENT_BUILDER_HPP

// The handler behind json::parse: builds a Value from the grammar's events. Included by
// json/parse.hpp after the declarations it uses.

#include <json/detail/grammar.hpp>
#include <json/value.hpp>

#include <algorithm>
#include <cfloat>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <unordered_set>
#include <utility>
#include <vector>

namespace json::detail {

/// Whether the writer writes `value`, read from the JSON number `literal`, back as the same
/// decimal number. Up to fifteen significant digits (the literal has at least as many
/// characters) come back unchanged from a normal double (DBL_DIG), and the writer writes every
/// double below 2^53 with its shortest digits; anything else is checked against its text.
inline bool held_exactly(std::string_view literal, double value) {
    constexpr double exact_integers = 9007199254740992.0; // 2^53
    const double magnitude = std::fabs(value);
    if (literal.size() <= DBL_DIG && magnitude >= DBL_MIN && magnitude <= exact_integers) {
        return true;
    }
    return is_written_back_exactly(literal, value);
}

/// A handler's refusal of the document (the builder's, the validator's): which, and where
/// when that is not the token being reported. Each refuse function returns false, for the
/// handler to return.
class DocumentRefusal {
  public:
    [[gnu::cold]] bool inexact(std::string_view literal) {
        constexpr std::size_t shown = 40;
        std::string text(literal.substr(0, shown));
        if (literal.size() > shown) {
            text += "...";
        }
        text += " cannot be held exactly by a double; without the exact_numbers option it is "
                "rounded";
        return refuse(Refusal::INEXACT_NUMBER, ParseResult::INVALID_EXPONENT, std::move(text));
    }
    /// A member name given a second time, at the token being reported.
    [[gnu::cold]] bool repeated_name() {
        return refuse(Refusal::DUPLICATE_KEY, ParseResult::MISSING_TRAILING_BRACE,
                      "the object already has a member of this name; without the "
                      "reject_duplicate_keys option the last one wins");
    }

    /// When the grammar stopped because of this refusal, puts it in `report` (the place is
    /// the grammar's: the token being reported).
    void explain(ParseReport& report) {
        if (report.refusal != Refusal::STOPPED || refused == Refusal::NONE) {
            return;
        }
        report.refusal = refused;
        report.result = result;
        report.note = std::move(note);
    }

  private:
    bool refuse(Refusal why, ParseResult code, std::string text) {
        refused = why;
        result = code;
        note = std::move(text);
        return false;
    }

    Refusal refused = Refusal::NONE;
    ParseResult result = ParseResult::SUCCESS;
    std::string note;
};

/// The member names of the open objects, where repeated names are refused: the second of
/// them is found when it comes. Memory: the names of the open objects.
class MemberNames {
  public:
    void open_object() { open_objects.emplace_back(); }
    void close_object() { open_objects.pop_back(); }
    /// False when the innermost open object already has a member of this name. Kept out of
    /// line: only documents parsed with reject_duplicate_keys call it.
    [[gnu::noinline]] bool add(std::string_view name) {
        return open_objects.back().emplace(name).second;
    }

  private:
    std::vector<std::unordered_set<std::string>> open_objects;
};

/// Builds the document of one parse from the grammar's events, every container once at its
/// final size, its children handed over without a copy. Here, where the document is made,
/// the options that concern it act: a number is refused unless a double holds it exactly
/// (exact_numbers), an object that names a member twice (reject_duplicate_keys).
class DocumentBuilder {
  public:
    explicit DocumentBuilder(const ParseOptions& options) : options(options) {}

    // The handler's events; false when the document is refused (see refusal()).
    bool null() {
        push_value(Null());
        return true;
    }
    bool boolean(bool truth) {
        push_value(truth);
        return true;
    }
    // The literal is NUL-terminated (the grammar's copy), so it is read in place.
    bool number(std::string_view literal) {
        const double value = string_to_double(literal.data());
        if (options.exact_numbers && !held_exactly(literal, value)) {
            return refusal.inexact(literal);
        }
        push_value(value);
        return true;
    }
    bool string(std::string_view text) {
        push_value(std::string(text));
        return true;
    }
    bool key(std::string_view name) {
        if (options.reject_duplicate_keys && !repeated.add(name)) {
            return refusal.repeated_name();
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
    void take(Value& out) { out.swap(values.back()); }

    /// Puts a refusal of the document in `report`, see DocumentRefusal.
    void explain(ParseReport& report) { refusal.explain(report); }

  private:
    struct OpenContainer {
        bool is_object;
        std::size_t first_value;  // index into `values` of its first child
        std::size_t first_name;   // index into `names` of its first member name
        std::size_t first_array;  // index into `finished_arrays` of its first Array child
        std::size_t first_object; // index into `finished_objects` of its first Object child
    };

    // A finished container other than the document itself waits in `finished_arrays` or
    // `finished_objects` until its parent closes, and stands in `values` as a marker: the
    // builder never makes Undefined or a float, so Undefined stands for an Array and a float
    // for an Object. Kept apart like this, the container's content is swapped into the Value
    // that holds it for good, and that Value is the only one ever allocated for it.
    static constexpr int ARRAY_MARKER = UNDEFINED_INDEX;
    static constexpr int OBJECT_MARKER = FLOAT_INDEX;

    // A member of an object being closed, in the order the map wants its keys.
    struct MemberInKeyOrder {
        std::uint64_t name_prefix; // see name_prefix()
        std::size_t child;         // position among the object's children
        std::size_t slot;          // for a marker, index of its finished container
    };

    bool open(bool is_object) {
        open_containers.push_back({is_object, values.size(), names.size(), finished_arrays.size(),
                                   finished_objects.size()});
        return true;
    }
    bool close();
    template <typename Container, typename Marker>
    void finish(Container& content, std::vector<Container>& finished, Marker marker);
    template <typename Alternative>
    Value& push_value(Alternative&& value);
    void grow_values();

    const ParseOptions options;
    DocumentRefusal refusal;
    MemberNames repeated;

    std::vector<Value> values; // finished values whose container is still open
    std::vector<Array> finished_arrays;
    std::vector<Object> finished_objects;
    std::vector<std::string> names; // member names of the open objects, in document order
    std::vector<OpenContainer> open_containers;
    std::vector<MemberInKeyOrder> members_in_key_order; // reused by every object closed
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

// Builds the innermost open container at its final size from the values given for it,
// adopting each one without a copy, and leaves it as one finished value. False when the object
// names a member twice and that is refused.
inline bool DocumentBuilder::close() {
    const OpenContainer container = open_containers.back();
    open_containers.pop_back();
    // The finished containers of the children, in document order.
    std::size_t next_array = container.first_array;
    std::size_t next_object = container.first_object;
    const auto slot_of = [&](const Value& child) -> std::size_t {
        switch (child.which()) {
        case ARRAY_MARKER:
            return next_array++;
        case OBJECT_MARKER:
            return next_object++;
        default:
            return 0;
        }
    };
    // Calls `place` with an empty container or string of the child's kind (or a copy of a
    // scalar child) to construct the Value in its final place, then swaps the content in: a
    // subtree changes owner without being copied.
    const auto adopt = [&](Value& child, std::size_t slot, auto place) {
        switch (child.which()) {
        case ARRAY_MARKER:
            boost::get<Array>(place(Array())).swap(finished_arrays[slot]);
            break;
        case OBJECT_MARKER:
            boost::get<Object>(place(Object())).swap(finished_objects[slot]);
            break;
        case STRING_INDEX:
            boost::get<std::string>(place(std::string())).swap(boost::get<std::string>(child));
            break;
        case DOUBLE_INDEX:
            // Scalars are constructed from their alternative, inline: no call to the general
            // copy constructor, which has containers to deal with.
            place(boost::get<double>(child));
            break;
        case BOOL_INDEX:
            place(boost::get<bool>(child));
            break;
        default:
            place(Null()); // the parser makes no other alternative
        }
    };
    const auto children = values.begin() + static_cast<std::ptrdiff_t>(container.first_value);
    const auto release_children = [&] {
        values.erase(children, values.end());
        finished_arrays.erase(finished_arrays.begin() +
                                  static_cast<std::ptrdiff_t>(container.first_array),
                              finished_arrays.end());
        finished_objects.erase(finished_objects.begin() +
                                   static_cast<std::ptrdiff_t>(container.first_object),
                               finished_objects.end());
    };
    if (container.is_object) {
        // The members go into the map in key order, each placed at its end after a single key
        // comparison; the order is found with comparisons of eight-byte prefixes, most of which
        // settle it without comparing the names themselves.
        const auto names_of = names.begin() + static_cast<std::ptrdiff_t>(container.first_name);
        members_in_key_order.clear();
        for (auto child = children; child != values.end(); ++child) {
            const auto position = static_cast<std::size_t>(child - children);
            members_in_key_order.push_back(
                {name_prefix(names_of[static_cast<std::ptrdiff_t>(position)]), position,
                 slot_of(*child)});
        }
        const auto name_of = [&](const MemberInKeyOrder& member) -> const std::string& {
            return names_of[static_cast<std::ptrdiff_t>(member.child)];
        };
        // Equal names keep document order: the later member then replaces the earlier one.
        const auto key_order = [&](const MemberInKeyOrder& left, const MemberInKeyOrder& right) {
            if (left.name_prefix != right.name_prefix) {
                return left.name_prefix < right.name_prefix;
            }
            const int order = name_of(left).compare(name_of(right));
            return order != 0 ? order < 0 : left.child < right.child;
        };
        // Documents written by programs often list names in order already: a check that stops
        // at the first name out of order costs less than sorting what is sorted.
        if (!std::is_sorted(members_in_key_order.begin(), members_in_key_order.end(), key_order)) {
            std::sort(members_in_key_order.begin(), members_in_key_order.end(), key_order);
        }
        Object members;
        for (const MemberInKeyOrder& member : members_in_key_order) {
            std::string& name = names_of[static_cast<std::ptrdiff_t>(member.child)];
            adopt(children[static_cast<std::ptrdiff_t>(member.child)], member.slot,
                  [&](const auto& initial) -> Value& {
                      const std::size_t count = members.size();
                      const auto placed =
                          members.emplace_hint(members.end(), std::move(name), initial);
                      if (members.size() == count) {
                          placed->second = initial; // a repeated name: the later member wins
                      }
                      return placed->second;
                  });
        }
        names.resize(container.first_name);
        release_children();
        finish(members, finished_objects, 0.0F); // OBJECT_MARKER
        return true;
    }
    Array items;
    items.reserve(values.size() - container.first_value);
    for (auto child = children; child != values.end(); ++child) {
        adopt(*child, slot_of(*child),
              [&items](const auto& initial) -> Value& { return items.emplace_back(initial); });
    }
    release_children();
    finish(items, finished_arrays, Undefined()); // ARRAY_MARKER
    return true;
}

template <typename Container, typename Marker>
void DocumentBuilder::finish(Container& content, std::vector<Container>& finished, Marker marker) {
    if (open_containers.empty()) {
        boost::get<Container>(push_value(Container())).swap(content);
    } else {
        finished.push_back(std::move(content));
        push_value(marker);
    }
}

template <typename Alternative>
Value& DocumentBuilder::push_value(Alternative&& value) {
    if (values.size() == values.capacity()) {
        grow_values();
    }
    return values.emplace_back(std::forward<Alternative>(value));
}

// std::vector would copy the values when it grows (a Value has no move constructor), so they
// are swapped into the larger storage instead: no string is copied. Only scalars, strings
// and markers live here, so none of the swaps can fail.
inline void DocumentBuilder::grow_values() {
    std::vector<Value> larger;
    larger.reserve(std::max<std::size_t>(64, 2 * values.capacity()));
    for (Value& value : values) {
        larger.emplace_back().swap(value);
    }
    values.swap(larger);
}

} // namespace json::detail

#endif
