// The number-text stand-in: shortest round-trip text, valid JSON numbers, locale independence.
#include <number_text.hpp>

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <regex>
#include <string>

namespace {

std::string double_text(double value) {
    char buffer[80] = {};
    const int length = getDoubleValueStr(buffer, value);
    EXPECT_EQ(length, static_cast<int>(std::strlen(buffer)));
    return buffer;
}

std::string float_text(float value) {
    char buffer[80] = {};
    getFloatValueStr(buffer, value);
    return buffer;
}

bool is_json_number(const std::string& text) {
    static const std::regex number(R"(-?(0|[1-9][0-9]*)(\.[0-9]+)?([eE][+-]?[0-9]+)?)");
    return std::regex_match(text, number);
}

bool same_bits(double a, double b) {
    return std::memcmp(&a, &b, sizeof a) == 0;
}

TEST(NumberText, ShortestForms) {
    EXPECT_EQ(double_text(0.1), "0.1");
    EXPECT_EQ(double_text(100), "100");
    EXPECT_EQ(double_text(-0.0), "-0");
    EXPECT_EQ(double_text(1e22), "1e+22");
    EXPECT_EQ(double_text(5e-324), "5e-324");
    EXPECT_EQ(float_text(0.1f), "0.1");
    EXPECT_EQ(float_text(16777216.0f), "16777216");
}

TEST(NumberText, RandomDoublesRoundTripAsJsonNumbers) {
    std::mt19937_64 random(20261122);
    for (int i = 0; i < 100'000; ++i) {
        const std::uint64_t bits = random();
        double value = 0;
        std::memcpy(&value, &bits, sizeof value);
        if (!std::isfinite(value)) {
            continue;
        }
        const std::string text = double_text(value);
        ASSERT_LE(text.size(), 79u);
        ASSERT_TRUE(is_json_number(text)) << text;
        ASSERT_TRUE(same_bits(convertStrToDouble(text.c_str()), value)) << text;
    }
}

TEST(NumberText, NonFiniteValuesStillGiveJsonNumbers) {
    EXPECT_EQ(double_text(std::numeric_limits<double>::infinity()), "1e999");
    EXPECT_EQ(double_text(-std::numeric_limits<double>::infinity()), "-1e999");
    EXPECT_EQ(float_text(std::nanf("")), "0");
}

TEST(NumberText, OutOfRangeReadsLikeStrtod) {
    const double inf = std::numeric_limits<double>::infinity();
    EXPECT_EQ(convertStrToDouble("1e400"), inf);
    EXPECT_EQ(convertStrToDouble("-1e400"), -inf);
    EXPECT_EQ(convertStrToDouble("123456789e99999999999999999999"), inf);
    EXPECT_EQ(convertStrToDouble("0.0001e-99999"), 0.0);
    EXPECT_TRUE(same_bits(convertStrToDouble("-1e-400"), -0.0));
    EXPECT_EQ(convertStrToDouble("0.00000000001e320"), inf) << "1e309: the exponent alone misleads";
    EXPECT_EQ(convertStrToDouble("100000e-329"), 0.0) << "1e-324";
    EXPECT_EQ(convertStrToDouble("4.9e-324"), 5e-324) << "subnormals are in range";
    EXPECT_EQ(convertStrToDouble("not a number"), 0.0);
}

} // namespace
