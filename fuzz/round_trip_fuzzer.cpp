// Parses arbitrary bytes; whatever parses is written compact and pretty and parsed again: the
// Values must be equal and the text stable. A number beyond the range of double parses as an
// infinity, which is written as the string "Inf" or "-Inf": when the text holds such a string,
// only the text must be stable.
#include <json/json.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    json::Value document;
    if (json::parse(std::string_view(reinterpret_cast<const char*>(data), size), document) !=
        json::ParseResult::SUCCESS) {
        return 0;
    }
    const std::string compact = json::serialize(document);
    const std::string pretty = json::pretty_print(document);
    const bool infinite = compact.find("Inf\"") != std::string::npos;
    for (const std::string& text : {compact, pretty}) {
        json::Value again;
        if (json::parse(text, again) != json::ParseResult::SUCCESS ||
            json::serialize(again) != compact || json::pretty_print(again) != pretty ||
            (!infinite && again != document)) {
            std::abort();
        }
    }
    return 0;
}
