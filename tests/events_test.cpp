// Reading JSON as events: the events of each kind of token, a handler stopping anywhere, the
// options, streams read a byte at a time, validation, the size limit every reader applies, and
// reformatting through the Writer.
#include <json/json.hpp>

#include <gtest/gtest.h>

#include <sys/resource.h>

#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <sstream>
#include <streambuf>
#include <string>
#include <vector>

namespace {

using json::ParseOptions;
using json::ParseReport;
using json::ParseResult;
using json::Refusal;

// Writes down every event as a word; stops when told to at the event numbered `stop_at`.
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

std::string events_of(std::string_view text, const ParseOptions& options = {}) {
    Recorder recorder;
    const ParseReport report = json::parse_events(text, recorder, options);
    return report ? recorder.events : recorder.events + "@" + std::to_string(report.offset);
}

// A stream buffer that holds one byte of its text at a time and never says that more is
// there, so that the reader takes the text in pieces of one byte and every token straddles
// pieces.
class OneByteAtATime : public std::streambuf {
  public:
    explicit OneByteAtATime(std::string text) : text(std::move(text)) {}

  private:
    int_type underflow() override {
        if (next == text.size()) {
            return traits_type::eof();
        }
        setg(&text[next], &text[next], &text[next] + 1);
        ++next;
        return traits_type::to_int_type(text[next - 1]);
    }
    std::string text;
    std::size_t next = 0;
};

std::string report_of(const ParseReport& report) {
    return std::to_string(static_cast<int>(report.result)) + "@" + std::to_string(report.offset) +
           " " + std::to_string(report.line) + ":" + std::to_string(report.column) + " " +
           std::to_string(static_cast<int>(report.refusal)) + " " + report.note;
}

TEST(Events, EachKindOfToken) {
    const std::pair<std::string, std::string> rows[] = {
        {"null", "null "},
        {" [true , false] ", "[ true false ] "},
        {"[1.50, -0, 1e400, 1234567890123456789]", "[ #1.50 #-0 #1e400 #1234567890123456789 ] "},
        {R"({"a\tb": "\u00e9\ud83d\ude00", "a": {}, "a": []})",
         "{ a\tb: '\xC3\xA9\xF0\x9F\x98\x80' a: { } a: [ ] } "},
        {R"([[], {}, [[]]])", "[ [ ] { } [ [ ] ] ] "},
        {R"("")", "'' "},
        // Failures come after the events of every token before them.
        {"[1, 2,, 3]", "[ #1 #2 @6"},
        {R"({"a": tru})", "{ a: @6"},
        {"[1] 2", "[ #1 ] @4"},
    };
    for (const auto& [text, expected] : rows) {
        EXPECT_EQ(events_of(text), expected) << text;
    }
}

// The options act as in json::parse, but the two that concern a document: names and literals
// are passed through.
TEST(Events, Options) {
    ParseOptions lenient;
    lenient.allow_comments = true;
    lenient.allow_trailing_commas = true;
    lenient.allow_invalid_utf8 = true;
    lenient.allow_lone_surrogates = true;
    ParseOptions document_rules;
    document_rules.reject_duplicate_keys = true;
    document_rules.exact_numbers = true;
    EXPECT_EQ(events_of("[1, /* c */ 2, ] // end", lenient), "[ #1 #2 ] ");
    EXPECT_EQ(events_of("[\"\xFF\", \"\\udc00\"]", lenient), "[ '\xFF' '\xEF\xBF\xBD' ] ");
    EXPECT_EQ(events_of("[\"\xFF\"]"), "[ @2");
    EXPECT_EQ(events_of(R"({"a": 1e400, "a": 0.10000000000000001})", document_rules),
              "{ a: #1e400 a: #0.10000000000000001 } ");
    ParseOptions shallow;
    shallow.max_depth = 2;
    EXPECT_EQ(events_of("[[[]]]", shallow), "[ [ @2");
}

// A handler that stops at each event in turn: the parse stops there, at that token.
TEST(Events, StoppedAtEveryEvent) {
    const std::string text = R"( {"list": [1, "two", null], "more": {"x": true}} )";
    const std::size_t offsets[] = {1, 2, 10, 11, 14, 21, 25, 28, 36, 37, 42, 46, 47};
    for (std::size_t stop = 0; stop < std::size(offsets); ++stop) {
        Recorder recorder;
        recorder.stop_at = stop;
        const ParseReport report = json::parse_events(text, recorder);
        EXPECT_EQ(report.refusal, Refusal::STOPPED) << stop;
        EXPECT_EQ(report.result, ParseResult::UNEXPECTED_END_OF_INPUT) << stop;
        EXPECT_EQ(report.offset, offsets[stop]) << stop;
        EXPECT_EQ(recorder.count, stop + 1);
    }
    Recorder all;
    EXPECT_TRUE(json::parse_events(text, all));
    EXPECT_EQ(all.count, std::size(offsets));
}

// Text given whole and a stream read a byte at a time give the same events and the same
// report, on the conformance suite and the benchmark documents, with several option sets;
// json::validate gives json::parse's report on every one of them, from text and from a stream.
TEST(Events, TextStreamAndValidationAgree) {
    const std::filesystem::path bench = JSON_BENCH_DATA_DIR;
    std::vector<std::filesystem::path> files = {bench / "twitter.json", bench / "citm_catalog.json",
                                                bench / "canada.json"};
    for (const auto& entry : std::filesystem::directory_iterator(JSON_TEST_PARSING_DIR)) {
        files.push_back(entry.path());
    }
    ParseOptions strict;
    strict.reject_duplicate_keys = true;
    strict.exact_numbers = true;
    ParseOptions lenient;
    lenient.allow_comments = true;
    lenient.allow_trailing_commas = true;
    lenient.allow_invalid_utf8 = true;
    lenient.allow_lone_surrogates = true;
    lenient.allow_bom = true;
    // Besides the files: line ends of every kind before a failure, byte order marks whole and
    // cut short.
    std::vector<std::pair<std::string, std::string>> texts = {
        {"line ends", "[1,\r\n2,\r3,\n\r4,\rx]"},
        {"byte order mark", "\xEF\xBB\xBF[1]"},
        {"byte order mark alone", "\xEF\xBB\xBF"},
        {"byte order mark cut short", "\xEF\xBB"},
    };
    for (const std::filesystem::path& path : files) {
        std::ifstream file(path, std::ios::binary);
        texts.emplace_back(path.string(), std::string{std::istreambuf_iterator<char>(file), {}});
    }
    for (const auto& [path, text] : texts) {
        for (const ParseOptions& options : {ParseOptions(), strict, lenient}) {
            Recorder from_text;
            const ParseReport text_report = json::parse_events(text, from_text, options);
            Recorder from_stream;
            OneByteAtATime bytes(text);
            std::istream stream(&bytes);
            const ParseReport stream_report = json::parse_events(stream, from_stream, options);
            EXPECT_EQ(from_stream.events, from_text.events) << path;
            EXPECT_EQ(report_of(stream_report), report_of(text_report)) << path;

            json::Value document;
            const std::string parsed = report_of(json::parse(text, document, options));
            EXPECT_EQ(report_of(json::validate(text, options)), parsed) << path;
            std::istringstream again(text);
            EXPECT_EQ(report_of(json::validate(again, options)), parsed) << path;
        }
    }
}

// A text longer than max_size is refused as a whole by every reader: given whole, before the
// grammar sees it; from a stream, once one byte more than max_size is read, and no further.
TEST(Events, MaxSizeRefusesLongerTexts) {
    std::string records = "[";
    while (records.size() < 150'000) { // pieces of 64 KiB: the limit falls in the second
        records += "1234567,\n";
    }
    records += "0]";
    for (const std::string& text : {std::string(R"({"a": [1, "two"]})"), records}) {
        for (const std::size_t max_size :
             {text.size(), text.size() - 1, std::size_t{0}, std::size_t{1}, std::size_t{70'000}}) {
            ParseOptions options;
            options.max_size = max_size;
            const bool refused = text.size() > max_size;
            const std::string expected = refused ? "19@0 1:1 10 the text is longer than the " +
                                                       std::to_string(max_size) +
                                                       " bytes ParseOptions::max_size allows"
                                                 : report_of(ParseReport());
            const std::string unread = refused ? text.substr(max_size + 1) : "";
            const std::string label =
                std::to_string(text.size()) + " bytes, at most " + std::to_string(max_size);

            json::Value document = "kept";
            EXPECT_EQ(report_of(json::parse(text, document, options)), expected) << label;
            EXPECT_EQ(document == "kept", refused) << label;
            EXPECT_EQ(report_of(json::validate(text, options)), expected) << label;
            Recorder recorder;
            EXPECT_EQ(report_of(json::parse_events(text, recorder, options)), expected) << label;
            EXPECT_EQ(recorder.count == 0, refused) << label;

            const std::function<ParseReport(std::istream&)> stream_readers[] = {
                [&](std::istream& in) { return json::parse(in, document, options); },
                [&](std::istream& in) { return json::validate(in, options); },
                [&](std::istream& in) { return json::parse_events(in, recorder, options); },
            };
            for (const auto& read : stream_readers) {
                std::istringstream in(text);
                EXPECT_EQ(report_of(read(in)), expected) << label;
                EXPECT_EQ(std::string(std::istreambuf_iterator<char>(in), {}), unread) << label;
            }
        }
    }
}

// Reformatting through the Writer keeps member order, repeated members and literals.
TEST(Events, WriterKeepsWhatItIsGiven) {
    std::string text;
    json::Writer writer(text);
    const std::string input = R"({"b": [1.50, 1e400], "a": 1234567890123456789, "b": "\/x"})";
    ASSERT_TRUE(json::parse_events(input, writer));
    EXPECT_EQ(text, R"({"b":[1.50,1e400],"a":1234567890123456789,"b":"\/x"})");
}

// A stream of 200 MB is checked, and read as events, in bounded memory: nothing but the open
// containers, the longest token and one piece is held.
constexpr std::string_view RECORD =
    R"({"id": 1234567890123, "name": "a record of some length", "tags": [1, 2]},)";

class Generated : public std::streambuf {
  public:
    explicit Generated(std::size_t records) : records(records) {}

  private:
    int_type underflow() override {
        if (made > records) {
            return traits_type::eof();
        }
        piece.clear();
        if (made == 0) {
            piece = "[";
        }
        for (int i = 0; i < 1000 && made < records; ++i, ++made) {
            piece += RECORD;
        }
        if (made == records) {
            piece += "null]";
            ++made;
        }
        setg(piece.data(), piece.data(), piece.data() + piece.size());
        return traits_type::to_int_type(piece[0]);
    }
    std::size_t records;
    std::size_t made = 0;
    std::string piece;
};

long peak_kilobytes() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss;
}

TEST(Events, TwoHundredMegabytesInBoundedMemory) {
    const std::size_t records = 200'000'000 / RECORD.size();
    const long before = peak_kilobytes();
    Generated validated(records);
    std::istream stream(&validated);
    EXPECT_TRUE(json::validate(stream));
    Generated counted(records);
    std::istream again(&counted);
    struct Counter : json::NoOpHandler {
        std::size_t numbers = 0;
        bool number(std::string_view) { return ++numbers != 0; }
    } numbers;
    EXPECT_TRUE(json::parse_events(again, numbers));
    EXPECT_EQ(numbers.numbers, 3 * records);
    EXPECT_LT(peak_kilobytes() - before, 16 * 1024);
}

} // namespace
