#ifndef JSON_SRC_TEXT_LAYOUT_HPP
#define JSON_SRC_TEXT_LAYOUT_HPP

#include "output_buffer.hpp"

#include <json/detail/byte_scan.hpp>
#include <json/serializer.hpp>

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

namespace json::detail {

/// How JSON text looks under a set of WriteOptions, for every writer of the library: what goes
/// between values (commas, line breaks, indentation, the colon after a member name), how an
/// empty container is written, and how strings and numbers are written and escaped. The
/// writers decide what comes next (a walk over a Value, or a json::Writer's events); this
/// decides how it looks, so that both give the same text.
///
/// Levels count the containers a value is inside: the top-level value is at level 0, the
/// contents of a container at level L are at level L + 1.
class TextLayout {
  public:
    TextLayout(OutputBuffer& buffer, const WriteOptions& options);

    void null() { buffer.append("null", 4); }
    void boolean(bool value) {
        if (value) {
            buffer.append("true", 4);
        } else {
            buffer.append("false", 5);
        }
    }
    /// The number's shortest text; NaN and the infinities as the strings "NaN", "Inf", "-Inf",
    /// or refused as check_finite() refuses them with WriteOptions::reject_non_finite.
    void number(double number);
    void number(float number);
    /// Throws std::invalid_argument when the options refuse NaN and the infinities and
    /// `number` is one of them.
    void check_finite(double number) const;
    /// A number's text as it is (the caller has checked that it is one).
    void number_text(std::string_view text) { buffer.append(text.data(), text.size()); }

    /// `text` quoted and escaped. Throws std::invalid_argument, after writing part of the
    /// string, when the text must be ASCII and `text` is not well-formed UTF-8.
    void string(const std::string& text) { quoted(text, 0); }
    /// The same for text of which nothing past its end may be read.
    void string(std::string_view text) { quoted_in_bounds(text, 0); }
    /// A member name as string() writes it, and its colon.
    void member_name(const std::string& name) { quoted(name, colon_size); }
    void member_name(std::string_view name) { quoted_in_bounds(name, colon_size); }
    /// Whether the text must be ASCII, so that a string that is not well-formed UTF-8 cannot
    /// be written.
    bool ascii_only() const {
        return escapes == Escapes::slash_and_high || escapes == Escapes::high;
    }

    /// The opening bracket of a container: '[' or '{'.
    void open(char bracket) { buffer.put(bracket); }
    /// What comes before an element or a member of a container at `level`: a comma unless it
    /// is the first, and in pretty text a line break and the indentation of level + 1.
    void start_entry(bool first, std::size_t level) {
        if (!first) {
            buffer.put(',');
        }
        if (pretty) {
            buffer.new_line(indent_width * (level + 1), blank);
        }
    }
    /// The end of a container at `level` (']' or '}'), `empty` when nothing was written in it.
    void close(char bracket, bool empty, std::size_t level) {
        if (pretty) {
            if (!empty) {
                buffer.new_line(indent_width * level, blank);
            } else if (pad_empty) {
                buffer.fill(blank, indent_width * level);
            }
        }
        buffer.put(bracket);
    }
    /// An empty container at `level`, its two brackets given, written whole: the text open()
    /// and close() would give.
    void empty_container(const char* brackets, std::size_t level) {
        if (pretty) {
            open(brackets[0]);
            close(brackets[1], true, level);
        } else {
            buffer.append(brackets, 2);
        }
    }

  private:
    // Which bytes a string's escapes cover besides the quote, the backslash and the control
    // characters: the slash, and every byte from 0x80 up when the text must be ASCII.
    enum class Escapes { slash, slash_and_high, none, high };

    // The quoted string, then the first `colon_count` bytes of the colon (0 for a string). The
    // library's own escapes are dispatched to inline; the other sets out of line.
    void quoted(const std::string& text, std::size_t colon_count) {
        if (escapes == Escapes::slash) {
            quoted<true, false>(text, colon_count);
        } else {
            quoted_with_other_escapes(text, colon_count);
        }
    }

    void quoted_with_other_escapes(const std::string& text, std::size_t colon_count);

    static constexpr std::size_t SHORT_SIZE = 16;

    template <bool EscapeSlash, bool EscapeHigh>
    void quoted(const std::string& text, std::size_t colon_count) {
        // Most keys and many values: a short string with nothing to escape. A std::string holds
        // at least sixteen readable bytes (its capacity and the NUL) from a capacity of fifteen
        // on; all sixteen are copied at once and only the string's own are kept.
        if (text.size() < SHORT_SIZE && text.capacity() >= SHORT_SIZE - 1 &&
            short_run_is_plain<EscapeSlash, EscapeHigh>(text.data(), text.size())) {
            char* const out = start_short();
            std::memcpy(out + 1, text.data(), SHORT_SIZE);
            end_short(out, text.size(), colon_count);
            return;
        }
        // Out of line, so that the path above stays small enough to be inlined.
        escaped<EscapeSlash, EscapeHigh>(text, colon_count);
    }

    // quoted() for text of which nothing past its end may be read.
    void quoted_in_bounds(std::string_view text, std::size_t colon_count);

    // Room for a short string's quotes and colon, its opening quote written.
    char* start_short() {
        char* const out = buffer.reserve(SHORT_SIZE + 4);
        out[0] = '"';
        return out;
    }

    // The closing quote after a short string written at out + 1; both bytes of the colon are
    // copied, and a member name keeps its own.
    void end_short(char* out, std::size_t size, std::size_t colon_count) {
        out[1 + size] = '"';
        std::memcpy(out + 2 + size, colon, sizeof colon);
        buffer.commit(out + 2 + size + colon_count);
    }

    // A string of one to fifteen bytes of which no more may be read, written whole when nothing
    // in it needs an escape; otherwise (or when empty) false, with nothing written.
    template <bool EscapeSlash, bool EscapeHigh>
    bool quoted_short_in_bounds(std::string_view text, std::size_t colon_count);

    template <typename Write>
    void with_escapes(Write&& write);

    // quoted()'s general case: a string of any length, its escapes written out.
    template <bool EscapeSlash, bool EscapeHigh>
    void escaped(std::string_view text, std::size_t colon_count);

    template <typename Number>
    void formatted_number(Number number);

    OutputBuffer& buffer;
    bool pretty;
    bool pad_empty;
    char blank; // what indentation is made of: a space or a tab
    std::size_t indent_width;
    Escapes escapes;
    char colon[2];
    std::size_t colon_size;
    bool reject_non_finite;
};

} // namespace json::detail

#endif
