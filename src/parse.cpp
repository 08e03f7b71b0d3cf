#include <json/events.hpp>
#include <json/parse.hpp>

#include <codecvt_ustring_to_string.hpp>
#include <number_text.hpp>

#include <istream>
#include <stdexcept>
#include <string>

namespace json {

namespace {

// Indexed by code. Row 0 is the description of SUCCESS.
constexpr const char* DESCRIPTIONS[] = {
    "No error",
    "Failed to match the string 'null'",
    "Failed to match either of 'true' or 'false' while parsing value of type boolean",
    "The given input sequence is empty",
    "Incomplete escape sequence while parsing value of type string",
    "Invalid escape sequence while parsing value of type char",
    "Invalid Unicode escape sequence while parsing value of type string",
    "Found '\"' character outside escape sequence before end of string",
    "Expected leading '\"' character while parsing value of type string",
    "Expected trailing '\"' character while parsing value of type string",
    "No quantity found after sign while parsing value of type number",
    "Expected leading digit while parsing value of type number",
    "Error in fractional component after decimal place while parsing value of type number",
    "Error in exponent while parsing value of type number",
    "No leading '[' while parsing value of type array",
    "No trailing ']' while parsing value of type array (possible missing comma?)",
    "No leading '{' while parsing value of type object",
    "No trailing '}' while parsing value of type object (possible missing comma?)",
    "No ':' after name while parsing value of type object",
    "Unexpected end of input",
};

constexpr int CODE_COUNT = static_cast<int>(sizeof DESCRIPTIONS / sizeof DESCRIPTIONS[0]);

} // namespace

const char* get_parse_result_description(ParseResult result) {
    const int code = static_cast<int>(result);
    return code >= 0 && code < CODE_COUNT ? DESCRIPTIONS[code] : "Unrecognized error code";
}

namespace detail {

double string_to_double(const char* text) {
    return convertStrToDouble(text);
}

std::string u16_to_u8(char16_t* text, int count) {
    const std::string encoding = "UTF-8";
    const codecvt_ustring_to_string converter(encoding, true);
    // libstdc++ words this case differently and would check the size first: test it here.
    if (text == nullptr && count != 0) {
        throw std::logic_error("basic_string::_M_construct null not valid");
    }
    // A negative count, widened with its sign, exceeds max_size(): std::length_error.
    const std::u16string units =
        count == 0 ? std::u16string() : std::u16string(text, static_cast<std::size_t>(count));
    if (units.empty()) {
        return std::string();
    }
    return converter.do_convert(units.data(), units.size());
}

} // namespace detail

ParseReport parse(std::istream& in, Value& out, const ParseOptions& options) {
    detail::Workspace workspace;
    detail::DocumentBuilder builder(options, workspace);
    detail::Grammar<detail::DocumentBuilder> grammar(builder, options, workspace);
    detail::TextPosition position;
    std::string rest;
    ParseReport report = detail::feed_stream(in, grammar, position, rest);
    if (report) {
        builder.take(out);
    } else {
        builder.explain(report);
    }
    return report;
}

} // namespace json
