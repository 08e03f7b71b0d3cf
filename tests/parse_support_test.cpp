// Parse outcome descriptions and the two text conversions.
#include <json/parse.hpp>

#include <codecvt_ustring_to_string.hpp>

#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

using json::ParseResult;
using json::detail::u16_to_u8;

const char* description(int code) {
    return json::get_parse_result_description(static_cast<ParseResult>(code));
}

TEST(ParseResultDescription, KnownCodes) {
    // The two ends and the texts with quotes, brackets and parentheses in them.
    EXPECT_STREQ(description(0), "No error");
    EXPECT_STREQ(description(1), "Failed to match the string 'null'");
    EXPECT_STREQ(description(7),
                 "Found '\"' character outside escape sequence before end of string");
    EXPECT_STREQ(description(15),
                 "No trailing ']' while parsing value of type array (possible missing comma?)");
    EXPECT_STREQ(description(17),
                 "No trailing '}' while parsing value of type object (possible missing comma?)");
    EXPECT_STREQ(description(19), "Unexpected end of input");
    std::set<std::string> distinct;
    for (int code = 0; code < 20; ++code) {
        ASSERT_NE(description(code), nullptr);
        EXPECT_NE(std::string(description(code)), "Unrecognized error code") << code;
        EXPECT_EQ(description(code), description(code)) << "one constant table";
        distinct.insert(description(code));
    }
    EXPECT_EQ(distinct.size(), 20u) << "every code has a text of its own";
    EXPECT_EQ(static_cast<int>(ParseResult::MISSING_COLON), 18);
    EXPECT_EQ(static_cast<int>(ParseResult::UNEXPECTED_END_OF_INPUT), 19);
}

TEST(ParseResultDescription, UnrecognizedCodes) {
    for (int code : {20, 21, -1, INT_MIN, INT_MAX}) {
        EXPECT_STREQ(description(code), "Unrecognized error code") << code;
    }
}

TEST(StringToDouble, ReadsNumberText) {
    EXPECT_EQ(json::detail::string_to_double("-12.5e2"), -1250.0);
    EXPECT_EQ(json::detail::string_to_double("1e999"), HUGE_VAL);
}

std::string utf8(std::u16string units) {
    return u16_to_u8(units.data(), static_cast<int>(units.size()));
}

TEST(U16ToU8, EmptyAndInvalidArguments) {
    char16_t text[] = u"abc";
    EXPECT_EQ(u16_to_u8(nullptr, 0), "");
    EXPECT_EQ(u16_to_u8(text, 0), "");
    try {
        u16_to_u8(nullptr, 3);
        FAIL() << "no exception";
    } catch (const std::length_error&) {
        FAIL() << "a null text is reported before the count";
    } catch (const std::logic_error& error) {
        EXPECT_STREQ(error.what(), "basic_string::_M_construct null not valid");
    }
    try {
        u16_to_u8(nullptr, -1);
        FAIL() << "no exception";
    } catch (const std::length_error&) {
        FAIL() << "a null text is reported before the count";
    } catch (const std::logic_error& error) {
        EXPECT_STREQ(error.what(), "basic_string::_M_construct null not valid");
    }
    EXPECT_THROW(u16_to_u8(text, -1), std::length_error);
}

TEST(U16ToU8, Characters) {
    EXPECT_EQ(utf8(u"A"), "A");
    EXPECT_EQ(utf8(u"\u00E9A"), "\xC3\xA9"
                                "A");
    EXPECT_EQ(utf8(u"\U0001F600"), "\xF0\x9F\x98\x80") << "a surrogate pair is one sequence";
    EXPECT_EQ(utf8(std::u16string(u"a\0b", 3)), std::string("a\0b", 3));
    EXPECT_EQ(utf8(u"\xD800x"), "\xEF\xBF\xBDx") << "an unpaired surrogate is U+FFFD";
    EXPECT_EQ(utf8(u"\xDC00"), "\xEF\xBF\xBD");
    EXPECT_EQ(utf8(std::u16string{0xDBFF}), "\xEF\xBF\xBD") << "a high surrogate at the end";
}

// An encoder written apart from the library's, straight from the definitions.
void encode_utf16(char32_t c, std::u16string& out) {
    if (c < 0x10000) {
        out += static_cast<char16_t>(c);
    } else {
        out += static_cast<char16_t>(0xD800 | ((c - 0x10000) / 0x400));
        out += static_cast<char16_t>(0xDC00 | ((c - 0x10000) % 0x400));
    }
}

void encode_utf8(char32_t c, std::string& out) {
    const int length = c < 0x80 ? 1 : c < 0x800 ? 2 : c < 0x10000 ? 3 : 4;
    static const unsigned char lead[] = {0, 0x00, 0xC0, 0xE0, 0xF0};
    unsigned char bytes[4];
    for (int i = length - 1; i > 0; --i) {
        bytes[i] = static_cast<unsigned char>(0x80 | (c % 64));
        c /= 64;
    }
    bytes[0] = static_cast<unsigned char>(lead[length] | c);
    out.append(reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(length));
}

TEST(U16ToU8, WholeUnicodeRange) {
    constexpr char32_t chunk = 0x1000;
    for (char32_t first = 0; first <= 0x10FFFF; first += chunk) {
        std::u16string units;
        std::string expected;
        for (char32_t c = first; c < first + chunk; ++c) {
            if (c < 0xD800 || c > 0xDFFF) {
                encode_utf16(c, units);
                encode_utf8(c, expected);
            }
        }
        ASSERT_EQ(utf8(units), expected) << "chunk from U+" << std::hex << first;
    }
}

TEST(TextEncoding, OtherEncodingsGoThroughIconv) {
    const std::u16string text = u"caf\u00E9 \u20AC";
    EXPECT_EQ(codecvt_ustring_to_string("ISO-8859-15", true).do_convert(text.data(), text.size()),
              "caf\xE9 \xA4");
    EXPECT_EQ(codecvt_ustring_to_string("utf8", true).do_convert(text.data(), text.size()),
              "caf\xC3\xA9 \xE2\x82\xAC");
    EXPECT_THROW(codecvt_ustring_to_string("ISO-8859-1", true).do_convert(text.data(), text.size()),
                 std::range_error);
    const std::u16string broken = u"\xD800";
    EXPECT_THROW(codecvt_ustring_to_string("UTF-8", false).do_convert(broken.data(), 1),
                 std::range_error);
    try {
        codecvt_ustring_to_string("NO-SUCH-ENCODING", true);
        FAIL() << "no exception";
    } catch (const std::invalid_argument& error) {
        EXPECT_NE(std::string(error.what()).find("\"NO-SUCH-ENCODING\""), std::string::npos);
    }
}

} // namespace
