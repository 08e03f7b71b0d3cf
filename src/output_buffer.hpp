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

/// Where the writer's text goes: a caller's stream, or the end of a string.
///
/// Stream: the text is gathered in a buffer of CAPACITY bytes inside the object and handed to
/// the stream with one write() per buffer full. Going through the stream's public functions
/// keeps all of its own behaviour: a stream that has gone bad receives nothing, a short write
/// sets badbit, the exceptions the caller enabled are thrown. StreamText says how newlines and
/// \u escapes go onto it.
///
/// String: for json::serialize, json::pretty_print and a json::Writer onto a string. The text
/// is what a std::ostringstream in its default state would hold: newlines widened by the
/// global locale, escapes as its default formatting writes them; flushing such a stream does
/// nothing, so nothing is flushed. The text is gathered in the same buffer first, and a text
/// that fits it is appended whole at flush(): a small document costs one allocation of its own
/// size, and no byte is zero-filled. A text that outgrows the buffer is moved into the
/// string's own storage and written straight there from then on; the string grows
/// geometrically (its size running ahead of the text until flush()), which costs less for a
/// long text than copying each buffer full. std::bad_alloc leaves the text intact.
class OutputBuffer {
  public:
    OutputBuffer(std::ostream& out, StreamText style)
        : out(&out), text(nullptr), formatted(style == StreamText::formatted),
          widened_newline_known(false), widened_newline('\n') {}
    explicit OutputBuffer(std::string& text)
        : out(nullptr), text(&text), formatted(false), widened_newline_known(false),
          widened_newline('\n') {}
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
        if (formatted || !widened_newline_known || indent > CAPACITY / 2) {
            new_line_in_pieces(indent, blank);
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

    /// Hands everything written on: to the stream, or (for a string) appends the text
    /// gathered, or trims the string to the text written into it.
    void flush() {
        if (text != nullptr && start != storage) {
            text->resize(static_cast<std::size_t>(cursor - start));
            point_into_text(text->size());
        } else if (cursor != start) {
            deliver(start, static_cast<std::size_t>(cursor - start));
            cursor = start;
        }
    }

    static constexpr std::size_t CAPACITY = std::size_t{16} * 1024;

  private:
    // A newline that a formatted stream receives in its own way, the first newline (which
    // learns how newlines are widened), or one whose indentation is too long for the buffer to
    // take in one piece.
    void new_line_in_pieces(std::size_t indent, char blank);

    // What a std::ostringstream in its default state widens '\n' to: the global locale's
    // answer. The classic locale, which a program has unless it sets another, answers '\n';
    // telling it by comparison (the same locale compares equal at once) skips the facet's
    // look-up, a dynamic_cast.
    static char default_newline() {
        const std::locale global;
        if (global == std::locale::classic()) {
            return '\n';
        }
        return std::use_facet<std::ctype<char>>(global).widen('\n');
    }

    std::size_t room() const { return static_cast<std::size_t>(limit - cursor); }

    // Stream: delivers what is gathered. String: enlarges the string geometrically, to at
    // least `count` bytes beyond the text, moves what is gathered there, and writes into the
    // string from then on; std::bad_alloc leaves the text intact.
    void make_room(std::size_t count) {
        if (text == nullptr) {
            flush();
            return;
        }
        const bool gathering = start == storage;
        const auto written = static_cast<std::size_t>(cursor - start);
        // While gathering, the string holds only what came before this writer's text;
        // afterwards [start, cursor) is the string's whole text.
        const std::size_t used = gathering ? text->size() + written : written;
        // Twice the string's size (twice the buffer at first): sizes of 2^k times the buffer
        // for a text that starts empty.
        text->resize(std::max({used + count, 2 * text->size(), 2 * CAPACITY}));
        if (gathering) {
            std::memcpy(text->data() + used - written, storage, written);
        }
        point_into_text(used);
    }

    // Points the buffer at the string's storage, the text ending `used` bytes in.
    void point_into_text(std::size_t used) {
        start = text->data();
        cursor = start + used;
        limit = start + text->size();
    }

    void deliver(const char* bytes, std::size_t count) {
        if (text != nullptr) {
            text->append(bytes, count);
        } else {
            out->write(bytes, static_cast<std::streamsize>(count));
        }
    }

    std::ostream* out;
    std::string* text;
    bool formatted; // StreamText::formatted
    // The widened newline is asked for at the first newline, so that compact text never pays
    // for the locale's look-up.
    bool widened_newline_known;
    char widened_newline;
    // The text being written: [start, cursor), with room up to limit. In storage (the stream's
    // buffer, and a string's until its text outgrows it), or in the string's own storage.
    char* start = storage;
    char* cursor = storage;
    char* limit = storage + CAPACITY;
    char storage[CAPACITY];
};

} // namespace json::detail

#endif
