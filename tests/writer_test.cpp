#include <json/json.hpp>

#include "support/errors.hpp"

#include <gtest/gtest.h>

#include <cmath>
#include <fstream>
#include <functional>
#include <sstream>
#include <stdexcept>

namespace {

using namespace json;

// More text than a Writer onto a stream gathers before it hands it on.
constexpr std::size_t detail_buffer_size() {
    return std::size_t{64} * 1024;
}

// Hands a Writer the events of a walk over `value`: members in key order, members holding
// Undefined left out, Undefined elements as null, doubles as number(double).
void emit(const Value& value, Writer& writer) {
    switch (value.which()) {
    case detail::NULL_INDEX:
    case detail::UNDEFINED_INDEX:
        writer.null();
        break;
    case detail::BOOL_INDEX:
        writer.boolean(boost::get<bool>(value));
        break;
    case detail::DOUBLE_INDEX:
        writer.number(boost::get<double>(value));
        break;
    case detail::STRING_INDEX:
        writer.string(boost::get<std::string>(value));
        break;
    case detail::ARRAY_INDEX:
        writer.begin_array();
        for (const Value& item : boost::get<Array>(value)) {
            emit(item, writer);
        }
        writer.end_array();
        break;
    case detail::OBJECT_INDEX:
        writer.begin_object();
        for (const auto& [key, member] : boost::get<Object>(value)) {
            if (member.which() != detail::UNDEFINED_INDEX) {
                writer.key(key);
                emit(member, writer);
            }
        }
        writer.end_object();
        break;
    default:
        writer.value(value); // a float: its own shortest text
    }
}

std::vector<WriteOptions> option_sets() {
    WriteOptions pretty;
    pretty.pretty = true;
    WriteOptions tabs_ascii = pretty;
    tabs_ascii.indent_with_tab = true;
    tabs_ascii.ascii_only = true;
    WriteOptions flat = pretty;
    flat.indent = 0;
    flat.pad_empty_containers = false;
    flat.escape_slash = false;
    return {WriteOptions(), pretty, COMMON_PRETTY, tabs_ascii, flat};
}

// The Writer gives serialize's text from events that do not come from serialize's own walk:
// onto a string, those of a walk over the Value (emit); onto a stream, those the parser reads
// from the document's compact text.
void expect_text_of_serialize(const Value& document) {
    const std::string compact = serialize(document);
    for (const WriteOptions& options : option_sets()) {
        const std::string expected = serialize(document, options);
        std::string by_events = "before:";
        Writer writer(by_events, options);
        emit(document, writer);
        EXPECT_EQ(by_events, "before:" + expected) << "complete without flush()";
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
}

TEST(Writer, EventsGiveTheTextOfSerializeOnTheBenchDocuments) {
    for (const char* name : {"twitter", "citm_catalog", "canada"}) {
        std::ifstream file(std::string(JSON_BENCH_DATA_DIR) + "/" + name + ".json");
        std::ostringstream text;
        text << file.rdbuf();
        Value document;
        // twitter.json's 64-bit ids are rounded on purpose: the text is the rounded document's.
        ParseOptions rounding;
        rounding.allow_inexact_integers = true;
        ASSERT_TRUE(parse(text.str(), document, rounding)) << name;
        expect_text_of_serialize(document);
        WriteOptions pretty;
        pretty.pretty = true;
        EXPECT_EQ(serialize(document, {}), serialize(document));
        EXPECT_EQ(serialize(document, pretty), pretty_print(document));
    }
}

// Indentation too long for the stream's buffer to take in one piece goes out in pieces.
TEST(Writer, LongIndentationOntoAStream) {
    const Value nested = Array{Array{1}, 2};
    WriteOptions wide;
    wide.pretty = true;
    wide.indent = 9000;
    std::ostringstream stream;
    Writer(stream, wide).value(nested);
    EXPECT_EQ(stream.str(), serialize(nested, wide));
    EXPECT_EQ(stream.str().size(), 9000 + 18000 + 9000 + 9000 + 12) << "spaces and 12 others";
}

TEST(Writer, ScalarsAndNumberTexts) {
    std::string text;
    Writer writer(text);
    writer.begin_array();
    for (const char* literal : {"0", "-0", "-0.5e+3", "12E-07", "1.25", "9007199254740993"}) {
        writer.number(literal);
    }
    writer.number(NAN);
    writer.number(100000.0);
    writer.value(Undefined());
    EXPECT_FALSE(writer.complete());
    writer.end_array();
    EXPECT_TRUE(writer.complete());
    EXPECT_EQ(text, R"([0,-0,-0.5e+3,12E-07,1.25,9007199254740993,"NaN",1e+05,null])");

    // Undefined alone at the top level writes nothing, and the value is still to come.
    std::string top;
    Writer later(top);
    later.value(Undefined());
    EXPECT_FALSE(later.complete());
    later.boolean(false);
    EXPECT_EQ(top, "false");
}

// Each call out of place throws and writes nothing; the Writer goes on as if it had not come.
TEST(Writer, MisuseWritesNothing) {
    using Call = std::function<void(Writer&)>;
    const Call open_object = [](Writer& w) { w.begin_object(); };
    const Call open_array = [](Writer& w) { w.begin_array(); };
    const Call named = [](Writer& w) {
        w.begin_object();
        w.key("a");
    };
    const Call done = [](Writer& w) {
        w.begin_array();
        w.end_array();
    };
    const Call nothing = [](Writer&) {};
    WriteOptions ascii;
    ascii.ascii_only = true;
    WriteOptions numbers_only;
    numbers_only.reject_non_finite = true;
    const struct {
        Call before, misuse;
        bool logic; // std::logic_error, else std::invalid_argument
        WriteOptions options = {};
    } rows[] = {
        {nothing, [](Writer& w) { w.key("a"); }, true},
        {open_array, [](Writer& w) { w.key("a"); }, true},
        {named, [](Writer& w) { w.key("b"); }, true},
        {open_object, [](Writer& w) { w.null(); }, true},
        {open_object, [](Writer& w) { w.string("v"); }, true},
        {open_object, [](Writer& w) { w.number(1.0); }, true},
        {open_object, [](Writer& w) { w.begin_array(); }, true},
        {open_object, [](Writer& w) { w.value(1); }, true},
        {open_object, [](Writer& w) { w.end_array(); }, true},
        {open_array, [](Writer& w) { w.end_object(); }, true},
        {named, [](Writer& w) { w.end_object(); }, true},
        {nothing, [](Writer& w) { w.end_array(); }, true},
        {done, [](Writer& w) { w.boolean(true); }, true},
        {done, [](Writer& w) { w.begin_object(); }, true},
        {done, [](Writer& w) { w.value(Undefined()); }, true},
        {named, [](Writer& w) { w.value(Undefined()); }, false},
        {open_array, [](Writer& w) { w.string("\xC3"); }, false, ascii},
        {open_object, [](Writer& w) { w.key("a\x80"); }, false, ascii},
        {open_array, [](Writer& w) { w.string("ok \xED\xA0\x80"); }, false},
        {open_object, [](Writer& w) { w.key("\xF4\x90\x80\x80"); }, false},
        {nothing,
         [](Writer& w) {
             w.value(Object{{"a", Array{1, "x\xC3"}}});
         },
         false},
        {nothing,
         [](Writer& w) {
             w.value(Object{{"a\xFF", 1}});
         },
         false},
        {open_array,
         [](Writer& w) {
             w.value(Array{"x", Array{"\xC0\x80"}});
         },
         false},
        {open_array, [](Writer& w) { w.number(std::nan("")); }, false, numbers_only},
        {open_array,
         [](Writer& w) {
             w.value(Array{1, -HUGE_VAL});
         },
         false, numbers_only},
        {open_array, [](Writer& w) { w.value(HUGE_VALF); }, false, numbers_only},
        {nothing, [](Writer& w) { w.number(""); }, false},
        {open_array, [](Writer& w) { w.number("01"); }, false},
        {open_array, [](Writer& w) { w.number("1."); }, false},
        {open_array, [](Writer& w) { w.number("+1"); }, false},
        {open_array, [](Writer& w) { w.number("NaN"); }, false},
        {open_array, [](Writer& w) { w.number(".5"); }, false},
        {open_array, [](Writer& w) { w.number("1e"); }, false},
        {open_array, [](Writer& w) { w.number("-"); }, false},
        {open_array, [](Writer& w) { w.number("1 "); }, false},
    };
    for (const auto& row : rows) {
        std::string text;
        Writer writer(text, row.options);
        row.before(writer);
        writer.flush();
        const std::string before = text;
        if (row.logic) {
            EXPECT_THROW(row.misuse(writer), std::logic_error) << before;
        } else {
            EXPECT_THROW(row.misuse(writer), std::invalid_argument) << before;
        }
        writer.flush();
        EXPECT_EQ(text, before);
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
    WriteOptions lenient;
    lenient.allow_invalid_utf8 = true;
    lenient.reject_non_finite = true;
    Writer writer(text, lenient);
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

// Fails on its first write, when its caller enabled exceptions.
class FailingBuffer : public std::streambuf {
  protected:
    int_type overflow(int_type) override { throw std::runtime_error("disk gone"); }
    std::streamsize xsputn(const char*, std::streamsize) override {
        throw std::runtime_error("disk gone");
    }
};

// A write that fails part-way leaves the Writer unusable.
TEST(Writer, FailedWriteLeavesItUnusable) {
    FailingBuffer failing;
    std::ostream out(&failing);
    out.exceptions(std::ios::badbit);
    Writer writer(out);
    writer.begin_array();
    EXPECT_THROW(writer.string(std::string(detail_buffer_size(), 'x')), std::runtime_error);
    EXPECT_THROW(writer.end_array(), std::logic_error);
    EXPECT_THROW(writer.null(), std::logic_error);
}

// A Writer that goes before its document is complete hands on none of it: a string is cut
// back to what it held before, however much was written into it; a stream gets nothing more
// and failbit, without an exception from the destructor.
TEST(Writer, AnIncompleteDocumentIsNotHandedOn) {
    using Events = std::function<void(Writer&)>;
    const Events truncated = [](Writer& w) {
        w.begin_array();
        w.begin_object();
        w.key("k");
    };
    const Events long_and_truncated = [](Writer& w) {
        w.begin_array();
        for (int i = 0; i < 1000; ++i) {
            w.string(std::string(100, 'x'));
        }
    };
    const Events flushed_and_truncated = [](Writer& w) {
        w.begin_array();
        w.null();
        w.flush();
    };
    for (const Events& events : {truncated, long_and_truncated, flushed_and_truncated}) {
        std::string text = "before";
        {
            Writer writer(text);
            events(writer);
        }
        EXPECT_EQ(text, "before");
        std::ostringstream out;
        out.exceptions(std::ios::failbit);
        {
            Writer writer(out);
            events(writer);
        }
        EXPECT_TRUE(out.fail());
        EXPECT_LT(out.str().size(), 100'000u); // what went out when the buffer filled
    }
    // Nothing begun is nothing cut short.
    std::ostringstream untouched;
    { Writer writer(untouched); }
    EXPECT_TRUE(untouched.good());
}

// Keeps what it is given and counts flushes.
class CountingBuffer : public std::stringbuf {
  public:
    int syncs = 0;

  protected:
    int sync() override {
        ++syncs;
        return 0;
    }
};

// Onto a stream: nothing before the top-level value is complete (the text is gathered in a
// buffer), no flush per line; flush() hands on what is gathered and flushes the stream.
TEST(Writer, OntoAStream) {
    CountingBuffer buffer;
    std::ostream out(&buffer);
    WriteOptions pretty;
    pretty.pretty = true;
    {
        Writer writer(out, pretty);
        writer.begin_array();
        writer.string("a");
        writer.null();
        EXPECT_EQ(buffer.str(), "");
        writer.flush();
        EXPECT_EQ(buffer.str(), "[\n    \"a\",\n    null");
        EXPECT_EQ(buffer.syncs, 1);
        writer.end_array();
        EXPECT_EQ(buffer.str(), "[\n    \"a\",\n    null\n]");
        EXPECT_EQ(buffer.syncs, 1);
        writer.flush();
        EXPECT_EQ(buffer.syncs, 2);
    }
}

} // namespace
