// Substitutes the text-encoding library: this executable defines the converter's exported
// members itself, so libjsonvalue's calls land here and can be recorded.
#include <json/text_conversion.hpp>

#include <codecvt_ustring_to_string.hpp>

#include <gtest/gtest.h>

#include <stdexcept>

namespace {

std::vector<std::string> calls;
bool constructor_throws = false;

} // namespace

codecvt_ustring_to_string::codecvt_ustring_to_string(const std::string& name, bool flag)
    : encoding(name), replace_malformed(flag), iconv_descriptor(nullptr) {
    calls.push_back("construct " + name + (flag ? " true" : " false"));
    if (constructor_throws) {
        throw std::runtime_error("converter unavailable"); // must reach the caller as it is
    }
}

codecvt_ustring_to_string::~codecvt_ustring_to_string() {
    calls.push_back("destroy");
}

std::string codecvt_ustring_to_string::do_convert(const char16_t* text, std::size_t count) const {
    calls.push_back("convert " + std::to_string(count) + (text[count] == 0 ? " terminated" : ""));
    return "converted";
}

using json::detail::u16_to_u8;

// The converter is made on every call, before the arguments are looked at, and is not asked
// to convert an empty text; its own failure passes through unchanged.
TEST(U16ToU8Calls, ConverterIsMadeOnEveryCall) {
    char16_t text[] = {u'a', 0, u'b'};
    EXPECT_EQ(u16_to_u8(text, 3), "converted");
    EXPECT_EQ(u16_to_u8(nullptr, 0), "");
    for (const int count : {2, -1}) { // a null text is refused as such, whatever the count
        try {
            u16_to_u8(nullptr, count);
            ADD_FAILURE() << "no exception";
        } catch (const std::length_error&) {
            ADD_FAILURE() << "the count was checked before the text";
        } catch (const std::logic_error& error) {
            EXPECT_STREQ(error.what(), "basic_string::_M_construct null not valid");
        }
    }
    EXPECT_THROW(u16_to_u8(text, -5), std::length_error);
    constructor_throws = true;
    EXPECT_THROW(u16_to_u8(text, 1), std::runtime_error);
    const std::string made = "construct UTF-8 true";
    EXPECT_EQ(calls,
              (std::vector<std::string>{made, "convert 3 terminated", "destroy", made, "destroy",
                                        made, "destroy", made, "destroy", made, "destroy", made}));
}
