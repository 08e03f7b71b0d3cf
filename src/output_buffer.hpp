#ifndef JSON_SRC_OUTPUT_BUFFER_HPP
#define JSON_SRC_OUTPUT_BUFFER_HPP

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <ostream>
#include <string>

namespace json::detail {

/// How text goes onto a caller's stream.
enum class StreamText {
    /// As Serializer::write puts it: each newline widened by the stream's locale and flushed,
    /// as std::endl does, and the digits of \u escapes in the stream's own number formatting.
    formatted,
    /// The bytes a string would receive, handed on only when the buffer is full or flushed.
    plain,
};

/// Where the writer's text goes: a caller's stream, or straight into a string.
///
/// Stream: the text is gathered and handed to the stream with one write() per buffer full.
/// Going through the stream's public functions keeps all of its own behaviour: a stream that
/// has gone bad receives nothing, a short write sets badbit, the exceptions the caller enabled
/// are thrown. StreamText says how newlines and \u escapes go onto it.
///
/// String: for json::serialize, json::pretty_print and a json::Writer onto a string. The text
/// is what a std::ostringstream in its default state would hold: newlines widened by the
/// global locale, escapes as its default formatting writes them; flushing such a stream does
/// nothing, so nothing is flushed. The text is written straight into the string's own
/// storage, which grows geometrically (its size runs ahead of the text until flush()), so
/// no byte is copied on the way but when the string reallocates.
class OutputBuffer {
  public:
    OutputBuffer(std::ostream& out, StreamText style)
        : out(&out), text(nullptr), formatted(style == StreamText::formatted),
          widened_newline_known(!formatted), widened_newline(formatted ? '\n' : default_newline()),
          start(storage), cursor(storage), limit(storage + CAPACITY) {}
    explicit OutputBuffer(std::string& text)
        : out(nullptr), text(&text), formatted(false), widened_newline_known(true),
          widened_newline(default_newline()) {
        point_into_text(text.size());
    }
    OutputBuffer(const OutputBuffer&) = delete;
    OutputBuffer& operator=(const OutputBuffer&) = delete;

    void append(const char* bytes, std::size_t count) {
        if (count > room()) {
            if (text == nullptr && count >= CAPACITY) {
                flush();
                deliver(bytes, count); // too big to gather: straight to the stream
                return;
            }
            make_room(count);
        }
        std::memcpy(cursor, bytes, count);
        cursor += count;
    }

    void put(char c) {
        if (cursor == limit) {
            make_room(1);
        }
        *cursor++ = c;
    }

    /// `count` copies of `c`, filled straight into the buffer a piece at a time.
    void fill(char c, std::size_t count) {
        while (count != 0) {
            if (cursor == limit) {
                make_room(count);
            }
            const std::size_t piece = std::min(count, room());
            std::memset(cursor, c, piece);
            cursor += piece;
            count -= piece;
        }
    }

    /// Room for at least `count` bytes (at most CAPACITY on a stream, any number in a
    /// string), made first when needed; the bytes written there count once commit() is
    /// given the end of them.
    char* reserve(std::size_t count) {
        if (count > room()) {
            make_room(count);
        }
        return cursor;
    }

    void commit(char* end) { cursor = end; }

    /// A widened newline (on a formatted stream: then a flush, with every byte before it
    /// delivered); then `indent` copies of `blank`, a space or a tab.
    void new_line(std::size_t indent, char blank) {
        if (out != nullptr && (formatted || indent > CAPACITY / 2)) {
            new_line_on_stream(indent, blank);
            return;
        }
        // Nothing to flush: the line break and its indentation in one piece, the blanks copied
        // in whole sixteen-byte blocks (cheaper than a call to memset for the few of them a
        // line has) into room reserved for them; only `indent` of them are kept.
        static constexpr char SPACES[17] = "                ";
        static constexpr char TABS[17] = "\t\t\t\t\t\t\t\t\t\t\t\t\t\t\t\t";
        constexpr std::size_t block = sizeof SPACES - 1;
        const char* const blanks = blank == '\t' ? TABS : SPACES;
        char* const line = reserve(1 + indent + block);
        *line = widened_newline;
        for (std::size_t at = 0; at < indent; at += block) {
            std::memcpy(line + 1 + at, blanks, block);
        }
        commit(line + 1 + indent);
    }

    /// "\u" and the UTF-16 code unit as four hexadecimal digits.
    void unicode_escape(char16_t unit);

    /// Hands everything buffered on: to the stream, or (for a string) trims the string to the
    /// text written so far.
    void flush() {
        if (text != nullptr) {
            text->resize(static_cast<std::size_t>(cursor - start));
            point_into_text(text->size());
        } else if (cursor != start) {
            deliver(start, static_cast<std::size_t>(cursor - start));
            cursor = start;
        }
    }

    static constexpr std::size_t CAPACITY = std::size_t{16} * 1024;

  private:
    // A newline a stream receives in its own way, or one whose indentation is too long for the
    // stream's buffer to take in one piece.
    void new_line_on_stream(std::size_t indent, char blank);

    // What a std::ostringstream in its default state widens '\n' to: the global locale's
    // answer.
    static char default_newline() {
        return std::use_facet<std::ctype<char>>(std::locale()).widen('\n');
    }

    std::size_t room() const { return static_cast<std::size_t>(limit - cursor); }

    // Stream: delivers what is gathered. String: enlarges the string to at least twice its
    // size and at least `count` bytes beyond the text; std::bad_alloc leaves the text intact.
    void make_room(std::size_t count) {
        if (text == nullptr) {
            flush();
            return;
        }
        const auto used = static_cast<std::size_t>(cursor - start);
        text->resize(std::max({used + count, 2 * text->size(), CAPACITY}));
        point_into_text(used);
    }

    // Points the buffer at the string's storage, the text ending `used` bytes in.
    void point_into_text(std::size_t used) {
        start = text->data();
        cursor = start + used;
        limit = start + text->size();
    }

    void deliver(const char* bytes, std::size_t count) {
        out->write(bytes, static_cast<std::streamsize>(count));
    }

    std::ostream* out;
    std::string* text;
    bool formatted; // StreamText::formatted
    bool widened_newline_known;
    char widened_newline;
    char* start = nullptr;
    char* cursor = nullptr;
    char* limit = nullptr;
    char storage[CAPACITY]; // the stream's gathering buffer (unused for a string)
};

} // namespace json::detail

#endif
