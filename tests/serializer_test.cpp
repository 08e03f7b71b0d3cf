#include <json/json.hpp>

#include <gtest/gtest.h>

#include <cfloat>
#include <cmath>
#include <limits>
#include <locale>
#include <sstream>

namespace {

using json::Array;
using json::Object;
using json::Value;

using namespace std::string_literals;

TEST(Serializer, Scalars) {
    EXPECT_EQ(json::serialize(Value()), "");
    EXPECT_EQ(json::pretty_print(Value()), "");
    EXPECT_EQ(json::serialize(nullptr), "null");
    EXPECT_EQ(json::serialize(true), "true");
    EXPECT_EQ(json::pretty_print(false), "false");
    EXPECT_EQ(json::serialize(0.5), "0.5");
    EXPECT_EQ(json::serialize(-0.0), "-0");
    EXPECT_EQ(json::serialize(0.1f), "0.1");
    EXPECT_EQ(json::serialize(1e300), "1e+300");
}

TEST(Serializer, NonFiniteNumbersBecomeStrings) {
    const double inf = std::numeric_limits<double>::infinity();
    const float inff = std::numeric_limits<float>::infinity();
    EXPECT_EQ(json::serialize(std::nan("")), "\"NaN\"");
    EXPECT_EQ(json::serialize(inf), "\"Inf\"");
    EXPECT_EQ(json::serialize(-inf), "\"-Inf\"");
    EXPECT_EQ(json::serialize(std::nanf("")), "\"NaN\"");
    EXPECT_EQ(json::serialize(inff), "\"Inf\"");
    EXPECT_EQ(json::serialize(-inff), "\"-Inf\"");
    // The largest finite values are numbers.
    EXPECT_EQ(json::serialize(DBL_MAX), "1.7976931348623157e+308");
    EXPECT_EQ(json::serialize(-DBL_MAX), "-1.7976931348623157e+308");
    EXPECT_EQ(json::serialize(FLT_MAX), "3.4028235e+38");
    EXPECT_EQ(json::serialize(-FLT_MAX), "-3.4028235e+38");
}

TEST(Serializer, StringEscapes) {
    EXPECT_EQ(json::serialize(""), "\"\"");
    EXPECT_EQ(json::serialize("a\"b\\c/d"), R"("a\"b\\c\/d")");
    EXPECT_EQ(json::serialize("\t\n"), R"("\t\n")");
    EXPECT_EQ(json::serialize("\b\f\r"), R"("\b\f\r")");
    EXPECT_EQ(json::serialize("\x00\x01\x0b\x1f"s), R"("\u0000\u0001\u000b\u001f")");
    EXPECT_EQ(json::serialize("\x7f"), "\"\x7f\"");
    EXPECT_EQ(json::serialize("caf\xC3\xA9 \xFF\xFE"), "\"caf\xC3\xA9 \xFF\xFE\"")
        << "bytes from 0x80 up pass unchanged, valid UTF-8 or not";
    EXPECT_EQ(json::serialize("long run before an escape\x01 and after"s),
              R"("long run before an escape\u0001 and after")");
}

TEST(Serializer, UnicodeEscapeUsesAndRestoresStreamFormatting) {
    json::Serializer serializer;
    std::ostringstream upper;
    upper.setf(std::ios_base::uppercase);
    serializer.write(upper, "\x1f");
    EXPECT_EQ(upper.str(), R"("\u001F")");
    EXPECT_TRUE(upper.flags() & std::ios_base::uppercase);

    std::ostringstream octal;
    octal.setf(std::ios_base::oct, std::ios_base::basefield);
    octal.fill(' ');
    const std::ios_base::fmtflags before = octal.flags();
    serializer.write(octal, "\x01");
    EXPECT_EQ(octal.str(), R"("\u0001")");
    EXPECT_EQ(octal.flags(), before);
    EXPECT_EQ(octal.fill(), '0') << "the fill character stays as the escape left it";
    octal << 8;
    EXPECT_EQ(octal.str(), R"("\u0001"10)");
}

struct LayoutCase {
    Value value;
    const char* compact;
    const char* pretty;
};

TEST(Serializer, ContainerLayout) {
    const LayoutCase cases[] = {
        {Array{}, "[]", "[]"},
        {Object{}, "{}", "{}"},
        {Array{true, false, nullptr}, "[true,false,null]", "[\n    true,\n    false,\n    null\n]"},
        {Object{{"b", true}, {"a", nullptr}, {"B", false}}, R"({"B":false,"a":null,"b":true})",
         "{\n    \"B\":false,\n    \"a\":null,\n    \"b\":true\n}"},
        {Object{{"a", Array{}}}, R"({"a":[]})", "{\n    \"a\":[    ]\n}"},
        {Object{{"k", Object{}}}, R"({"k":{}})", "{\n    \"k\":{    }\n}"},
        {Array{Array{}}, "[[]]", "[\n    [    ]\n]"},
        {Array{Object{}}, "[{}]", "[\n    {    }\n]"},
        {Array{Array{Array{}}}, "[[[]]]", "[\n    [\n        [        ]\n    ]\n]"},
        {Object{{"a", Array{true, nullptr}}, {"b", "x"}}, R"({"a":[true,null],"b":"x"})",
         "{\n    \"a\":[\n        true,\n        null\n    ],\n    \"b\":\"x\"\n}"},
        {Array{Object{{"x", false}}}, R"([{"x":false}])",
         "[\n    {\n        \"x\":false\n    }\n]"},
        {Object{{"o", Object{{"p", Array{}}}}}, R"({"o":{"p":[]}})",
         "{\n    \"o\":{\n        \"p\":[        ]\n    }\n}"},
        {Object{{"a/b", "c"}}, R"({"a\/b":"c"})", "{\n    \"a\\/b\":\"c\"\n}"},
    };
    for (const LayoutCase& layout : cases) {
        EXPECT_EQ(json::serialize(layout.value), layout.compact);
        EXPECT_EQ(json::pretty_print(layout.value), layout.pretty);
    }
}

TEST(Serializer, UndefinedInsideContainersKeepsTheTextValid) {
    const Value array = Array{true, json::Undefined(), false};
    EXPECT_EQ(json::serialize(array), "[true,null,false]");
    const Value object = Object{{"a", json::Undefined()}, {"b", 1}, {"c", json::Undefined()}};
    EXPECT_EQ(json::serialize(object), R"({"b":1})");
    EXPECT_EQ(json::pretty_print(object), "{\n    \"b\":1\n}");
    const Value only_undefined = Array{Object{{"a", json::Undefined()}}};
    EXPECT_EQ(json::serialize(only_undefined), "[{}]");
    EXPECT_EQ(json::pretty_print(only_undefined), "[\n    {    }\n]");
}

TEST(Serializer, ModeAndStreamOperator) {
    json::Serializer serializer;
    EXPECT_FALSE(serializer.pretty_print());
    serializer.pretty_print(true);
    EXPECT_TRUE(serializer.pretty_print());
    std::ostringstream out;
    serializer.write(out, Array{1});
    serializer.write(out, Array{2});
    EXPECT_EQ(out.str(), "[\n    1\n][\n    2\n]") << "each write starts at level 0";

    std::ostringstream streamed;
    streamed << Value(Object{{"k", Array{1, "v"}}});
    EXPECT_EQ(streamed.str(), R"({"k":[1,"v"]})");
}

// Counts what reaches it and how often it is flushed.
class CountingBuffer : public std::streambuf {
  public:
    std::string text;
    int flushes = 0;
    std::size_t newlines_at_flush = 0;

  protected:
    int_type overflow(int_type c) override {
        text.push_back(traits_type::to_char_type(c));
        return c;
    }
    std::streamsize xsputn(const char* bytes, std::streamsize count) override {
        text.append(bytes, static_cast<std::size_t>(count));
        return count;
    }
    int sync() override {
        ++flushes;
        EXPECT_EQ(text.back(), '\n') << "a flush comes right after each newline";
        return 0;
    }
};

TEST(Serializer, PrettyModeFlushesAtEveryNewline) {
    CountingBuffer buffer;
    std::ostream out(&buffer);
    json::Serializer serializer;
    serializer.pretty_print(true);
    serializer.write(out, Object{{"a", Array{1, 2}}, {"b", Object{}}});
    EXPECT_EQ(buffer.flushes, 6);

    CountingBuffer compact_buffer;
    std::ostream compact(&compact_buffer);
    json::Serializer().write(compact, Array{1, Array{2}});
    EXPECT_EQ(compact_buffer.flushes, 0);
}

// A ctype facet that widens '\n' to '|', to show that newlines go through the stream's widen.
class PipeNewlines : public std::ctype<char> {
  protected:
    char do_widen(char c) const override { return c == '\n' ? '|' : c; }
    const char* do_widen(const char* from, const char* end, char* to) const override {
        for (; from != end; ++from, ++to) {
            *to = do_widen(*from);
        }
        return end;
    }
};

TEST(Serializer, NewlinesAreWidenedByTheStream) {
    std::ostringstream out;
    out.imbue(std::locale(out.getloc(), new PipeNewlines));
    json::Serializer serializer;
    serializer.pretty_print(true);
    serializer.write(out, Array{1, 2});
    EXPECT_EQ(out.str(), "[|    1,|    2|]");
}

// json::serialize and json::pretty_print give what a Serializer writes into a default
// std::ostringstream, also when the global locale widens '\n' to something else.
TEST(Serializer, StringResultsMatchADefaultStringStream) {
    const Value document =
        Object{{"text", "tab\t nul\x01 \x1f/"}, {"list", Array{1.5, Array{}, Object{}}}};
    auto through_stream = [&document](bool pretty) {
        json::Serializer serializer;
        serializer.pretty_print(pretty);
        std::ostringstream out;
        serializer.write(out, document);
        return out.str();
    };
    const std::locale previous = std::locale::global(std::locale(std::locale(), new PipeNewlines));
    const std::string compact = json::serialize(document);
    const std::string pretty = json::pretty_print(document);
    const std::string compact_expected = through_stream(false);
    const std::string pretty_expected = through_stream(true);
    std::locale::global(previous);
    EXPECT_EQ(compact, compact_expected);
    EXPECT_EQ(pretty, pretty_expected);
    EXPECT_NE(pretty.find("{|    \"list\""), std::string::npos) << pretty;
}

TEST(Serializer, BadStreamReceivesNothingAndExceptionsPropagate) {
    std::ostringstream bad;
    bad.setstate(std::ios_base::badbit);
    json::Serializer().write(bad, Array{"text", 1});
    EXPECT_EQ(bad.str(), "");

    CountingBuffer buffer;
    std::ostream throwing(&buffer);
    throwing.exceptions(std::ios_base::badbit);
    throwing.setstate(std::ios_base::failbit);
    EXPECT_THROW(
        {
            throwing.exceptions(std::ios_base::failbit);
            json::Serializer().write(throwing, Array{1});
        },
        std::ios_base::failure);
}

} // namespace
