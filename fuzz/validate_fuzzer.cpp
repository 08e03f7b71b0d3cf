// Reads arbitrary bytes, with options taken from the first byte, through every reader of the one
// grammar. json::parse must end in a report without a crash, a leak or a sanitizer report; a
// failure must leave `out` as it was and report a place inside the text, and a refusal must come
// with a note. json::validate, from the text and from a stream, must give exactly the parse's
// report (outcome, code, place, refusal and note). json::parse_events must give the same events
// and the same report from the text and from a stream that holds one byte at a time, so that
// every token straddles the pieces read.
#include "parse_options.hpp"
#include "support/reading.hpp"

#include <json/json.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <istream>
#include <sstream>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    using test_support::report_text;
    std::string_view text;
    const json::ParseOptions options = options_and_text(data, size, text);
    json::Value out = "previous";
    const json::ParseReport parsed = json::parse(text, out, options);
    const bool placed = parsed || (out == json::Value("previous") && parsed.offset <= text.size() &&
                                   parsed.line != 0 && parsed.column != 0 &&
                                   (parsed.refusal == json::Refusal::NONE || !parsed.note.empty()));
    std::istringstream stream{std::string(text)};
    const bool validated = report_text(json::validate(text, options)) == report_text(parsed) &&
                           report_text(json::validate(stream, options)) == report_text(parsed);
    test_support::Recorder whole;
    const json::ParseReport from_text = json::parse_events(text, whole, options);
    test_support::Recorder pieces;
    test_support::InPieces bytes{std::string(text), 1};
    std::istream one_byte_at_a_time(&bytes);
    const json::ParseReport from_stream = json::parse_events(one_byte_at_a_time, pieces, options);
    if (!placed || !validated || whole.events != pieces.events ||
        report_text(from_text) != report_text(from_stream)) {
        std::abort();
    }
    return 0;
}
