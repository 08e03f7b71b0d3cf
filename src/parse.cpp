// The outcome codes' descriptions, and parsing into a document: with a report, throwing, or
// from a stream's extraction operator.
#include "document_builder.hpp"

#include <json/detail/run_parser.hpp>
#include <json/parse.hpp>

#include <istream>
#include <stdexcept>
#include <string>
#include <string_view>

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

namespace {

// Parses `input` (a text or a stream) into `out`, which keeps what it held unless the whole
// document was read.
template <typename Input>
ParseReport parse_into(Input& input, Value& out, const ParseOptions& options) {
    detail::Workspace workspace;
    detail::DocumentBuilder builder(options, workspace);
    ParseReport report = detail::run_parser(builder, options, workspace, input);
    if (report) {
        builder.take(out);
    }
    return report;
}

} // namespace

ParseReport parse(std::string_view text, Value& out, const ParseOptions& options) {
    return parse_into(text, out, options);
}

ParseReport parse(std::istream& in, Value& out, const ParseOptions& options) {
    return parse_into(in, out, options);
}

namespace {

// Parses `input` (a text or a stream) into a document that is returned, or throws with the
// failure's place and message.
template <typename Input>
Value parse_or_throw(Input& input, const ParseOptions& options) {
    Value document;
    const ParseReport report = parse(input, document, options);
    if (!report) {
        throw std::invalid_argument(std::to_string(report.line) + ":" +
                                    std::to_string(report.column) + ": " + report.message());
    }
    return document;
}

} // namespace

Value parse(std::string_view text, const ParseOptions& options) {
    return parse_or_throw(text, options);
}

Value parse(std::istream& in, const ParseOptions& options) {
    return parse_or_throw(in, options);
}

std::istream& operator>>(std::istream& in, Value& value) {
    if (!parse(in, value, ParseOptions())) {
        in.setstate(std::ios::failbit);
    }
    return in;
}

} // namespace json
