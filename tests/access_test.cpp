// Reading a Value: kinds, checked access, subscripts, lookups, value_or, swap and the taking
// constructors.
#include "support/allocation_failure.hpp"
#include "support/documents.hpp"
#include "support/errors.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>

namespace {

using json::Array;
using json::Object;
using json::Value;
using test_support::allocations_made;
using test_support::error_of;
using test_support::parsed;

TEST(Access, KindsLookupsAndTheirErrors) {
    const Value values[] = {Value(),       Value(nullptr), Value(true),     Value(1.5),
                            Value("text"), Value(Array{}), Value(Object{}), Value(2.5f)};
    std::string kinds; // the one query each Value answers with true
    for (const Value& v : values) {
        kinds += std::string(v.is_undefined() ? "U" : "") + (v.is_null() ? "N" : "") +
                 (v.is_bool() ? "B" : "") + (v.is_number() ? "#" : "") +
                 (v.is_string() ? "S" : "") + (v.is_array() ? "A" : "") +
                 (v.is_object() ? "O" : "");
    }
    EXPECT_EQ(kinds, "UNB#SAO#");
    EXPECT_TRUE(values[2].as_bool());
    EXPECT_EQ(values[7].as_number(), 2.5); // a float widened
    EXPECT_EQ(values[4].as_string(), "text");

    Value doc = parsed(R"({"a":1,"list":[10,20]})");
    const Value& view = doc;
    EXPECT_EQ(*view.find("a"), 1);
    EXPECT_EQ(view.find("b"), nullptr);
    EXPECT_EQ(view.at("list").find("a"), nullptr); // not an Object
    EXPECT_TRUE(doc.contains("list") && !doc.contains("zz"));
    doc.at("a") = "changed";
    EXPECT_EQ(view.at("list").at(1), 20);
    EXPECT_EQ(json::serialize(doc), R"({"a":"changed","list":[10,20]})"); // nothing inserted

    const std::pair<std::function<void()>, const char*> errors[] = {
        {[&] { values[4].as_number(); }, "invalid: expected JSON number, found JSON string"},
        {[&] { values[7].as_object(); }, "invalid: expected JSON object, found JSON number"},
        {[&] { values[0].as_array(); }, "invalid: expected JSON array, found no value"},
        {[&] { values[1].as_bool(); }, "invalid: expected JSON boolean, found JSON null"},
        {[&] { view.at("b"); }, "missing: no member \"b\""},
        {[&] { view.at("list").at(2); },
         "missing: index 2 out of range for a JSON array of 2 elements"},
        {[&] { view.at(0); }, "invalid: expected JSON array, found JSON object"},
    };
    for (const auto& [operation, message] : errors) {
        EXPECT_EQ(error_of(operation), message);
    }
}

// The writer leaves out a member holding Undefined: every lookup finds nothing there either,
// and value_or falls back as for a member that is not there.
TEST(Access, AMemberHoldingUndefinedIsAbsentAndValueOrFallsBack) {
    Value doc =
        Object{{"gone", Value()}, {"list", Array{Value()}}, {"port", 8080}, {"name", "api"}};
    const Value& view = doc;
    EXPECT_EQ(json::serialize(doc), R"({"list":[null],"name":"api","port":8080})");
    EXPECT_FALSE(view.contains("gone"));
    EXPECT_EQ(view.find("gone"), nullptr);
    EXPECT_EQ(doc.find("gone"), nullptr);
    EXPECT_EQ(view.find_pointer("/gone"), nullptr);
    EXPECT_EQ(error_of([&] { view.at("gone"); }), "missing: no member \"gone\"");
    EXPECT_EQ(error_of([&] { view.at_pointer("/gone/x"); }), "missing: /gone: no member \"gone\"");
    EXPECT_TRUE(view.at_pointer("/list/0").is_undefined()); // an element is there: null
    EXPECT_EQ(view.value_or("port", 80), 8080);
    EXPECT_EQ(view.value_or("missing", 80) + view.value_or("gone", 80), 160);
    EXPECT_EQ(view.value_or<std::string>("name", "x"), "api");
    EXPECT_EQ(view.value_or("name", "x") + view.value_or("missing", "x"), "apix");
    EXPECT_EQ(error_of([&] { view.value_or("name", 80); }),
              "invalid: /name: expected JSON number, found JSON string");
    EXPECT_THROW(Value(Array{}).value_or("port", 80), std::invalid_argument);
}

// A string subscript makes what is missing on the way; an index subscript makes nothing.
TEST(Access, Subscripts) {
    Value doc;
    doc["a"] = 1;
    doc["b"]["c"] = "x";
    doc["b"]["d"] = Array{1, 2};
    doc["b"]["d"][1] = true;
    doc["e"];
    EXPECT_EQ(json::serialize(doc), R"({"a":1,"b":{"c":"x","d":[1,true]}})");
    EXPECT_EQ(doc.as_object().size(), 3u); // "e" is there, holding Undefined
    EXPECT_TRUE(doc["e"].is_undefined() && !doc.contains("e"));
    const Value& view = doc;
    EXPECT_EQ(view.at("b").at("d")[0], 1);

    const std::pair<Value, const char*> rows[] = {
        {Value(nullptr), "invalid: expected JSON object, found JSON null"},
        {Value(2.5f), "invalid: expected JSON object, found JSON number"},
        {Value("k"), "invalid: expected JSON object, found JSON string"},
        {Value(Array{}), "invalid: expected JSON object, found JSON array"},
    };
    for (const auto& [start, message] : rows) {
        Value value = start;
        EXPECT_EQ(error_of([&] { value["k"]; }), message);
        EXPECT_EQ(value, start);
    }
    // The literal 0 is an index, never a null key; a string literal is a key.
    Value both = Array{Object{{"k", 7}}};
    EXPECT_EQ(both[0]["k"], 7);
    EXPECT_EQ(error_of([&] { both[1]; }),
              "missing: index 1 out of range for a JSON array of 1 elements");
    EXPECT_EQ(error_of([&] { doc[0]; }), "invalid: expected JSON array, found JSON object");
    EXPECT_EQ(both.as_array().size(), 1u);
}

// When an allocation fails, a subscript leaves the Value as it was: Undefined, or the Object
// without the new member.
TEST(Access, SubscriptKeepsTheValueWhenAnAllocationFails) {
    const Value starts[] = {Value(), Value(Object{{"x", 1}})};
    for (const Value& start : starts) {
        test_support::for_each_failure_mode(
            [&] { return start; },
            [](Value& value) { value["a key longer than the small-string buffer"] = 1; },
            [&](const Value& value, bool) { EXPECT_EQ(value, start); });
    }
}

// Big enough that a deep copy would show: an Array of Objects with long strings.
Value large_document(int seed) {
    Array items;
    for (int i = 0; i < 200; ++i) {
        items.push_back(Object{{"id", seed + i}, {"text", std::string(40, 'a')}});
    }
    return items;
}

TEST(Access, SwapsAndTakingConstructorsCopyNothing) {
    Value a = large_document(1);
    Value b = Array{large_document(2), 7};
    Value arrays = Array{large_document(3), large_document(4), large_document(5)};
    Value text = "a string longer than the small-string buffer";
    Value number = 1.5;
    const Value a_before = a;
    const Value b_before = b;
    const Value arrays_before = arrays;
    Array items(1000, text);
    std::string characters(100, 'x');
    const std::size_t before = allocations_made();
    swap(a, b); // argument-dependent lookup finds json::swap
    std::reverse(arrays.as_array().begin(), arrays.as_array().end());
    number.swap(text);
    const Value taken_items(std::move(items));
    const Value taken_text(std::move(characters));
    EXPECT_EQ(allocations_made() - before, 1u); // the taken Array itself
    EXPECT_TRUE(a == b_before && b == a_before);
    EXPECT_TRUE(arrays.at(0) == arrays_before.at(2) && arrays.at(2) == arrays_before.at(0));
    EXPECT_TRUE(number == "a string longer than the small-string buffer" && text == 1.5);
    EXPECT_EQ(taken_items.as_array().size() + taken_text.as_string().size(), 1100u);
}

TEST(Access, SwapOfDifferentKindsKeepsBothWhenAnAllocationFails) {
    const Value kinds[] = {large_document(1), Object{{"k", large_document(2)}},
                           Value("a string longer than the small-string buffer"), Value(2.0)};
    for (const Value& left : kinds) {
        for (const Value& right : kinds) {
            // One failed allocation: both unchanged. Memory exhausted for good: each holds its
            // own content or false, never the other's.
            test_support::for_each_failure_mode(
                [&] { return std::make_pair(left, right); },
                [](auto& pair) { pair.first.swap(pair.second); },
                [&](auto& pair, bool may_lose) {
                    EXPECT_TRUE(pair.first == left || (may_lose && pair.first == false));
                    EXPECT_TRUE(pair.second == right || (may_lose && pair.second == false));
                });
            Value x = left;
            Value y = right;
            x.swap(y);
            EXPECT_TRUE(x == right && y == left);
        }
    }
}

} // namespace
