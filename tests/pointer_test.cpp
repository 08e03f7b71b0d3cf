// JSON Pointers: reading, resolving against a document, building, and the messages that say
// why a pointer finds nothing.
#include "support/documents.hpp"
#include "support/errors.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace {

using json::Kind;
using json::Pointer;
using json::Value;
using test_support::error_of;
using test_support::parsed;

TEST(Pointer, ResolvesEveryPointerOfTheRfcExample) {
    // The example document of RFC 6901, with every pointer it lists.
    const Value doc = parsed(R"({"foo":["bar","baz"],"":0,"a/b":1,"c%d":2,"e^f":3,"g|h":4,
        "i\\j":5,"k\"l":6," ":7,"m~n":8})");
    EXPECT_EQ(doc.find_pointer(""), &doc);
    EXPECT_EQ(json::serialize(doc.at_pointer("/foo")), R"(["bar","baz"])");
    EXPECT_EQ(doc.at_pointer("/foo/0"), "bar");
    // The members that hold the numbers 0 to 8, in that order.
    const char* const numbered[] = {"/",     "/a~1b", "/c%d", "/e^f", "/g|h",
                                    "/i\\j", "/k\"l", "/ ",   "/m~0n"};
    for (std::size_t number = 0; number != std::size(numbered); ++number) {
        EXPECT_EQ(doc.at_pointer(numbered[number]), static_cast<double>(number))
            << numbered[number];
    }
    const std::pair<const char*, const char*> missing[] = {
        {"/bar", "/bar: no member \"bar\""},
        {"/foo/2", "/foo/2: index 2 out of range for a JSON array of 2 elements"},
        {"/foo/-", "/foo/-: \"-\" is no index of a JSON array"},
        {"/foo/01", "/foo/01: \"01\" is no index of a JSON array: it has a leading zero"},
        {"/foo/0/x/y", "/foo/0/x: expected JSON object or array, found JSON string"},
    };
    for (const auto& [pointer, message] : missing) {
        EXPECT_EQ(doc.find_pointer(pointer), nullptr) << pointer;
        EXPECT_EQ(error_of([&] { doc.at_pointer(pointer); }), std::string("missing: ") + message);
    }
    // Indices at and beyond the largest std::size_t are out of range, not misread.
    for (const std::string index :
         {"18446744073709551614", "18446744073709551615", "123456789012345678901234567890"}) {
        EXPECT_EQ(doc.find_pointer("/foo/" + index), nullptr) << index;
        EXPECT_EQ(error_of([&] { doc.at_pointer("/foo/" + index); }),
                  "missing: /foo/" + index + ": index " + index +
                      " out of range for a JSON array of 2 elements");
    }
}

TEST(Pointer, TakesTextApartIntoTokens) {
    const Pointer pointer("/a~1b/0/-/01/~0/18446744073709551616/");
    ASSERT_EQ(pointer.size(), 7u);
    const struct {
        const char* token;
        const char* name;
        std::size_t index;
        bool past_end;
    } rows[] = {
        {"a~1b", "a/b", Pointer::NOT_AN_INDEX, false},
        {"0", "0", 0, false},
        {"-", "-", Pointer::NOT_AN_INDEX, true},
        {"01", "01", Pointer::NOT_AN_INDEX, false},
        {"~0", "~", Pointer::NOT_AN_INDEX, false},
        {"18446744073709551616", "18446744073709551616", Pointer::NOT_AN_INDEX - 1, false},
        {"", "", Pointer::NOT_AN_INDEX, false},
    };
    for (std::size_t step = 0; step < pointer.size(); ++step) {
        EXPECT_EQ(pointer.token(step), rows[step].token) << step;
        EXPECT_EQ(pointer.name(step), rows[step].name) << step;
        EXPECT_EQ(pointer.index(step), rows[step].index) << step;
        EXPECT_EQ(pointer.is_past_end(step), rows[step].past_end) << step;
    }
    EXPECT_EQ(pointer.prefix(0), "");
    EXPECT_EQ(pointer.prefix(2), "/a~1b/0");
    EXPECT_EQ(pointer.prefix(7), pointer.text());
    EXPECT_TRUE(Pointer().empty() && Pointer("").empty());
    EXPECT_EQ(Pointer("/").size(), 1u); // the member with the empty name
}

TEST(Pointer, RefusesWhatIsNoPointer) {
    const std::pair<const char*, const char*> rows[] = {
        {"a/b", "invalid: JSON Pointer \"a/b\" does not start with '/'"},
        {"/m~2n", "invalid: JSON Pointer \"/m~2n\" has a '~' not followed by '0' or '1'"},
        {"/a~", "invalid: JSON Pointer \"/a~\" has a '~' not followed by '0' or '1'"},
        {"/b/~x", "invalid: JSON Pointer \"/b/~x\" has a '~' not followed by '0' or '1'"},
    };
    for (const auto& [text, message] : rows) {
        EXPECT_EQ(error_of([text = text] { Pointer{text}; }), message);
        EXPECT_EQ(error_of([text = text] { Value().find_pointer(text); }), message);
    }
}

// Built token by token, a pointer escapes what it must and reads back to the same names.
TEST(Pointer, BuildsPointersThatReadBack) {
    Pointer pointer;
    pointer.push_back("a/b").push_back(std::size_t{12}).push_back("~").push_back("");
    EXPECT_EQ(pointer.text(), "/a~1b/12/~0/");
    EXPECT_EQ(pointer, Pointer(pointer.text()));
    EXPECT_EQ(pointer.index(1), 12u);
    EXPECT_EQ(pointer.name(2), "~");
    pointer.pop_back();
    pointer.pop_back();
    EXPECT_EQ(pointer.text(), "/a~1b/12");
    EXPECT_NE(pointer, Pointer("/a~1b"));
    EXPECT_EQ(json::escape_pointer_token("~1/~0"), "~01~1~00");

    const Value doc = parsed(R"({"a/b":[0,1,{"~":{"":"here"}}]})");
    Pointer deep;
    deep.push_back("a/b").push_back(std::size_t{2}).push_back("~").push_back("");
    EXPECT_EQ(deep.at(doc), "here");
    EXPECT_EQ(deep.find(doc, 2), &doc.at("a/b").at(2));
}

// What at_pointer's messages (above) do not show: a name under an array, and parents that
// at_pointer never reaches.
TEST(Pointer, SaysWhyAStepFindsNothing) {
    const Pointer pointer("/name/3/x/-");
    const struct {
        std::size_t step;
        Kind parent;
        std::size_t elements;
        const char* why;
    } rows[] = {
        {2, Kind::ARRAY, 5, "\"x\" is no index of a JSON array"},
        {2, Kind::NULL_VALUE, 0, "expected JSON object or array, found JSON null"},
        {2, Kind::UNDEFINED, 0, "expected JSON object or array, found no value"},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(pointer.why_missing(row.step, row.parent, row.elements), row.why) << row.why;
    }
}

} // namespace
