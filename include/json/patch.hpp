#ifndef JSON_PATCH_HPP
#define JSON_PATCH_HPP

// Changing documents by patches and telling how two documents differ: JSON Patch (RFC 6902),
// a list of operations at JSON Pointers, and JSON Merge Patch (RFC 7396), a document that
// shows what changes.

#include <json/detail/export.hpp>
#include <json/value.hpp>

#include <cstddef>
#include <string>

namespace json {

/// The outcome of json::apply_patch.
struct PatchReport {
    std::size_t operation = 0; ///< index in the patch of the operation that failed
    std::string message;       ///< why, naming the operation and its path; empty on success

    /// True when the whole patch was applied.
    explicit operator bool() const { return message.empty(); }
};

/// Applies the JSON Patch (RFC 6902) `patch`, an array of operations, to `document`, all or
/// nothing. Each operation is an object with an "op" member of "add", "remove", "replace",
/// "move", "copy" or "test", a "path" (a JSON Pointer, read by json::Pointer), a "value" for
/// add, replace and test and a "from" for move and copy; other members are ignored. The
/// operations are applied in turn, each to the result of the ones before, as RFC 6902 says:
/// "-" as the last step of an add's path appends to an array; `test` compares with
/// operator== (1 and 1.0 are equal, a number and a string are not).
///
/// When an operation fails, `document` is exactly as it was and the report gives the
/// operation's index and a message of the form "operation 2 (test /a): the value differs",
/// "operation 0 (add /a/b): no member \"a\"" or "operation 1: unknown op \"spam\"". A patch
/// that is not an array of objects fails as operation 0 (or the first one that is no object).
/// A member holding Undefined counts as absent, in the document and in the operations.
///
/// Cost: no copy of the document. Each operation costs the length of its pointers (a
/// logarithmic look-up per object on the way), a copy of its "value" or of the value at
/// "from" for copy, and for an element added to or removed from an array the length of that
/// array: its elements are moved over by swapping, with one small allocation per element
/// that is an array or object when the array has no room left, its elements differ in kind,
/// or the element removed is itself an array or object. What an operation replaces or removes
/// is kept until the patch is through, so that a failure puts it back without copying or
/// allocating anything.
///
/// `patch` must not lie inside `document`. Throws only std::bad_alloc, and then too
/// `document` is as it was, with one exception: when the patch turns a top-level array into
/// an object or the other way round and memory is exhausted at that very last step,
/// `document` holds `false`, as after a failed Value::swap.
JSONVALUE_API PatchReport apply_patch(Value& document, const Value& patch);

/// A JSON Patch (RFC 6902) that turns `source` into `target`: apply_patch on a copy of
/// `source` gives `target`. `[]` when they are equal. Objects are compared member by member
/// (members holding Undefined count as absent): "remove" for a member only `source` has,
/// "add" for one only `target` has, and the members of both compared in turn. Arrays are
/// compared element by element: the elements both have compared in turn, then "add" for each
/// element beyond the end of `source` or "remove" for each beyond the end of `target`, last
/// first. Any other difference (in kind, or of two scalars or strings) is a "replace". The
/// patch is readable, not the shortest: an element put in at the front of an array replaces
/// every element after it. Operations come in the order of the documents' members and
/// elements. Linear in the size of both documents; values are copied into the patch. Works
/// on documents of any depth with a bounded call stack. Throws std::bad_alloc.
JSONVALUE_API Value diff(const Value& source, const Value& target);

/// Applies the JSON Merge Patch (RFC 7396) `patch` to `document`: an object patch changes
/// the members it names (a member set to null is removed, an object merged member by member,
/// anything else put in whole, arrays included) and makes anything but an object an empty
/// object first; a patch that is no object replaces the whole document. Linear in the size
/// of `patch`, logarithmic per member in the size of its object. Works on documents of any
/// depth with a bounded call stack. Strong guarantee: on std::bad_alloc `document` is as it
/// was, but for the one exception apply_patch has (a top-level array replaced by an object
/// or the other way round, with memory exhausted at that step). `patch` may lie inside
/// `document`.
JSONVALUE_API void apply_merge_patch(Value& document, const Value& patch);

/// A JSON Merge Patch (RFC 7396) that turns `source` into `target`: `{}` when they are
/// equal objects, null for each member only `source` has, the members `target` adds or
/// changes, objects that both have as members compared in turn; `target` itself when either
/// is no object. A merge patch cannot set a member to null (null removes it), so the patch
/// is exact whenever `target` has no member whose value is null (in arrays nulls are fine):
/// a member set to null, or put in with nulls inside, comes out removed. Linear in the size
/// of both documents; works on documents of any depth with a bounded call stack. Throws
/// std::bad_alloc.
JSONVALUE_API Value merge_diff(const Value& source, const Value& target);

} // namespace json

#endif
