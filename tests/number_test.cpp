// Integers of sixteen to twenty digits, which json::parse converts from their 64-bit value up
// to nineteen digits and through the number-text library beyond: the double it keeps against
// the library's, and its refusal of the inexact ones against the double's exact decimal digits
// (printf's "%.0f", which prints them all).

#include <json/json.hpp>
#include <json/text_conversion.hpp>

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <random>
#include <string>
#include <vector>

namespace {

using namespace json;

// Whether the double holds the integer `literal` exactly, by its exact decimal digits.
bool holds_exactly(const std::string& literal, double value) {
    char digits[400];
    std::snprintf(digits, sizeof digits, "%.0f", value);
    return literal.compare(digits) == 0;
}

bool same_double(double left, double right) {
    return std::memcmp(&left, &right, sizeof left) == 0;
}

// The default parse keeps an integer exactly or refuses it; asked to round, it keeps the
// library's double.
void expect_read_as_the_library_reads(const std::string& literal) {
    const double expected = detail::string_to_double(literal.c_str());
    ParseOptions rounding;
    rounding.allow_inexact_integers = true;
    Value rounded;
    ASSERT_TRUE(parse(literal, rounded, rounding)) << literal;
    EXPECT_TRUE(same_double(boost::get<double>(rounded), expected))
        << literal << ": " << boost::get<double>(rounded) << " against " << expected;

    Value kept;
    const ParseReport report = parse(literal, kept, ParseOptions());
    EXPECT_EQ(static_cast<bool>(report), holds_exactly(literal, expected)) << literal;
    EXPECT_EQ(report.refusal, report ? Refusal::NONE : Refusal::INEXACT_NUMBER) << literal;
}

// Around 2^53 (ties to even), 2^63 (past the signed range), the last nineteen-digit integer and
// the first twenty-digit ones, 2^64 and a tie above it, each with either sign.
TEST(IntegerNumbers, EdgesReadAsTheLibraryReads) {
    const char* const edges[] = {
        "9007199254740991",     "9007199254740992",     "9007199254740993",
        "9007199254740995",     "18014398509481986",    "18014398509481990",
        "1000000000000000",     "9999999999999999",     "1234567890123456789",
        "9223372036854775807",  "9223372036854775808",  "9223372036854775809",
        "9223372036854776832",  "9223372036854776833",  "1000000000000000000",
        "9999999999999999999",  "10000000000000000000", "12345678901234567890",
        "18446744073709551615", "18446744073709551616", "18446744073709555712",
        "99999999999999999999", "100000000000000000000"};
    for (const std::string edge : edges) {
        expect_read_as_the_library_reads(edge);
        expect_read_as_the_library_reads("-" + edge);
    }
}

// Integers of sixteen to twenty digits drawn from a fixed seed, half of them near a power of
// two, where the doubles are farthest apart for their digits.
TEST(IntegerNumbers, SampledReadAsTheLibraryReads) {
    std::mt19937_64 random(20240934);
    for (int sample = 0; sample < 100000; ++sample) {
        std::uint64_t integer = random();
        if (sample % 2 == 0) {
            const int power = 53 + static_cast<int>(random() % 11);
            integer = (std::uint64_t{1} << power) + random() % 4096 - 2048;
        }
        std::string literal = std::to_string(integer);
        if (sample % 7 == 0) {
            literal += std::to_string(random() % 10); // twenty digits, some beyond 2^64
        }
        if (literal.size() >= 16) {
            expect_read_as_the_library_reads(sample % 3 == 0 ? "-" + literal : literal);
        }
    }
}

// An exponent that takes a number beyond the range of double is refused wherever it stands in a
// long literal (the look for it takes eight bytes at a time), in either case; so is a long
// integer part's, while the same digits without the exponent are read.
TEST(ExponentNumbers, FoundAtEveryPlace) {
    for (std::size_t zeros = 0; zeros != 24; ++zeros) {
        for (const std::string& mantissa :
             {"1." + std::string(zeros, '0') + "5", "-1" + std::string(zeros, '0') + ".5"}) {
            Value out;
            EXPECT_TRUE(parse(mantissa, out, ParseOptions())) << mantissa;
            for (const char* exponent : {"e400", "E+400"}) {
                const std::string literal = mantissa + exponent;
                const ParseReport report = parse(literal, out, ParseOptions());
                EXPECT_EQ(report.refusal, Refusal::INEXACT_NUMBER) << literal;
            }
        }
    }
}

} // namespace
