#include <json/parse.hpp>

#include <codecvt_ustring_to_string.hpp>
#include <number_text.hpp>

#include <algorithm>
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

namespace {

// The report of a stream that failed: UNEXPECTED_END_OF_INPUT at the end of what was read.
ParseReport stream_failure(std::string_view text, const char* note) {
    ParseReport report;
    report.result = ParseResult::UNEXPECTED_END_OF_INPUT;
    report.note = note;
    detail::locate(report, text, text.size());
    return report;
}

// Appends the rest of `buffer` to `text`. What the buffer says it holds is taken on its own,
// so that a buffer that throws when it refills has given every byte before into `text`; when
// it holds nothing, a whole chunk is asked for, refilled as often as it takes. xsgetn stops
// short only at the end of the stream.
void read_rest(std::streambuf& buffer, std::string& text) {
    std::array<char, std::size_t{64} * 1024> chunk;
    const auto size = static_cast<std::streamsize>(chunk.size());
    for (std::streamsize held = buffer.in_avail(); held >= 0; held = buffer.in_avail()) {
        const std::streamsize count = held > 0 ? std::min(held, size) : size;
        const std::streamsize got = buffer.sgetn(chunk.data(), count);
        text.append(chunk.data(), static_cast<std::size_t>(got));
        if (got < count) {
            return;
        }
    }
}

// Sets badbit after the stream buffer threw, as the standard input functions do: without the
// std::ios::failure that setstate would throw when the caller enabled exceptions for badbit,
// so that the buffer's own exception can be rethrown instead.
void set_bad_without_throwing(std::istream& in) {
    const std::ios::iostate enabled = in.exceptions();
    in.exceptions(std::ios::goodbit);
    in.setstate(std::ios::badbit);
    try {
        in.exceptions(enabled); // sets the mask back first, then throws as the state is bad
    } catch (const std::ios::failure&) { // NOLINT(bugprone-empty-catch): replaced by the cause
    }
}

} // namespace

ParseReport parse(std::istream& in, Value& out, const ParseOptions& options) {
    // Failed before anything is read (a file that did not open): not an empty text.
    const bool unreadable = in.fail();
    std::string text;
    const std::istream::sentry ready(in, true); // whitespace is the parser's business
    if (!ready) {
        return unreadable ? stream_failure(text, "the stream was not readable")
                          : parse(text, out, options); // at the end already: an empty text
    }
    try {
        read_rest(*in.rdbuf(), text);
    } catch (const std::bad_alloc&) {
        throw;
    } catch (...) {
        set_bad_without_throwing(in);
        if ((in.exceptions() & std::ios::badbit) != 0) {
            throw;
        }
        return stream_failure(text, "the stream failed while it was read");
    }
    in.setstate(std::ios::eofbit);
    return parse(text, out, options);
}

} // namespace json
