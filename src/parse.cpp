#include <json/parse.hpp>

#include <codecvt_ustring_to_string.hpp>
#include <number_text.hpp>

#include <array>
#include <istream>
#include <new>
#include <stdexcept>

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
    std::string text;
    bool read_whole = false;
    const std::istream::sentry ready(in, true); // whitespace is the parser's business
    if (ready) {
        try {
            // xsgetn reads until it has the count or the buffer is exhausted: a short count
            // is the end of the stream.
            std::array<char, std::size_t{64} * 1024> chunk;
            std::streamsize got = 0;
            do {
                got = in.rdbuf()->sgetn(chunk.data(), static_cast<std::streamsize>(chunk.size()));
                text.append(chunk.data(), static_cast<std::size_t>(got));
            } while (got == static_cast<std::streamsize>(chunk.size()));
            read_whole = true;
        } catch (const std::bad_alloc&) {
            throw;
        } catch (...) {
            in.setstate(std::ios::badbit); // throws if the caller asked for that
        }
        if (read_whole) {
            in.setstate(std::ios::eofbit);
        }
    } else {
        read_whole = !in.bad(); // at the end already: an empty text
    }
    if (!read_whole) {
        ParseReport report;
        report.result = ParseResult::UNEXPECTED_END_OF_INPUT;
        report.note = "the stream failed while it was read";
        detail::locate(report, text, text.size());
        return report;
    }
    return parse(text, out, options);
}

} // namespace json
