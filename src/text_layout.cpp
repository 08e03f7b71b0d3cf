#include "text_layout.hpp"

#include "number.hpp"

#include <json/detail/utf8.hpp>

#include <array>
#include <cmath>
#include <limits>
#include <stdexcept>
#include <string>
#include <type_traits>

namespace json::detail {

namespace {

// For each byte: 0 when it is written as it is, 'u' for a \u escape, otherwise the letter that
// follows the backslash of its two-character escape. The slash is in the table, and only
// reaches it when it is to be escaped.
constexpr std::array<char, 256> make_escape_table() {
    std::array<char, 256> table{};
    for (int byte = 0; byte < 0x20; ++byte) {
        table[byte] = 'u';
    }
    table['\b'] = 'b';
    table['\t'] = 't';
    table['\n'] = 'n';
    table['\f'] = 'f';
    table['\r'] = 'r';
    table['"'] = '"';
    table['/'] = '/';
    table['\\'] = '\\';
    return table;
}

constexpr std::array<char, 256> ESCAPES = make_escape_table();

[[noreturn]] void throw_ill_formed(std::size_t offset) {
    throw std::invalid_argument("json: byte " + std::to_string(offset) +
                                " of a string is not well-formed UTF-8, which ASCII-only text "
                                "cannot write");
}

#if defined(__SSE2__)
// Whether no byte of the two eight-byte pieces needs an escape.
template <bool EscapeSlash, bool EscapeHigh>
bool pieces_are_plain(std::uint64_t head, std::uint64_t tail) {
    const __m128i bytes =
        _mm_set_epi64x(static_cast<long long>(tail), static_cast<long long>(head));
    return special_bytes_in<EscapeSlash, EscapeHigh>(bytes) == 0;
}
#endif

} // namespace

TextLayout::TextLayout(OutputBuffer& buffer, const WriteOptions& options)
    : buffer(buffer), pretty(options.pretty), pad_empty(options.pad_empty_containers),
      blank(options.indent_with_tab ? '\t' : ' '),
      indent_width(options.indent_with_tab ? 1 : options.indent),
      escapes(options.escape_slash ? (options.ascii_only ? Escapes::slash_and_high : Escapes::slash)
                                   : (options.ascii_only ? Escapes::high : Escapes::none)),
      colon{':', ' '}, colon_size(options.space_after_colon ? 2 : 1),
      reject_non_finite(options.reject_non_finite) {}

// Calls `write` with the escape set as two std::bool_constant arguments: the slash, and the
// bytes from 0x80 up.
template <typename Write>
void TextLayout::with_escapes(Write&& write) {
    switch (escapes) {
    case Escapes::slash:
        write(std::true_type(), std::false_type());
        break;
    case Escapes::slash_and_high:
        write(std::true_type(), std::true_type());
        break;
    case Escapes::none:
        write(std::false_type(), std::false_type());
        break;
    case Escapes::high:
        write(std::false_type(), std::true_type());
        break;
    }
}

void TextLayout::quoted_with_other_escapes(const std::string& text, std::size_t colon_count) {
    with_escapes([&](auto slash, auto high) {
        quoted<decltype(slash)::value, decltype(high)::value>(text, colon_count);
    });
}

void TextLayout::quoted_in_bounds(std::string_view text, std::size_t colon_count) {
    with_escapes([&](auto slash, auto high) {
        constexpr bool escape_slash = decltype(slash)::value;
        constexpr bool escape_high = decltype(high)::value;
        if (text.size() >= SHORT_SIZE ||
            !quoted_short_in_bounds<escape_slash, escape_high>(text, colon_count)) {
            escaped<escape_slash, escape_high>(text, colon_count);
        }
    });
}

// Its bytes
// are loaded and stored as two pieces that overlap (eight bytes each from eight on, four
// from four on, else the first, middle and last byte), which together cover every byte, so
// the check sees the string's bytes only and no call to memcpy is made for a few bytes.
template <bool EscapeSlash, bool EscapeHigh>
bool TextLayout::quoted_short_in_bounds(std::string_view text, std::size_t colon_count) {
#if defined(__SSE2__)
    const char* const from = text.data();
    const std::size_t size = text.size();
    if (size >= 8) {
        std::uint64_t head = 0;
        std::uint64_t tail = 0;
        std::memcpy(&head, from, 8);
        std::memcpy(&tail, from + size - 8, 8);
        if (!pieces_are_plain<EscapeSlash, EscapeHigh>(head, tail)) {
            return false;
        }
        char* const out = start_short();
        std::memcpy(out + 1, &head, 8);
        std::memcpy(out + 1 + size - 8, &tail, 8);
        end_short(out, size, colon_count);
    } else if (size >= 4) {
        std::uint32_t head = 0;
        std::uint32_t tail = 0;
        std::memcpy(&head, from, 4);
        std::memcpy(&tail, from + size - 4, 4);
        const std::uint64_t both = head | std::uint64_t{tail} << 32U;
        if (!pieces_are_plain<EscapeSlash, EscapeHigh>(both, both)) {
            return false;
        }
        char* const out = start_short();
        std::memcpy(out + 1, &head, 4);
        std::memcpy(out + 1 + size - 4, &tail, 4);
        end_short(out, size, colon_count);
    } else if (size != 0) {
        const char first = from[0];
        const char middle = from[size / 2];
        const char last = from[size - 1];
        const auto lane = [](char c) { return std::uint64_t{static_cast<unsigned char>(c)}; };
        // The first byte in every lane but the second and third: the middle and the last.
        const std::uint64_t all = (lane(first) * 0x0101010101010101U & ~std::uint64_t{0xFFFF00}) |
                                  lane(middle) << 8U | lane(last) << 16U;
        if (!pieces_are_plain<EscapeSlash, EscapeHigh>(all, all)) {
            return false;
        }
        char* const out = start_short();
        out[1] = first;
        out[1 + size / 2] = middle;
        out[size] = last;
        end_short(out, size, colon_count);
    } else {
        return false;
    }
    return true;
#else
    static_cast<void>(text);
    static_cast<void>(colon_count);
    return false;
#endif
}

template <bool EscapeSlash, bool EscapeHigh>
void TextLayout::escaped(std::string_view text, std::size_t colon_count) {
    buffer.put('"');
    const char* run = text.data();
    const char* const end = run + text.size();
    for (;;) {
        // Bytes that need no escape go out as one run.
        const char* const byte = find_special_byte<EscapeSlash, EscapeHigh>(run, end);
        buffer.append(run, static_cast<std::size_t>(byte - run));
        if (byte == end) {
            break;
        }
        const auto code = static_cast<unsigned char>(*byte);
        if (EscapeHigh && code >= 0x80) {
            const std::size_t length = utf8_sequence_length(byte, end);
            if (length == 0) {
                throw_ill_formed(static_cast<std::size_t>(byte - text.data()));
            }
            const char32_t character = decode_utf8(byte, length);
            if (character > 0xFFFF) {
                // UTF-16's surrogate pair: the 20 bits above U+10000, ten in each half.
                const char32_t above = character - 0x10000;
                buffer.unicode_escape(static_cast<char16_t>(0xD800 + (above >> 10U)));
                buffer.unicode_escape(static_cast<char16_t>(0xDC00 + (above & 0x3FFU)));
            } else {
                buffer.unicode_escape(static_cast<char16_t>(character));
            }
            run = byte + length;
            continue;
        }
        const char escape = ESCAPES[code];
        if (escape == 'u') {
            buffer.unicode_escape(code);
        } else {
            const char pair[2] = {'\\', escape};
            buffer.append(pair, 2);
        }
        run = byte + 1;
    }
    buffer.put('"');
    if (colon_count != 0) {
        char* const out = buffer.reserve(sizeof colon);
        std::memcpy(out, colon, sizeof colon);
        buffer.commit(out + colon_count);
    }
}

template void TextLayout::escaped<true, false>(std::string_view, std::size_t);
template void TextLayout::escaped<true, true>(std::string_view, std::size_t);
template void TextLayout::escaped<false, false>(std::string_view, std::size_t);
template void TextLayout::escaped<false, true>(std::string_view, std::size_t);

void TextLayout::number(double number) {
    formatted_number(number);
}

void TextLayout::number(float number) {
    formatted_number(number);
}

void TextLayout::check_finite(double number) const {
    if (reject_non_finite && !std::isfinite(number)) {
        throw std::invalid_argument(std::string("json: ") +
                                    (std::isnan(number) ? "NaN"
                                     : number > 0       ? "Inf"
                                                        : "-Inf") +
                                    " has no JSON number, and WriteOptions::reject_non_finite "
                                    "refuses to write it as a string");
    }
}

// NaN and the infinities are written as strings; every finite number's text is written
// straight into the buffer.
template <typename Number>
void TextLayout::formatted_number(Number number) {
    check_finite(number);
    if (std::isnan(number)) {
        buffer.append("\"NaN\"", 5);
    } else if (number > std::numeric_limits<Number>::max()) {
        buffer.append("\"Inf\"", 5);
    } else if (number < -std::numeric_limits<Number>::max()) {
        buffer.append("\"-Inf\"", 6);
    } else {
        char* const text = buffer.reserve(NUMBER_TEXT_SIZE);
        buffer.commit(write_number(text, number));
    }
}

} // namespace json::detail
