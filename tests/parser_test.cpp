#include <json/json.hpp>

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>

namespace {

using json::Array;
using json::Object;
using json::ParseResult;
using json::Value;

Value parsed(std::string_view text) {
    Value out;
    const json::ParseReport report = json::parse(text, out, {});
    EXPECT_TRUE(report) << text << ": " << report.message();
    return out;
}

ParseResult code_of(std::string_view text) {
    Value out = "untouched";
    const ParseResult result = json::parse(text, out);
    EXPECT_EQ(out, Value("untouched")) << "a failed parse changed out: " << text;
    return result;
}

TEST(Parser, EveryKindOfValue) {
    EXPECT_EQ(parsed("null"), nullptr);
    EXPECT_EQ(parsed(" true "), true);
    EXPECT_EQ(parsed("\tfalse\r\n"), false);
    EXPECT_EQ(parsed("-12.5e1"), -125.0);
    EXPECT_EQ(parsed("0").which(), 3);
    EXPECT_EQ(parsed(R"("text")"), "text");
    EXPECT_EQ(parsed("[]"), Array{});
    EXPECT_EQ(parsed("{}"), Object{});
    EXPECT_EQ(parsed(R"([1, "two", [true], {"k": null}])"),
              (Array{1, "two", Array{true}, Object{{"k", nullptr}}}));
}

TEST(Parser, Numbers) {
    EXPECT_EQ(parsed("1E2"), 100.0);
    EXPECT_EQ(parsed("1e-2"), 0.01);
    EXPECT_EQ(parsed("-0"), -0.0);
    EXPECT_TRUE(std::signbit(boost::get<double>(parsed("-0"))));
    EXPECT_EQ(parsed("1e400"), std::numeric_limits<double>::infinity());
    EXPECT_EQ(parsed("-1e400"), -std::numeric_limits<double>::infinity());
    EXPECT_EQ(parsed("1e-400"), 0.0);
    EXPECT_EQ(parsed("123456789012345678901234567890"), 1.2345678901234568e29);
}

TEST(Parser, Strings) {
    EXPECT_EQ(parsed(R"("\"\\\/\b\f\n\r\t")"), "\"\\/\b\f\n\r\t");
    EXPECT_EQ(parsed(R"("\u0041\u00e9")"), "A\xC3\xA9");
    EXPECT_EQ(parsed(R"("\ud83d\ude00")"), "\xF0\x9F\x98\x80") << "a pair is one character";
    EXPECT_EQ(parsed(R"("\ud83dx")"), "\xEF\xBF\xBDx") << "an unpaired surrogate is U+FFFD";
    EXPECT_EQ(parsed(R"("a\u0000b")"), std::string("a\0b", 3));
    EXPECT_EQ(parsed("\"caf\xC3\xA9 \xFF\""), "caf\xC3\xA9 \xFF") << "bytes from 0x80 up kept";
}

TEST(Parser, DuplicateNamesLastOneWins) {
    EXPECT_EQ(parsed(R"({"a": 1, "b": [2], "a": {"c": 3}})"),
              (Object{{"a", Object{{"c", 3}}}, {"b", Array{2}}}));
}

TEST(Parser, FailureCodes) {
    EXPECT_EQ(code_of(""), ParseResult::EMPTY_INPUT);
    EXPECT_EQ(code_of(" \n\t"), ParseResult::EMPTY_INPUT);
    EXPECT_EQ(code_of("nul"), ParseResult::INVALID_NULL);
    EXPECT_EQ(code_of("nulL"), ParseResult::INVALID_NULL);
    EXPECT_EQ(code_of("tru"), ParseResult::INVALID_BOOLEAN);
    EXPECT_EQ(code_of("fals e"), ParseResult::INVALID_BOOLEAN);
    EXPECT_EQ(code_of(R"("a\)"), ParseResult::INCOMPLETE_ESCAPE);
    EXPECT_EQ(code_of(R"("\u12)"), ParseResult::INCOMPLETE_ESCAPE);
    EXPECT_EQ(code_of(R"("\x")"), ParseResult::INVALID_ESCAPE);
    EXPECT_EQ(code_of(R"("\u12g4")"), ParseResult::INVALID_UNICODE_ESCAPE);
    EXPECT_EQ(code_of(R"({1: 2})"), ParseResult::MISSING_LEADING_QUOTE);
    EXPECT_EQ(code_of(R"("abc)"), ParseResult::MISSING_TRAILING_QUOTE);
    EXPECT_EQ(code_of("\"a\nb\""), ParseResult::MISSING_TRAILING_QUOTE);
    EXPECT_EQ(code_of("-"), ParseResult::MISSING_QUANTITY_AFTER_SIGN);
    EXPECT_EQ(code_of("-x"), ParseResult::MISSING_QUANTITY_AFTER_SIGN);
    EXPECT_EQ(code_of("[1,]"), ParseResult::MISSING_LEADING_DIGIT);
    EXPECT_EQ(code_of("+1"), ParseResult::MISSING_LEADING_DIGIT);
    EXPECT_EQ(code_of("1."), ParseResult::INVALID_FRACTION);
    EXPECT_EQ(code_of("1.e5"), ParseResult::INVALID_FRACTION);
    EXPECT_EQ(code_of("1e"), ParseResult::INVALID_EXPONENT);
    EXPECT_EQ(code_of("1e+"), ParseResult::INVALID_EXPONENT);
    EXPECT_EQ(code_of("[1 2]"), ParseResult::MISSING_TRAILING_BRACKET);
    EXPECT_EQ(code_of("[01]"), ParseResult::MISSING_TRAILING_BRACKET);
    EXPECT_EQ(code_of(R"({"a": 1 "b": 2})"), ParseResult::MISSING_TRAILING_BRACE);
    EXPECT_EQ(code_of(R"({"a" 1})"), ParseResult::MISSING_COLON);
    EXPECT_EQ(code_of("[1,"), ParseResult::UNEXPECTED_END_OF_INPUT);
    EXPECT_EQ(code_of(R"({"a":)"), ParseResult::UNEXPECTED_END_OF_INPUT);
    EXPECT_EQ(code_of("[1] [2]"), ParseResult::UNEXPECTED_END_OF_INPUT);
}

TEST(Parser, ReportSaysWhere) {
    Value out;
    const json::ParseReport report = json::parse("[\n  1,\n  2 3\n]", out, {});
    EXPECT_EQ(report.result, ParseResult::MISSING_TRAILING_BRACKET);
    EXPECT_EQ(report.offset, 11u);
    EXPECT_EQ(report.line, 3u);
    EXPECT_EQ(report.column, 5u);
    EXPECT_FALSE(report.too_deep);
    EXPECT_EQ(report.message(), json::get_parse_result_description(report.result));

    const json::ParseReport trailing = json::parse("{} x", out, {});
    EXPECT_EQ(trailing.message(),
              "Unexpected end of input (the text goes on after the JSON value)");
    EXPECT_EQ(trailing.column, 4u);
}

TEST(Parser, DepthLimit) {
    const std::string deep_ok = std::string(512, '[') + std::string(512, ']');
    const std::string too_deep = std::string(513, '[') + std::string(513, ']');
    Value out = 1;
    EXPECT_EQ(json::parse(deep_ok, out), ParseResult::SUCCESS);
    const json::ParseReport report = json::parse(too_deep, out, {});
    EXPECT_FALSE(report);
    EXPECT_TRUE(report.too_deep);
    EXPECT_EQ(report.offset, 512u);
    EXPECT_NE(report.message().find("nested deeper"), std::string::npos);
    EXPECT_EQ(json::parse(std::string(100'000, '['), out), ParseResult::MISSING_TRAILING_BRACKET);
    EXPECT_EQ(json::parse(too_deep, out, json::ParseOptions{513}).result, ParseResult::SUCCESS);

    std::string objects;
    for (int i = 0; i < 100'000; ++i) {
        objects += R"({"k":)";
    }
    EXPECT_EQ(json::parse(objects, out), ParseResult::MISSING_TRAILING_BRACE);
    objects += "1" + std::string(100'000, '}');
    EXPECT_EQ(json::parse(objects, out, json::ParseOptions{100'000}).result, ParseResult::SUCCESS);
    EXPECT_EQ(json::serialize(out), objects);
}

TEST(Parser, OutTakesTheDocumentWhateverItHeld) {
    const Value documents[] = {Array{1, Object{}}, Object{{"a", "b"}}, "text", 2.0, nullptr};
    const Value previous[] = {Value(), Array{3}, Object{{"x", 1}}, "old", 4.0f};
    for (const Value& document : documents) {
        for (const Value& before : previous) {
            Value out = before;
            ASSERT_EQ(json::parse(json::serialize(document), out), ParseResult::SUCCESS);
            EXPECT_EQ(out, document);
        }
    }
}

// Random Values of every alternative a parse can give back, with awkward strings and numbers.
class ValueGenerator {
  public:
    explicit ValueGenerator(unsigned seed) : random(seed) {}

    Value make(int depth) {
        switch (pick(depth > 0 ? 7 : 5)) {
        case 0:
            return nullptr;
        case 1:
            return pick(2) == 1;
        case 2:
            return number();
        case 3:
        case 4:
            return text();
        case 5: {
            Array items;
            for (int i = pick(5); i > 0; --i) {
                items.push_back(make(depth - 1));
            }
            return items;
        }
        default: {
            Object members;
            for (int i = pick(5); i > 0; --i) {
                members[text()] = make(depth - 1);
            }
            return members;
        }
        }
    }

  private:
    int pick(int count) { return std::uniform_int_distribution<int>(0, count - 1)(random); }

    double number() {
        std::uint64_t bits = random();
        double value = 0;
        std::memcpy(&value, &bits, sizeof value);
        return std::isfinite(value) ? value : static_cast<double>(pick(1000)) - 500;
    }

    std::string text() {
        std::string result;
        for (int i = pick(12); i > 0; --i) {
            result += static_cast<char>(pick(256));
        }
        return result;
    }

    std::mt19937_64 random;
};

TEST(Parser, GeneratedValuesRoundTripExactly) {
    ValueGenerator generator(7);
    for (int i = 0; i < 2000; ++i) {
        const Value original = generator.make(4);
        for (const std::string& text : {json::serialize(original), json::pretty_print(original)}) {
            Value back;
            ASSERT_EQ(json::parse(text, back), ParseResult::SUCCESS) << text;
            ASSERT_EQ(back, original) << text;
            ASSERT_EQ(json::serialize(back), json::serialize(original));
        }
    }
}

} // namespace
