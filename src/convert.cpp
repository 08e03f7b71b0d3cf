#include "messages.hpp"
#include "number.hpp"

#include <json/convert.hpp>
#include <json/pointer.hpp>
#include <json/serializer.hpp>

#include <exception>
#include <string>

namespace json::detail {

namespace {

// The shortest text that reads back as `number`, as the writer writes it.
std::string number_text(double number) {
    char text[NUMBER_TEXT_SIZE];
    return std::string(text, write_number(text, number));
}

// `message` with "/token" in front of its pointer; a message without a pointer (a failure at
// the Value converted) gets one, followed by ": ".
std::string prefixed(const std::string& token, const char* message) {
    std::string text = "/" + escape_pointer_token(token);
    if (message[0] != '/') {
        text += ": ";
    }
    return text + message;
}

[[noreturn]] void rethrow_with_token(const std::string& token) {
    try {
        throw;
    } catch (const std::out_of_range& error) {
        throw std::out_of_range(prefixed(token, error.what()));
    } catch (const std::invalid_argument& error) {
        throw std::invalid_argument(prefixed(token, error.what()));
    }
}

} // namespace

void throw_wrong_kind(const char* expected, const Value& found) {
    throw std::invalid_argument(kind_message(expected, found));
}

void throw_not_in_range(double number, std::intmax_t min, std::uintmax_t max) {
    throw std::invalid_argument("expected an integer from " + std::to_string(min) + " to " +
                                std::to_string(max) + ", found " + number_text(number));
}

void throw_not_a_float(double number) {
    throw std::invalid_argument("expected a number within the range of float, found " +
                                number_text(number));
}

void throw_missing_member() {
    throw std::out_of_range("missing member");
}

void throw_unknown_member() {
    throw std::invalid_argument("unknown member (the struct has no member of this name)");
}

void throw_wrong_size(std::size_t size, std::size_t found) {
    const std::string sizes = "expected " + std::string(traits<Array>::name) + " of " +
                              std::to_string(size) + " elements, found " + std::to_string(found);
    if (found < size) {
        throw std::out_of_range("missing element (" + sizes + ")");
    }
    throw std::invalid_argument(sizes);
}

void throw_unknown_enumerator(const std::string& name) {
    // Written as a JSON string: a control character or NUL byte in it stays visible, where
    // what() would end the message at a NUL.
    throw std::invalid_argument("unknown enumerator " + serialize(Value(name)));
}

void throw_unnamed_enum_value(long long value) {
    throw std::invalid_argument("no enumerator has the value " + std::to_string(value));
}

void rethrow_below(std::string_view token) {
    rethrow_with_token(std::string(token));
}

void rethrow_below(std::size_t index) {
    rethrow_with_token(std::to_string(index));
}

} // namespace json::detail
