#ifndef JSON_POINTER_HPP
#define JSON_POINTER_HPP

// JSON Pointer (RFC 6901): the path from the root of a document to one of its values, as a
// list of reference tokens. The one place where pointers are read, resolved, built and
// explained: Value::find_pointer and Value::at_pointer, the conversions' error messages,
// JSON Patch and jsonfmt's --pointer all go through it.

#include <json/detail/export.hpp>
#include <json/kind.hpp>

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace json {

class Value;

/// A JSON Pointer taken apart: "" is the whole document, and each "/token" goes one level down,
/// into the member of that name ("~1" standing for '/' and "~0" for '~') or the element at that
/// index (decimal digits without a leading zero; "-" names the element after the last, which
/// never exists but is where JSON Patch appends).
class JSONVALUE_API Pointer {
  public:
    /// What index() gives for a token that names no element ("-" included).
    static constexpr std::size_t NOT_AN_INDEX = static_cast<std::size_t>(-1);

    /// The pointer to the whole document, "". Throws nothing.
    Pointer() = default;

    /// Reads `text`. Linear in its length. Throws std::invalid_argument when it is not a JSON
    /// Pointer: not empty and not starting with '/' ("JSON Pointer \"a\" does not start with
    /// '/'"), or with a '~' not followed by '0' or '1'; and std::bad_alloc.
    explicit Pointer(std::string_view text);

    /// The pointer as text, every token escaped. Throws nothing.
    const std::string& text() const noexcept { return written; }
    /// The number of reference tokens. Throws nothing.
    std::size_t size() const noexcept { return steps.size(); }
    /// Whether this is the pointer to the whole document. Throws nothing.
    bool empty() const noexcept { return steps.empty(); }

    /// Token `step` (below size()) as written in the text. Constant time; throws nothing.
    std::string_view token(std::size_t step) const noexcept;
    /// The member name that token `step` stands for, its escapes resolved. Throws nothing.
    const std::string& name(std::size_t step) const noexcept { return steps[step].name; }
    /// The element that token `step` names: "0", or digits without a leading zero (an index
    /// beyond std::size_t is NOT_AN_INDEX - 1, past the end of every array); NOT_AN_INDEX for any
    /// other token. Throws nothing.
    std::size_t index(std::size_t step) const noexcept { return steps[step].index; }
    /// Whether token `step` is "-", the element after the last of an array. Throws nothing.
    bool is_past_end(std::size_t step) const noexcept { return token(step) == "-"; }
    /// The text of the first `count` tokens: "/a/b" of "/a/b/c" for 2. Throws nothing.
    std::string_view prefix(std::size_t count) const noexcept;

    /// Appends a token naming the member `name`, escaped; returns *this. Linear in the length
    /// of `name`. Throws std::bad_alloc (strong guarantee).
    Pointer& push_back(std::string_view name);
    /// Appends a token naming the element at `index`; returns *this. Throws std::bad_alloc
    /// (strong guarantee).
    Pointer& push_back(std::size_t index);
    /// Drops the last token: the pointer to the parent. Must not be empty. Throws nothing.
    void pop_back() noexcept;

    /// The value this pointer refers to in `root`, or null when there is none. A member
    /// holding Undefined is absent, as for every lookup. Linear in the number of tokens,
    /// logarithmic per Object. Throws nothing.
    Value* find(Value& root) const noexcept;
    /// @copydoc find(Value&) const
    const Value* find(const Value& root) const noexcept;
    /// The value that the first `count` tokens lead to in `root`, or null. Throws nothing.
    Value* find(Value& root, std::size_t count) const noexcept;
    /// @copydoc find(Value&, std::size_t) const
    const Value* find(const Value& root, std::size_t count) const noexcept;
    /// How many of the first `count` tokens lead somewhere in `root`: `count` when
    /// find(root, count) finds a value, otherwise the first token that finds nothing, whose
    /// parent is find(root, result) and why_missing(result, parent) says why. Throws nothing.
    std::size_t found_steps(const Value& root, std::size_t count) const noexcept;

    /// The value this pointer refers to in `root`. Throws std::out_of_range when there is none,
    /// with a message that begins with the pointer up to the first token not found, followed by
    /// why_missing(): "/servers/3: index 3 out of range for a JSON array of 2 elements".
    Value& at(Value& root) const;
    /// @copydoc at(Value&) const
    const Value& at(const Value& root) const;

    /// Why token `step` finds nothing in `parent`, the value the tokens before it lead to:
    /// "no member \"a\"", "index 3 out of range for a JSON array of 2 elements", "\"x\" is no
    /// index of a JSON array", "\"01\" is no index of a JSON array: it has a leading zero", or
    /// "expected JSON object or array, found JSON string". Linear in the length of the token.
    /// Throws std::bad_alloc.
    std::string why_missing(std::size_t step, const Value& parent) const;
    /// The same from what a reader of parsing events knows of the parent: its kind and, for
    /// an array, how many elements it has.
    std::string why_missing(std::size_t step, Kind parent, std::size_t elements) const;

    /// Two pointers are equal when their texts are. Throws nothing.
    friend bool operator==(const Pointer& left, const Pointer& right) noexcept {
        return left.written == right.written;
    }
    /// The negation of operator==.
    friend bool operator!=(const Pointer& left, const Pointer& right) noexcept {
        return !(left == right);
    }

  private:
    struct Step {
        std::string name;  // the member name the token stands for
        std::size_t index; // the element it names, or NOT_AN_INDEX
        std::size_t end;   // where the token ends in the text
    };

    void add_step(std::size_t start, std::size_t end);
    // The child that token `step` leads to from `parent`, or null.
    Value* child(Value& parent, std::size_t step) const noexcept;

    std::string written;
    std::vector<Step> steps;
};

/// `name` as a reference token: '~' written "~0" and '/' written "~1". Linear. Throws
/// std::bad_alloc.
JSONVALUE_API std::string escape_pointer_token(std::string_view name);

} // namespace json

#endif
