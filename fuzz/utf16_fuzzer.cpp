// Decodes arbitrary bytes as UTF-16 code units: the result must be valid UTF-8 (shortest
// forms, no surrogates, nothing above U+10FFFF), whatever the input.
#include <json/parse.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

namespace {

bool valid_utf8(const std::string& text) {
    const auto* byte = reinterpret_cast<const unsigned char*>(text.data());
    const auto* const end = byte + text.size();
    while (byte != end) {
        const unsigned char lead = *byte;
        const int length = lead < 0x80           ? 1
                           : (lead >> 5) == 0x6  ? 2
                           : (lead >> 4) == 0xE  ? 3
                           : (lead >> 3) == 0x1E ? 4
                                                 : 0;
        if (length == 0 || end - byte < length) {
            return false;
        }
        std::uint32_t code_point = length == 1 ? lead : lead & (0x7F >> length);
        for (int i = 1; i < length; ++i) {
            if ((byte[i] & 0xC0) != 0x80) {
                return false;
            }
            code_point = (code_point << 6) | (byte[i] & 0x3F);
        }
        static const std::uint32_t smallest[] = {0, 0, 0x80, 0x800, 0x10000};
        if (code_point < smallest[length] || code_point > 0x10FFFF ||
            (code_point >= 0xD800 && code_point <= 0xDFFF)) {
            return false;
        }
        byte += length;
    }
    return true;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::vector<char16_t> units(size / 2);
    if (!units.empty()) {
        std::memcpy(units.data(), data, units.size() * 2);
    }
    const std::string text = json::detail::u16_to_u8(units.data(), static_cast<int>(units.size()));
    if (!valid_utf8(text) || (units.empty() != text.empty())) {
        std::abort();
    }
    return 0;
}
