// The number-text companion's shortest text against std::to_chars (plain form, shortest round
// trip), which the companion promises to match exactly for every finite value.
//
// The samples are drawn from a fixed seed, so a failure repeats. Their number per table is
// JSONVALUE_NUMBER_TEXT_SAMPLES when set (the valgrind run of the test command sets a small
// one), otherwise 10,000,000 in an optimised build (about four seconds for the whole test) and
// 1,000,000 in a debug or sanitizer build, where each call costs some ten times as much.

#include <number_text.hpp>

#include <gtest/gtest.h>

#include <array>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <random>
#include <sstream>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

namespace {

constexpr std::uint64_t SEED = 20240934;

std::uint64_t sample_count() {
    if (const char* samples = std::getenv("JSONVALUE_NUMBER_TEXT_SAMPLES")) {
        return std::stoull(samples);
    }
#ifdef NDEBUG
    return 10'000'000;
#else
    return 1'000'000;
#endif
}

int companion_text(char* buffer, double value) {
    return getDoubleValueStr(buffer, value);
}

int companion_text(char* buffer, float value) {
    return getFloatValueStr(buffer, value);
}

// Compares the companion's text of each value with to_chars' and keeps the first few
// differences.
template <typename Number>
class TextComparison {
  public:
    // Non-finite values have no JSON number: to_chars writes "inf", the companion "1e999".
    void check(Number value) {
        if (!std::isfinite(value)) {
            return;
        }
        std::array<char, 80> expected{};
        const auto expected_end = std::to_chars(expected.begin(), expected.end() - 1, value).ptr;
        const std::string_view wanted(expected.data(),
                                      static_cast<std::size_t>(expected_end - expected.data()));
        // Not zero-filled, so that a missing terminator shows.
        std::array<char, 80> written;
        written.fill('#');
        const int length = companion_text(written.data(), value);
        const bool terminated =
            length >= 0 && length < 80 && written.at(static_cast<std::size_t>(length)) == '\0';
        const std::string_view got(written.data(), terminated ? std::strlen(written.data()) : 0);
        if (terminated && got == wanted) {
            return;
        }
        if (++mismatches_ <= 5) {
            examples_ << "\n  wanted " << wanted << ", got "
                      << (terminated ? std::string(got) : "an unterminated text") << " (" << length
                      << ")";
        }
    }

    ::testing::AssertionResult result() const {
        if (mismatches_ == 0) {
            return ::testing::AssertionSuccess();
        }
        return ::testing::AssertionFailure()
               << mismatches_ << " values written unlike to_chars (seed " << SEED
               << "):" << examples_.str();
    }

  private:
    std::uint64_t mismatches_ = 0;
    std::ostringstream examples_;
};

template <typename Number>
using Bits = std::conditional_t<sizeof(Number) == 8, std::uint64_t, std::uint32_t>;

template <typename Number>
Number from_bits(Bits<Number> bits) {
    Number value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

// A value and both its neighbours.
template <typename Number>
void check_with_neighbours(TextComparison<Number>& comparison, Number value) {
    comparison.check(value);
    comparison.check(std::nextafter(value, std::numeric_limits<Number>::infinity()));
    comparison.check(std::nextafter(value, -std::numeric_limits<Number>::infinity()));
}

template <typename Number>
class NumberText : public ::testing::Test {};

using Numbers = ::testing::Types<double, float>;
TYPED_TEST_SUITE(NumberText, Numbers);

// Bit patterns drawn evenly: every exponent, sign and subnormal equally likely.
TYPED_TEST(NumberText, RandomBitPatterns) {
    using Number = TypeParam;
    std::mt19937_64 random(SEED);
    TextComparison<Number> comparison;
    for (std::uint64_t i = 0, count = sample_count(); i != count; ++i) {
        comparison.check(from_bits<Number>(static_cast<Bits<Number>>(random())));
    }
    EXPECT_TRUE(comparison.result());
}

// Values read from decimals of 1 to 17 significant digits (9 for a float), and their
// neighbours: the numbers people write, whose shortest text is often the decimal itself, and
// next to them the longest texts. Half of the exponents are drawn near zero, where fixed and
// scientific notation take turns.
TYPED_TEST(NumberText, DecimalsAndTheirNeighbours) {
    using Number = TypeParam;
    constexpr int max_digits = std::numeric_limits<Number>::max_digits10;
    std::mt19937_64 random(SEED);
    std::uniform_int_distribution<int> digit_count(1, max_digits);
    std::uniform_int_distribution<int> any_exponent(std::numeric_limits<Number>::min_exponent10 -
                                                        max_digits - 8,
                                                    std::numeric_limits<Number>::max_exponent10);
    std::uniform_int_distribution<int> near_exponent(-max_digits - 8, max_digits + 8);
    TextComparison<Number> comparison;
    for (std::uint64_t i = 0, count = sample_count() / 3; i != count; ++i) {
        const int digits = digit_count(random);
        std::uniform_int_distribution<std::uint64_t> significand(
            digits == 1 ? 1 : static_cast<std::uint64_t>(std::pow(10.0, digits - 1)),
            static_cast<std::uint64_t>(std::pow(10.0, digits)) - 1);
        const int exponent = i % 2 == 0 ? near_exponent(random) : any_exponent(random);
        const std::string decimal =
            std::to_string(significand(random)) + 'e' + std::to_string(exponent);
        Number value = 0;
        const auto read = std::from_chars(decimal.data(), decimal.data() + decimal.size(), value);
        if (read.ec == std::errc()) {
            check_with_neighbours(comparison, value);
        }
    }
    EXPECT_TRUE(comparison.result());
}

// Zeros, the limits of the subnormals, normals and exact integers, every power of two and
// ten, and the integers around the powers of ten that fixed notation still writes in full; each
// with its neighbours and both signs.
TYPED_TEST(NumberText, EdgeCases) {
    using Number = TypeParam;
    using Limits = std::numeric_limits<Number>;
    TextComparison<Number> comparison;
    const auto check_both_signs = [&comparison](Number value) {
        check_with_neighbours(comparison, value);
        check_with_neighbours(comparison, -value);
    };
    check_both_signs(Number{0});
    for (const Number value : {Limits::denorm_min(), 3 * Limits::denorm_min(),
                               Limits::min() - Limits::denorm_min(), Limits::min(), Limits::max(),
                               Limits::epsilon(), std::ldexp(Number{1}, Limits::digits) + 2}) {
        check_both_signs(value);
    }
    for (int exponent = Limits::min_exponent - Limits::digits; exponent < Limits::max_exponent;
         ++exponent) {
        check_both_signs(std::ldexp(Number{1}, exponent));
    }
    for (int exponent = Limits::min_exponent10 - Limits::digits10;
         exponent <= Limits::max_exponent10; ++exponent) {
        const std::string power = "1e" + std::to_string(exponent);
        Number value = 0;
        if (std::from_chars(power.data(), power.data() + power.size(), value).ec == std::errc()) {
            check_both_signs(value);
            for (const Number factor : {2, 3, 5, 7, 9}) {
                check_both_signs(value * factor);
            }
        }
    }
    for (Number integer = 1; integer < static_cast<Number>(1e24); integer *= 10) {
        for (const Number offset : {1, 3, 7, 123, 4096}) {
            check_both_signs(integer + offset);
            check_both_signs(integer * 7 + offset);
        }
    }
    EXPECT_TRUE(comparison.result());
}

TEST(NumberText, NonFiniteValues) {
    constexpr double inf = std::numeric_limits<double>::infinity();
    constexpr double nan = std::numeric_limits<double>::quiet_NaN();
    const std::pair<double, std::string_view> rows[] = {
        {inf, "1e999"}, {-inf, "-1e999"}, {nan, "0"}, {-nan, "0"}};
    for (const auto& [value, text] : rows) {
        std::array<char, 80> as_double, as_float;
        as_double.fill('#');
        as_float.fill('#');
        EXPECT_EQ(getDoubleValueStr(as_double.data(), value), static_cast<int>(text.size()));
        EXPECT_EQ(getFloatValueStr(as_float.data(), static_cast<float>(value)),
                  static_cast<int>(text.size()));
        EXPECT_EQ(as_double.data(), text);
        EXPECT_EQ(as_float.data(), text);
    }
}

} // namespace
