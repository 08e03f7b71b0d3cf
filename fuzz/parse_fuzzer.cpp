// Parses arbitrary bytes: any input must end in a result code, without a crash, a leak or a
// sanitizer report, and a failure must leave `out` as it was.
#include <json/json.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    json::Value out = "previous";
    const json::ParseReport report = json::parse(text, out, {});
    if (!report && out != json::Value("previous")) {
        std::abort();
    }
    if (!report && (report.offset > size || report.line == 0 || report.column == 0)) {
        std::abort();
    }
    return 0;
}
