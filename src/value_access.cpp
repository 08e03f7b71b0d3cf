// Checked access, lookups and JSON Pointer resolution on a Value. The const overloads share
// the code of the others: they only read.
#include "kind_message.hpp"

#include <json/convert.hpp>
#include <json/value.hpp>

#include <algorithm>
#include <charconv>
#include <stdexcept>
#include <string>

namespace json {

namespace {

template <typename Alternative>
Alternative& checked(Value& value, int index) {
    if (value.which() != index) {
        detail::throw_wrong_kind(traits<Alternative>::name, value);
    }
    return boost::get<Alternative>(value);
}

std::string index_out_of_range(std::string_view index, std::size_t size) {
    return "index " + std::string(index) + " out of range for a " + traits<Array>::name + " of " +
           std::to_string(size) + " elements";
}

// Refuses what is not a JSON Pointer: text that is not empty and does not start with '/', or
// a '~' that is not followed by '0' or '1'. Checked over the whole pointer, so that a malformed
// pointer is refused whatever the document holds.
void check_pointer(std::string_view pointer) {
    if (!pointer.empty() && pointer.front() != '/') {
        throw std::invalid_argument("JSON Pointer \"" + std::string(pointer) +
                                    "\" does not start with '/'");
    }
    for (std::size_t i = 0; i < pointer.size(); ++i) {
        if (pointer[i] == '~' &&
            (i + 1 == pointer.size() || (pointer[i + 1] != '0' && pointer[i + 1] != '1'))) {
            throw std::invalid_argument("JSON Pointer \"" + std::string(pointer) +
                                        "\" has a '~' not followed by '0' or '1'");
        }
    }
}

// Whether a token names an element: "0", or digits without a leading zero, of any length ("-",
// the element after the last, never exists here).
bool is_index(std::string_view token) {
    return !token.empty() && token.find_first_not_of("0123456789") == std::string_view::npos &&
           (token[0] != '0' || token.size() == 1);
}

// The element an index token names, or null when it is past the end (an index too large for
// std::size_t is past the end of every Array).
Value* element(Array& items, std::string_view index) {
    std::size_t position = 0;
    const std::from_chars_result read =
        std::from_chars(index.data(), index.data() + index.size(), position);
    return read.ec == std::errc() && position < items.size() ? &items[position] : nullptr;
}

Value* child(Value& parent, std::string_view token) {
    if (parent.is_object()) {
        return parent.find(detail::pointer_member_name(token));
    }
    if (parent.is_array() && is_index(token)) {
        return element(boost::get<Array>(parent), token);
    }
    return nullptr;
}

// How far a pointer led: to the value it refers to, or to the deepest value it reached and
// the first token that is not found there. Iterative: one step per token.
struct Resolution {
    Value* found;
    Value* reached;
    std::string_view missing; // the first token not found
    std::size_t missing_end;  // where that token ends in the pointer
};

Resolution resolve(Value& root, std::string_view pointer) {
    check_pointer(pointer);
    Value* current = &root;
    for (std::size_t start = 0; start < pointer.size();) {
        const std::size_t end = std::min(pointer.find('/', start + 1), pointer.size());
        const std::string_view token = pointer.substr(start + 1, end - start - 1);
        Value* next = child(*current, token);
        if (next == nullptr) {
            return {nullptr, current, token, end};
        }
        current = next;
        start = end;
    }
    return {current, current, {}, pointer.size()};
}

// Why `token` is not found in `parent`.
std::string not_found(const Value& parent, std::string_view token) {
    if (parent.is_object()) {
        return "no member \"" + detail::pointer_member_name(token) + "\"";
    }
    if (parent.is_array()) {
        if (!is_index(token)) {
            return "\"" + std::string(token) + "\" is no index of a " + traits<Array>::name;
        }
        return index_out_of_range(token, boost::get<Array>(parent).size());
    }
    // Anything else has no values inside: say what it is.
    return detail::kind_message("JSON object or array", parent);
}

} // namespace

std::string detail::pointer_member_name(std::string_view token) {
    std::string name;
    name.reserve(token.size());
    for (std::size_t i = 0; i < token.size(); ++i) {
        if (token[i] == '~') {
            name += token[++i] == '0' ? '~' : '/';
        } else {
            name += token[i];
        }
    }
    return name;
}

bool Value::as_bool() const {
    return checked<bool>(const_cast<Value&>(*this), detail::BOOL_INDEX);
}

double Value::as_number() const {
    if (which() == detail::FLOAT_INDEX) {
        return boost::get<float>(*this);
    }
    return checked<double>(const_cast<Value&>(*this), detail::DOUBLE_INDEX);
}

std::string& Value::as_string() {
    return checked<std::string>(*this, detail::STRING_INDEX);
}

const std::string& Value::as_string() const {
    return const_cast<Value*>(this)->as_string();
}

Array& Value::as_array() {
    return checked<Array>(*this, detail::ARRAY_INDEX);
}

const Array& Value::as_array() const {
    return const_cast<Value*>(this)->as_array();
}

Object& Value::as_object() {
    return checked<Object>(*this, detail::OBJECT_INDEX);
}

const Object& Value::as_object() const {
    return const_cast<Value*>(this)->as_object();
}

Value* Value::find(const std::string& key) {
    if (which() != detail::OBJECT_INDEX) {
        return nullptr;
    }
    Object& members = boost::get<Object>(*this);
    const auto found = members.find(key);
    // A member holding Undefined has no JSON text (the writer leaves it out): it is absent.
    return found == members.end() || found->second.is_undefined() ? nullptr : &found->second;
}

const Value* Value::find(const std::string& key) const {
    return const_cast<Value*>(this)->find(key);
}

Value& Value::at(const std::string& key) {
    static_cast<void>(as_object()); // throws when this is no Object
    Value* const member = find(key);
    if (member == nullptr) {
        throw std::out_of_range("no member \"" + key + "\"");
    }
    return *member;
}

const Value& Value::at(const std::string& key) const {
    return const_cast<Value*>(this)->at(key);
}

Value& Value::at(std::size_t index) {
    Array& items = as_array();
    if (index >= items.size()) {
        throw std::out_of_range(index_out_of_range(std::to_string(index), items.size()));
    }
    return items[index];
}

const Value& Value::at(std::size_t index) const {
    return const_cast<Value*>(this)->at(index);
}

Value* Value::find_pointer(std::string_view pointer) {
    return resolve(*this, pointer).found;
}

const Value* Value::find_pointer(std::string_view pointer) const {
    return const_cast<Value*>(this)->find_pointer(pointer);
}

Value& Value::at_pointer(std::string_view pointer) {
    const Resolution resolution = resolve(*this, pointer);
    if (resolution.found == nullptr) {
        throw std::out_of_range(std::string(pointer.substr(0, resolution.missing_end)) + ": " +
                                not_found(*resolution.reached, resolution.missing));
    }
    return *resolution.found;
}

const Value& Value::at_pointer(std::string_view pointer) const {
    return const_cast<Value*>(this)->at_pointer(pointer);
}

} // namespace json
