#include "codecvt_ustring_to_string.hpp"

#include <cerrno>
#include <iconv.h>
#include <stdexcept>
#include <strings.h>

namespace {

constexpr char32_t REPLACEMENT_CHARACTER = 0xFFFD;

bool is_high_surrogate(char16_t unit) {
    return unit >= 0xD800 && unit <= 0xDBFF;
}
bool is_low_surrogate(char16_t unit) {
    return unit >= 0xDC00 && unit <= 0xDFFF;
}

bool names_utf8(const std::string& encoding) {
    return strcasecmp(encoding.c_str(), "UTF-8") == 0 || strcasecmp(encoding.c_str(), "UTF8") == 0;
}

// Calls `emit` with each code point of the UTF-16 text; an unpaired surrogate is U+FFFD or an
// error, as the converter was asked.
template <typename Emit>
void for_each_code_point(const char16_t* text, std::size_t count, bool replace_malformed,
                         Emit emit) {
    for (std::size_t i = 0; i < count; ++i) {
        const char16_t unit = text[i];
        if (is_high_surrogate(unit) && i + 1 < count && is_low_surrogate(text[i + 1])) {
            emit(0x10000 + ((char32_t(unit) - 0xD800) << 10) + (char32_t(text[i + 1]) - 0xDC00));
            ++i;
        } else if (is_high_surrogate(unit) || is_low_surrogate(unit)) {
            if (!replace_malformed) {
                throw std::range_error("codecvt_ustring_to_string: unpaired UTF-16 surrogate");
            }
            emit(REPLACEMENT_CHARACTER);
        } else {
            emit(char32_t(unit));
        }
    }
}

void append_utf8(std::string& out, char32_t code_point) {
    if (code_point < 0x80) {
        out += static_cast<char>(code_point);
    } else if (code_point < 0x800) {
        out += static_cast<char>(0xC0 | (code_point >> 6));
        out += static_cast<char>(0x80 | (code_point & 0x3F));
    } else if (code_point < 0x10000) {
        out += static_cast<char>(0xE0 | (code_point >> 12));
        out += static_cast<char>(0x80 | ((code_point >> 6) & 0x3F));
        out += static_cast<char>(0x80 | (code_point & 0x3F));
    } else {
        out += static_cast<char>(0xF0 | (code_point >> 18));
        out += static_cast<char>(0x80 | ((code_point >> 12) & 0x3F));
        out += static_cast<char>(0x80 | ((code_point >> 6) & 0x3F));
        out += static_cast<char>(0x80 | (code_point & 0x3F));
    }
}

// Well-formed UTF-16: unpaired surrogates replaced (or rejected) before iconv sees the text.
std::u16string well_formed(const char16_t* text, std::size_t count, bool replace_malformed) {
    std::u16string units;
    units.reserve(count);
    for_each_code_point(text, count, replace_malformed, [&units](char32_t code_point) {
        if (code_point < 0x10000) {
            units += static_cast<char16_t>(code_point);
        } else {
            units += static_cast<char16_t>(0xD800 + ((code_point - 0x10000) >> 10));
            units += static_cast<char16_t>(0xDC00 + ((code_point - 0x10000) & 0x3FF));
        }
    });
    return units;
}

} // namespace

codecvt_ustring_to_string::codecvt_ustring_to_string(const std::string& encoding,
                                                     bool replace_malformed)
    : encoding(encoding), replace_malformed(replace_malformed), iconv_descriptor(nullptr) {
    if (names_utf8(encoding)) {
        return;
    }
    const iconv_t descriptor = iconv_open(encoding.c_str(), "UTF-16LE");
    // iconv_open's documented failure value.
    if (descriptor == reinterpret_cast<iconv_t>(-1)) { // NOLINT(performance-no-int-to-ptr)
        throw std::invalid_argument("codecvt_ustring_to_string: unknown encoding \"" + encoding +
                                    "\"");
    }
    iconv_descriptor = descriptor;
}

codecvt_ustring_to_string::~codecvt_ustring_to_string() {
    if (iconv_descriptor != nullptr) {
        iconv_close(static_cast<iconv_t>(iconv_descriptor));
    }
}

std::string codecvt_ustring_to_string::do_convert(const char16_t* text, std::size_t count) const {
    std::string out;
    if (iconv_descriptor == nullptr) {
        out.reserve(count);
        for_each_code_point(text, count, replace_malformed,
                            [&out](char32_t code_point) { append_utf8(out, code_point); });
        return out;
    }
    std::u16string units = well_formed(text, count, replace_malformed);
    const iconv_t descriptor = static_cast<iconv_t>(iconv_descriptor);
    iconv(descriptor, nullptr, nullptr, nullptr, nullptr); // a fresh conversion state
    char* input = reinterpret_cast<char*>(units.data());
    std::size_t input_left = units.size() * sizeof(char16_t);
    char buffer[4096];
    bool flushed = false;
    while (!flushed) {
        char* output = buffer;
        std::size_t output_left = sizeof buffer;
        // Once the input is used up, a call without input ends any shift state.
        const std::size_t result =
            input_left > 0 ? iconv(descriptor, &input, &input_left, &output, &output_left)
                           : iconv(descriptor, nullptr, nullptr, &output, &output_left);
        out.append(buffer, static_cast<std::size_t>(output - buffer));
        if (result == static_cast<std::size_t>(-1) && errno != E2BIG) {
            throw std::range_error("codecvt_ustring_to_string: text not representable in \"" +
                                   encoding + "\"");
        }
        flushed = input_left == 0 && result != static_cast<std::size_t>(-1);
    }
    return out;
}
