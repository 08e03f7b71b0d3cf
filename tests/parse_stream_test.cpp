// Parsing from a std::istream: documents and their failures, streams that fail while they are
// read or were never readable, the exceptions a caller enabled on the stream, and operator>>.
#include "support/reading.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <functional>
#include <sstream>
#include <string>
#include <tuple>

namespace {

using json::ParseResult;
using json::Value;
using test_support::InPieces;
using test_support::WHOLE;

// Whatever the size of the buffer's refills, a buffer that fails after N bytes is reported at
// offset N, on the line and column of that place, by every reader of streams.
TEST(ParseStream, AFailureIsPlacedAfterTheLastByteDelivered) {
    std::string text = "[";
    while (text.size() < 200'000) {
        text += "\"1234567\",\n";
    }
    text.back() = ']';
    const auto position = [&text](std::size_t offset) {
        const auto lines = static_cast<std::size_t>(
            std::count(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(offset), '\n'));
        const std::size_t line_start = text.rfind('\n', offset - 1);
        return std::make_tuple(offset, lines + 1,
                               offset - (line_start == std::string::npos ? 0 : line_start + 1) + 1);
    };
    using Reader = std::function<json::ParseReport(std::istream&)>;
    const std::pair<const char*, Reader> readers[] = {
        {"parse",
         [](std::istream& in) {
             Value out;
             return json::parse(in, out, {});
         }},
        {"parse_events",
         [](std::istream& in) {
             json::NoOpHandler handler;
             return json::parse_events(in, handler);
         }},
        {"validate", [](std::istream& in) { return json::validate(in); }},
    };
    for (const std::size_t refill : {std::size_t{1}, std::size_t{4096}, std::size_t{65536}}) {
        for (const std::size_t limit :
             {std::size_t{1}, std::size_t{5}, std::size_t{4096}, std::size_t{16384},
              std::size_t{65537}, std::size_t{150000}}) {
            for (const auto& [name, read] : readers) {
                InPieces buffer(text, refill, limit);
                std::istream in(&buffer);
                const json::ParseReport report = read(in);
                EXPECT_EQ(report.note, "the stream failed while it was read") << name;
                EXPECT_EQ(std::make_tuple(report.offset, report.line, report.column),
                          position(limit))
                    << name << " refilling " << refill << " failing after " << limit;
            }
        }
    }
}

// What a stream that cannot give a document is reported as; `out` keeps its value throughout.
TEST(ParseStream, StreamsThatGiveNoDocument) {
    InPieces buffer("[1, 2, 3]", WHOLE, 9); // a whole document, then the failure
    std::istream broken(&buffer);
    std::ifstream missing("/nonexistent/missing.json");
    std::istream no_buffer(nullptr);
    std::istringstream drained("[1]");
    std::string whole;
    drained >> whole; // reads to the end: eofbit set
    const struct {
        const char* name;
        std::istream& stream;
        ParseResult result;
        const char* note;
        std::size_t offset;
    } rows[] = {
        {"broken", broken, ParseResult::UNEXPECTED_END_OF_INPUT,
         "the stream failed while it was read", 9},
        {"missing file", missing, ParseResult::UNEXPECTED_END_OF_INPUT,
         "the stream was not readable", 0},
        {"no buffer", no_buffer, ParseResult::UNEXPECTED_END_OF_INPUT,
         "the stream was not readable", 0},
        {"at the end", drained, ParseResult::EMPTY_INPUT, "", 0},
    };
    for (const auto& row : rows) {
        Value out = "kept";
        const json::ParseReport report = json::parse(row.stream, out, {});
        EXPECT_EQ(report.result, row.result) << row.name;
        EXPECT_EQ(report.note, row.note) << row.name;
        EXPECT_EQ(report.offset, row.offset) << row.name;
        EXPECT_TRUE(row.stream.fail()) << row.name;
        EXPECT_EQ(out, "kept") << row.name;
    }
    EXPECT_TRUE(broken.bad());
}

// `in >> value` reads the rest of the stream as one document; on a failure it sets failbit and
// leaves the Value alone.
TEST(ParseStream, ExtractionOperator) {
    const struct {
        const char* text;
        const char* read; // the compact text of the Value afterwards
        bool fails;
    } rows[] = {
        {" {\"a\": [1, 2]}\n", R"({"a":[1,2]})", false},
        {"[1] [2]", R"("kept")", true},
        {"[1,", R"("kept")", true},
        {"", R"("kept")", true},
        {"// note\n1", R"("kept")", true},
    };
    for (const auto& row : rows) {
        std::istringstream in(row.text);
        Value value = "kept";
        in >> value;
        EXPECT_EQ(json::serialize(value), row.read) << row.text;
        EXPECT_EQ(in.fail(), row.fails) << row.text;
        EXPECT_TRUE(row.fails || in.eof()) << row.text; // a document is read to the end
    }
    std::istringstream strict("[1,]");
    strict.exceptions(std::ios::failbit);
    Value value;
    EXPECT_THROW(strict >> value, std::ios::failure);
    EXPECT_TRUE(value.is_undefined());
}

// With exceptions enabled for badbit, the stream buffer's own exception reaches the caller, as
// from the standard input functions, and the stream is bad.
TEST(ParseStream, TheBuffersExceptionPassesOn) {
    InPieces throwing("[1", WHOLE, 2);
    std::istream strict(&throwing);
    strict.exceptions(std::ios::badbit);
    Value out;
    EXPECT_THROW(json::parse(strict, out, {}), test_support::DiskGone);
    EXPECT_TRUE(strict.bad());
    EXPECT_EQ(strict.exceptions(), std::ios::badbit);
}

} // namespace
