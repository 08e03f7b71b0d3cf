#include "messages.hpp"

#include <json/serializer.hpp>

namespace json::detail {

std::string kind_message(const char* expected, const Value& found) {
    return std::string("expected ") + expected + ", found " + kind_name(found.kind());
}

std::string index_out_of_range(std::string_view index, std::size_t size) {
    return "index " + std::string(index) + " out of range for a " + kind_name(Kind::ARRAY) +
           " of " + std::to_string(size) + " elements";
}

std::string quoted(std::string_view text) {
    WriteOptions options;
    options.escape_slash = false;
    return serialize(Value(std::string(text)), options);
}

} // namespace json::detail
