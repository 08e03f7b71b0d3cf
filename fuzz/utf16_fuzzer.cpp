// Decodes arbitrary bytes as UTF-16 code units: the result must be the UTF-8 of the same
// characters, a surrogate pair becoming one character and an unpaired surrogate U+FFFD. The
// UTF-8 is read back by the C library's strict decoder of the C.UTF-8 locale.
#include <json/text_conversion.hpp>

#include <clocale>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static const bool utf8_locale = std::setlocale(LC_ALL, "C.UTF-8") != nullptr;
    std::vector<char16_t> units(size / 2 + 1);
    std::memcpy(units.data(), data, size / 2 * 2);
    units.pop_back();
    const std::string text = json::detail::u16_to_u8(units.data(), static_cast<int>(units.size()));
    std::mbstate_t state{};
    std::size_t at = 0;
    for (std::size_t i = 0; i < units.size(); ++i) {
        char32_t expected = units[i];
        if (expected >= 0xD800 && expected <= 0xDFFF) {
            const bool pair = expected < 0xDC00 && i + 1 < units.size() && units[i + 1] >= 0xDC00 &&
                              units[i + 1] <= 0xDFFF;
            expected =
                pair ? 0x10000 + ((expected - 0xD800) << 10) + (units[++i] - 0xDC00) : 0xFFFD;
        }
        wchar_t decoded = 0;
        const std::size_t length =
            std::mbrtowc(&decoded, text.data() + at, text.size() - at, &state);
        if (!utf8_locale || length > 4 || static_cast<char32_t>(decoded) != expected) {
            std::abort();
        }
        at += length == 0 ? 1 : length; // 0: the character U+0000, one byte
    }
    if (at != text.size()) {
        std::abort();
    }
    return 0;
}
