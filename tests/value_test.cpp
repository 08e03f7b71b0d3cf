#include <json/json.hpp>

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <type_traits>

namespace {

using json::Array;
using json::Object;
using json::Value;

template <typename T>
std::uint64_t bits_of(T number) {
    std::uint64_t bits = 0;
    std::memcpy(&bits, &number, sizeof number);
    return bits;
}

// A document with every alternative at some depth.
Value sample_document() {
    Object inner;
    inner["flag"] = true;
    inner["list"] = Array{1, "two", nullptr, Array{}, Object{}, 2.5f};
    Object root;
    root["inner"] = inner;
    root["text"] = "hello";
    root["nothing"] = json::Undefined();
    return Array{root, 3.25, json::Null()};
}

TEST(Value, ConstructorsSelectTheirAlternative) {
    EXPECT_EQ(Value().which(), 0);
    EXPECT_EQ(Value(json::Undefined()).which(), 0);
    EXPECT_EQ(Value(json::Null()).which(), 1);
    EXPECT_EQ(Value(nullptr).which(), 1);
    EXPECT_EQ(Value(false).which(), 2);
    EXPECT_EQ(Value(1.5).which(), 3);
    EXPECT_EQ(Value(std::string("s")).which(), 4);
    EXPECT_EQ(Value(Array()).which(), 5);
    EXPECT_EQ(Value(Object()).which(), 6);
    EXPECT_EQ(Value(1.5f).which(), 7);
    EXPECT_TRUE(boost::get<Array>(Value(Array())).empty());
    EXPECT_TRUE(boost::get<Object>(Value(Object())).empty());
}

TEST(Value, ConvenienceConstructorsNeverMakeABool) {
    const Value literal = "text";
    ASSERT_EQ(literal.which(), 4);
    EXPECT_EQ(boost::get<std::string>(literal), "text");
    char buffer[] = "mutable";
    EXPECT_EQ(Value(buffer).which(), 4);

    EXPECT_EQ(boost::get<double>(Value(42)), 42.0);
    EXPECT_EQ(boost::get<double>(Value(std::int8_t{-8})), -8.0);
    EXPECT_EQ(boost::get<double>(Value(std::uint64_t{1} << 60)), std::ldexp(1.0, 60));
    EXPECT_EQ(boost::get<double>(Value(-7LL)), -7.0);
    EXPECT_FALSE((std::is_constructible_v<Value, int*>));
    EXPECT_FALSE((std::is_constructible_v<Value, const Value*>));
}

TEST(Value, MissingObjectMemberIsUndefined) {
    Object object;
    EXPECT_EQ(object["absent"].which(), 0);
    EXPECT_EQ(object.size(), 1u);
}

TEST(Value, TypeNames) {
    EXPECT_STREQ(json::traits<json::Undefined>::name, "undefined");
    EXPECT_STREQ(json::traits<json::Null>::name, "JSON null");
    EXPECT_STREQ(json::traits<bool>::name, "JSON boolean");
    EXPECT_STREQ(json::traits<double>::name, "JSON number");
    EXPECT_STREQ(json::traits<std::string>::name, "JSON string");
    EXPECT_STREQ(json::traits<Array>::name, "JSON array");
    EXPECT_STREQ(json::traits<Object>::name, "JSON object");
    EXPECT_STREQ(json::traits<float>::name, "float");
    EXPECT_STREQ(json::traits<int>::name, "int");
}

TEST(Value, TagsAreNotTheFallbackAlternative) {
    EXPECT_FALSE(std::is_nothrow_default_constructible_v<json::Undefined>);
    EXPECT_FALSE(std::is_nothrow_default_constructible_v<json::Null>);
    EXPECT_TRUE(std::is_nothrow_copy_constructible_v<json::Undefined>);
    EXPECT_TRUE(std::is_nothrow_copy_constructible_v<json::Null>);
    EXPECT_FALSE(std::is_move_constructible_v<Value> &&
                 std::is_nothrow_move_constructible_v<Value>);
}

TEST(Value, SharedUndefinedConstant) {
    EXPECT_EQ(Value::UNDEFINED.which(), 0);
    const Value copy = Value::UNDEFINED;
    EXPECT_EQ(copy.which(), 0);
    EXPECT_NE(copy, Value(json::Null()));
}

TEST(Value, CopiesAreDeepAndIndependent) {
    const Value original = sample_document();
    Value by_construction = original;
    Value by_assignment = 1.0;
    by_assignment = original;
    EXPECT_EQ(by_construction, original);
    EXPECT_EQ(by_assignment, original);

    Array& list = boost::get<Array>(boost::get<Object>(
        boost::get<Object>(boost::get<Array>(by_construction)[0])["inner"])["list"]);
    list[1] = "changed";
    EXPECT_NE(by_construction, original);
    EXPECT_EQ(by_assignment, original);
    EXPECT_EQ(serialize(original), serialize(sample_document()));
}

TEST(Value, NumbersCopyBitForBit) {
    const double doubles[] = {std::numeric_limits<double>::quiet_NaN(),
                              std::numeric_limits<double>::infinity(),
                              -std::numeric_limits<double>::infinity(), -0.0};
    for (double number : doubles) {
        const Value copy = Value(number);
        ASSERT_EQ(copy.which(), 3);
        EXPECT_EQ(bits_of(boost::get<double>(copy)), bits_of(number));
    }
    const float floats[] = {std::numeric_limits<float>::quiet_NaN(),
                            -std::numeric_limits<float>::infinity(), -0.0f};
    for (float number : floats) {
        Value copy;
        copy = Value(number);
        ASSERT_EQ(copy.which(), 7);
        EXPECT_EQ(bits_of(boost::get<float>(copy)), bits_of(number));
    }
}

TEST(Value, AssignmentChangesAlternative) {
    Value target = sample_document();
    target = true;
    ASSERT_EQ(target.which(), 2);
    EXPECT_TRUE(boost::get<bool>(target));
    target = Object{{"k", 1}};
    EXPECT_EQ(serialize(target), R"({"k":1})");
    target = "s";
    EXPECT_EQ(target, Value("s"));
}

TEST(Value, SelfAssignmentLeavesEveryAlternativeUnchanged) {
    const Value samples[] = {Value(),
                             Value(nullptr),
                             true,
                             2.5,
                             "text",
                             sample_document(),
                             boost::get<Array>(sample_document())[0],
                             1.5f};
    for (const Value& sample : samples) {
        Value target = sample;
        Value& alias = target;
        target = alias;
        EXPECT_EQ(target, sample);
    }
}

// The source lies inside the target's own tree: every combination of alternatives.
TEST(Value, AssignmentFromInsideItsOwnTree) {
    const Value payloads[] = {nullptr,
                              true,
                              4.0,
                              "a string long enough to live on the heap",
                              Array{1, Array{2}},
                              Object{{"x", Object{{"y", 1}}}},
                              0.5f};
    for (const Value& payload : payloads) {
        Value in_array = Array{payload, 1};
        in_array = boost::get<Array>(in_array)[0];
        EXPECT_EQ(in_array, payload);

        Value in_object = Object{{"m", Object{{"n", payload}}}};
        in_object = boost::get<Object>(boost::get<Object>(in_object)["m"])["n"];
        EXPECT_EQ(in_object, payload);
    }
}

TEST(Value, ObjectKeysSortAsUnsignedBytes) {
    Object object{{"b", 1}, {"a", 2}, {"B", 3}, {"ab", 4}, {"", 5}, {"\xC3\xA9", 6}, {"z", 7}};
    std::string order;
    for (const auto& member : object) {
        order += "[" + member.first + "]";
    }
    EXPECT_EQ(order, "[][B][a][ab][b][z][\xC3\xA9]");
}

TEST(Value, Equality) {
    EXPECT_EQ(Value(), Value());
    EXPECT_EQ(Value(nullptr), Value(nullptr));
    EXPECT_NE(Value(), Value(nullptr));
    EXPECT_NE(Value(1.0), Value(1.0f)) << "double and float are distinct alternatives";
    EXPECT_NE(Value(std::nan("")), Value(std::nan("")));
    EXPECT_EQ(Value(0.0), Value(-0.0));
    EXPECT_NE((Array{1, 2}), (Array{1, 2, 3}));
    EXPECT_NE((Array{1, 2}), (Array{2, 1}));
    EXPECT_NE((Object{{"a", 1}}), (Object{{"b", 1}}));
    EXPECT_NE((Object{{"a", 1}}), (Object{{"a", 2}}));
    EXPECT_EQ(sample_document(), sample_document());
}

} // namespace
