// Parses arbitrary bytes with options taken from the first byte: any input must end in a
// result code, without a crash, a leak or a sanitizer report; a failure must leave `out` as it
// was and report a place inside the text, and a refusal must come with a note.
#include "parse_options.hpp"

#include <json/json.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string_view text;
    const json::ParseOptions options = options_and_text(data, size, text);
    json::Value out = "previous";
    const json::ParseReport report = json::parse(text, out, options);
    if (!report &&
        (out != json::Value("previous") || report.offset > text.size() || report.line == 0 ||
         report.column == 0 || (report.refusal != json::Refusal::NONE && report.note.empty()))) {
        std::abort();
    }
    return 0;
}
