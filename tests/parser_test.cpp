#include "support/documents.hpp"
#include "support/errors.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <cmath>
#include <filesystem>
#include <fstream>
#include <map>
#include <sstream>
#include <type_traits>
#include <utility>
#include <vector>

namespace {

using namespace json;
using R = ParseResult;
using test_support::options_from;

// Each text into `out` holding each alternative: `out` takes the document whatever it held.
TEST(Parser, Values) {
    const std::pair<std::string, Value> rows[] = {
        {"null", nullptr},
        {" true ", true},
        {"\tfalse\r\n", false},
        {"-12.5e1", -125.0},
        {"1E2", 100.0},
        {"1e-2", 0.01},
        {"100000000000000000000", 1e20},   // an integer beyond 2^64 that a double holds
        {"-9223372036854775808", -0x1p63}, // the least 64-bit integer, a power of two
        {"123456789012345678901234567890.5", 1.2345678901234568e29}, // a fraction, rounded
        {"100000e-329", 0.0},                                        // 1e-324: rounded to zero
        {"4.9e-324", 5e-324},                                        // subnormals are in range
        {R"("\"\\\/\b\f\n\r\t")", "\"\\/\b\f\n\r\t"},
        {R"("\u0041\u00e9\u20AC\ud83d\ude00")", "A\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80"},
        {R"("a\u0000b")", std::string("a\0b", 3)},
        {"\"caf\xC3\xA9 \xF0\x9F\x98\x80\"", "caf\xC3\xA9 \xF0\x9F\x98\x80"},
        {"[]", Array{}},
        {"{}", Object{}},
        {R"([1, "two", [true], {"k": null}])",
         Array{1, "two", Array{true}, Object{{"k", nullptr}}}},
        {R"({"a": 1, "b": [2], "a": {"c": 3}})", Object{{"a", Object{{"c", 3}}}, {"b", Array{2}}}},
        {R"({"s": "first", "t": "kept", "s": "last"})", Object{{"s", "last"}, {"t", "kept"}}},
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
               report.message() + (report.refusal == Refusal::TOO_DEEP ? " too deep" : "");
    };
    EXPECT_EQ(message("[\n  1,\n  2 3\n]"),
              "3:5 No trailing ']' while parsing value of type array (possible missing comma?)");
    // A carriage return ends a line, alone or before a line feed.
    EXPECT_EQ(message("[1,\r2,\rx]"),
              "3:1 Expected leading digit while parsing value of type number "
              "(no JSON value starts here)");
    EXPECT_EQ(message("[1,\r\n2,\n\r x]").substr(0, 4), "4:2 ");
    EXPECT_EQ(message("{} x"),
              "1:4 Unexpected end of input (the text goes on after the JSON value)");
    // A refusal leads with its reason.
    EXPECT_EQ(message(std::string(513, '[')),
              "1:513 the document is nested deeper than 512 levels; ParseOptions::max_depth sets "
              "the limit too deep");
    Value out;
    EXPECT_EQ(parse(std::string(512, '[') + std::string(512, ']'), out), R::SUCCESS);
    EXPECT_TRUE(parse(std::string(513, '[') + std::string(513, ']'), out, ParseOptions{513}));
}

// json::parse(text or stream) returns the document, or throws with what() made of the report's
// place and message; the overloads that take `out` still return their report or code.
TEST(Parser, ReturningTheDocument) {
    static_assert(std::is_same_v<decltype(parse("[1]")), Value>);
    static_assert(std::is_same_v<decltype(parse("[1]", std::declval<Value&>())), R>);
    std::istringstream stream(" [3] ");
    EXPECT_EQ(parse(stream), Array{3});
    EXPECT_EQ(parse(R"([1, {"a": null}])"), (Array{1, Object{{"a", nullptr}}}));
    EXPECT_EQ(parse("[2] // two", options_from("c")), Array{2});
    EXPECT_EQ(parse(std::string(R"("a\u0000b")")), std::string("a\0b", 3));
    const std::pair<std::string, std::string> failures[] = {
        {"[1] // one", ""}, {"[1,\n 2,,]", "c"}, {"{\"a\":1}\n\n  x", "c"}};
    for (const auto& [text, letters] : failures) {
        Value out;
        const ParseReport report = parse(text, out, options_from(letters));
        const std::string expected = "invalid: " + std::to_string(report.line) + ":" +
                                     std::to_string(report.column) + ": " + report.message();
        EXPECT_EQ(test_support::error_of([&] { parse(text, options_from(letters)); }), expected);
        std::istringstream in(text);
        EXPECT_EQ(test_support::error_of([&] { parse(in, options_from(letters)); }), expected);
    }
    EXPECT_EQ(test_support::error_of([] { parse(""); }),
              "invalid: 1:1: The given input sequence is empty");
}

// "=" and the compact text of what `text` parses to, or "@offset #code" and the refusal;
// checks that a failure leaves `out` alone.
std::string outcome(std::string_view text, std::string_view letters) {
    static constexpr const char* REFUSALS[] = {
        "",        "too deep", "bad UTF-8", "surrogate", "duplicate",
        "inexact", "stopped",  "bom",       "comment",   "trailing comma"};
    Value out = "untouched";
    const ParseReport report = parse(text, out, options_from(letters));
    if (report) {
        return "=" + serialize(out);
    }
    EXPECT_EQ(out, Value("untouched")) << text;
    std::string failure = "@" + std::to_string(report.offset) + " #" +
                          std::to_string(static_cast<int>(report.result));
    if (report.refusal != Refusal::NONE) {
        failure.append(" ").append(REFUSALS[static_cast<int>(report.refusal)]);
    }
    return failure;
}

struct OptionRow {
    std::string text;
    std::string letters;
    std::string expected;
};

void expect_outcomes(const std::vector<OptionRow>& rows) {
    for (const auto& [text, letters, expected] : rows) {
        EXPECT_EQ(outcome(text, letters), expected) << text << " with '" << letters << "'";
    }
}

// Nothing is changed silently: each of these is refused by default or when asked, and parsed
// as before by the lenient setting.
TEST(ParseOptions, RefusedUnlessAllowed) {
    expect_outcomes({
        {R"({"id": 1234567890123456789})", "", "@7 #13 inexact"},
        {R"({"id": 1234567890123456789})", "x", "@7 #13 inexact"},
        {R"({"id": 1234567890123456789})", "i", R"(={"id":1234567890123456768})"},
        {R"({"id": 1234567890123456789})", "ix", "@7 #13 inexact"},
        {"[-9007199254740993]", "o", "@1 #13 inexact"},
        {"[9007199254740994, -9223372036854775808, 18446744073709551616]", "",
         "=[9007199254740994,-9223372036854775808,18446744073709551616]"},
        {"[100000000000000000000, 2e22]", "", "=[1e+20,2e+22]"},
        {"[" + std::string(309, '9') + "]", "i", "@1 #13 inexact"},
        {"[" + std::string(309, '9') + "]", "o", R"(=["Inf"])"},
        {"[1e400]", "", "@1 #13 inexact"},
        {"[1e400]", "o", R"(=["Inf"])"},
        {"[-1e400]", "o", R"(=["-Inf"])"},
        {"[1e400]", "ox", "@1 #13 inexact"},
        {"[-1e-400]", "x", "@1 #13 inexact"},
        {"[1e-400]", "", "=[0]"},
        {"[1.5e300, 1e308]", "", "=[1.5e+300,1e+308]"},
        {"3.14159265358979323846", "", "=3.141592653589793"},
        {"\"\xFF\xFE\"", "", "@1 #9 bad UTF-8"},
        {"\"\xFF\xFE\"", "u", "=\"\xFF\xFE\""},
        {R"("\ud800")", "", "@1 #6 surrogate"},
        {R"("\ud800")", "s", "=\"\xEF\xBF\xBD\""},
        {R"({"a":1,"a":2})", "", R"(={"a":2})"},
        {R"({"a":1,"a":2})", "d", "@7 #17 duplicate"},
        {"// settings\n[1]", "", "@0 #11 comment"},
        {"// settings\n[1]", "c", "=[1]"},
        {"[1,]", "", "@3 #11 trailing comma"},
        {"[1,]", "t", "=[1]"},
        {R"({"a":1,})", "", "@7 #8 trailing comma"},
        {R"({"a":1,})", "t", R"(={"a":1})"},
        {"\xEF\xBB\xBF[1]", "", "@0 #11 bom"},
        {"\xEF\xBB\xBF[1]", "b", "=[1]"},
        {"\xEF\xBB\xBF", "b", "@3 #3"},
        {"\xEF\xBB", "b", "@0 #11"},
        {" \xEF\xBB\xBF[1]", "b", "@1 #11"},
    });
    const std::tuple<std::string, std::string, std::string> notes[] = {
        {"[1 // one\n]", "", "comments are not JSON; ParseOptions::allow_comments accepts them"},
        {"[1,]", "",
         "a trailing comma is not JSON; ParseOptions::allow_trailing_commas accepts one"},
        {"[1234567890123456789]", "",
         "1234567890123456789 cannot be held exactly by a double (the nearest is "
         "1234567890123456768): read it as text through json::parse_events, or allow it "
         "rounded with ParseOptions::allow_inexact_integers"},
        {"[-123456789012345678901234567890]", "",
         "(the nearest is -123456789012345677877719597056)"},
        {"[-1e400]", "",
         "-1e400 is beyond the range of a double: read it as text through json::parse_events, "
         "or allow it as an infinity with ParseOptions::allow_overflow"},
        {"[1234567890123456789]", "x",
         "1234567890123456789 cannot be held exactly by a double; "
         "ParseOptions::exact_numbers refuses every number a double changes"},
        {"[" + std::string(50, '1') + "]", "x", std::string(40, '1') + "... cannot be held"},
        {R"(["x\udc00y"])", "", "\\udc00 is half of a surrogate pair without its other half"},
        {"\"\xC0\x80\"", "", "not well-formed UTF-8"},
        {R"({"a\"\u0000/":1,"a\"\u0000/":2})", "d",
         "the object already has a member named \"a\\\"\\u0000/\"; without "
         "ParseOptions::reject_duplicate_keys the last one wins"},
        {"[1 /* open", "c", "the comment is not closed"},
        {"[1 / 2]", "c", "a comment starts with // or /*"},
        {std::string(513, '['), "", "nested deeper than 512 levels"},
        {"\xEF\xBB\xBF{}", "",
         "a UTF-8 byte order mark (EF BB BF) is not JSON; ParseOptions::allow_bom skips it"}};
    for (const auto& [text, letters, note] : notes) {
        Value out;
        const ParseReport report = parse(text, out, options_from(letters));
        EXPECT_NE(report.note.find(note), std::string::npos) << text << ": " << report.note;
    }
}

// Comments and trailing commas, alone and together, where they may stand and where not.
TEST(ParseOptions, CommentsAndTrailingCommas) {
    expect_outcomes({
        {"/* head */ [1, /* between */ 2] // tail", "c", "=[1,2]"},
        {"[1//c\n,2//c\r,3]", "c", "=[1,2,3]"},
        {"{/**/\"a\"/**/:/**/1/**/}", "c", R"(={"a":1})"},
        {"/**/", "c", "@4 #3"},
        {"1 /* open", "c", "@2 #19"},
        {"[1 /* open", "c", "@3 #15"},
        {"/", "c", "@0 #11"},
        {"[1]/", "c", "@3 #19"},
        {"[1 /* a */ 2]", "c", "@11 #15"},
        {"[\"//\", \"/*\"]", "", R"(=["\/\/","\/*"])"},
        {"[1,/**/]", "ct", "=[1]"},
        {"[1,/**/]", "t", "@3 #11 comment"},
        {"[1,/**/]", "c", "@7 #11 trailing comma"},
        {"{\"a\":[1,],}", "t", R"(={"a":[1]})"},
        {"[ 1 , ]", "t", "=[1]"},
        {"[,]", "t", "@1 #11"},
        {"{,}", "t", "@1 #8"},
        {"[1,,]", "t", "@3 #11"},
        {"[1,]", "cusdx", "@3 #11 trailing comma"},
        {"[1,]", "cusdxt", "=[1]"},
    });
}

// Every boundary of the table of well-formed UTF-8 sequences, in a short string, in one long
// enough for the sixteen-byte scan and in a member name; refused at the first byte of the
// ill-formed sequence, kept byte for byte with allow_invalid_utf8.
TEST(ParseOptions, Utf8Boundaries) {
    // The lowest and highest sequence of each row of the table, separated by spaces.
    const std::string well_formed =
        "\x7F \xC2\x80 \xDF\xBF \xE0\xA0\x80 \xE0\xBF\xBF \xE1\x80\x80 \xEC\xBF\xBF \xED\x80\x80 "
        "\xED\x9F\xBF \xEE\x80\x80 \xEF\xBF\xBF \xF0\x90\x80\x80 \xF1\x80\x80\x80 "
        "\xF3\xBF\xBF\xBF \xF4\x80\x80\x80 \xF4\x8F\xBF\xBF";
    // Overlong forms, lone and missing continuation bytes, a second or third byte that is no
    // continuation byte, surrogates, above U+10FFFF, and sequences cut short by an ASCII byte
    // or by the closing quote.
    const std::string ill_formed =
        "\xC1\xBF \xC0\x80 \xE0\x9F\xBF \xF0\x8F\xBF\xBF \x80 \xBF \xC2\xC0 \xDF\xC0 \xE1\xC0\x80 "
        "\xE1\x80\xC0 \xE1\x80\x7F \xED\xA0\x80 \xED\xBF\xBF \xF4\x90\x80\x80 \xF5\x80\x80\x80 "
        "\xFF \xC2\x7F \xEF\xBF \xF0\x90\x80";
    for (const bool expected : {true, false}) {
        std::istringstream sequences(expected ? well_formed : ill_formed);
        for (std::string bytes; sequences >> bytes;) {
            for (const std::string& before : {std::string("ab"), std::string(20, 'a')}) {
                for (const bool as_name : {false, true}) {
                    const std::string string = "\"" + before + bytes + "z\"";
                    const std::string text = as_name ? "{" + string + ":1}" : string;
                    const std::size_t offset = (as_name ? 2 : 1) + before.size();
                    const std::string stored = as_name ? "={" + string + ":1}" : "=" + string;
                    EXPECT_EQ(outcome(text, ""),
                              expected ? stored : "@" + std::to_string(offset) + " #9 bad UTF-8")
                        << string;
                    EXPECT_EQ(outcome(text, "u"), stored) << string;
                }
            }
        }
    }
    EXPECT_EQ(outcome("\"\xE2\x82", ""), "@1 #9 bad UTF-8"); // cut short by the end of the text
}

// Surrogate escapes: pairs in either run of escapes, every way of leaving one unpaired.
TEST(ParseOptions, LoneSurrogates) {
    expect_outcomes({
        {R"("x\ud83d\ude00")", "", "=\"x\xF0\x9F\x98\x80\""},
        {R"("\udbff\udfff")", "", "=\"\xF4\x8F\xBF\xBF\""},
        {R"("\ud83dx")", "", "@1 #6 surrogate"},
        {R"("\ude00\ud83d")", "", "@1 #6 surrogate"},
        {R"("\ud83d\ud83d\ude00")", "", "@1 #6 surrogate"},
        {R"("ab\u0041\udbff")", "", "@9 #6 surrogate"},
        {R"("\ud83d\n\ude00")", "", "@1 #6 surrogate"},
        {R"({"\udfff":1})", "", "@2 #6 surrogate"},
        {R"("\ud83dx\ude00")", "s", "=\"\xEF\xBF\xBDx\xEF\xBF\xBD\""},
    });
}

// The last member of a name wins, or the second of them is refused.
TEST(ParseOptions, DuplicateKeys) {
    expect_outcomes({
        {R"({"a":1,"b":2,"a":3,"a":4})", "", R"(={"a":4,"b":2})"},
        {R"({"a":1,"b":2,"a":3,"a":4})", "d", "@13 #17 duplicate"},
        {R"({"b":1,"a":1,"b":2,"a":2})", "d", "@13 #17 duplicate"},
        {R"({"same prefix 1":1,"same prefix 2":2})", "d",
         R"(={"same prefix 1":1,"same prefix 2":2})"},
        {R"([{"a":1},{"a":2}])", "d", R"(=[{"a":1},{"a":2}])"},
        {R"({"a":{"a":1}})", "d", R"(={"a":{"a":1}})"},
        {R"({"o":{"x":1, "x":2}})", "d", "@13 #17 duplicate"},
        {R"({"a":1,"a":2,})", "dt", "@7 #17 duplicate"},
        {"{\"\\u0061\":1,\"a\":2}", "d", "@12 #17 duplicate"},
    });
}

// The parsing test suite: y_ files must parse, n_ files must fail, i_ files may do either.
// Accepted documents, and the benchmark documents, survive a write, compact and pretty, and a
// second parse unchanged (canada.json: numbers of every magnitude).
TEST(Parser, Conformance) {
    std::map<char, int> files;
    std::vector<std::filesystem::path> documents = test_support::bench_files();
    for (const auto& path : test_support::suite_files()) {
        const char kind = path.filename().string().front();
        ++files[kind];
        Value document;
        const R result = parse(test_support::read_file(path), document);
        EXPECT_TRUE(kind == 'i' || (result == R::SUCCESS) == (kind == 'y')) << path;
        if (kind == 'y') {
            documents.push_back(path);
        }
    }
    EXPECT_EQ(files, (std::map<char, int>{{'i', 35}, {'n', 188}, {'y', 95}}));
    for (const std::filesystem::path& path : documents) {
        // twitter.json's 64-bit ids are rounded on purpose: the round trip is the rounded one's.
        const Value document =
            test_support::parsed(test_support::read_file(path), options_from("i"));
        const std::string compact = serialize(document);
        for (const std::string& text : {compact, pretty_print(document)}) {
            Value again;
            ASSERT_EQ(parse(text, again), R::SUCCESS) << path;
            EXPECT_EQ(again, document) << path;
            EXPECT_EQ(serialize(again), compact) << path << ": writing is not stable";
        }
    }
}

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
}

} // namespace
