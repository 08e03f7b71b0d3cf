// Reads arbitrary bytes as events, with options taken from the first byte, twice: as one text
// and from a stream that holds one byte at a time, so that every token straddles the pieces
// read. Both must give the same events and the same report.
#include "parse_options.hpp"

#include <json/json.hpp>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <istream>
#include <streambuf>
#include <string>

namespace {

// Every event as a tag byte and its text.
struct Recorder {
    std::string events;
    bool add(char tag, std::string_view text = {}) {
        events += tag;
        events.append(text).push_back('\0');
        return true;
    }
    bool null() { return add('n'); }
    bool boolean(bool value) { return add(value ? 't' : 'f'); }
    bool number(std::string_view literal) { return add('#', literal); }
    bool string(std::string_view text) { return add('"', text); }
    bool key(std::string_view name) { return add(':', name); }
    bool begin_array() { return add('['); }
    bool end_array() { return add(']'); }
    bool begin_object() { return add('{'); }
    bool end_object() { return add('}'); }
};

class OneByteAtATime : public std::streambuf {
  public:
    explicit OneByteAtATime(std::string_view text) : text(text) {}

  private:
    std::streamsize showmanyc() override { return next < text.size() ? 1 : -1; }
    int_type underflow() override {
        if (next == text.size()) {
            return traits_type::eof();
        }
        byte = text[next++];
        setg(&byte, &byte, &byte + 1);
        return traits_type::to_int_type(byte);
    }
    std::string_view text;
    std::size_t next = 0;
    char byte = 0;
};

bool same(const json::ParseReport& left, const json::ParseReport& right) {
    return left.result == right.result && left.offset == right.offset && left.line == right.line &&
           left.column == right.column && left.refusal == right.refusal && left.note == right.note;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string_view text;
    const json::ParseOptions options = options_and_text(data, size, text);
    Recorder whole;
    const json::ParseReport from_text = json::parse_events(text, whole, options);
    Recorder pieces;
    OneByteAtATime bytes(text);
    std::istream stream(&bytes);
    const json::ParseReport from_stream = json::parse_events(stream, pieces, options);
    if (whole.events != pieces.events || !same(from_text, from_stream)) {
        std::abort();
    }
    return 0;
}
