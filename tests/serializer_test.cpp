#include "support/documents.hpp"
#include "support/errors.hpp"
#include "support/writing.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <algorithm>
#include <cfloat>
#include <clocale>
#include <cmath>
#include <cstdlib>
#include <iomanip>
#include <locale>
#include <sstream>

namespace {

using namespace json;
using std::ios_base;
using namespace std::string_literals;

TEST(Serializer, CompactAndPrettyText) {
    const Undefined undefined;
    const struct {
        Value value;
        std::string compact;
        const char* pretty = nullptr; // when it differs
    } rows[] = {
        {Value(), ""},
        // The number texts themselves are number_text_test's; here zero's sign, a float's own
        // shortest text, the longest text, scientific notation, the longest fixed notation,
        // and the strings of the non-finite numbers.
        {-0.0, "-0"},
        {0.1f, "0.1"},
        {DBL_MAX, "1.7976931348623157e+308"},
        {-12000000.0, "-1.2e+07"},
        {1125899906842623.5, "1125899906842623.5"},
        {HUGE_VAL, R"("Inf")"},
        {-HUGE_VAL, R"("-Inf")"},
        {std::nan(""), R"("NaN")"},
        {-HUGE_VALF, R"("-Inf")"},
        {NAN, R"("NaN")"},
        {"\"\\/\b\f\n\r\t", R"("\"\\\/\b\f\n\r\t")"},
        {"\x00\x01\x0b\x1f\x20\x7f"s, "\"\\u0000\\u0001\\u000b\\u001f \x7f\""},
        {"caf\xC3\xA9 \xFF\xFE", "\"caf\xC3\xA9 \xFF\xFE\""},
        // Escapes at the ends of eight-byte words.
        {"0123456\03789abcdef\"ABCDEF/", R"("0123456\u001f89abcdef\"ABCDEF\/")"},
        {Array{}, "[]"},
        {Object{}, "{}"},
        {Array{true, undefined, nullptr}, "[true,null,null]",
         "[\n    true,\n    null,\n    null\n]"},
        {Object{{"b", true}, {"a", undefined}, {"\xC3\xA9", 1}, {"B", false}},
         "{\"B\":false,\"b\":true,\"\xC3\xA9\":1}",
         "{\n    \"B\":false,\n    \"b\":true,\n    \"\xC3\xA9\":1\n}"},
        {Object{{"a", Array{}}, {"u", undefined}}, R"({"a":[]})", "{\n    \"a\":[    ]\n}"},
        {Object{{"a", Array{true, nullptr}}, {"b/", "x"}}, R"({"a":[true,null],"b\/":"x"})",
         "{\n    \"a\":[\n        true,\n        null\n    ],\n    \"b\\/\":\"x\"\n}"},
        // An empty container's padding grows with its depth (the options' rows show depth 1).
        {Array{Object{{"x", Object{{"p", Array{}}}}}}, R"([{"x":{"p":[]}}])",
         "[\n    {\n        \"x\":{\n            \"p\":[            ]\n        }\n    }\n]"},
        // Indentation deeper than sixteen spaces, on the way in and out.
        {Array{Array{Array{Array{Array{1}}}}}, "[[[[[1]]]]]",
         "[\n    [\n        [\n            [\n                [\n                    1\n"
         "                ]\n            ]\n        ]\n    ]\n]"}};
    const WriteOptions pretty = test_support::write_options_from("p");
    for (const auto& row : rows) {
        const std::string pretty_text = row.pretty ? row.pretty : row.compact;
        EXPECT_EQ(serialize(row.value), row.compact);
        EXPECT_EQ(pretty_print(row.value), pretty_text);
        // The default options give the library's own text.
        EXPECT_EQ(serialize(row.value, {}), row.compact);
        EXPECT_EQ(serialize(row.value, pretty), pretty_text);
    }
}

// Strings are scanned in sixteen-byte blocks, the last of them overlapping the one before, and
// shorter ones with nothing to escape take a shortcut: an escape anywhere in a string of any
// length up to past two blocks must still be found.
TEST(Serializer, StringsFindEveryEscape) {
    const struct {
        char byte;
        const char* escaped;
    } specials[] = {
        {'"', "\\\""}, {'\\', "\\\\"}, {'/', "\\/"}, {'\n', "\\n"}, {'\x1f', "\\u001f"}};
    for (std::size_t length = 1; length <= 40; ++length) {
        for (const auto& special : specials) {
            for (std::size_t at = 0; at != length; ++at) {
                std::string text(length, 'a');
                text[at] = special.byte;
                const std::string expected =
                    '"' + text.substr(0, at) + special.escaped + text.substr(at + 1) + '"';
                EXPECT_EQ(serialize(text), expected) << "length " << length << ", at " << at;
            }
        }
    }
}

// Text that outgrows the buffer the writer gathers it in, with a string longer than that buffer.
TEST(Serializer, TextLongerThanItsBuffer) {
    const std::string long_string(40000, 'x');
    const Value document = Array{long_string, Array(3000, "0123456789")};
    std::string expected = "[\"" + long_string + "\",[";
    for (int i = 0; i < 3000; ++i) {
        expected += "\"0123456789\",";
    }
    expected.back() = ']';
    EXPECT_EQ(serialize(document), expected + ']');
    std::ostringstream pretty;
    pretty << std::setw(4) << document;
    EXPECT_EQ(pretty_print(document), pretty.str());
}

// On a caller's stream the \u digits come from the stream's own formatting: the writer sets
// only the base, the fill and the width, and gives the flags back.
TEST(Serializer, EscapesOnAStreamFollowItsFlags) {
    const struct {
        const char* text;
        ios_base::fmtflags flags, mask;
        const char *on_stream, *in_string;
    } rows[] = {{"\x01", {}, {}, R"("\u0001")", R"("\u0001")"},
                {"\x1f", ios_base::uppercase, ios_base::uppercase, R"("\u001F")", R"("\u001f")"},
                {"\x01", ios_base::left, ios_base::adjustfield, R"("\u1000")", R"("\u0001")"},
                {"\x01", ios_base::showbase, ios_base::showbase, R"("\u00x1")", R"("\u0001")"},
                {"\x1f", ios_base::oct, ios_base::basefield, R"("\u001f")", R"("\u001f")"}};
    for (const auto& row : rows) {
        std::ostringstream out;
        out.setf(row.flags, row.mask);
        const ios_base::fmtflags before = out.flags();
        Serializer().write(out, row.text);
        EXPECT_EQ(out.str(), row.on_stream);
        EXPECT_EQ(out.flags(), before);
        EXPECT_EQ(serialize(row.text), row.in_string);
    }
}

// A ctype facet that widens '\n' to '|'.
class PipeNewlines : public std::ctype<char> {
  protected:
    char do_widen(char c) const override { return c == '\n' ? '|' : c; }
    const char* do_widen(const char* from, const char* end, char* to) const override {
        std::transform(from, end, to, [this](char c) { return do_widen(c); });
        return end;
    }
};

// Each newline is widened by the stream's locale and flushed, as std::endl does.
TEST(Serializer, NewlinesAndStreams) {
    test_support::WrittenText buffer;
    std::ostream out(&buffer);
    out.imbue(std::locale(out.getloc(), new PipeNewlines));
    Serializer serializer;
    serializer.pretty_print(true);
    serializer.write(out, Array{1, Object{}});
    serializer.write(out, Array{2});
    const std::string pretty = "[|    1,|    {    }|][|    2|]";
    EXPECT_EQ(buffer.text, pretty) << "each write starts at level 0";
    EXPECT_EQ(buffer.flushes, (std::vector<std::size_t>{2, 9, 20, 23, 29}));
    Serializer().write(out, Array{1, Array{2}});
    out << Value(Object{{"k", Array{1, "v"}}});
    EXPECT_EQ(buffer.text, pretty + R"([1,[2]]{"k":[1,"v"]})");
    EXPECT_EQ(buffer.flushes.size(), 5u) << "compact text is never flushed";

    std::ostringstream bad;
    bad.setstate(ios_base::badbit);
    Serializer().write(bad, Array{"text", 1});
    EXPECT_EQ(bad.str(), "") << "a bad stream receives nothing";
    buffer.broken = true;
    out.exceptions(ios_base::badbit);
    EXPECT_THROW(Serializer().write(out, Array{1}), ios_base::failure);
}

// A width set on the stream asks for pretty text with that many spaces per level, std::setw(4)
// for json::pretty_print's text; the Value uses the width up, as the standard inserters do.
TEST(Serializer, InsertionTakesTheWidthAsIndentation) {
    const Value document = Object{{"a", Array{1, Object{}}}};
    const std::pair<int, std::string> rows[] = {
        {0, R"({"a":[1,{}]})"},
        {-2, R"({"a":[1,{}]})"},
        {1, "{\n \"a\":[\n  1,\n  {  }\n ]\n}"},
        {4, pretty_print(document)},
    };
    for (const auto& [width, text] : rows) {
        std::ostringstream out;
        out << std::setw(width) << document << 7;
        EXPECT_EQ(out.str(), text + "7") << width;
    }
}

// Under global C and C++ locales with a comma as decimal separator, and a newline widened to
// '|': the strings of serialize and pretty_print are what a default std::ostringstream would
// hold, and numbers are written and read unchanged. The locale is made by the set-up script;
// without it the test is skipped, unless JSONVALUE_REQUIRE_SETUP=1 (scripts/test.sh) asks for
// everything the set-up makes.
TEST(Serializer, UnderADecimalCommaLocale) {
    if (std::setlocale(LC_ALL, "de_DE.UTF-8") == nullptr) {
        const char* const missing = "the de_DE.UTF-8 locale is missing: scripts/install-deps.sh "
                                    "(as root) makes it, or locale-gen de_DE.UTF-8";
        const char* const require = std::getenv("JSONVALUE_REQUIRE_SETUP");
        if (require != nullptr && std::string(require) == "1") {
            FAIL() << missing;
        }
        GTEST_SKIP() << missing;
    }
    const std::locale previous =
        std::locale::global(std::locale(std::locale("de_DE.UTF-8"), new PipeNewlines));
    const Value numbers = Array{0.5, -1.25e-3, 1e300, 1234567.875, 0.1f};
    std::ostringstream imbued;
    Serializer().write(imbued, numbers);
    Value parsed;
    const ParseResult result = parse(serialize(numbers), parsed);
    const std::string in_string = pretty_print(Array{1, Object{}});
    std::locale::global(previous);
    std::setlocale(LC_ALL, "C");
    EXPECT_EQ(in_string, "[|    1,|    {    }|]");
    EXPECT_EQ(imbued.str(), "[0.5,-0.00125,1e+300,1234567.875,0.1]");
    EXPECT_EQ(result, ParseResult::SUCCESS);
    EXPECT_EQ(parsed, (Array{0.5, -1.25e-3, 1e300, 1234567.875, 0.1}));
}

} // namespace

namespace options_test {

// Each option alone and in pairs, against text written out by hand.
TEST(SerializerOptions, EachOptionAloneAndInPairs) {
    const Value document = Object{{"a", Array{1, "x/y"}},
                                  {"e", Array{}},
                                  {"o", Object{{"u", Undefined()}}},
                                  {"\xC3\xA9", "\xE2\x82\xAC"}};
    const auto with = test_support::write_options_from;
    const struct {
        WriteOptions options;
        const char* text;
    } rows[] = {
        {with(""), "{\"a\":[1,\"x\\/y\"],\"e\":[],\"o\":{},\"\xC3\xA9\":\"\xE2\x82\xAC\"}"},
        // Layout options do nothing to compact text.
        {with("2te"), "{\"a\":[1,\"x\\/y\"],\"e\":[],\"o\":{},\"\xC3\xA9\":\"\xE2\x82\xAC\"}"},
        {with("p"), "{\n    \"a\":[\n        1,\n        \"x\\/y\"\n    ],\n    \"e\":[    ],\n"
                    "    \"o\":{    },\n    \"\xC3\xA9\":\"\xE2\x82\xAC\"\n}"},
        {with("s"), "{\"a\": [1,\"x\\/y\"],\"e\": [],\"o\": {},\"\xC3\xA9\": \"\xE2\x82\xAC\"}"},
        {with("/"), "{\"a\":[1,\"x/y\"],\"e\":[],\"o\":{},\"\xC3\xA9\":\"\xE2\x82\xAC\"}"},
        {with("a"), R"({"a":[1,"x\/y"],"e":[],"o":{},"\u00e9":"\u20ac"})"},
        {with("p2"), "{\n  \"a\":[\n    1,\n    \"x\\/y\"\n  ],\n  \"e\":[  ],\n  \"o\":{  },\n"
                     "  \"\xC3\xA9\":\"\xE2\x82\xAC\"\n}"},
        {with("p0"),
         "{\n\"a\":[\n1,\n\"x\\/y\"\n],\n\"e\":[],\n\"o\":{},\n\"\xC3\xA9\":\"\xE2\x82\xAC\"\n}"},
        {with("pt"), "{\n\t\"a\":[\n\t\t1,\n\t\t\"x\\/y\"\n\t],\n\t\"e\":[\t],\n\t\"o\":{\t},\n"
                     "\t\"\xC3\xA9\":\"\xE2\x82\xAC\"\n}"},
        {with("pe"), "{\n    \"a\":[\n        1,\n        \"x\\/y\"\n    ],\n    \"e\":[],\n"
                     "    \"o\":{},\n    \"\xC3\xA9\":\"\xE2\x82\xAC\"\n}"},
        {with("ps"), "{\n    \"a\": [\n        1,\n        \"x\\/y\"\n    ],\n    \"e\": [    ],\n"
                     "    \"o\": {    },\n    \"\xC3\xA9\": \"\xE2\x82\xAC\"\n}"},
        {with("pte"), "{\n\t\"a\":[\n\t\t1,\n\t\t\"x\\/y\"\n\t],\n\t\"e\":[],\n\t\"o\":{},\n"
                      "\t\"\xC3\xA9\":\"\xE2\x82\xAC\"\n}"},
        {with("a/"), R"({"a":[1,"x/y"],"e":[],"o":{},"\u00e9":"\u20ac"})"},
        {with("as"), R"({"a": [1,"x\/y"],"e": [],"o": {},"\u00e9": "\u20ac"})"},
        {COMMON_PRETTY, "{\n  \"a\": [\n    1,\n    \"x/y\"\n  ],\n  \"e\": [],\n  \"o\": {},\n"
                        "  \"\xC3\xA9\": \"\xE2\x82\xAC\"\n}"},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(serialize(document, row.options), row.text);
        std::ostringstream out;
        EXPECT_EQ(&write(out, document, row.options), &out);
        EXPECT_EQ(out.str(), row.text);
    }
}

// Characters above U+007F become \u escapes, those above U+FFFF a surrogate pair; a string
// that is not well-formed UTF-8 cannot be written, and the offset of its first bad byte is
// named.
TEST(SerializerOptions, AsciiOnly) {
    const WriteOptions ascii = test_support::write_options_from("a");
    const struct {
        const char *text, *escaped;
    } characters[] = {
        {"\x7f", "\"\x7f\""},
        {"\xC2\x80", R"("\u0080")"},
        {"\xEF\xBF\xBF", R"("\uffff")"},
        {"\xF0\x90\x80\x80", R"("\ud800\udc00")"},
        {"\xF4\x8F\xBF\xBF", R"("\udbff\udfff")"},
        {"a\xC3\xA9/\n\x01 0123456789abcdef\xF0\x9F\x98\x80",
         R"("a\u00e9\/\n\u0001 0123456789abcdef\ud83d\ude00")"},
    };
    for (const auto& row : characters) {
        EXPECT_EQ(serialize(row.text, ascii), row.escaped);
        EXPECT_EQ(serialize(Object{{row.text, 1}}, ascii), "{" + std::string(row.escaped) + ":1}");
    }
    const struct {
        const char* text;
        std::size_t offset;
    } ill_formed[] = {{"\x80", 0},
                      {"ab\xC3", 2},
                      {"\xC0\xAF", 0},
                      {"\xED\xA0\x80", 0},
                      {"\xF4\x90\x80\x80", 0},
                      {"\xC3\xA9\xFF", 2},
                      {"0123456789abcdefghij\xE2\x82", 20}};
    for (const auto& row : ill_formed) {
        for (const Value& value : {Value(row.text), Value(Object{{row.text, 1}})}) {
            const std::string error = test_support::error_of([&] { serialize(value, ascii); });
            EXPECT_EQ(error.rfind("invalid: ", 0), 0u) << error;
            EXPECT_NE(error.find("byte " + std::to_string(row.offset)), std::string::npos) << error;
        }
    }
    // On a caller's stream the digits follow its flags, as for control characters.
    std::ostringstream upper;
    upper << std::uppercase;
    write(upper, "\xC3\xA9", ascii);
    EXPECT_EQ(upper.str(), R"("\u00E9")");
}

} // namespace options_test
