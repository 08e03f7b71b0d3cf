// Checked access, subscripts and lookups on a Value, and JSON Pointer lookups through
// json::Pointer. The const overloads share the code of the others: they only read.
#include "messages.hpp"

#include <json/convert.hpp>
#include <json/pointer.hpp>
#include <json/value.hpp>

#include <stdexcept>
#include <string>
#include <utility>

namespace json {

namespace {

template <typename Alternative>
Alternative& checked(Value& value, int index) {
    if (value.which() != index) {
        detail::throw_wrong_kind(traits<Alternative>::name, value);
    }
    return boost::get<Alternative>(value);
}

} // namespace

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
        throw std::out_of_range(detail::index_out_of_range(std::to_string(index), items.size()));
    }
    return items[index];
}

const Value& Value::at(std::size_t index) const {
    return const_cast<Value*>(this)->at(index);
}

Value& Value::operator[](const std::string& key) {
    if (is_undefined()) {
        // The Object is made with its member before this Value changes; the swap of an
        // Undefined Value with an Object either happens whole or not at all.
        Object members;
        members.try_emplace(key);
        Value made(std::move(members));
        swap(made);
        return boost::get<Object>(*this).begin()->second;
    }
    return as_object().try_emplace(key).first->second;
}

Value* Value::find_pointer(std::string_view pointer) {
    return Pointer(pointer).find(*this);
}

const Value* Value::find_pointer(std::string_view pointer) const {
    return Pointer(pointer).find(*this);
}

Value& Value::at_pointer(std::string_view pointer) {
    return Pointer(pointer).at(*this);
}

const Value& Value::at_pointer(std::string_view pointer) const {
    return Pointer(pointer).at(*this);
}

std::string Value::value_or(const std::string& key, const char* fallback) const {
    return value_or<std::string>(key, fallback);
}

} // namespace json
