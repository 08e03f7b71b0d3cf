#ifndef JSON_SRC_OUTPUT_BUFFER_HPP
#define JSON_SRC_OUTPUT_BUFFER_HPP

#include <cstddef>
#include <cstring>
#include <ostream>

namespace json::detail {

/// Collects the writer's output and hands it to the stream with one write() per buffer full.
/// Going through the stream's public write() keeps all of its own behaviour: a stream that
/// has gone bad receives nothing, a short write sets badbit, and the exceptions the caller
/// enabled are thrown. What is still buffered when an exception passes is not written.
class OutputBuffer {
  public:
    explicit OutputBuffer(std::ostream& out) : out(out) {}
    OutputBuffer(const OutputBuffer&) = delete;
    OutputBuffer& operator=(const OutputBuffer&) = delete;

    std::ostream& stream() const { return out; }

    void append(const char* bytes, std::size_t count) {
        if (count > CAPACITY - used) {
            flush();
            if (count >= CAPACITY) {
                out.write(bytes, static_cast<std::streamsize>(count));
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

    /// Room for at least `count` bytes (at most CAPACITY), flushing first when needed; the
    /// bytes written there count once commit() is given the end of them.
    char* reserve(std::size_t count) {
        if (count > CAPACITY - used) {
            flush();
        }
        return data + used;
    }

    void commit(const char* end) { used = static_cast<std::size_t>(end - data); }

    static constexpr std::size_t CAPACITY = 16 * 1024;

    /// The stream's widened '\n'. The first call hands the buffered text to the stream before
    /// it asks: widen() throws std::bad_cast when the locale has no std::ctype<char>, and the
    /// text so far must be out by then. Once it has answered, its answer is reused.
    char newline() {
        if (!widened_newline_known) {
            flush();
            widened_newline = out.widen('\n');
            widened_newline_known = true;
        }
        return widened_newline;
    }

    /// Hands everything buffered to the stream.
    void flush() {
        if (used != 0) {
            out.write(data, static_cast<std::streamsize>(used));
            used = 0;
        }
    }

  private:
    std::ostream& out;
    bool widened_newline_known = false;
    char widened_newline = '\n';
    std::size_t used = 0;
    char data[CAPACITY];
};

} // namespace json::detail

#endif
