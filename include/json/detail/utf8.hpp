#ifndef JSON_DETAIL_UTF8_HPP
#define JSON_DETAIL_UTF8_HPP

// Well-formed UTF-8: the byte sequences of Unicode's table of well-formed sequences (no
// overlong forms, no encoded surrogates, nothing above U+10FFFF, nothing cut short). Shared by
// the parser, which refuses anything else in strings, and the writer, which decodes
// characters to escape them.

#include <json/detail/byte_scan.hpp>

#include <cstddef>
#include <string_view>

namespace json::detail {

/// The length, 1 to 4, of the well-formed UTF-8 sequence that starts at `from`, or 0 when the
/// bytes there start none (an ill-formed lead or continuation byte, or a sequence that `end`
/// cuts short). `from` must be before `end`. Reads only [from, end). Throws nothing.
inline std::size_t utf8_sequence_length(const char* from, const char* end) noexcept {
    const auto byte = [from](std::size_t at) { return static_cast<unsigned char>(from[at]); };
    const unsigned char lead = byte(0);
    if (lead < 0x80) {
        return 1;
    }
    // The lead byte fixes the length and the range of the second byte; every later byte is a
    // plain continuation byte (0x80 to 0xBF). The narrowed ranges after E0, ED, F0 and F4 are
    // what exclude overlong forms, surrogates and code points above U+10FFFF.
    std::size_t length = 0;
    unsigned char second_low = 0x80;
    unsigned char second_high = 0xBF;
    if (lead < 0xC2) {
        return 0; // a continuation byte, or the lead of an overlong two-byte form
    }
    if (lead < 0xE0) {
        length = 2;
    } else if (lead < 0xF0) {
        length = 3;
        second_low = lead == 0xE0 ? 0xA0 : 0x80;
        second_high = lead == 0xED ? 0x9F : 0xBF;
    } else if (lead < 0xF5) {
        length = 4;
        second_low = lead == 0xF0 ? 0x90 : 0x80;
        second_high = lead == 0xF4 ? 0x8F : 0xBF;
    } else {
        return 0;
    }
    if (static_cast<std::size_t>(end - from) < length || byte(1) < second_low ||
        byte(1) > second_high) {
        return 0;
    }
    for (std::size_t at = 2; at < length; ++at) {
        if ((byte(at) & 0xC0U) != 0x80U) {
            return 0;
        }
    }
    return length;
}

/// The code point of the well-formed sequence of `length` bytes at `from` (as
/// utf8_sequence_length measured it). Throws nothing.
inline char32_t decode_utf8(const char* from, std::size_t length) noexcept {
    static constexpr unsigned char LEAD_BITS[] = {0, 0x7F, 0x1F, 0x0F, 0x07};
    char32_t code_point = static_cast<unsigned char>(from[0]) & LEAD_BITS[length];
    for (std::size_t at = 1; at < length; ++at) {
        code_point = code_point << 6U | (static_cast<unsigned char>(from[at]) & 0x3FU);
    }
    return code_point;
}

/// The first byte in [from, end) that needs attention inside a JSON string (see
/// is_special_byte) or that is not part of a well-formed UTF-8 sequence, or `end`. ASCII runs
/// are scanned as find_special_byte scans them; each run of non-ASCII bytes is checked
/// sequence by sequence. Linear. Throws nothing.
template <bool WithSlash>
inline const char* find_special_or_ill_formed(const char* from, const char* end) noexcept {
    for (;;) {
        from = find_special_byte<WithSlash, true>(from, end);
        while (from != end && static_cast<unsigned char>(*from) >= 0x80) {
            // Most characters are two bytes (Latin, Greek, Cyrillic, Hebrew, Arabic) or three
            // bytes with a lead from E1 to EF other than ED (CJK and most other scripts), whose
            // later bytes are plain continuation bytes: those are checked in one step each.
            const auto lead = static_cast<unsigned char>(*from);
            if (lead >= 0xC2 && lead <= 0xDF && end - from >= 2) { // likewise two bytes
                if ((static_cast<unsigned char>(from[1]) & 0xC0U) != 0x80U) {
                    return from;
                }
                from += 2;
                continue;
            }
            if (lead >= 0xE1 && lead != 0xED && lead <= 0xEF && end - from >= 3) {
                const auto second = static_cast<unsigned char>(from[1]);
                const auto third = static_cast<unsigned char>(from[2]);
                if (((second & third) & 0xC0U) != 0x80U || ((second | third) & 0x40U) != 0) {
                    return from;
                }
                from += 3;
                continue;
            }
            const std::size_t length = utf8_sequence_length(from, end);
            if (length == 0) {
                return from;
            }
            from += length;
        }
        if (from == end || is_special_byte<WithSlash>(static_cast<unsigned char>(*from))) {
            return from;
        }
    }
}

/// The offset in `text` of the first byte that is not part of a well-formed UTF-8 sequence, or
/// std::string_view::npos when it is all well-formed. Linear. Throws nothing.
inline std::size_t ill_formed_offset(std::string_view text) noexcept {
    const char* const end = text.data() + text.size();
    for (const char* at = text.data(); at != end; ++at) {
        // Stops at a byte a string escapes, which is well-formed, or at an ill-formed one.
        at = find_special_or_ill_formed<false>(at, end);
        if (at == end) {
            break;
        }
        if (static_cast<unsigned char>(*at) >= 0x80) {
            return static_cast<std::size_t>(at - text.data());
        }
    }
    return std::string_view::npos;
}

} // namespace json::detail

#endif
