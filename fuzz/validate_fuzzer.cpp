// Validates arbitrary bytes with options taken from the first byte, as a text and from a
// stream, and parses them: validation must give exactly the report of the parse (outcome, code,
// place, refusal and note), whatever the input.
#include "parse_options.hpp"

#include <json/json.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <sstream>
#include <string>

namespace {

bool same(const json::ParseReport& left, const json::ParseReport& right) {
    return left.result == right.result && left.offset == right.offset && left.line == right.line &&
           left.column == right.column && left.refusal == right.refusal && left.note == right.note;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string_view text;
    const json::ParseOptions options = options_and_text(data, size, text);
    json::Value document;
    const json::ParseReport parsed = json::parse(text, document, options);
    std::istringstream stream{std::string(text)};
    if (!same(json::validate(text, options), parsed) ||
        !same(json::validate(stream, options), parsed)) {
        std::abort();
    }
    return 0;
}
