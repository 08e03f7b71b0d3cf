// The value model and the builders.
#include "support/errors.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <functional>
#include <stdexcept>

namespace {

using namespace json;
using E = Element;
using P = Property;

// Distinct Values of every alternative; the containers hold every alternative at some depth.
std::vector<Value> samples() {
    const Value list = Array{1, "two", nullptr, true, Array{}, Object{}, 2.5f, Undefined()};
    const Value nested = Array{list, Object{{"in", list}}};
    const Value ab =
        Object{{"a", list},    {"b", 1},        {"c", "two"}, {"d", nullptr},    {"e", true},
               {"f", Array{}}, {"g", Object{}}, {"h", 2.5f},  {"i", Undefined()}};
    const Value a1 = Object{{"a", 1}}, a2 = Object{{"a", 2}}, b1 = Object{{"b", 1}};
    const Value pair = Array{1, 2}, reversed = Array{2, 1}, triple = Array{1, 2, 3};
    return {Value(),  nullptr, true, 1.0, 1.0f, "a string long enough to live on the heap",
            nested,   ab,      a1,   a2,  b1,   pair,
            reversed, triple,  list};
}

TEST(Value, ConstructorsSelectTheirAlternative) {
    char buffer[] = "mutable";
    const std::pair<Value, int> rows[] = {
        {Value(), 0},       {Undefined(), 0}, {Value::UNDEFINED, 0}, {Null(), 1},   {nullptr, 1},
        {false, 2},         {1.5, 3},         {std::int8_t{-8}, 3},  {-7LL, 3},     {"text", 4},
        {std::string(), 4}, {buffer, 4},      {Array(), 5},          {Object(), 6}, {1.5f, 7}};
    for (const auto& [value, which] : rows) {
        EXPECT_EQ(value.which(), which) << serialize(value);
    }
    EXPECT_FALSE((std::is_constructible_v<Value, const Value*>));
}

// An integer becomes a double only when the double holds it exactly: no 64-bit id is rounded
// without a word, whichever way the Value is made.
TEST(Value, IntegersAreHeldExactlyOrRefused) {
    const std::pair<Value, double> held[] = {
        {std::int64_t{9007199254740992}, 9007199254740992.0},
        {std::int64_t{-9007199254740994}, -9007199254740994.0},
        {INT64_MIN, -0x1p63},
        {std::uint64_t{1} << 63U, 0x1p63},
        {std::uint64_t{0xFFFFFFFFFFFFF800}, 0x1.fffffffffffffp63},
        {std::int64_t{1} << 62U, 0x1p62},
    };
    for (const auto& [value, number] : held) {
        EXPECT_EQ(value, number) << number;
    }
    const std::pair<std::function<void()>, const char*> refused[] = {
        {[] { Value(std::int64_t{1234567890123456789}); },
         "1234567890123456789 cannot be held exactly by a double (the nearest is "
         "1234567890123456768): keep it as a string, or convert it to a double first"},
        {[] { Value(INT64_MAX); }, "9223372036854775807 cannot be held exactly by a double (the "
                                   "nearest is 9223372036854775808): "},
        {[] { Value(UINT64_MAX); }, "18446744073709551615 cannot be held exactly by a double (the "
                                    "nearest is 18446744073709551616): "},
        {[] { Value(std::int64_t{-9007199254740993}); }, "-9007199254740993 cannot be held"},
        {[] {
             json::value_from(std::vector<long long>{1, 9007199254740993});
         },
         "9007199254740993 cannot be held"},
        {[] { Value(json::Property("id") = 1234567890123456789LL); },
         "1234567890123456789 cannot be held"},
    };
    for (const auto& [make, message] : refused) {
        const std::string error = test_support::error_of(make);
        EXPECT_EQ(error.rfind("missing: " + std::string(message), 0), 0U) << error;
    }
}

// Each sample onto each sample, from inside the target's own tree and onto itself too: copies
// are deep, independent, and equal to their source and to nothing else.
TEST(Value, CopiesAssignmentAndEquality) {
    const std::vector<Value> all = samples();
    for (std::size_t i = 0; i < all.size(); ++i) {
        for (std::size_t j = 0; j < all.size(); ++j) {
            EXPECT_EQ(all[i] == all[j], i == j) << i << " == " << j;
            EXPECT_EQ(all[i] != all[j], i != j);
            Value target = all[i];
            target = all[j];
            Value in_array = Array{all[i], all[j]};
            in_array = boost::get<Array>(in_array)[1];
            Value in_object = Object{{"m", Object{{"n", all[j]}}}};
            in_object = boost::get<Object>(boost::get<Object>(in_object)["m"])["n"];
            EXPECT_TRUE(target == all[j] && in_array == all[j] && in_object == all[j]) << i << j;
        }
        Value self = all[i];
        self = static_cast<const Value&>(self);
        EXPECT_EQ(self, all[i]);
    }
    EXPECT_NE(Value(std::nan("")), Value(std::nan("")));
    EXPECT_NE(Value(std::nanf("")), Value(std::nanf("")));
    EXPECT_EQ(Value(0.0), Value(-0.0));
    Value copy = all[6];
    boost::get<Array>(boost::get<Array>(copy)[0])[1] = "changed";
    EXPECT_NE(copy, all[6]);
    EXPECT_EQ(all[6], samples()[6]);
    // Comparison with what a Value is made from; with namespace json in use, two operands that
    // are not Values keep their own comparison (else -Wpedantic calls it ambiguous: an error
    // in the test builds).
    EXPECT_TRUE(all[6] != 5 && Value(5) == 5 && Value("abc") == std::string("abc"));
    char same[] = "abc"; // not const: a qualification conversion away from std::string's own
    EXPECT_TRUE(std::string("abc") == same);
}

// Short Arrays of scalars, strings and empty containers are copied in one loop, longer ones and
// those holding a non-empty container element by element: each length around the limit, each
// with and without a nested container at its end. Beyond the depth the copy recurses to, the
// levels are copied from its work list: arrays and objects that each hold a container beside
// the next level, several at each level, each level swapped in so that nothing but the last
// check copies the tree.
TEST(Value, CopiesArraysOfEveryLengthAndNestingOfEveryDepth) {
    const std::vector<Value> all = samples();
    const Value leaves[] = {all[0], all[1], all[2], all[3], all[4], all[5], Array{}, Object{}};
    for (const std::size_t length : {1, 2, 255, 256, 257, 1000}) {
        Array items;
        for (std::size_t i = 0; i < length; ++i) {
            items.push_back(leaves[i % std::size(leaves)]);
        }
        for (const bool nested : {false, true}) {
            if (nested) {
                items.back() = all[6];
            }
            const Value source(items);
            EXPECT_EQ(Value(source), source) << length << (nested ? " nested" : "");
        }
    }
    Value deep = all[6];
    for (int level = 0; level < 300; ++level) {
        Value next = level % 2 == 0 ? Value(Array{all[7], Value()})
                                    : Value(Object{{"a", Value()}, {"b", all[11]}});
        (level % 2 == 0 ? boost::get<Array>(next)[1] : boost::get<Object>(next)["a"]).swap(deep);
        deep.swap(next);
    }
    EXPECT_EQ(Value(deep), deep);
}

TEST(Builders, Expressions) {
    const Value x = 1, y = "y", z = false;
    const E right(y);
    const E pair = (E(x), E(y)); // initialised from the chain's reference: a copy, so it nests
    const E direct = E(x);       // from a temporary: no copy
    const std::string name = "Ada";
    const std::pair<Value, const char*> rows[] = {
        {E(Array{x, y}), R"([[1,"y"]])"}, // an Array value is one item, never spliced
        {(E(x), right, E(z)), R"([1,"y",false])"},
        {pair, R"([[1,"y"]])"},
        {E(pair), R"([[[1,"y"]]])"},
        {direct, "[1]"},
        {(E(x), E((E(y), E(z))), E(x)), R"([1,["y",false],1])"},
        {(E(1.5), E("x"), Value(true), E(P("k") = 1), 2, nullptr),
         R"([1.5,"x",true,{"k":1},2,null])"},
        {(P("outer") = (P("a") = x, P("b") = y), P("c") = z),
         R"({"c":false,"outer":{"a":1,"b":"y"}})"},
        {(P("k") = x, P("k") = y), R"({"k":1})"},                 // the first occurrence wins
        {(P("k") = x) = y, R"({"k":"y"})"},                       // a second assignment overwrites
        {(P("a") = x, P("b") = y) = z, R"({"a":false,"b":"y"})"}, // the leftmost name
        {P("m") = P("n"), R"({"m":{}})"},
        {P("m") = P("n") = y, R"({"m":{"n":"y"}})"}, // assignment groups to the right
        {(P("name") = "Ada", P("age") = 36, P("ok") = true, P("none") = nullptr, P("f") = 1.5f,
          P("owner") = name, P("tags") = (E("x"), 2), P("nested") = (P("in") = Array{})),
         R"({"age":36,"f":1.5,"name":"Ada","nested":{"in":[]},"none":null,"ok":true,)"
         R"("owner":"Ada","tags":["x",2]})"}};
    for (const auto& [value, expected] : rows) {
        EXPECT_EQ(serialize(value), expected);
    }
    EXPECT_EQ(Value(right), Array{y}) << "a right operand is unchanged";
    for (const Value& item : samples()) {
        EXPECT_EQ(Value(E(item)), Array{item});
        EXPECT_EQ(Value(P("k") = item), (Object{{"k", item}})) << "Undefined is kept too";
    }
}

TEST(Builders, SelfReferenceAndIndependentCopies) {
    const E e(1);
    (e, E("b"));
    (e, e);
    EXPECT_EQ(serialize(e), R"([1,"b",1,"b"])");
    (e, e, e); // doubles to 8, then appends those 8 again
    Value converted = e;
    EXPECT_EQ(boost::get<Array>(converted).size(), 16u);
    EXPECT_EQ(boost::get<Array>(converted).capacity(), 16u) << "allocated at the exact size";
    boost::get<Array>(converted)[0] = "changed";
    EXPECT_EQ(boost::get<Array>(Value(e))[0], 1) << "conversions are independent";
    const P p("k");
    p = 1;
    p = p;
    (p, p);
    const P copy(p);
    p = 2;
    EXPECT_EQ(serialize(copy), R"({"k":{"k":1}})");
    EXPECT_EQ(serialize(p), R"({"k":2})");
}

} // namespace
