// JSON Patch (RFC 6902): each operation read from the patch and applied through Edits, which
// take everything back when one fails.
#include "patch_edits.hpp"

#include <json/patch.hpp>
#include <json/pointer.hpp>

#include <algorithm>
#include <iterator>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>

namespace json {

namespace {

using detail::Edits;

enum class Op { ADD, REMOVE, REPLACE, MOVE, COPY, TEST };

constexpr std::pair<std::string_view, Op> OPS[] = {
    {"add", Op::ADD},   {"remove", Op::REMOVE}, {"replace", Op::REPLACE},
    {"move", Op::MOVE}, {"copy", Op::COPY},     {"test", Op::TEST},
};

// The value the first `count` steps of `path` lead to in `root`, or null and why in `why`.
// "-" names no element of an array here: only "add" gives it a meaning.
Value* existing(Value& root, const Pointer& path, std::size_t count, std::string& why) {
    const std::size_t found = path.found_steps(root, count);
    if (found == count) {
        return path.find(root, count);
    }
    const Value& parent = *path.find(root, found);
    why = parent.is_array() && path.is_past_end(found)
              ? "\"-\" names no element, only the place after the last"
              : path.why_missing(found, parent);
    return nullptr;
}

// Puts `incoming` at `path` as "add" does: the whole document, a member set, or an element
// inserted ("-" appending). Returns why not, or nothing.
std::string add(Edits& edits, const Pointer& path, Value& incoming) {
    if (path.empty()) {
        edits.replace_root(incoming);
        return {};
    }
    const std::size_t last = path.size() - 1;
    std::string why;
    Value* const parent = existing(edits.root(), path, last, why);
    if (parent == nullptr) {
        return why;
    }
    if (parent->is_object()) {
        edits.put_member(parent->as_object(), path.name(last), incoming);
        return {};
    }
    if (!parent->is_array()) {
        return path.why_missing(last, *parent);
    }
    Array& array = parent->as_array();
    const std::size_t index = path.is_past_end(last) ? array.size() : path.index(last);
    if (index > array.size()) { // not an index at all included
        return path.why_missing(last, *parent);
    }
    edits.insert_element(array, index, incoming);
    return {};
}

// Removes the value at `path`; returns it (kept by `edits`), or null and why in `why`.
Value* remove(Edits& edits, const Pointer& path, std::string& why) {
    if (path.empty()) {
        why = "the whole document cannot be removed";
        return nullptr;
    }
    if (existing(edits.root(), path, path.size(), why) == nullptr) {
        return nullptr;
    }
    const std::size_t last = path.size() - 1;
    Value& parent = *path.find(edits.root(), last);
    if (parent.is_object()) {
        Object& members = parent.as_object();
        return &edits.remove_member(members, members.find(path.name(last)));
    }
    return &edits.remove_element(parent.as_array(), path.index(last));
}

std::string replace(Edits& edits, const Pointer& path, const Value& value) {
    std::string why;
    if (existing(edits.root(), path, path.size(), why) == nullptr) {
        return why;
    }
    Value& incoming = edits.keep(value);
    if (path.empty()) {
        edits.replace_root(incoming);
        return {};
    }
    const std::size_t last = path.size() - 1;
    Value& parent = *path.find(edits.root(), last);
    if (parent.is_object()) {
        edits.put_member(parent.as_object(), path.name(last), incoming);
    } else {
        edits.replace_element(parent.as_array(), path.index(last), incoming);
    }
    return {};
}

// "move" and "copy": the value at `from`, removed or copied, added at `path`.
std::string move_or_copy(Edits& edits, Op op, const Pointer& from, const Pointer& path) {
    std::string why;
    Value* value = nullptr;
    if (op == Op::COPY) {
        value = existing(edits.root(), from, from.size(), why);
        value = value == nullptr ? nullptr : &edits.keep(*value);
    } else if (from.size() < path.size() && path.prefix(from.size()) == from.text()) {
        return "the path lies inside \"from\" " + (from.empty() ? "\"\"" : from.text()) +
               ": a value cannot move into itself";
    } else {
        value = remove(edits, from, why);
    }
    return value == nullptr ? "from " + from.text() + ": " + why : add(edits, path, *value);
}

std::string test(Edits& edits, const Pointer& path, const Value& value) {
    std::string why;
    const Value* const target = existing(edits.root(), path, path.size(), why);
    if (target == nullptr) {
        return why;
    }
    return *target == value ? std::string() : "the value differs";
}

// The string member `name` of an operation, or null and why in `why`.
const std::string* text_member(const Value& operation, const char* name, std::string& why) {
    const Value* const member = operation.find(name);
    if (member == nullptr) {
        why = std::string("no \"") + name + "\" member";
        return nullptr;
    }
    if (!member->is_string()) {
        why = std::string("\"") + name + "\" is a " + kind_name(member->kind()) +
              ", not a JSON string";
        return nullptr;
    }
    return &member->as_string();
}

// The JSON Pointer in the string member `name`, or nothing and why in `why`.
std::optional<Pointer> pointer_member(const Value& operation, const char* name, std::string& why) {
    const std::string* const text = text_member(operation, name, why);
    if (text == nullptr) {
        return std::nullopt;
    }
    try {
        return Pointer(*text);
    } catch (const std::invalid_argument& malformed) {
        why = malformed.what();
        return std::nullopt;
    }
}

// Applies one operation; returns why it failed, or nothing. `label` gets the op and the path,
// as far as they could be read, for the message.
std::string apply_operation(Edits& edits, const Value& operation, std::string& label) {
    if (!operation.is_object()) {
        return std::string("expected a JSON object, found ") + kind_name(operation.kind());
    }
    std::string why;
    const std::string* const name = text_member(operation, "op", why);
    if (name == nullptr) {
        return why;
    }
    const auto known = std::find_if(std::begin(OPS), std::end(OPS),
                                    [name](const auto& entry) { return entry.first == *name; });
    if (known == std::end(OPS)) {
        return "unknown op \"" + *name + "\"";
    }
    const Op op = known->second;
    label = *name;
    const std::string* const path_text = text_member(operation, "path", why);
    if (path_text != nullptr) {
        label += ' ' + (path_text->empty() ? std::string("\"\"") : *path_text);
    }
    const std::optional<Pointer> path = pointer_member(operation, "path", why);
    if (!path) {
        return why;
    }
    if (op == Op::MOVE || op == Op::COPY) {
        const std::optional<Pointer> from = pointer_member(operation, "from", why);
        return from ? move_or_copy(edits, op, *from, *path) : why;
    }
    if (op == Op::REMOVE) {
        return remove(edits, *path, why) == nullptr ? why : std::string();
    }
    const Value* const value = operation.find("value");
    if (value == nullptr) {
        return "no \"value\" member";
    }
    switch (op) {
    case Op::ADD:
        return add(edits, *path, edits.keep(*value));
    case Op::REPLACE:
        return replace(edits, *path, *value);
    default:
        return test(edits, *path, *value);
    }
}

PatchReport failure(std::size_t operation, const std::string& label, const std::string& why) {
    PatchReport report;
    report.operation = operation;
    report.message = "operation " + std::to_string(operation) +
                     (label.empty() ? std::string() : " (" + label + ")") + ": " + why;
    return report;
}

} // namespace

PatchReport apply_patch(Value& document, const Value& patch) {
    if (!patch.is_array()) {
        return failure(0, {},
                       std::string("expected a JSON array of operations, found ") +
                           kind_name(patch.kind()));
    }
    const Array& operations = patch.as_array();
    Edits edits(document);
    for (std::size_t index = 0; index < operations.size(); ++index) {
        std::string label;
        const std::string why = apply_operation(edits, operations[index], label);
        if (!why.empty()) {
            return failure(index, label, why);
        }
    }
    edits.commit();
    return {};
}

} // namespace json
