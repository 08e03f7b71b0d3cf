#ifndef JSON_SRC_MESSAGES_HPP
#define JSON_SRC_MESSAGES_HPP

// Wording that several of the library's errors share.

#include <json/value.hpp>

#include <cstddef>
#include <string>
#include <string_view>

namespace json::detail {

/// "expected EXPECTED, found KIND", KIND being the kind of JSON value `found` holds
/// (kind_name): the text of every wrong-kind error.
std::string kind_message(const char* expected, const Value& found);

/// "index INDEX out of range for a JSON array of SIZE elements", INDEX as written.
std::string index_out_of_range(std::string_view index, std::size_t size);

/// `text` as a JSON string, so that quotes, control characters and bytes that are not UTF-8 in
/// it show: "\"a\\u0000b\"".
std::string quoted(std::string_view text);

} // namespace json::detail

#endif
