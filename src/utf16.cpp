// UTF-16 to UTF-8 through the text-encoding library: the only caller of it.
#include <json/detail/utf16.hpp>
#include <json/text_conversion.hpp>

#include <codecvt_ustring_to_string.hpp>

#include <stdexcept>
#include <string>

namespace json::detail {

std::string u16_to_u8(char16_t* text, int count) {
    const std::string encoding = "UTF-8";
    const codecvt_ustring_to_string converter(encoding, true);
    // libstdc++ words this case differently and would check the size first: test it here.
    if (text == nullptr && count != 0) {
        throw std::logic_error("basic_string::_M_construct null not valid");
    }
    // A negative count, widened with its sign, exceeds max_size(): std::length_error.
    const std::u16string units =
        count == 0 ? std::u16string() : std::u16string(text, static_cast<std::size_t>(count));
    if (units.empty()) {
        return std::string();
    }
    return converter.do_convert(units.data(), units.size());
}

// To UTF-8, unpaired surrogates as U+FFFD, as u16_to_u8 converts.
class Utf16Decoder::Converter {
  public:
    void append(std::string& text, const char16_t* units, std::size_t count) const {
        text += to_utf8.do_convert(units, count);
    }

  private:
    codecvt_ustring_to_string to_utf8{"UTF-8", true};
};

Utf16Decoder::Utf16Decoder() noexcept = default;

Utf16Decoder::~Utf16Decoder() {
    delete converter;
}

void Utf16Decoder::append(std::string& text, const char16_t* units, std::size_t count) {
    if (converter == nullptr) {
        converter = new Converter();
    }
    converter->append(text, units, count);
}

} // namespace json::detail
