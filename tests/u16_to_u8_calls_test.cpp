// Substitutes the text-encoding library: this executable defines the converter's exported
// members itself, so libjsonvalue's calls land here and can be recorded.
#include <json/parse.hpp>

#include <codecvt_ustring_to_string.hpp>

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <vector>

namespace {

std::vector<std::string> calls;
bool constructor_throws = false;

} // namespace

codecvt_ustring_to_string::codecvt_ustring_to_string(const std::string& name, bool flag)
    : encoding(name), replace_malformed(flag), iconv_descriptor(nullptr) {
    calls.push_back("construct " + name + (flag ? " true" : " false"));
    if (constructor_throws) {
        throw std::runtime_error("converter unavailable");
    }
}

codecvt_ustring_to_string::~codecvt_ustring_to_string() {
    calls.push_back("destroy");
}

std::string codecvt_ustring_to_string::do_convert(const char16_t* text, std::size_t count) const {
    calls.push_back("convert " + std::to_string(count) + (text[count] == 0 ? " terminated" : ""));
    return "converted";
}

namespace {

using json::detail::u16_to_u8;
using Calls = std::vector<std::string>;

class U16ToU8Calls : public ::testing::Test {
  protected:
    void SetUp() override {
        calls.clear();
        constructor_throws = false;
    }
};

TEST_F(U16ToU8Calls, ConverterIsMadeOnEveryCallBeforeTheInputIsLookedAt) {
    char16_t text[] = {u'a', 0, u'b'};
    EXPECT_EQ(u16_to_u8(text, 3), "converted");
    EXPECT_EQ(calls, (Calls{"construct UTF-8 true", "convert 3 terminated", "destroy"}));

    calls.clear();
    EXPECT_EQ(u16_to_u8(text, 0), "");
    EXPECT_EQ(u16_to_u8(nullptr, 0), "");
    EXPECT_EQ(calls, (Calls{"construct UTF-8 true", "destroy", "construct UTF-8 true", "destroy"}))
        << "no do_convert for an empty input";

    calls.clear();
    EXPECT_THROW(u16_to_u8(nullptr, 2), std::logic_error);
    EXPECT_THROW(u16_to_u8(text, -5), std::length_error);
    EXPECT_EQ(calls, (Calls{"construct UTF-8 true", "destroy", "construct UTF-8 true", "destroy"}));
}

TEST_F(U16ToU8Calls, ConverterFailurePassesThroughUnchanged) {
    constructor_throws = true;
    char16_t text[] = {u'a'};
    try {
        u16_to_u8(text, 1);
        FAIL() << "no exception";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "converter unavailable");
    }
    EXPECT_EQ(calls, (Calls{"construct UTF-8 true"}));
}

} // namespace
