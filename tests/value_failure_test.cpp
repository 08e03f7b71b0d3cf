// What a Value is left holding when memory runs out, for every allocation an operation makes.
#include "support/allocation_failure.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

namespace {

using json::Array;
using json::Object;
using json::Value;
using test_support::for_each_failing_allocation;

Value sample_document() {
    return Array{Object{{"name", "a string longer than the small-string buffer"},
                        {"list", Array{1, Array{2, Object{{"x", nullptr}}}, "three"}}},
                 Object{}, 2.5f};
}

struct Assignment {
    Value target;
    Value source;
    Value target_before;
};

// Assigns `source` to `target`, failing each allocation in turn; `check` sees the result.
template <typename Check>
std::size_t check_failed_assignments(const Value& target, const Value& source, Check check) {
    return for_each_failing_allocation(
        [&] {
            return Assignment{target, source, target};
        },
        [](Assignment& state) { state.target = state.source; }, check);
}

TEST(ValueFailure, CopyConstructionLeavesNothingBehind) {
    const std::size_t allocations = for_each_failing_allocation(
        [] { return sample_document(); }, [](const Value& source) { Value copy(source); },
        [](const Value& source) { EXPECT_EQ(source, sample_document()); });
    EXPECT_GT(allocations, 10u);
}

TEST(ValueFailure, SameAlternativeStaysThatAlternative) {
    check_failed_assignments(Array{"old", Array{1}}, sample_document(), [](Assignment& state) {
        ASSERT_EQ(state.target.which(), 5);
        EXPECT_FALSE(json::serialize(state.target).empty());
    });
    check_failed_assignments(Object{{"k", "old value, long enough to be allocated"}},
                             boost::get<Array>(sample_document())[0],
                             [](Assignment& state) { EXPECT_EQ(state.target.which(), 6); });
}

TEST(ValueFailure, StringSourceLeavesTargetUnchanged) {
    const Value text = "a string longer than the small-string buffer of std::string";
    for (const Value& target : {sample_document(), Value(1.0), Value(Object{{"k", 1}})}) {
        check_failed_assignments(
            target, text, [](Assignment& state) { EXPECT_EQ(state.target, state.target_before); });
    }
}

TEST(ValueFailure, ContainerSourceOntoOtherAlternativeLeavesFalse) {
    const Value targets[] = {Value(3.0), Value("old text that needs its own allocation"),
                             Value(Object{{"old", Array{1, 2}}}), Value(nullptr)};
    const Value sources[] = {sample_document(), boost::get<Array>(sample_document())[0]};
    for (const Value& source : sources) {
        for (const Value& target : targets) {
            if (target.which() == source.which()) {
                continue;
            }
            check_failed_assignments(target, source, [](Assignment& state) {
                ASSERT_EQ(state.target.which(), 2);
                EXPECT_FALSE(boost::get<bool>(state.target));
            });
        }
    }
}

TEST(ValueFailure, ScalarSourcesCannotFail) {
    for (const Value& source : {Value(), Value(nullptr), Value(true), Value(1.0), Value(2.0f)}) {
        check_failed_assignments(sample_document(), source,
                                 [](Assignment&) { ADD_FAILURE() << "assigning a scalar threw"; });
    }
}

TEST(ValueFailure, CopiesAllocateOnlyWhatTheyKeep) {
    // One block for the Array, one for its item storage: the shallow step wastes nothing.
    EXPECT_EQ(for_each_failing_allocation(
                  [] {
                      return Value(Array{1, 2, 3});
                  },
                  [](const Value& source) { Value copy(source); }, [](const Value&) {}),
              2u);
    EXPECT_EQ(for_each_failing_allocation([] { return Value(Array()); },
                                          [](const Value& source) { Value copy(source); },
                                          [](const Value&) {}),
              1u);
}

} // namespace
