// The json::Writer: serialize's text from events, numbers and literals, calls out of place and
// refused arguments, failed and unfinished writes, and what reaches a stream when.
#include "support/documents.hpp"
#include "support/errors.hpp"
#include "support/writing.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <map>
#include <sstream>
#include <stdexcept>

namespace {

using namespace json;
using test_support::write_options_from;
using namespace std::string_literals;

// The Writer gives serialize's text under several layouts, from the events the parser reads from
// the document's compact text (not from serialize's own walk): onto a string after what it held,
// complete without flush(), and onto a stream.
void expect_text_of_serialize(const Value& document) {
    const std::string compact = serialize(document);
    for (const WriteOptions& options :
         {write_options_from(""), write_options_from("p"), COMMON_PRETTY, write_options_from("pta"),
          write_options_from("p0e/")}) {
        const std::string expected = serialize(document, options);
        std::string text = "before:";
        Writer onto_string(text, options);
        ASSERT_TRUE(parse_events(compact, onto_string));
        EXPECT_EQ(text, "before:" + expected);
        std::ostringstream stream;
        Writer onto_stream(stream, options);
        ASSERT_TRUE(parse_events(compact, onto_stream));
        EXPECT_TRUE(onto_stream.complete());
        EXPECT_EQ(stream.str(), expected);
    }
}

TEST(Writer, EventsGiveTheTextOfSerialize) {
    const Value document =
        Object{{"a", Array{1, Undefined(), "x/y\n", Array{}, Object{{"u", Undefined()}}}},
               {"b", Object{{"c", true}, {"d", nullptr}, {"\xC3\xA9", 0.5f}}},
               {"n", Array{NAN, -HUGE_VAL, 1e300, false}},
               {"u", Undefined()}};
    expect_text_of_serialize(document);
    expect_text_of_serialize("top");
    expect_text_of_serialize(Array{});
    // Text that outgrows the Writer's buffer, with a string longer than that buffer.
    expect_text_of_serialize(Array{std::string(40000, 'x'), Array(3000, 0.25)});
    for (const auto& path : test_support::bench_files()) {
        expect_text_of_serialize(
            test_support::parsed(test_support::read_file(path), test_support::options_from("i")));
    }
    // Reformatting through the Writer keeps member order, repeated members and literals.
    std::string text;
    Writer writer(text);
    ASSERT_TRUE(
        parse_events(R"({"b": [1.50, 1e400], "a": 1234567890123456789, "b": "\/x"})", writer));
    EXPECT_EQ(text, R"({"b":[1.50,1e400],"a":1234567890123456789,"b":"\/x"})");
}

TEST(Writer, ScalarsAndNumberTexts) {
    std::string text;
    Writer writer(text);
    writer.begin_array();
    for (const char* literal : {"0", "-0", "-0.5e+3", "12E-07", "1.25", "9007199254740993"}) {
        writer.number(literal);
    }
    for (const double number : {std::nan(""), 100000.0, -0.0, 1e300, 0.1}) {
        writer.number(number);
    }
    writer.value(2.5f);
    writer.value(Undefined());
    EXPECT_FALSE(writer.complete());
    writer.end_array();
    EXPECT_TRUE(writer.complete());
    EXPECT_EQ(text,
              R"([0,-0,-0.5e+3,12E-07,1.25,9007199254740993,"NaN",1e+05,-0,1e+300,0.1,2.5,null])");

    // Undefined alone at the top level writes nothing, and the value is still to come.
    std::string top;
    Writer later(top);
    later.value(Undefined());
    EXPECT_FALSE(later.complete());
    later.boolean(false);
    EXPECT_EQ(top, "false");
}

using Events = std::function<void(Writer&)>;

// Plays events by letter: [ ] { } as themselves, k the key "a", n null, t true, s the string
// "v", S a string of 100 bytes, 1 the number 1.0, v the Value 1, u an Undefined Value, f flush().
void play(Writer& writer, std::string_view events) {
    static const std::map<char, Events> by_letter = {
        {'[', [](Writer& w) { w.begin_array(); }},
        {']', [](Writer& w) { w.end_array(); }},
        {'{', [](Writer& w) { w.begin_object(); }},
        {'}', [](Writer& w) { w.end_object(); }},
        {'k', [](Writer& w) { w.key("a"); }},
        {'n', [](Writer& w) { w.null(); }},
        {'t', [](Writer& w) { w.boolean(true); }},
        {'s', [](Writer& w) { w.string("v"); }},
        {'1', [](Writer& w) { w.number(1.0); }},
        {'v', [](Writer& w) { w.value(1); }},
        {'u', [](Writer& w) { w.value(Undefined()); }},
        {'f', [](Writer& w) { w.flush(); }},
        {'S', [](Writer& w) { w.string(std::string(100, 'x')); }}};
    for (const char event : events) {
        by_letter.at(event)(writer);
    }
}

// After the events `before`, with the options of `letters`, `misuse` throws Error and the
// Writer writes nothing.
template <typename Error>
void expect_refused(std::string_view before, std::string_view letters, const Events& misuse) {
    std::string text;
    Writer writer(text, write_options_from(letters));
    play(writer, before);
    writer.flush();
    const std::string written = text;
    EXPECT_THROW(misuse(writer), Error) << before << " then a misuse";
    writer.flush();
    EXPECT_EQ(text, written);
}

// Each call out of place throws std::logic_error, each argument that has no JSON text or that
// the options refuse std::invalid_argument; either writes nothing, and the Writer goes on as if
// the call had not come.
TEST(Writer, MisuseWritesNothing) {
    const std::pair<const char*, const char*> out_of_place[] = {
        {"", "k"},   {"[", "k"}, {"{k", "k"}, {"{", "n"},  {"{", "s"},
        {"{", "1"},  {"{", "["}, {"{", "v"},  {"{", "]"},  {"[", "}"},
        {"{k", "}"}, {"", "]"},  {"[]", "t"}, {"[]", "{"}, {"[]", "u"}};
    for (const auto& [before, event] : out_of_place) {
        expect_refused<std::logic_error>(before, "",
                                         [event = event](Writer& w) { play(w, event); });
    }
    // Not well-formed UTF-8 (checked whole before a byte is written), non-finite numbers with
    // reject_non_finite, Undefined as a member's value.
    const std::tuple<const char*, const char*, Value> values[] = {
        {"{k", "", Undefined()},         {"", "", Object{{"a", Array{1, "x\xC3"}}}},
        {"", "", Object{{"a\xFF", 1}}},  {"[", "", Array{"x", Array{"\xC0\x80"}}},
        {"[", "n", Array{1, -HUGE_VAL}}, {"[", "n", HUGE_VALF}};
    for (const auto& [before, letters, value] : values) {
        expect_refused<std::invalid_argument>(before, letters,
                                              [&value = value](Writer& w) { w.value(value); });
    }
    // A string after "[", a member name after "{".
    const std::tuple<const char*, const char*, const char*> strings[] = {
        {"[", "a", "\xC3"},
        {"{", "a", "a\x80"},
        {"[", "", "ok \xED\xA0\x80"},
        {"{", "", "\xF4\x90\x80\x80"}};
    for (const auto& [before, letters, utf8] : strings) {
        const bool name = before[0] == '{';
        expect_refused<std::invalid_argument>(before, letters, [name, utf8 = utf8](Writer& w) {
            name ? w.key(utf8) : w.string(utf8);
        });
    }
    expect_refused<std::invalid_argument>("[", "n", [](Writer& w) { w.number(std::nan("")); });
    for (const char* literal : {"", "01", "1.", "+1", "NaN", ".5", "1e", "-", "1 "}) {
        expect_refused<std::invalid_argument>("[", "", [literal](Writer& w) { w.number(literal); });
    }

    // After a refused call the Writer carries on.
    std::string text;
    Writer writer(text);
    writer.begin_object();
    EXPECT_THROW(writer.number("1."), std::logic_error);
    writer.key("k");
    EXPECT_THROW(writer.number("1."), std::invalid_argument);
    writer.number("1.5");
    writer.end_object();
    EXPECT_EQ(text, R"({"k":1.5})");
}

// A refusal names the byte and its place in a document; what is refused by default goes
// through when the caller asks for it by name.
TEST(Writer, RefusalsAndWhatTheOptionsLetThrough) {
    std::string text;
    Writer strict(text);
    EXPECT_EQ(test_support::error_of([&] {
                  strict.value(Object{{"a", Array{1, "x\xC3"}}});
              }),
              "invalid: json: byte 1 of the string at \"/a/1\" is not well-formed UTF-8 "
              "(WriteOptions::allow_invalid_utf8 writes it as it is)");
    Writer writer(text, write_options_from("un"));
    writer.begin_object();
    writer.key("\xFF");
    EXPECT_EQ(test_support::error_of([&] {
                  writer.value(Array{1, NAN});
              }),
              "invalid: json: NaN has no JSON number, and WriteOptions::reject_non_finite refuses "
              "to write it as a string (the number at \"/1\")");
    writer.value(Array{"x\xC3", 1.5});
    writer.end_object();
    EXPECT_EQ(text, "{\"\xFF\":[\"x\xC3\",1.5]}");
    EXPECT_EQ(json::validate(text).refusal, json::Refusal::INVALID_UTF8); // as the option warns
}

// A write that fails part-way leaves the Writer unusable.
TEST(Writer, FailedWriteLeavesItUnusable) {
    test_support::WrittenText failing;
    failing.broken = true;
    std::ostream out(&failing);
    out.exceptions(std::ios::badbit);
    Writer writer(out);
    writer.begin_array();
    // More than the Writer gathers before it hands text on to its stream.
    EXPECT_THROW(writer.string(std::string(std::size_t{64} * 1024, 'x')), std::ios::failure);
    EXPECT_THROW(writer.end_array(), std::logic_error);
    EXPECT_THROW(writer.null(), std::logic_error);
}

// A Writer that goes before its document is complete hands on none of it: a string is cut
// back to what it held before, however much was written into it; a stream gets nothing more
// and failbit, without an exception from the destructor.
TEST(Writer, AnIncompleteDocumentIsNotHandedOn) {
    // Cut short: at once, after more than the Writer gathers, after a flush.
    for (const std::string& events : {"[{k"s, "[" + std::string(1000, 'S'), "[nf"s}) {
        std::string text = "before";
        {
            Writer writer(text);
            play(writer, events);
        }
        EXPECT_EQ(text, "before");
        std::ostringstream out;
        out.exceptions(std::ios::failbit);
        {
            Writer writer(out);
            play(writer, events);
        }
        EXPECT_TRUE(out.fail());
        EXPECT_LT(out.str().size(), 100'000u); // what went out when the buffer filled
    }
    // Nothing begun is nothing cut short.
    std::ostringstream untouched;
    { Writer writer(untouched); }
    EXPECT_TRUE(untouched.good());
}

// Onto a stream: nothing before the top-level value is complete (the text is gathered in a
// buffer), no flush per line; flush() hands on what is gathered and flushes the stream.
// Indentation too long for the stream's buffer to take in one piece goes out in pieces.
TEST(Writer, OntoAStream) {
    test_support::WrittenText buffer;
    std::ostream out(&buffer);
    Writer writer(out, write_options_from("p"));
    writer.begin_array();
    writer.string("a");
    writer.null();
    EXPECT_EQ(buffer.text, "");
    writer.flush();
    EXPECT_EQ(buffer.text, "[\n    \"a\",\n    null");
    EXPECT_EQ(buffer.flushes.size(), 1u);
    writer.end_array();
    EXPECT_EQ(buffer.text, "[\n    \"a\",\n    null\n]");
    EXPECT_EQ(buffer.flushes.size(), 1u);
    writer.flush();
    EXPECT_EQ(buffer.flushes.size(), 2u);

    const Value nested = Array{Array{1}, 2};
    WriteOptions wide;
    wide.pretty = true;
    wide.indent = 9000;
    std::ostringstream stream;
    Writer(stream, wide).value(nested);
    EXPECT_EQ(stream.str(), serialize(nested, wide));
    EXPECT_EQ(stream.str().size(), 9000 + 18000 + 9000 + 9000 + 12) << "spaces and 12 others";
}

} // namespace
