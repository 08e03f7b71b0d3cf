#ifndef JSON_SRC_OUTPUT_BUFFER_HPP
#define JSON_SRC_OUTPUT_BUFFER_HPP

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <ostream>
#include <string>

namespace json::detail {

/// Where the writer's text goes: a caller's stream, or straight into a string.
///
/// Stream: the text is gathered and handed to the stream with one write() per buffer full.
/// Going through the stream's public functions keeps all of its own behaviour: a stream that
/// has gone bad receives nothing, a short write sets badbit, the exceptions the caller enabled
/// are thrown. Each newline is widened by the stream and flushed, as std::endl does, and \u
/// escapes use the stream's own number formatting.
///
/// String: for json::serialize and json::pretty_print, whose stream nobody else sees. The text
/// is what a std::ostringstream in its default state would hold: newlines widened by the
/// global locale, escapes as its default formatting writes them; flushing such a stream does
/// nothing, so nothing is flushed.
class OutputBuffer {
  public:
    explicit OutputBuffer(std::ostream& out) : out(&out), text(nullptr) {}
    explicit OutputBuffer(std::string& text)
        : out(nullptr), text(&text), widened_newline_known(true),
          widened_newline(std::use_facet<std::ctype<char>>(std::locale()).widen('\n')) {}
    OutputBuffer(const OutputBuffer&) = delete;
    OutputBuffer& operator=(const OutputBuffer&) = delete;

    void append(const char* bytes, std::size_t count) {
        if (count > CAPACITY - used) {
            flush();
            if (count >= CAPACITY) {
                deliver(bytes, count);
                return;
            }
        }
        std::memcpy(data + used, bytes, count);
        used += count;
    }

    void put(char c) {
        if (used == CAPACITY) {
            flush();
        }
        data[used++] = c;
    }

    /// `count` copies of `c`, filled straight into the buffer a piece at a time.
    void fill(char c, std::size_t count) {
        while (count != 0) {
            if (used == CAPACITY) {
                flush();
            }
            const std::size_t piece = std::min(count, CAPACITY - used);
            std::memset(data + used, c, piece);
            used += piece;
            count -= piece;
        }
    }

    /// Room for at least `count` bytes (at most CAPACITY), flushing first when needed; the
    /// bytes written there count once commit() is given the end of them.
    char* reserve(std::size_t count) {
        if (count > CAPACITY - used) {
            flush();
        }
        return data + used;
    }

    void commit(const char* end) { used = static_cast<std::size_t>(end - data); }

    /// A widened newline, then a flush, with every byte before it delivered.
    void new_line();

    /// "\u" and the byte as four hexadecimal digits.
    void unicode_escape(unsigned char byte);

    /// Hands everything buffered on.
    void flush() {
        if (used != 0) {
            deliver(data, used);
            used = 0;
        }
    }

    static constexpr std::size_t CAPACITY = std::size_t{16} * 1024;

  private:
    void deliver(const char* bytes, std::size_t count) {
        if (out != nullptr) {
            out->write(bytes, static_cast<std::streamsize>(count));
        } else {
            text->append(bytes, count);
        }
    }

    std::ostream* out;
    std::string* text;
    bool widened_newline_known = false;
    char widened_newline = '\n';
    std::size_t used = 0;
    char data[CAPACITY];
};

} // namespace json::detail

#endif
