#include <json/json.hpp>

#include <gtest/gtest.h>

namespace {

using json::Array;
using json::Element;
using json::Object;
using json::Value;
using P = json::Property;
using E = json::Element;

const Value a = 1;
const Value b = "b";
const Value c = Array{true};
const Value d = Object{{"k", nullptr}};

std::string text(const Value& value) {
    return json::serialize(value);
}

TEST(Element, OneItemPerValueWhateverItsAlternative) {
    const Value samples[] = {Value(), nullptr, true, 2.5, "s", Array{1, 2}, Object{}, 1.5f};
    for (const Value& sample : samples) {
        const Value converted = E(sample);
        ASSERT_EQ(converted.which(), 5);
        ASSERT_EQ(boost::get<Array>(converted).size(), 1u);
        EXPECT_EQ(boost::get<Array>(converted)[0], sample);
    }
    EXPECT_EQ(text(E(Array{a, b})), R"([[1,"b"]])") << "an Array value nests, never splices";
}

TEST(Element, CommaChainsAppendToTheLeftmostOperand) {
    const E y(b);
    const E z(c);
    const Value converted = (E(a), y, z);
    EXPECT_EQ(converted, (Array{a, b, c}));
    EXPECT_EQ(Value(y), Array{b}) << "right operands are unchanged";
    EXPECT_EQ(Value(z), Array{c});
}

TEST(Element, CopyingNests) {
    const Element pair = (E(a), E(b));
    // `pair` was initialised from the chain's const reference: a copy, so it already nests.
    EXPECT_EQ(text(pair), R"([[1,"b"]])");
    const Element deeper(pair);
    EXPECT_EQ(text(deeper), R"([[[1,"b"]]])");
    const Element direct = E(a);
    EXPECT_EQ(text(direct), "[1]") << "initialising from a temporary makes no copy";
    EXPECT_EQ(Value((E(a), Element((E(b), E(c))), E(d))), (Array{a, Array{b, c}, d}));
}

TEST(Element, SelfAppendDoublesTheList) {
    const E e(a);
    (e, E(b));
    (e, e);
    EXPECT_EQ(Value(e), (Array{a, b, a, b}));
    (e, e, e); // first doubles to 8, then appends those 8 again
    EXPECT_EQ(boost::get<Array>(Value(e)).size(), 16u);
}

TEST(Element, ConversionsAreIndependentCopies) {
    const E e(c);
    Value first = e;
    const Value second = e;
    boost::get<Array>(boost::get<Array>(first)[0]).push_back(2);
    EXPECT_EQ(second, Array{c});
    EXPECT_EQ(Value(e), Array{c});
    EXPECT_EQ(boost::get<Array>(second).capacity(), 1u) << "storage allocated at the exact size";
}

TEST(Property, WorkedExamples) {
    const Value x = 1, y = "y", z = false;
    EXPECT_EQ(text((P("a") = x, P("b") = y)), R"({"a":1,"b":"y"})");
    EXPECT_EQ(text((P("outer") = (P("a") = x, P("b") = y), P("c") = z)),
              R"({"c":false,"outer":{"a":1,"b":"y"}})");
    EXPECT_EQ(text(P("list") = (E(x), E(y))), R"({"list":[1,"y"]})");
    EXPECT_EQ(text((E(P("a") = x), E(P("b") = y))), R"([{"a":1},{"b":"y"}])");
}

TEST(Property, MergingAndOverwriting) {
    const Value x = 1, y = 2, z = 3;
    EXPECT_EQ(text(P("k")), "{}");
    EXPECT_EQ(text((P("a"), P("b"))), "{}");
    EXPECT_EQ(text((P("k") = x, P("k") = y)), R"({"k":1})") << "the first occurrence wins";
    EXPECT_EQ(text((P("k") = x) = y), R"({"k":2})") << "a second assignment overwrites";
    EXPECT_EQ(text((P("a") = x, P("b") = y) = z), R"({"a":3,"b":2})")
        << "the chain carries the name of its left operand";
    EXPECT_EQ(text((P("b") = x, P("a") = y)), R"({"a":2,"b":1})");
    EXPECT_EQ(text(P("") = x), R"({"":1})");
}

TEST(Property, NestingProperties) {
    const Value v = "v";
    EXPECT_EQ(text(P("m") = P("n")), R"({"m":{}})");
    EXPECT_EQ(text(P("m") = (P("n") = v)), R"({"m":{"n":"v"}})");
    EXPECT_EQ(text(P("m") = P("n") = v), R"({"m":{"n":"v"}})") << "assignment groups right";
}

TEST(Property, UndefinedValuesAreStoredNotSkipped) {
    const P p("k");
    p = json::Undefined();
    const Value converted = p;
    ASSERT_EQ(boost::get<Object>(converted).count("k"), 1u);
    EXPECT_EQ(boost::get<Object>(converted).at("k").which(), 0);
    p = 5;
    EXPECT_EQ(text(p), R"({"k":5})");
}

TEST(Property, SelfAssignmentAndSelfComma) {
    const P p("k");
    p = 1;
    p = p;
    EXPECT_EQ(text(p), R"({"k":{"k":1}})");
    (p, p);
    EXPECT_EQ(text(p), R"({"k":{"k":1}})");
}

TEST(Property, CopiesAndConversionsAreIndependent) {
    const P p("k");
    p = Array{1};
    const P copy(p);
    p = 2;
    EXPECT_EQ(text(copy), R"({"k":[1]})");
    Value first = p;
    boost::get<Object>(first)["other"] = 3;
    EXPECT_EQ(Value(p), (Object{{"k", 2}}));
}

// The spellings a user writes naturally compile and mean what they say.
TEST(Builders, NaturalSpellings) {
    const std::string name = "Ada";
    const Value person =
        (P("name") = "Ada", P("age") = 36, P("ok") = true, P("none") = nullptr, P("height") = 1.5f,
         P("owner") = name, P("tags") = (E("x"), 2, 1.5), P("nested") = (P("inner") = Array{}));
    EXPECT_EQ(text(person), R"({"age":36,"height":1.5,"name":"Ada","nested":{"inner":[]},)"
                            R"("none":null,"ok":true,"owner":"Ada","tags":["x",2,1.5]})");
    EXPECT_EQ(boost::get<Object>(person).at("name").which(), 4) << "a literal is a string";
    const Value list = (E(1.5), E("x"), Value(true), E(P("k") = 1));
    EXPECT_EQ(text(list), R"([1.5,"x",true,{"k":1}])");
}

} // namespace
