// Numbers are written and read the same under a locale whose decimal separator is a comma.
#include <json/json.hpp>

#include <gtest/gtest.h>

#include <clocale>
#include <locale>
#include <sstream>

namespace {

using json::Array;
using json::Value;

class CommaDecimalLocale : public ::testing::Test {
  protected:
    void SetUp() override {
        // scripts/install-deps.sh generates this locale.
        ASSERT_NE(std::setlocale(LC_ALL, "de_DE.UTF-8"), nullptr) << "de_DE.UTF-8 is missing";
        previous = std::locale::global(std::locale("de_DE.UTF-8"));
        ASSERT_EQ(*std::localeconv()->decimal_point, ',');
    }
    void TearDown() override {
        std::locale::global(previous);
        std::setlocale(LC_ALL, "C");
    }
    std::locale previous;
};

TEST_F(CommaDecimalLocale, WrittenNumbersKeepTheirPoint) {
    const Value numbers = Array{0.5, -1.25e-3, 1e300, 1234567.875, 0.1f};
    const std::string expected = "[0.5,-0.00125,1e+300,1234567.875,0.1]";
    EXPECT_EQ(json::serialize(numbers), expected);
    std::ostringstream imbued; // a stream carrying the locale too
    json::Serializer().write(imbued, numbers);
    EXPECT_EQ(imbued.str(), expected);
    EXPECT_EQ(json::serialize("\x01"), R"("\u0001")");
}

TEST_F(CommaDecimalLocale, ParsedNumbersKeepTheirValue) {
    Value parsed;
    ASSERT_EQ(json::parse("[0.5, -1.25e-3, 1234567.875]", parsed), json::ParseResult::SUCCESS);
    EXPECT_EQ(parsed, (Array{0.5, -1.25e-3, 1234567.875}));
    EXPECT_EQ(json::detail::string_to_double("2.5"), 2.5);
}

} // namespace
