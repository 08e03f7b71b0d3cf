// What the builders are left holding when memory runs out, for every allocation they make.
#include "support/allocation_failure.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <optional>

namespace {

using json::Array;
using json::Element;
using json::Object;
using json::Property;
using json::Value;
using test_support::for_each_failing_allocation;

const Value big = Array{"a string long enough for its own allocation", Object{{"k", Array{1}}}};

Value element_items(const Element& element) {
    return element;
}

TEST(ElementFailure, ConstructionLeavesNothingBehind) {
    for_each_failing_allocation([] { return 0; }, [](int) { Element e(big); }, [](int) {});
    for_each_failing_allocation(
        [] { return Element(big); }, [](const Element& inner) { Element outer(inner); },
        [](const Element& inner) { EXPECT_EQ(element_items(inner), Array{big}); });
}

TEST(ElementFailure, CommaLeavesTheLeftOperandExactlyAsBefore) {
    struct Operands {
        Element left;
        Element right;
    };
    // Both with spare capacity and with reallocation, and appending to itself.
    for (int initial : {1, 3}) {
        auto setup = [initial] {
            Operands operands{Element(big), Element(1)};
            for (int i = 1; i < initial; ++i) {
                (operands.left, Element(i));
            }
            (operands.right, Element(big));
            return operands;
        };
        const Value left_before = setup().left;
        for_each_failing_allocation(
            setup, [](Operands& o) { (o.left, o.right); },
            [&](Operands& o) {
                EXPECT_EQ(element_items(o.left), left_before);
                EXPECT_EQ(element_items(o.right), (Array{1, big}));
            });
        for_each_failing_allocation(
            setup, [](Operands& o) { (o.left, o.left); },
            [&](Operands& o) { EXPECT_EQ(element_items(o.left), left_before); });
    }
}

TEST(ElementFailure, ConversionLeavesTheElementUnchanged) {
    auto setup = [] { return Element((Element(big), Element("second long string value here"))); };
    const Value before = setup();
    for_each_failing_allocation(
        setup, [](const Element& e) { Value converted = e; },
        [&](const Element& e) { EXPECT_EQ(element_items(e), before); });
}

Value property_members(const Property& property) {
    return property;
}

TEST(PropertyFailure, AssignmentKeepsAValidMember) {
    auto setup = [] {
        const Property p("name");
        (p, Property("other") = big);
        return p;
    };
    // Failing while a member is made or filled: other members are untouched, and the member
    // `name`, if it was created, holds Undefined or what a failed assignment leaves (false).
    auto check = [](const Property& p) {
        const Value members = property_members(p);
        const Object& object = boost::get<Object>(members);
        EXPECT_EQ(object.at("other"), big);
        EXPECT_LE(object.size(), 2u);
        if (object.count("name") != 0) {
            const Value& member = object.at("name");
            EXPECT_TRUE(member.which() == 0 || member == false) << json::serialize(member);
        }
    };
    for_each_failing_allocation(
        setup, [](const Property& p) { p = big; }, check);
    for_each_failing_allocation(
        setup, [](const Property& p) { p = Property("x") = big; }, check);
}

TEST(PropertyFailure, CommaKeepsTheMembersInsertedBeforeTheFailure) {
    struct Operands {
        Property left;
        Property right;
    };
    auto setup = [] {
        Operands operands{Property("l"), Property("r")};
        (operands.left, Property("b") = "left value that must survive the merge");
        (operands.right, Property("a") = big, Property("b") = big, Property("c") = big,
         Property("d") = big);
        return operands;
    };
    for_each_failing_allocation(
        setup, [](Operands& o) { (o.left, o.right); },
        [](Operands& o) {
            const Value merged = property_members(o.left);
            const Object& members = boost::get<Object>(merged);
            EXPECT_EQ(members.at("b"), Value("left value that must survive the merge"));
            // The new keys present form a prefix of a, c, d.
            const bool has_a = members.count("a") != 0;
            const bool has_c = members.count("c") != 0;
            const bool has_d = members.count("d") != 0;
            EXPECT_FALSE(has_d) << "the last member cannot be in";
            EXPECT_TRUE(has_a || !has_c);
            for (const auto& member : members) {
                if (member.first != "b") {
                    EXPECT_EQ(member.second, big);
                }
            }
        });
}

TEST(PropertyFailure, ConversionLeavesThePropertyUnchanged) {
    auto setup = [] { return (Property("a") = big, Property("b") = big); };
    const Value before = setup();
    for_each_failing_allocation(
        setup, [](const Property& p) { Value converted = p; },
        [&](const Property& p) { EXPECT_EQ(property_members(p), before); });
    for_each_failing_allocation([] { return 0; },
                                [](int) { Property p("a name longer than the small buffer"); },
                                [](int) {});
}

} // namespace
