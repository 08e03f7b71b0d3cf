// Parses arbitrary bytes; whatever parses is written compact and pretty and parsed again: the
// Values must be equal and the text stable. (A number beyond the range of double parses as an
// infinity, which is written as the string "Inf": for such documents only the text must be
// stable.)
#include <json/json.hpp>

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>

namespace {

bool all_numbers_finite(const json::Value& value) {
    switch (value.which()) {
    case json::detail::DOUBLE_INDEX:
        return std::isfinite(boost::get<double>(value));
    case json::detail::ARRAY_INDEX:
        for (const json::Value& item : boost::get<json::Array>(value)) {
            if (!all_numbers_finite(item)) {
                return false;
            }
        }
        return true;
    case json::detail::OBJECT_INDEX:
        for (const auto& member : boost::get<json::Object>(value)) {
            if (!all_numbers_finite(member.second)) {
                return false;
            }
        }
        return true;
    default:
        return true;
    }
}

void check(bool condition) {
    if (!condition) {
        std::abort();
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    json::Value document;
    if (json::parse(std::string_view(reinterpret_cast<const char*>(data), size), document) !=
        json::ParseResult::SUCCESS) {
        return 0;
    }
    const std::string compact = json::serialize(document);
    const std::string pretty = json::pretty_print(document);
    json::Value from_compact;
    json::Value from_pretty;
    check(json::parse(compact, from_compact) == json::ParseResult::SUCCESS);
    check(json::parse(pretty, from_pretty) == json::ParseResult::SUCCESS);
    check(json::serialize(from_compact) == compact);
    check(json::serialize(from_pretty) == compact);
    check(json::pretty_print(from_compact) == pretty);
    if (all_numbers_finite(document)) {
        check(from_compact == document);
        check(from_pretty == document);
    }
    return 0;
}
