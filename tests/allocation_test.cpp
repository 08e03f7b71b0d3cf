// Every operation that allocates, run once for every allocation it makes with that allocation
// failing, and once more with memory exhausted from that allocation on: no leak, and the state
// the library documents for a failure. CTest runs each test in a process of its own, so
// nothing the library might make on first use is made before the counting starts.
#include "support/allocation_failure.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

namespace {

using namespace json;
using test_support::allocations_made;
using test_support::for_each_failure_mode;

const char* const LONG = "a string longer than the small-string buffer of std::string";

// Made anew when needed, never kept at namespace scope, so that no copy precedes the counting.
Value document() {
    return Array{Object{{"name", LONG}, {"list", Array{1, Array{2, Object{{"x", nullptr}}}}}},
                 Object{}, 2.5f};
}

// First in the file, so that it also sees the library's first use when the tests of the file
// share a process (as under valgrind).
TEST(Allocation, NothingOutlivesTheFirstUse) {
    const std::size_t before = test_support::live_blocks();
    {
        Value copy = document();
        copy = Object{{"k", copy}};
        EXPECT_NE(pretty_print(copy), serialize(copy));
        EXPECT_EQ(parse(R"([{"a":"\u00e9"},[]])", copy), ParseResult::SUCCESS);
        EXPECT_EQ(Value((Property("a") = (Element(1), Element(copy)))).which(), 6);
    }
    EXPECT_EQ(test_support::live_blocks(), before);
}

// A container copy allocates only what it keeps: the container, its item storage, and so on.
TEST(Allocation, FailedCopyLeavesNothingBehind) {
    const auto allocations = [](Value (*setup)(), auto check) {
        const auto copy = [](const Value& source) { Value copy(source); };
        return for_each_failure_mode(setup, copy, check).allocations;
    };
    const auto nothing = [](const Value&, bool) {};
    EXPECT_EQ(allocations([] { return Value(Array{}); }, nothing), 1u);
    EXPECT_EQ(allocations([] { return Value(Array{1, 2, 3}); }, nothing), 2u);
    EXPECT_GT(
        allocations(document, [](const Value& source, bool) { EXPECT_EQ(source, document()); }),
        10u);
}

// Assigns `source`, or when `element` is not -1 that element of the target, to `target`. On
// failure a scalar source cannot throw; a container onto another alternative leaves false;
// anything else leaves the target unchanged.
void expect_failed_assignment(const Value& target, const Value& source, int element) {
    const bool container = source.which() == 5 || source.which() == 6;
    const Value expected = container && target.which() != source.which() ? Value(false) : target;
    for_each_failure_mode(
        [&] { return std::make_pair(target, source); },
        [element](std::pair<Value, Value>& state) {
            state.first = element < 0 ? state.second : boost::get<Array>(state.first)[element];
        },
        [&](const std::pair<Value, Value>& state, bool) {
            EXPECT_TRUE(container || source.which() == 4) << "assigning a scalar threw";
            EXPECT_EQ(state.first, expected) << serialize(target) << " = " << serialize(source);
        });
}

// Each of these onto each, failing. Besides, comparing two of them allocates nothing unless one
// is nested (values[0] and values[1]), nor does copying and assigning scalars (values[5] on).
TEST(Allocation, AssignmentAndComparison) {
    const Value nested = document(), object = boost::get<Array>(nested)[0];
    const Value items = Array{1, LONG, nullptr}, members = Object{{"a", 1}, {"b", LONG}};
    const Value values[] = {nested,  object,  items, members, LONG,
                            Value(), nullptr, true,  1.0,     2.5f};
    for (const Value& target : values) {
        for (const Value& source : values) {
            expect_failed_assignment(target, source, -1);
            std::size_t before = allocations_made();
            const bool equal = target == source;
            EXPECT_TRUE(&target <= &values[1] || &source <= &values[1] ||
                        allocations_made() == before)
                << serialize(target) << (equal ? " == " : " != ") << serialize(source);
            if (&target >= &values[5] && &source >= &values[5]) {
                before = allocations_made();
                Value copy = target;
                copy = source;
                EXPECT_EQ(allocations_made(), before) << "copying a scalar allocated";
            }
        }
    }
    const Value inside = Array{Object{{"k", LONG}}, Array{LONG}, LONG};
    for (int element : {0, 1, 2}) {
        expect_failed_assignment(inside, boost::get<Array>(inside)[element], element);
    }
}

// The operands of every builder operation; `left` has room for one more item, `right` none.
struct Builders {
    Value value;
    Element left, right;
    Property property, other;
};

Builders builders() {
    const Value big = Array{LONG, Object{{"k", Array{1}}}};
    Builders b{big, Element(big), Element(big), Property("name"), Property("o")};
    (b.left, Element(1), Element(2));
    (b.property, Property("b") = LONG, Property("other") = big);
    (b.other, Property("a") = big, Property("b") = big, Property("c") = big, Property("d") = big);
    return b;
}

// STRONG: nothing changes. SOME: besides its old members, `property` may hold `name` as a
// failed assignment leaves it (Undefined or false) or some of the new members of `other`.
TEST(Allocation, FailedBuilderOperationsLeaveTheDocumentedState) {
    enum Guarantee { STRONG, SOME };
    const std::pair<void (*)(const Builders&), Guarantee> rows[] = {
        {[](const Builders& b) { Element made(b.value); }, STRONG},
        {[](const Builders& b) { Element copy(b.left); }, STRONG},
        {[](const Builders& b) { (b.left, b.right); }, STRONG},
        {[](const Builders& b) { (b.right, b.left); }, STRONG},
        {[](const Builders& b) { (b.left, b.left); }, STRONG},
        {[](const Builders& b) { Value converted = b.left; }, STRONG},
        {[](const Builders&) { Property made(LONG); }, STRONG},
        {[](const Builders& b) { Value converted = b.property; }, STRONG},
        {[](const Builders& b) { b.property = b.value; }, SOME},
        {[](const Builders& b) { b.property = b.other; }, SOME},
        {[](const Builders& b) { (b.property, b.other); }, SOME}};
    const Builders before = builders();
    const Value members = before.property, other = before.other;
    const Object& others = boost::get<Object>(other);
    for (const auto& [operation, guarantee] : rows) {
        for_each_failure_mode(
            builders, operation, [&, guarantee = guarantee](const Builders& b, bool) {
                EXPECT_TRUE(Value(b.left) == Value(before.left) &&
                            Value(b.right) == Value(before.right) && Value(b.other) == other);
                Object after = boost::get<Object>(Value(b.property));
                for (auto member = after.begin(); guarantee == SOME && member != after.end();) {
                    const bool fresh = boost::get<Object>(members).count(member->first) == 0;
                    const Value& value = member->second;
                    EXPECT_TRUE(!fresh || member->first != "d")
                        << "all of `other` is in, yet it threw";
                    EXPECT_TRUE(
                        !fresh || value.which() == 0 || value == false ||
                        (others.count(member->first) != 0 && value == others.at(member->first)));
                    member = fresh ? after.erase(member) : std::next(member);
                }
                EXPECT_EQ(Value(after), members);
            });
    }
}

// json::parse(text) hands its document over as parse(text, out) does, without a copy.
TEST(Allocation, ReturnedDocumentIsNotCopied) {
    const std::string text = serialize(document());
    Value out;
    std::size_t before = allocations_made();
    ASSERT_TRUE(parse(text, out, {}));
    const std::size_t into_out = allocations_made() - before;
    before = allocations_made();
    const Value returned = parse(text);
    EXPECT_EQ(allocations_made() - before, into_out);
    EXPECT_EQ(returned, out);
}

// With one allocation failing `out` is left exactly as it was; with memory exhausted it may
// also be left holding false, but never any part of the new document. Either way the caller
// gets the std::bad_alloc.
TEST(Allocation, FailedParseLeavesOutAsItWas) {
    const char* const texts[] = {
        R"({"name":"a string long enough to be allocated","list":[1,[2,{"x":null}],"three"]})",
        R"([{"a":1,"a":[2]},"\u00e9\ud83d\ude00",[],{}])",
        R"("just a string that needs an allocation of its own")"};
    for (const char* text : texts) {
        for (const Value& before :
             {Value(), Value(Array{1, LONG}), Value(Object{{"old", Array{}}}), Value(LONG)}) {
            const auto runs =
                for_each_failure_mode([&before] { return before; },
                                      [text](Value& out) { static_cast<void>(parse(text, out)); },
                                      [&](const Value& out, bool exhausted) {
                                          EXPECT_TRUE(out == before || (exhausted && out == false))
                                              << text << " into " << serialize(before) << ": "
                                              << serialize(out);
                                      });
            EXPECT_EQ(runs.absorbed, 0u) << text;
        }
    }
}

} // namespace
