#include <json/json.hpp>

#include <gtest/gtest.h>

#include <cmath>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <sstream>

namespace {

using namespace json;
using R = ParseResult;

// Each text into `out` holding each alternative: `out` takes the document whatever it held.
TEST(Parser, Values) {
    const std::pair<std::string, Value> rows[] = {
        {"null", nullptr},
        {" true ", true},
        {"\tfalse\r\n", false},
        {"-12.5e1", -125.0},
        {"1E2", 100.0},
        {"1e-2", 0.01},
        {"123456789012345678901234567890", 1.2345678901234568e29},
        {"-1e400", -HUGE_VAL},
        {"0.00000000001e320", HUGE_VAL}, // 1e309: the exponent alone misleads
        {"100000e-329", 0.0},            // 1e-324
        {"4.9e-324", 5e-324},            // subnormals are in range
        {R"("\"\\\/\b\f\n\r\t")", "\"\\/\b\f\n\r\t"},
        {R"("\u0041\u00e9\u20AC\ud83d\ude00")", "A\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80"},
        {R"("\ud83dx\ude00")", "\xEF\xBF\xBDx\xEF\xBF\xBD"}, // unpaired: U+FFFD
        {R"("a\u0000b")", std::string("a\0b", 3)},
        {"\"caf\xC3\xA9 \xFF\"", "caf\xC3\xA9 \xFF"}, // bytes from 0x80 up are kept
        {"[]", Array{}},
        {"{}", Object{}},
        {R"([1, "two", [true], {"k": null}])",
         Array{1, "two", Array{true}, Object{{"k", nullptr}}}},
        {R"({"a": 1, "b": [2], "a": {"c": 3}})", Object{{"a", Object{{"c", 3}}}, {"b", Array{2}}}},
        // Members are taken in key order: names sharing eight-byte prefixes, empty, holding NUL
        // or bytes from 0x80 up, and repeated names far apart (the last one wins).
        {R"({"abcdefgh2": 1, "abcdefgh1": 2, "": 3, "abcdefgh": [4], "\u0000": 5, "\u00e9": 6,
            "abcdefgh1": {"x": 7}, "B": 8, "": 9, "abcdefgh1": [10]})",
         Object{{"abcdefgh2", 1},
                {"abcdefgh1", Array{10}},
                {"", 9},
                {"abcdefgh", Array{4}},
                {std::string(1, '\0'), 5},
                {"\xC3\xA9", 6},
                {"B", 8}}},
        // Finished arrays and objects waiting for their parents, in and out of order.
        {R"([[1, {"x": [2, {}]}], {}, [[], [3]], {"y": {"z": []}, "w": [{}]}])",
         Array{Array{1, Object{{"x", Array{2, Object{}}}}}, Object{}, Array{Array{}, Array{3}},
               Object{{"y", Object{{"z", Array{}}}}, {"w", Array{Object{}}}}}},
        // Digit runs around a sixteen-byte block.
        {"[-65.61361699999997711,1234567890123456,4.1234567890123456789e-0000000000000001]",
         Array{-65.61361699999997711, 1234567890123456.0, 0.41234567890123456789}},
        // Whitespace runs longer than one sixteen-byte block, of each kind.
        {std::string(17, '\t') + "[" + std::string(16, '\r') + "1," + std::string(33, '\n') + "2" +
             std::string(20, ' ') + "]" + std::string(18, ' '),
         Array{1, 2}}};
    for (const auto& [text, expected] : rows) {
        for (const Value& before :
             {Value(), Value(Array{3}), Value(Object{{"x", 1}}), Value("old")}) {
            Value out = before;
            EXPECT_EQ(parse(text, out), R::SUCCESS) << text;
            EXPECT_EQ(out, expected) << text;
        }
    }
    Value zero;
    ASSERT_EQ(parse("-1e-400", zero), R::SUCCESS);
    EXPECT_TRUE(std::signbit(boost::get<double>(zero)));
}

// The code and the byte offset of each failure; `out` is left as it was.
TEST(Parser, Failures) {
    const std::tuple<std::string, R, std::size_t> rows[] = {
        {" \n\t", R::EMPTY_INPUT, 3},
        {"nulL", R::INVALID_NULL, 0},
        {"[fals e]", R::INVALID_BOOLEAN, 1},
        {R"("\u12)", R::INCOMPLETE_ESCAPE, 5},
        {R"("\x")", R::INVALID_ESCAPE, 2},
        {R"("\u12g4")", R::INVALID_UNICODE_ESCAPE, 5},
        {R"({"a": 1,})", R::MISSING_LEADING_QUOTE, 8},
        {R"("abc)", R::MISSING_TRAILING_QUOTE, 4},
        {"\"a\nb\"", R::MISSING_TRAILING_QUOTE, 2},
        {"-x", R::MISSING_QUANTITY_AFTER_SIGN, 1},
        {"[1,]", R::MISSING_LEADING_DIGIT, 3},
        {"1.e5", R::INVALID_FRACTION, 2},
        {"1e+", R::INVALID_EXPONENT, 3},
        {"[01]", R::MISSING_TRAILING_BRACKET, 2},
        // The bytes next to the digits, inside a sixteen-byte block.
        {"[123456789/]" + std::string(16, ' '), R::MISSING_TRAILING_BRACKET, 10},
        {"[0.123456789:]" + std::string(16, ' '), R::MISSING_TRAILING_BRACKET, 12},
        {"[\n  1,\n  2 3\n]", R::MISSING_TRAILING_BRACKET, 11},
        {R"({"a": 1 "b": 2})", R::MISSING_TRAILING_BRACE, 8},
        {R"({"a" 1})", R::MISSING_COLON, 5},
        {R"({"a":)", R::UNEXPECTED_END_OF_INPUT, 5},
        {"[1] [2]", R::UNEXPECTED_END_OF_INPUT, 4},
        {std::string(513, '[') + std::string(513, ']'), R::MISSING_TRAILING_BRACKET, 512}};
    for (const auto& [text, code, offset] : rows) {
        Value out = Array{"untouched"};
        const ParseReport report = parse(text, out, {});
        EXPECT_TRUE(report.result == code && report.offset == offset) << text;
        EXPECT_EQ(out, Array{"untouched"}) << text;
    }
    const auto message = [](const std::string& text) {
        Value out;
        const ParseReport report = parse(text, out, {});
        return std::to_string(report.line) + ":" + std::to_string(report.column) + " " +
               report.message() + (report.too_deep ? " too deep" : "");
    };
    EXPECT_EQ(message("[\n  1,\n  2 3\n]"),
              "3:5 No trailing ']' while parsing value of type array (possible missing comma?)");
    EXPECT_EQ(message("{} x"),
              "1:4 Unexpected end of input (the text goes on after the JSON value)");
    EXPECT_EQ(message(std::string(513, '[')),
              "1:513 No trailing ']' while parsing value of type array (possible missing comma?) "
              "(the document is nested deeper than the maximum depth) too deep");
    Value out;
    EXPECT_EQ(parse(std::string(512, '[') + std::string(512, ']'), out), R::SUCCESS);
    EXPECT_TRUE(parse(std::string(513, '[') + std::string(513, ']'), out, ParseOptions{513}));
}

#ifdef JSON_DATA_DIR
std::string read_file(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

// The parsing test suite: y_ files must parse, n_ files must fail, i_ files may do either.
// Accepted documents, and the benchmark documents, survive a write, compact and pretty, and a
// second parse unchanged (canada.json: numbers of every magnitude).
TEST(Parser, Conformance) {
    const std::filesystem::path data = JSON_DATA_DIR;
    std::map<char, int> files;
    std::vector<std::filesystem::path> documents = {
        data / "bench/twitter.json", data / "bench/citm_catalog.json", data / "bench/canada.json"};
    for (const auto& entry :
         std::filesystem::directory_iterator(data / "JSONTestSuite/test_parsing")) {
        const char kind = entry.path().filename().string().front();
        ++files[kind];
        Value document;
        const R result = parse(read_file(entry.path()), document);
        EXPECT_TRUE(kind == 'i' || (result == R::SUCCESS) == (kind == 'y')) << entry.path();
        if (kind == 'y') {
            documents.push_back(entry.path());
        }
    }
    EXPECT_EQ(files, (std::map<char, int>{{'i', 35}, {'n', 188}, {'y', 95}}));
    for (const std::filesystem::path& path : documents) {
        Value document;
        ASSERT_EQ(parse(read_file(path), document), R::SUCCESS) << path;
        const std::string compact = serialize(document);
        EXPECT_EQ(Value(document), document) << path << ": the copy differs";
        for (const bool pretty : {false, true}) {
            Serializer serializer;
            serializer.pretty_print(pretty);
            std::ostringstream on_stream;
            serializer.write(on_stream, document);
            EXPECT_EQ(on_stream.str(), pretty ? pretty_print(document) : compact)
                << path << ": a stream and a string receive different text";
        }
        for (const std::string& text : {compact, pretty_print(document)}) {
            Value again;
            ASSERT_EQ(parse(text, again), R::SUCCESS) << path;
            EXPECT_EQ(again, document) << path;
            EXPECT_EQ(serialize(again), compact) << path << ": writing is not stable";
        }
    }
}
#endif

// The texts with quotes, brackets and parentheses in them, and the ends of the table.
TEST(ParseSupport, Descriptions) {
    const std::pair<int, const char*> rows[] = {
        {0, "No error"},
        {7, "Found '\"' character outside escape sequence before end of string"},
        {17, "No trailing '}' while parsing value of type object (possible missing comma?)"},
        {19, "Unexpected end of input"},
        {20, "Unrecognized error code"},
        {-1, "Unrecognized error code"}};
    for (const auto& [code, text] : rows) {
        EXPECT_STREQ(get_parse_result_description(static_cast<R>(code)), text) << code;
    }
}

TEST(ParseSupport, U16ToU8) {
    using detail::u16_to_u8;
    const std::pair<std::u16string, std::string> rows[] = {
        {u"A\u007F\u0080", "A\x7F\xC2\x80"},
        {u"\u07FF\u0800", "\xDF\xBF\xE0\xA0\x80"},
        {u"\uD7FF\uE000\uFFFF", "\xED\x9F\xBF\xEE\x80\x80\xEF\xBF\xBF"},
        {u"\U00010000\U0010FFFF", "\xF0\x90\x80\x80\xF4\x8F\xBF\xBF"},
        {std::u16string(u"a\0b", 3), std::string("a\0b", 3)},
        {u"\xD800x\xDC00\xD800", "\xEF\xBF\xBDx\xEF\xBF\xBD\xEF\xBF\xBD"}}; // unpaired: U+FFFD
    for (auto [units, expected] : rows) {
        EXPECT_EQ(u16_to_u8(units.data(), static_cast<int>(units.size())), expected);
    }
    char16_t units[] = u"abc";
    EXPECT_EQ(u16_to_u8(units, 0), "");
    EXPECT_EQ(u16_to_u8(nullptr, 0), "");
    for (int count : {3, -1}) {
        try {
            u16_to_u8(nullptr, count);
            ADD_FAILURE() << "no exception";
        } catch (const std::length_error&) {
            ADD_FAILURE() << "the count was checked before the text";
        } catch (const std::logic_error& error) {
            EXPECT_STREQ(error.what(), "basic_string::_M_construct null not valid");
        }
    }
    EXPECT_THROW(u16_to_u8(units, -1), std::length_error);
}

} // namespace
