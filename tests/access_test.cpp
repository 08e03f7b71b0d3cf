// Reading a Value: kinds, checked access, lookups, JSON Pointer, value_or, swap, the taking
// constructors and parsing from a stream.
#include "support/allocation_failure.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <algorithm>
#include <sstream>
#include <stdexcept>
#include <streambuf>

namespace {

using json::Array;
using json::Object;
using json::Value;
using test_support::allocations_made;

Value parsed(const char* text) {
    Value out;
    EXPECT_TRUE(json::parse(text, out, {})) << text;
    return out;
}

template <typename Exception, typename Operation>
std::string message_of(Operation operation) {
    try {
        operation();
    } catch (const Exception& error) {
        return error.what();
    }
    return "(nothing thrown)";
}

TEST(Access, KindQueriesAndCheckedAccess) {
    const Value values[] = {Value(),    Value(nullptr), Value(true),     Value(1.5),
                            Value("s"), Value(Array{}), Value(Object{}), Value(2.5f)};
    const char* kinds = "UNBDSAOF"; // the kind each query accepts, by alternative
    for (int i = 0; i < 8; ++i) {
        const Value& v = values[i];
        const char kind = kinds[i];
        EXPECT_EQ(v.is_undefined(), kind == 'U');
        EXPECT_EQ(v.is_null(), kind == 'N');
        EXPECT_EQ(v.is_bool(), kind == 'B');
        EXPECT_EQ(v.is_number(), kind == 'D' || kind == 'F');
        EXPECT_EQ(v.is_string(), kind == 'S');
        EXPECT_EQ(v.is_array(), kind == 'A');
        EXPECT_EQ(v.is_object(), kind == 'O');
        EXPECT_EQ(v.is_number(), v.which() == 3 || v.which() == 7);
    }
    EXPECT_TRUE(values[2].as_bool());
    EXPECT_EQ(values[7].as_number(), 2.5); // a float widened
    EXPECT_EQ(values[4].as_string(), "s");
    EXPECT_EQ(message_of<std::invalid_argument>([&] { values[4].as_number(); }),
              "expected JSON number, found JSON string");
    EXPECT_EQ(message_of<std::invalid_argument>([&] { values[7].as_object(); }),
              "expected JSON object, found float");
    EXPECT_EQ(message_of<std::invalid_argument>([&] { values[0].as_array(); }),
              "expected JSON array, found undefined");
    EXPECT_EQ(message_of<std::invalid_argument>([&] { values[1].as_bool(); }),
              "expected JSON boolean, found JSON null");
}

TEST(Access, LookupsNeverInsert) {
    Value doc = parsed(R"({"a":1,"list":[10,20]})");
    const Value& view = doc;
    EXPECT_EQ(*view.find("a"), 1);
    EXPECT_EQ(view.find("b"), nullptr);
    EXPECT_EQ(view.at("list").find("a"), nullptr); // not an Object
    EXPECT_TRUE(doc.contains("list"));
    EXPECT_FALSE(doc.contains("zz"));
    doc.at("a") = "changed";
    EXPECT_EQ(view.at("list").at(1), 20);
    EXPECT_EQ(message_of<std::out_of_range>([&] { view.at("b"); }), "no member \"b\"");
    EXPECT_EQ(message_of<std::out_of_range>([&] { view.at("list").at(2); }),
              "index 2 out of range for a JSON array of 2 elements");
    EXPECT_EQ(message_of<std::invalid_argument>([&] { view.at(0); }),
              "expected JSON array, found JSON object");
    EXPECT_EQ(json::serialize(doc), R"({"a":"changed","list":[10,20]})");
}

TEST(Access, JsonPointers) {
    // The example document of RFC 6901, with every pointer it lists.
    const Value doc = parsed(R"({"foo":["bar","baz"],"":0,"a/b":1,"c%d":2,"e^f":3,"g|h":4,
        "i\\j":5,"k\"l":6," ":7,"m~n":8})");
    const struct {
        const char* pointer;
        const char* text;
    } found[] = {{"/foo", R"(["bar","baz"])"},
                 {"/foo/0", R"("bar")"},
                 {"/", "0"},
                 {"/a~1b", "1"},
                 {"/c%d", "2"},
                 {"/e^f", "3"},
                 {"/g|h", "4"},
                 {"/i\\j", "5"},
                 {"/k\"l", "6"},
                 {"/ ", "7"},
                 {"/m~0n", "8"}};
    EXPECT_EQ(doc.find_pointer(""), &doc);
    for (const auto& row : found) {
        EXPECT_EQ(json::serialize(doc.at_pointer(row.pointer)), row.text) << row.pointer;
    }
    const struct {
        const char* pointer;
        const char* message;
    } missing[] = {
        {"/bar", "/bar: no member \"bar\""},
        {"/foo/2", "/foo/2: index 2 out of range for a JSON array of 2 elements"},
        {"/foo/-", "/foo/-: \"-\" is no index of a JSON array"},
        {"/foo/01", "/foo/01: \"01\" is no index of a JSON array"},
        {"/foo/0/x/y", "/foo/0/x: expected JSON object or array, found JSON string"},
        {"/a~1b/c", "/a~1b/c: expected JSON object or array, found JSON number"},
    };
    for (const auto& row : missing) {
        EXPECT_EQ(doc.find_pointer(row.pointer), nullptr) << row.pointer;
        EXPECT_EQ(message_of<std::out_of_range>([&] { doc.at_pointer(row.pointer); }), row.message);
    }
    for (const char* malformed : {"foo", "/m~2n", "/foo~", "/bar/~x"}) {
        EXPECT_THROW(doc.find_pointer(malformed), std::invalid_argument) << malformed;
        EXPECT_THROW(doc.at_pointer(malformed), std::invalid_argument) << malformed;
    }
}

TEST(Access, ValueOrConvertsOrFallsBack) {
    const Value config = Object{{"port", 8080}, {"name", "api"}, {"unset", Value()}};
    EXPECT_EQ(config.value_or("port", 80), 8080);
    EXPECT_EQ(config.value_or("missing", 80), 80);
    EXPECT_EQ(config.value_or("unset", 80), 80);
    EXPECT_EQ(config.value_or<std::string>("name", "x"), "api");
    EXPECT_EQ(message_of<std::invalid_argument>([&] { config.value_or("name", 80); }),
              "/name: expected JSON number, found JSON string");
    EXPECT_THROW(Value(Array{}).value_or("port", 80), std::invalid_argument);
}

// A document big enough that a deep copy would show: an Array of Objects with long strings.
Value large_document(int seed) {
    Array items;
    for (int i = 0; i < 200; ++i) {
        items.push_back(Object{{"id", seed + i}, {"text", std::string(40, 'a' + seed % 26)}});
    }
    return items;
}

TEST(Access, SwapAndReverseAllocateNothing) {
    Value a = large_document(1);
    Value b = Array{large_document(2), 7};
    Value arrays = Array{large_document(3), large_document(4), large_document(5)};
    const Value a_before = a;
    const Value b_before = b;
    const Value arrays_before = arrays;
    Value text = "a string longer than the small-string buffer";
    Value number = 1.5;
    const std::size_t before = allocations_made();
    swap(a, b); // argument-dependent lookup finds json::swap
    std::reverse(boost::get<Array>(arrays).begin(), boost::get<Array>(arrays).end());
    number.swap(text);
    EXPECT_EQ(allocations_made(), before);
    EXPECT_EQ(a, b_before);
    EXPECT_EQ(b, a_before);
    EXPECT_EQ(arrays.at(0), arrays_before.at(2));
    EXPECT_EQ(arrays.at(2), arrays_before.at(0));
    EXPECT_EQ(number, "a string longer than the small-string buffer");
    EXPECT_EQ(text, 1.5);
}

TEST(Access, SwapOfDifferentKindsKeepsBothWhenAnAllocationFails) {
    using test_support::Exhaustion;
    const Value kinds[] = {large_document(1), Object{{"k", large_document(2)}},
                           Value("a string longer than the small-string buffer"), Value(2.0)};
    for (const Value& left : kinds) {
        for (const Value& right : kinds) {
            // One failed allocation: both unchanged. Memory exhausted for good: each holds its
            // own content or false, never the other's.
            for (const Exhaustion mode : {Exhaustion::ONE, Exhaustion::EVERY}) {
                test_support::for_each_failing_allocation(
                    [&] { return std::make_pair(left, right); },
                    [](auto& pair) { pair.first.swap(pair.second); },
                    [&](auto& pair) {
                        const bool lost = mode == Exhaustion::EVERY;
                        EXPECT_TRUE(pair.first == left || (lost && pair.first == false));
                        EXPECT_TRUE(pair.second == right || (lost && pair.second == false));
                    },
                    mode);
            }
            Value x = left;
            Value y = right;
            x.swap(y);
            EXPECT_EQ(x, right);
            EXPECT_EQ(y, left);
        }
    }
}

TEST(Access, TakingConstructorsDoNotCopy) {
    Array items(1000, Value("a string longer than the small-string buffer"));
    Object members{{"k", Array(10, Value(1))}};
    std::string text(100, 'x');
    const std::size_t before = allocations_made();
    const Value array(std::move(items));
    const Value object(std::move(members));
    const Value string(std::move(text));
    EXPECT_EQ(allocations_made() - before, 2u); // the Array and the Object themselves
    EXPECT_EQ(array.as_array().size(), 1000u);
    EXPECT_EQ(object.at("k").as_array().size(), 10u);
    EXPECT_EQ(string.as_string().size(), 100u);
}

// A stream buffer that gives some text, then throws.
class BrokenBuffer : public std::streambuf {
  public:
    explicit BrokenBuffer(std::string text) : text(std::move(text)) {
        setg(this->text.data(), this->text.data(), this->text.data() + this->text.size());
    }

  private:
    int_type underflow() override { throw std::runtime_error("disk gone"); }
    std::string text;
};

TEST(Access, ParsingFromAStream) {
    std::istringstream good("  {\"a\": [1, 2]}\n");
    Value out = 5;
    ASSERT_TRUE(json::parse(good, out, {}));
    EXPECT_EQ(json::serialize(out), R"({"a":[1,2]})");
    EXPECT_TRUE(good.eof());

    std::istringstream bad("[1,\n 2,,]");
    const json::ParseReport report = json::parse(bad, out, {});
    EXPECT_EQ(report.result, json::ParseResult::MISSING_LEADING_DIGIT);
    EXPECT_EQ(report.line, 2u);
    EXPECT_EQ(report.column, 4u);
    EXPECT_EQ(json::serialize(out), R"({"a":[1,2]})");

    BrokenBuffer buffer("[1, 2, 3]"); // a whole document, then the failure
    std::istream broken(&buffer);
    const json::ParseReport failed = json::parse(broken, out, {});
    EXPECT_EQ(failed.result, json::ParseResult::UNEXPECTED_END_OF_INPUT);
    EXPECT_STREQ(failed.note, "the stream failed while it was read");
    EXPECT_TRUE(broken.bad());
    EXPECT_EQ(json::serialize(out), R"({"a":[1,2]})");

    BrokenBuffer throwing("[1");
    std::istream strict(&throwing);
    strict.exceptions(std::ios::badbit);
    EXPECT_THROW(json::parse(strict, out, {}), std::ios::failure);
}

} // namespace
