// Reading JSON as events: the events of each kind of token, a handler stopping anywhere, the
// options, streams read a byte at a time, validation, and the size limit every reader applies.
#include "support/documents.hpp"
#include "support/reading.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <sys/resource.h>

#include <functional>
#include <iterator>
#include <sstream>
#include <string>
#include <vector>

namespace {

using json::ParseOptions;
using json::ParseReport;
using json::ParseResult;
using json::Refusal;
using test_support::options_from;
using test_support::Recorder;
using test_support::report_text;

std::string events_of(std::string_view text, const ParseOptions& options = {}) {
    Recorder recorder;
    const ParseReport report = json::parse_events(text, recorder, options);
    return report ? recorder.events : recorder.events + "@" + std::to_string(report.offset);
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
    const ParseOptions lenient = options_from("ctus");
    EXPECT_EQ(events_of("[1, /* c */ 2, ] // end", lenient), "[ #1 #2 ] ");
    EXPECT_EQ(events_of("[\"\xFF\", \"\\udc00\"]", lenient), "[ '\xFF' '\xEF\xBF\xBD' ] ");
    EXPECT_EQ(events_of("[\"\xFF\"]"), "[ @2");
    EXPECT_EQ(events_of(R"({"a": 1e400, "a": 0.10000000000000001})", options_from("dx")),
              "{ a: #1e400 a: #0.10000000000000001 } ");
    EXPECT_EQ(events_of("[[[]]]", options_from("", 2)), "[ [ @2");
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
    // Besides the files: line ends of every kind before a failure, byte order marks whole and
    // cut short.
    std::vector<std::pair<std::string, std::string>> texts = {
        {"line ends", "[1,\r\n2,\r3,\n\r4,\rx]"},
        {"byte order mark", "\xEF\xBB\xBF[1]"},
        {"byte order mark alone", "\xEF\xBB\xBF"},
        {"byte order mark cut short", "\xEF\xBB"},
    };
    for (const auto& files : {test_support::suite_files(), test_support::bench_files()}) {
        for (const auto& path : files) {
            texts.emplace_back(path.string(), test_support::read_file(path));
        }
    }
    for (const auto& [path, text] : texts) {
        for (const char* letters : {"", "dx", "ctusb"}) {
            const ParseOptions options = options_from(letters);
            Recorder from_text;
            const ParseReport text_report = json::parse_events(text, from_text, options);
            Recorder from_stream;
            test_support::InPieces bytes(text, 1);
            std::istream stream(&bytes);
            const ParseReport stream_report = json::parse_events(stream, from_stream, options);
            EXPECT_EQ(from_stream.events, from_text.events) << path;
            EXPECT_EQ(report_text(stream_report), report_text(text_report)) << path;

            json::Value document;
            const std::string parsed = report_text(json::parse(text, document, options));
            EXPECT_EQ(report_text(json::validate(text, options)), parsed) << path;
            std::istringstream again(text);
            EXPECT_EQ(report_text(json::validate(again, options)), parsed) << path;
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
                                                 : report_text(ParseReport());
            const std::string unread = refused ? text.substr(max_size + 1) : "";
            const std::string label =
                std::to_string(text.size()) + " bytes, at most " + std::to_string(max_size);

            json::Value document = "kept";
            EXPECT_EQ(report_text(json::parse(text, document, options)), expected) << label;
            EXPECT_EQ(document == "kept", refused) << label;
            EXPECT_EQ(report_text(json::validate(text, options)), expected) << label;
            Recorder recorder;
            EXPECT_EQ(report_text(json::parse_events(text, recorder, options)), expected) << label;
            EXPECT_EQ(recorder.count == 0, refused) << label;

            const std::function<ParseReport(std::istream&)> stream_readers[] = {
                [&](std::istream& in) { return json::parse(in, document, options); },
                [&](std::istream& in) { return json::validate(in, options); },
                [&](std::istream& in) { return json::parse_events(in, recorder, options); },
            };
            for (const auto& read : stream_readers) {
                std::istringstream in(text);
                EXPECT_EQ(report_text(read(in)), expected) << label;
                EXPECT_EQ(std::string(std::istreambuf_iterator<char>(in), {}), unread) << label;
            }
        }
    }
}

// A stream of 200 MB is checked, and read as events, in bounded memory: nothing but the open
// containers, the longest token and one piece is held.
long peak_kilobytes() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss;
}

TEST(Events, TwoHundredMegabytesInBoundedMemory) {
    using test_support::GeneratedRecords;
    constexpr std::size_t records = 3'000'000;
    const long before = peak_kilobytes();
    GeneratedRecords validated(records, json::RecordReader::Layout::ARRAY);
    std::istream stream(&validated);
    EXPECT_TRUE(json::validate(stream));
    GeneratedRecords counted(records, json::RecordReader::Layout::ARRAY);
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
