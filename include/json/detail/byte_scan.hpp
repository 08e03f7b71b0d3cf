#ifndef JSON_DETAIL_BYTE_SCAN_HPP
#define JSON_DETAIL_BYTE_SCAN_HPP

// Byte scans: the bytes of a string that need attention (shared by the writer and the parser),
// the whitespace between the parser's tokens and the digits of its numbers.

#include <cstddef>
#include <cstdint>
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

namespace json::detail {

/// Whether `byte` needs attention inside a JSON string: a control character (below 0x20),
/// '"' or '\\', also '/' when `WithSlash` (the writer escapes it; the parser keeps it), and
/// also every byte from 0x80 up when `WithHigh` (where UTF-8 is checked or escaped).
template <bool WithSlash, bool WithHigh = false>
constexpr bool is_special_byte(unsigned char byte) {
    return byte < 0x20 || byte == '"' || byte == '\\' || (WithSlash && byte == '/') ||
           (WithHigh && byte >= 0x80);
}

#if defined(__SSE2__)
/// Bit i is set when byte i of `bytes` needs attention (see is_special_byte).
template <bool WithSlash, bool WithHigh = false>
inline int special_bytes_in(__m128i bytes) noexcept {
    // Unsigned min(byte, 0x1F) == byte exactly for the bytes below 0x20.
    const __m128i control = _mm_cmpeq_epi8(_mm_min_epu8(bytes, _mm_set1_epi8(0x1F)), bytes);
    // Without the slash, its comparison repeats the quote's: one shape for both scans.
    const __m128i special =
        _mm_or_si128(_mm_cmpeq_epi8(bytes, _mm_set1_epi8('"')),
                     _mm_or_si128(_mm_cmpeq_epi8(bytes, _mm_set1_epi8(WithSlash ? '/' : '"')),
                                  _mm_cmpeq_epi8(bytes, _mm_set1_epi8('\\'))));
    const int hits = _mm_movemask_epi8(_mm_or_si128(control, special));
    // The sign bit of each byte is the byte's own high bit.
    return WithHigh ? hits | _mm_movemask_epi8(bytes) : hits;
}

/// Bit i is set when byte i of the sixteen at `from` needs attention (see is_special_byte).
template <bool WithSlash, bool WithHigh = false>
inline int special_bytes_of_16(const char* from) noexcept {
    return special_bytes_in<WithSlash, WithHigh>(
        _mm_loadu_si128(reinterpret_cast<const __m128i*>(from)));
}
#endif

/// The first byte in [from, end) for which is_special_byte holds, or `end`. Linear; sixteen
/// bytes at a time with SSE2 where the compiler targets it (every x86-64 processor, so no
/// run-time dispatch) and the range has sixteen, else eight at a time, then one by one. Reads
/// nothing outside [from, end). Throws nothing.
template <bool WithSlash, bool WithHigh = false>
inline const char* find_special_byte(const char* from, const char* end) noexcept {
#if defined(__SSE2__)
    if (end - from >= 16) {
        const char* const last_block = end - 16;
        while (from < last_block) {
            const int hits = special_bytes_of_16<WithSlash, WithHigh>(from);
            if (hits != 0) {
                return from + __builtin_ctz(static_cast<unsigned>(hits));
            }
            from += 16;
        }
        // The last sixteen bytes of the range, instead of a byte loop over the rest: those
        // of them scanned already (fewer than sixteen) had nothing, so the first hit is new.
        const int hits = special_bytes_of_16<WithSlash, WithHigh>(last_block);
        return hits != 0 ? last_block + __builtin_ctz(static_cast<unsigned>(hits)) : end;
    }
#endif
    // Eight bytes as one word: the bit tricks are exact for "some byte matches" (they only
    // blur which one), which is all that is asked of them here.
    constexpr std::uint64_t ones = 0x0101010101010101;
    constexpr std::uint64_t highs = 0x8080808080808080;
    const auto has_zero_byte = [](std::uint64_t v) { return (v - ones) & ~v & highs; };
    const auto has_special = [&](std::uint64_t word) {
        const std::uint64_t below_space = (word - ones * 0x20) & ~word & highs;
        const std::uint64_t slash = WithSlash ? has_zero_byte(word ^ (ones * '/')) : 0;
        const std::uint64_t high = WithHigh ? word & highs : 0;
        return (below_space | slash | high | has_zero_byte(word ^ (ones * '"')) |
                has_zero_byte(word ^ (ones * '\\'))) != 0;
    };
    std::uint64_t word = 0;
    while (end - from >= 8 && (std::memcpy(&word, from, 8), !has_special(word))) {
        from += 8;
    }
    while (from != end &&
           !is_special_byte<WithSlash, WithHigh>(static_cast<unsigned char>(*from))) {
        ++from;
    }
    return from;
}

/// Whether none of the `count` bytes at `from` needs attention, where `count` is below 16 and
/// sixteen bytes are readable at `from` (as in any std::string whose capacity is at least 15:
/// the bytes past its size are read but play no part). One comparison for a short string
/// instead of a loop. Throws nothing.
template <bool WithSlash, bool WithHigh = false>
inline bool short_run_is_plain(const char* from, std::size_t count) noexcept {
#if defined(__SSE2__)
    return (special_bytes_of_16<WithSlash, WithHigh>(from) & ((1 << count) - 1)) == 0;
#else
    return find_special_byte<WithSlash, WithHigh>(from, from + count) == from + count;
#endif
}

/// Whether `byte` is JSON whitespace: space, tab, line feed or carriage return.
constexpr bool is_whitespace(char byte) {
    return byte == ' ' || byte == '\n' || byte == '\r' || byte == '\t';
}

/// The first byte in [from, end) that is not JSON whitespace, or `end`. Linear; sixteen bytes
/// at a time with SSE2 (indented documents have long runs of spaces). Throws nothing.
inline const char* skip_whitespace(const char* from, const char* end) noexcept {
#if defined(__SSE2__)
    while (end - from >= 16) {
        const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(from));
        const __m128i blank =
            _mm_or_si128(_mm_or_si128(_mm_cmpeq_epi8(bytes, _mm_set1_epi8(' ')),
                                      _mm_cmpeq_epi8(bytes, _mm_set1_epi8('\n'))),
                         _mm_or_si128(_mm_cmpeq_epi8(bytes, _mm_set1_epi8('\r')),
                                      _mm_cmpeq_epi8(bytes, _mm_set1_epi8('\t'))));
        const unsigned others = ~static_cast<unsigned>(_mm_movemask_epi8(blank)) & 0xFFFFU;
        if (others != 0) {
            return from + __builtin_ctz(others);
        }
        from += 16;
    }
#endif
    while (from != end && is_whitespace(*from)) {
        ++from;
    }
    return from;
}

/// The first byte in [from, end) that is not a decimal digit, or `end`. Linear; sixteen bytes at
/// a time with SSE2 (a coordinate has seventeen digits). Throws nothing.
inline const char* skip_digits(const char* from, const char* end) noexcept {
#if defined(__SSE2__)
    while (end - from >= 16) {
        const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(from));
        // A digit's distance above '0', wrapping, is at most 9 exactly for the ten digits.
        const __m128i above_zero = _mm_sub_epi8(bytes, _mm_set1_epi8('0'));
        const __m128i digit =
            _mm_cmpeq_epi8(_mm_min_epu8(above_zero, _mm_set1_epi8(9)), above_zero);
        const unsigned others = ~static_cast<unsigned>(_mm_movemask_epi8(digit)) & 0xFFFFU;
        if (others != 0) {
            return from + __builtin_ctz(others);
        }
        from += 16;
    }
#endif
    while (from != end && *from >= '0' && *from <= '9') {
        ++from;
    }
    return from;
}

} // namespace json::detail

#endif
