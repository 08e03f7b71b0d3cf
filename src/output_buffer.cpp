#include "output_buffer.hpp"

namespace json::detail {

void OutputBuffer::new_line_in_pieces(std::size_t indent, char blank) {
    if (!widened_newline_known) {
        if (formatted) {
            // widen() throws std::bad_cast for a locale without std::ctype<char>: the text so
            // far must be on the stream by then.
            flush();
            widened_newline = out->widen('\n');
        } else {
            widened_newline = default_newline();
        }
        widened_newline_known = true; // its answer is reused for every later newline
    }
    put(widened_newline);
    if (formatted) {
        flush();
        out->flush();
    }
    fill(blank, indent);
}

// On a formatted stream: \u, then the digits from the stream's own formatting, with its flags
// restored afterwards and its fill character left at '0'. Elsewhere: what a default stream
// writes.
void OutputBuffer::unicode_escape(char16_t unit) {
    if (!formatted) {
        static constexpr char HEX[] = "0123456789abcdef";
        const char escape[6] = {'\\',
                                'u',
                                HEX[unit >> 12U],
                                HEX[(unit >> 8U) & 0xFU],
                                HEX[(unit >> 4U) & 0xFU],
                                HEX[unit & 0xFU]};
        append(escape, sizeof escape);
        return;
    }
    const std::ios_base::fmtflags saved = out->flags();
    append("\\u", 2);
    flush();
    out->width(4);
    out->fill('0');
    out->setf(std::ios_base::hex, std::ios_base::basefield);
    *out << static_cast<int>(unit);
    out->flags(saved);
}

} // namespace json::detail
