#ifndef JSON_SRC_KIND_MESSAGE_HPP
#define JSON_SRC_KIND_MESSAGE_HPP

#include <json/value.hpp>

#include <string>

namespace json::detail {

/// "expected EXPECTED, found KIND", KIND being the JSON kind `found` holds ("JSON number" for
/// a double and a float alike, "no value" for Undefined): the text of every wrong-kind error.
std::string kind_message(const char* expected, const Value& found);

} // namespace json::detail

#endif
