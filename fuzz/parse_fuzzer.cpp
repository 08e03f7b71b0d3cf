// Parses arbitrary bytes: any input must end in a result code, without a crash, a leak or a
// sanitizer report; a failure must leave `out` as it was and report a place inside the text.
#include <json/json.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    json::Value out = "previous";
    const json::ParseReport report =
        json::parse(std::string_view(reinterpret_cast<const char*>(data), size), out, {});
    if (!report && (out != json::Value("previous") || report.offset > size || report.line == 0 ||
                    report.column == 0)) {
        std::abort();
    }
    return 0;
}
