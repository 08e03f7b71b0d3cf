#ifndef JSONFMT_POINTER_FILTER_HPP
#define JSONFMT_POINTER_FILTER_HPP

// --pointer: of the parsing events of a document, only those of the value at a JSON Pointer.

#include <json/pointer.hpp>

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace jsonfmt {

/// Follows a JSON Pointer through the events of one document and says which events belong to
/// the value it refers to. Memory: the pointer
/// and one entry per container on its path.
///
/// The value is found where the pointer's member names and indexes lead; when the path leaves
/// the document, problem() says where and why, in the words of json::Value::at_pointer. An
/// object that has the name the path takes more than once makes the pointer ambiguous: that
/// is a problem too, found wherever the second member stands (so the whole document is read).
class PointerPath {
  public:
    explicit PointerPath(const json::Pointer& pointer) : pointer(pointer) {}

    /// A value of `kind` starts (a container opens): whether it belongs to the value at the
    /// pointer.
    bool value(json::Kind kind);
    /// A member name: whether it belongs to the value at the pointer.
    bool key(std::string_view name);
    /// A container closes: whether it belongs to the value at the pointer.
    bool close();

    /// Once the document is read: empty when the pointer found one value, otherwise the
    /// message, "no value at PREFIX: reason" or "no single value at PREFIX: reason", PREFIX
    /// being the pointer up to the step that failed.
    std::string problem() const;

  private:
    // A container on the path: the value at the first `level` steps, for level = its place.
    struct Open {
        bool is_object;
        bool current_matches = false; // whether the member being read is the one the step names
        bool matched = false;         // whether the step's member or element has been seen
        std::size_t elements = 0;     // elements seen so far, in an array
    };

    bool is_wanted_next();
    void fail(std::size_t step, const std::string& reason);

    const json::Pointer& pointer;
    std::vector<Open> path;     // the containers on the path that are open, outermost first
    std::size_t depth = 0;      // the containers open outside the value at the pointer
    std::size_t value_open = 0; // the containers open inside the value at the pointer
    bool found = false;
    bool ambiguous = false;
    std::string failure; // the first problem, with its PREFIX
};

/// A handler of parsing events that passes on to `next` only the events of the value at the
/// pointer.
template <typename Next>
class PointerFilter {
  public:
    PointerFilter(const json::Pointer& pointer, Next& next) : path(pointer), next(next) {}

    bool null() { return !path.value(Kind::NULL_VALUE) || next.null(); }
    bool boolean(bool value) { return !path.value(Kind::BOOLEAN) || next.boolean(value); }
    bool number(std::string_view literal) {
        return !path.value(Kind::NUMBER) || next.number(literal);
    }
    bool string(std::string_view utf8) { return !path.value(Kind::STRING) || next.string(utf8); }
    bool key(std::string_view utf8) { return !path.key(utf8) || next.key(utf8); }
    bool begin_array() { return !path.value(Kind::ARRAY) || next.begin_array(); }
    bool end_array() { return !path.close() || next.end_array(); }
    bool begin_object() { return !path.value(Kind::OBJECT) || next.begin_object(); }
    bool end_object() { return !path.close() || next.end_object(); }

    /// See PointerPath::problem().
    std::string problem() const { return path.problem(); }

  private:
    using Kind = json::Kind;
    PointerPath path;
    Next& next;
};

} // namespace jsonfmt

#endif
