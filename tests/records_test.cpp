// Reading records one at a time: both layouts, their ends and failures placed in the whole
// stream, skipping bad lines, pieces of every size, the options per record, agreement with
// json::parse, failing streams and allocations, and memory that does not grow with the stream.
#include "support/allocation_failure.hpp"
#include "support/documents.hpp"
#include "support/reading.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <memory>
#include <sstream>
#include <string>
#include <string_view>

namespace {

using json::ParseOptions;
using json::ParseReport;
using Layout = json::RecordReader::Layout;
using test_support::DiskGone;
using test_support::InPieces;
using test_support::options_from;
using test_support::WHOLE;

constexpr std::string_view BOM = "\xEF\xBB\xBF";

// What a reader of `in` gives, read on after every failure until it is at its end: each record
// written compactly, each failure as "!code@line:column".
std::string records_of(std::istream& in, Layout layout, const ParseOptions& options) {
    json::RecordReader reader(in, options, layout);
    std::string seen;
    json::Value record;
    for (int calls = 0; !reader.at_end(); ++calls) {
        if (calls == 100'000) {
            return seen + "... never at its end";
        }
        if (reader.next(record)) {
            seen += json::serialize(record) + " ";
        } else if (const ParseReport& report = reader.report(); !report) {
            seen += "!" + std::to_string(static_cast<int>(report.result)) + "@" +
                    std::to_string(report.line) + ":" + std::to_string(report.column) + " ";
        }
    }
    return seen;
}

std::string records_of(const std::string& text, Layout layout, const ParseOptions& options = {},
                       std::size_t piece = WHOLE) {
    InPieces buffer(text, piece);
    std::istream in(&buffer);
    return records_of(in, layout, options);
}

struct Row {
    Layout layout;
    std::string text;
    std::string expected;
    ParseOptions options = {};
};

// Every row read whole, a byte at a time and in pieces of 4 KiB gives the same.
void check(const Row& row,
           std::initializer_list<std::size_t> pieces = {WHOLE, std::size_t{1}, std::size_t{4096}}) {
    for (const std::size_t piece : pieces) {
        EXPECT_EQ(records_of(row.text, row.layout, row.options, piece), row.expected)
            << row.text << " in pieces of " << piece;
    }
}

TEST(Records, ArraysAndLines) {
    const Row rows[] = {
        {Layout::ARRAY, R"([1, {"a": [2, {}]}, "x\u00e9", null, true, [], 1.5e3])",
         R"(1 {"a":[2,{}]} "xé" null true [] 1500 )"},
        {Layout::ARRAY, " \t\r\n[\n1\r\n,\t2\n]\n\n", "1 2 "},
        {Layout::ARRAY, "[]", ""},
        {Layout::ARRAY, "", "!3@1:1 "},
        {Layout::ARRAY, "  \n ", "!3@2:2 "},
        // Not an array: refused at the value's first character.
        {Layout::ARRAY, R"({"a": [1]})", "!14@1:1 "},
        {Layout::ARRAY, "\n  \"text\"", "!14@2:3 "},
        // The records before a failure come first; the failure is placed in the whole text.
        {Layout::ARRAY, "[1, 2,", "1 2 !19@1:7 "},
        {Layout::ARRAY, "[1, 2] 3", "1 2 !19@1:8 "},
        {Layout::ARRAY, "[1,\r\n 2,\r 3,\n\r x]", "1 2 3 !11@5:2 "},
        {Layout::ARRAY, "[{\"a\": 1},\n {\"b\": tru}]", "{\"a\":1} !2@2:8 "},
        {Layout::ARRAY, "[{\"a\": 1} {\"b\": 2}]", "{\"a\":1} !15@1:11 "},
        {Layout::ARRAY, std::string(BOM) + "[1]", "!11@1:1 "},
        {Layout::LINES, "{\"a\": 1}\n{\"b\": [2]}\n", R"({"a":1} {"b":[2]} )"},
        // Any value, directly after the one before or after whitespace of any kind.
        {Layout::LINES, R"(1 2 {"a":1}{"b":2}[3]"s"true null)",
         R"(1 2 {"a":1} {"b":2} [3] "s" true null )"},
        {Layout::LINES, "\r\n\r\n {\"a\":\n 1}\t\r\n\n [\n]", R"({"a":1} [] )"},
        {Layout::LINES, "", ""},
        {Layout::LINES, " \n\t\r\n ", ""},
        // After a failure, the text after the next line break.
        {Layout::LINES, "{\"a\": 1}\n{\"b\": x}\n{\"c\": 3}\n", R"({"a":1} !11@2:7 {"c":3} )"},
        {Layout::LINES, "{\"a\": 1}\r\n{\"b\": x}\r\n{\"c\": 3}", R"({"a":1} !11@2:7 {"c":3} )"},
        {Layout::LINES, "{\"a\": 1}\r{\"b\": x}\r{\"c\": 3}", R"({"a":1} !11@2:7 {"c":3} )"},
        {Layout::LINES, "1 x 2 3\n4", "1 !11@1:3 4 "},
        {Layout::LINES, "x\ny\n\nz", "!11@1:1 !11@2:1 !11@4:1 "},
        {Layout::LINES, "x\r\ny\r\n\r\nz", "!11@1:1 !11@2:1 !11@4:1 "},
        {Layout::LINES, "1\n2x", "1 2 !11@2:2 "},
        {Layout::LINES, "{\"a\": 1}\n{\"b\":", R"({"a":1} !19@2:6 )"},
        {Layout::LINES, "{\"a\":\n[1,\n2 3]}\n4", "!15@3:3 4 "},
        {Layout::LINES, "[1]]\n[2]", "[1] !11@1:4 [2] "},
        // A raw line break in a string fails there, and what follows it is read.
        {Layout::LINES, "\"abc\n\"d\"", "!9@1:5 \"d\" "},
        {Layout::LINES, "[\"\xFF\"]\n1", "!9@1:3 1 "},
        // A byte order mark only at the start of the stream, and only with allow_bom.
        {Layout::LINES, std::string(BOM) + "1\n2", "!11@1:1 2 "},
        {Layout::LINES, std::string(BOM) + "1\nx\n" + std::string(BOM) + "2\n3",
         "1 !11@2:1 !11@3:1 3 ", options_from("b")},
    };
    for (const Row& row : rows) {
        check(row);
    }
}

// The options act on each record as json::parse applies them: a refusal ends the records of an
// array and skips a line; what one record holds does not count against the next.
TEST(Records, OptionsPerRecord) {
    const ParseOptions exact = options_from("x"), unique = options_from("d");
    const ParseOptions shallow = options_from("", 3), deep_enough = options_from("", 100'001);
    const std::string deep = std::string(100'000, '[') + std::string(100'000, ']');
    const Row rows[] = {
        {Layout::LINES, "1.5\n9007199254740993\n2", "1.5 !13@2:1 2 ", exact},
        {Layout::ARRAY, "[1.5, 1e400, 2]", "1.5 !13@1:7 ", exact},
        {Layout::LINES, "{\"a\": 1}\n{\"a\": 1, \"a\": 2}\n{\"a\": 3}",
         R"({"a":1} !17@2:10 {"a":3} )", unique},
        {Layout::ARRAY, R"([{"a": 1}, {"a": {"a": 2}}, {"b": 1, "a": 1, "b": 2}])",
         R"({"a":1} {"a":{"a":2}} !17@1:46 )", unique},
        // The array around the records is one of max_depth's levels; a line's text is not in one.
        {Layout::ARRAY, "[[[1]], [[[2]]]]", "[[1]] !15@1:11 ", shallow},
        {Layout::LINES, "[[[1]]]\n[[[[2]]]]\n3", "[[[1]]] !15@2:4 3 ", shallow},
        {Layout::LINES, deep + "\n" + deep, deep + " " + deep + " ", deep_enough},
        {Layout::ARRAY, "[" + deep + "]", deep + " ", deep_enough},
        {Layout::LINES, "1 // one\n/* two: */ 2 /* three */ 3", "1 2 3 ", options_from("ct")},
        {Layout::ARRAY, "[1, /* two */ 2, ]", "1 2 ", options_from("ct")},
    };
    for (const Row& row : rows) {
        check(row);
    }
}

// Records longer than a piece of the reader's, failures beyond the first piece, and lines
// counted over all of them; the text is built with what it is expected to give.
TEST(Records, LongStreams) {
    const std::string long_string(100'000, 'x');
    std::string lines;
    std::string expected;
    for (int line = 1; line <= 4000; ++line) {
        if (line % 1000 == 0) {
            lines += "{\"line\": " + std::to_string(line) + ", oops}\n";
            expected += "!8@" + std::to_string(line) + ":" +
                        std::to_string(std::to_string(line).size() + 12) + " ";
        } else if (line % 700 == 0) {
            lines += "\"" + long_string + "\"\n";
            expected += "\"" + long_string + "\" ";
        } else {
            lines += "{\"line\": " + std::to_string(line) + "}\n";
            expected += "{\"line\":" + std::to_string(line) + "} ";
        }
    }
    // A string read a byte at a time is read again from its start with every byte: not here.
    check({Layout::LINES, lines, expected}, {WHOLE, std::size_t{4096}, std::size_t{65537}});
}

// With Layout::ARRAY the reader fails where json::parse fails on a text that starts with an
// array, with the same report, and reads exactly the elements of what it parses: over the
// conformance suite, whole and a byte at a time. Any text json::parse takes is one record of
// Layout::LINES.
TEST(Records, AgreeWithParse) {
    std::string all_lines;
    std::string all_documents;
    for (const auto& path : test_support::suite_files()) {
        const std::string text = test_support::read_file(path);
        json::Value document;
        const ParseReport parsed = json::parse(text, document, {});
        if (parsed && text.find_first_of("\r\n") == std::string::npos) {
            all_lines += text + "\n";
            all_documents += json::serialize(document) + " ";
        }
        const std::size_t start = text.find_first_not_of(" \t\r\n");
        if (start == std::string::npos || text[start] != '[') {
            continue;
        }
        std::string elements;
        if (parsed) {
            for (const json::Value& element : document.as_array()) {
                elements += json::serialize(element) + " ";
            }
        }
        for (const std::size_t piece : {WHOLE, std::size_t{1}}) {
            InPieces buffer(text, piece);
            std::istream in(&buffer);
            json::RecordReader reader(in);
            std::string records;
            json::Value record;
            while (reader.next(record)) {
                records += json::serialize(record) + " ";
            }
            EXPECT_EQ(test_support::report_text(reader.report()), test_support::report_text(parsed))
                << path;
            EXPECT_TRUE(!parsed || records == elements) << path;
        }
    }
    EXPECT_EQ(records_of(all_lines, Layout::LINES), all_documents);
}

// A stream that fails ends the reading, whatever the layout, after the records it gave whole.
TEST(Records, FailingStreams) {
    for (const Layout layout : {Layout::ARRAY, Layout::LINES}) {
        const std::string text = layout == Layout::ARRAY ? "[1,\n 22,\n 3" : "1\n 22\n 3";
        InPieces buffer(text, WHOLE, text.size());
        std::istream broken(&buffer);
        EXPECT_EQ(records_of(broken, layout, {}), "1 22 !19@3:3 ");
        EXPECT_TRUE(broken.bad());

        std::ifstream missing("/nonexistent/records.json");
        EXPECT_EQ(records_of(missing, layout, {}), "!19@1:1 ");

        // With exceptions enabled for badbit, the buffer's own exception reaches the caller;
        // the reader is then at its end and the record as it was.
        InPieces throwing(text, WHOLE, text.size());
        std::istream strict(&throwing);
        strict.exceptions(std::ios::badbit);
        json::RecordReader reader(strict, {}, layout);
        json::Value record;
        ASSERT_TRUE(reader.next(record));
        ASSERT_TRUE(reader.next(record));
        EXPECT_THROW(reader.next(record), DiskGone);
        EXPECT_EQ(record, 22);
        EXPECT_TRUE(reader.at_end());
        EXPECT_FALSE(reader.next(record));
        EXPECT_EQ(reader.report().note, "an exception stopped the reading");
    }
}

// Whichever allocation fails, std::bad_alloc reaches the caller, nothing leaks, and the reader
// is at its end with the record it was given whole: as it was, or a record read before.
TEST(Records, AllocationFailures) {
    const std::string first = R"({"name": "a long enough name", "list": [1, 2]})";
    json::Value first_record;
    ASSERT_TRUE(json::parse(first, first_record, {}));
    for (const Layout layout : {Layout::ARRAY, Layout::LINES}) {
        struct Reading {
            std::istringstream in;
            json::RecordReader reader;
            json::Value record = "before";
            Reading(const std::string& text, Layout layout) : in(text), reader(in, {}, layout) {}
        };
        const std::string text =
            layout == Layout::ARRAY ? "[" + first + ", \"x\"]" : first + "\n[1, x]\n\"x\"";
        const auto runs = test_support::for_each_failing_allocation(
            [&] { return std::make_unique<Reading>(text, layout); },
            [](std::unique_ptr<Reading>& reading) {
                while (!reading->reader.at_end()) {
                    reading->reader.next(reading->record);
                }
            },
            [&](std::unique_ptr<Reading>& reading) {
                const json::Value& record = reading->record;
                EXPECT_TRUE(record == "before" || record == first_record || record == "x");
                EXPECT_TRUE(reading->reader.at_end());
                EXPECT_FALSE(reading->reader.next(reading->record));
            },
            test_support::Exhaustion::ONE);
        EXPECT_GT(runs.allocations, 0U);
    }
}

// What the reader holds does not grow with the stream: over the last nine tenths of the records
// no more, give or take a piece, than over the first tenth; and every record is handed over.
TEST(Records, MemoryDoesNotGrowWithTheStream) {
    constexpr std::size_t records = 100'000; // about 6.5 MB
    for (const Layout layout : {Layout::ARRAY, Layout::LINES}) {
        test_support::GeneratedRecords generated(records, layout);
        std::istream in(&generated);
        json::RecordReader reader(in, {}, layout);
        json::Value record;
        std::size_t read = 0;
        std::size_t ids = 0;
        std::size_t most_early = 0;
        std::size_t most_late = 0;
        while (reader.next(record)) {
            ids += json::value_to<std::size_t>(record.at("id"));
            std::size_t& most = read++ < records / 10 ? most_early : most_late;
            most = std::max(most, test_support::live_bytes());
        }
        EXPECT_TRUE(reader.report());
        EXPECT_EQ(read, records);
        EXPECT_EQ(ids, records * (records - 1) / 2);
        EXPECT_LT(most_late, most_early + std::size_t{64} * 1024);
    }
}

} // namespace
