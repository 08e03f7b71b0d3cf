#ifndef JSON_TESTS_READING_HPP
#define JSON_TESTS_READING_HPP

// What the tests of the readers feed them and note down: streams that hand their text over in
// pieces (and may break part-way), a generated stream of records, an event handler that writes
// every event down, and a report as one line of text. Without gtest: the fuzz targets use it too.

#include <json/json.hpp>

#include <algorithm>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <stdexcept>
#include <streambuf>
#include <string>
#include <string_view>

namespace test_support {

/// Writes down every event as a word; stops the reading at the event numbered `stop_at`.
struct Recorder {
    std::string events;
    std::size_t count = 0;
    std::size_t stop_at = SIZE_MAX;

    bool note(const std::string& event) {
        events += event + " ";
        return count++ != stop_at;
    }
    bool null() { return note("null"); }
    bool boolean(bool value) { return note(value ? "true" : "false"); }
    bool number(std::string_view literal) { return note("#" + std::string(literal)); }
    bool string(std::string_view text) { return note("'" + std::string(text) + "'"); }
    bool key(std::string_view name) { return note(std::string(name) + ":"); }
    bool begin_array() { return note("["); }
    bool end_array() { return note("]"); }
    bool begin_object() { return note("{"); }
    bool end_object() { return note("}"); }
};

/// Every field of a report: "code@offset line:column refusal note".
inline std::string report_text(const json::ParseReport& report) {
    return std::to_string(static_cast<int>(report.result)) + "@" + std::to_string(report.offset) +
           " " + std::to_string(report.line) + ":" + std::to_string(report.column) + " " +
           std::to_string(static_cast<int>(report.refusal)) + " " + report.note;
}

/// What a broken InPieces throws: a disk that fails part-way through a file.
struct DiskGone : std::runtime_error {
    DiskGone() : std::runtime_error("disk gone") {}
};

constexpr std::size_t WHOLE = std::string::npos; ///< a piece size: all of the text at once
constexpr std::size_t NEVER = std::string::npos; ///< a breaking point that never comes

/// A stream buffer that hands its text over `size` bytes at a time and never says that more is
/// there, so that the reader takes pieces of that size (with one byte, every token straddles
/// pieces). Once it has handed over `breaks_after` bytes it throws DiskGone instead of giving
/// more or ending.
class InPieces : public std::streambuf {
  public:
    InPieces(std::string text, std::size_t size, std::size_t breaks_after = NEVER)
        : text(std::move(text)), size(size), breaks_after(breaks_after) {}

  private:
    int_type underflow() override {
        if (next == breaks_after) {
            throw DiskGone();
        }
        const std::size_t count = std::min({size, text.size() - next, breaks_after - next});
        if (count == 0) {
            return traits_type::eof();
        }
        char* const first = text.data() + next;
        setg(first, first, first + count);
        next += count;
        return traits_type::to_int_type(*first);
    }
    std::string text;
    std::size_t size;
    std::size_t breaks_after;
    std::size_t next = 0;
};

/// `records` records {"id": N, "name": ..., "tags": [1, 2]} (N counting from 0), the elements
/// of one array or one to a line, made as they are read so that no large text is ever held.
class GeneratedRecords : public std::streambuf {
  public:
    GeneratedRecords(std::size_t records, json::RecordReader::Layout layout)
        : records(records), layout(layout) {}

  private:
    int_type underflow() override {
        const bool array = layout == json::RecordReader::Layout::ARRAY;
        piece = made == 0 && array ? "[" : "";
        // Appended in place, without a temporary string per record: under AddressSanitizer
        // every freed block waits in quarantine, which would count against a reader's memory.
        for (int i = 0; i < 1000 && made < records; ++i, ++made) {
            char id[24];
            piece.append(R"({"id": )").append(id, std::to_chars(id, id + sizeof id, made).ptr);
            piece.append(R"(, "name": "a record of some length", "tags": [1, 2]})");
            piece.append(!array ? "\n" : made + 1 == records ? "]" : ",\n");
        }
        if (piece.empty()) {
            return traits_type::eof();
        }
        setg(piece.data(), piece.data(), piece.data() + piece.size());
        return traits_type::to_int_type(piece[0]);
    }
    std::size_t records;
    json::RecordReader::Layout layout;
    std::size_t made = 0;
    std::string piece;
};

} // namespace test_support

#endif
