// Parses arbitrary bytes with options taken from the first byte; whatever parses is written
// compact and pretty and parsed again with the same options: the Values must be equal and the
// text stable. A number beyond the range of double parses as an infinity (with allow_overflow
// and without exact numbers), which is written as the string "Inf" or "-Inf": when the text holds
// such a string (or what looks like one), only the text must be stable.
#include "parse_options.hpp"

#include <json/json.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string_view text;
    const json::ParseOptions options = options_and_text(data, size, text);
    json::Value document;
    if (!json::parse(text, document, options)) {
        return 0;
    }
    const std::string compact = json::serialize(document);
    const std::string pretty = json::pretty_print(document);
    const bool infinite = compact.find("Inf\"") != std::string::npos;
    for (const std::string& written : {compact, pretty}) {
        json::Value again;
        if (!json::parse(written, again, options) || json::serialize(again) != compact ||
            json::pretty_print(again) != pretty || (!infinite && again != document)) {
            std::abort();
        }
    }
    return 0;
}
