// Parses arbitrary bytes with options taken from the first byte. Whatever parses is written
// compact and pretty and parsed again with the same options: the Values must be equal and the
// text stable. A number beyond the range of double parses as an infinity (with allow_overflow and
// without exact numbers), which is written as the string "Inf" or "-Inf": when the text holds such
// a string (or what looks like one), only the text must be stable. Then the events of the compact
// text go to a json::Writer under several layouts: the Writer's text must be serialize's for the
// same layout, byte for byte, and where serialize refuses (a string ASCII-only text cannot hold)
// the Writer must refuse too.
#include "parse_options.hpp"

#include <json/json.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <stdexcept>
#include <string>

namespace {

// The text of `write`, or "refused" when it throws std::invalid_argument.
template <typename Write>
std::string text_of(Write write) {
    try {
        return write();
    } catch (const std::invalid_argument&) {
        return "refused";
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string_view text;
    const json::ParseOptions options = options_and_text(data, size, text);
    json::Value document;
    if (!json::parse(text, document, options)) {
        return 0;
    }
    // The compact text holds the document's events: members in key order, numbers shortest.
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
    json::ParseOptions lenient = options;
    lenient.allow_invalid_utf8 = true;
    json::WriteOptions indented;
    indented.pretty = true;
    json::WriteOptions ascii = json::COMMON_PRETTY;
    ascii.ascii_only = true;
    for (json::WriteOptions layout : {json::WriteOptions(), indented, json::COMMON_PRETTY, ascii}) {
        layout.allow_invalid_utf8 = true; // as serialize, which writes what it holds
        const std::string expected = text_of([&] { return json::serialize(document, layout); });
        const std::string written = text_of([&] {
            std::string out;
            json::Writer writer(out, layout);
            if (!json::parse_events(compact, writer, lenient) || !writer.complete()) {
                std::abort();
            }
            return out;
        });
        if (written != expected) {
            std::abort();
        }
    }
    return 0;
}
