#include "messages.hpp"

namespace json::detail {

std::string kind_message(const char* expected, const Value& found) {
    return std::string("expected ") + expected + ", found " + kind_name(found.kind());
}

std::string index_out_of_range(std::string_view index, std::size_t size) {
    return "index " + std::string(index) + " out of range for a " + kind_name(Kind::ARRAY) +
           " of " + std::to_string(size) + " elements";
}

} // namespace json::detail
