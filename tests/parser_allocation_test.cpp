// The parser's allocations grow with the document, and running out of memory at any point
// leaves `out` as it was.
#include "support/allocation_failure.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

namespace {

using json::Value;
using test_support::allocations_made;
using test_support::for_each_failing_allocation;

std::size_t allocations_to_parse(const std::string& text, const json::ParseOptions& options) {
    Value out;
    const std::size_t before = allocations_made();
    EXPECT_TRUE(json::parse(text, out, options));
    return allocations_made() - before;
}

std::string small_objects(int count) {
    std::string text = "[";
    for (int i = 0; i < count; ++i) {
        text += (i == 0 ? "" : ",");
        text += R"({"id":1,"name":"n"})";
    }
    return text + "]";
}

std::string nested(int depth) {
    return std::string(depth, '[') + std::string(depth, ']');
}

TEST(ParserAllocations, GrowLinearlyWithTheDocument) {
    const double per_object_small =
        static_cast<double>(allocations_to_parse(small_objects(10'000), {})) / 10'000;
    const double per_object_large =
        static_cast<double>(allocations_to_parse(small_objects(100'000), {})) / 100'000;
    EXPECT_LT(per_object_large, 8.0) << "a few blocks per object: the object, its members";
    EXPECT_LT(per_object_large, per_object_small * 1.1);

    const json::ParseOptions deep{1000};
    const double per_level_small = static_cast<double>(allocations_to_parse(nested(50), deep)) / 50;
    const double per_level_large =
        static_cast<double>(allocations_to_parse(nested(500), deep)) / 500;
    EXPECT_LT(per_level_large, 6.0);
    EXPECT_LT(per_level_large, per_level_small * 1.1);
}

TEST(ParserAllocations, RunningOutOfMemoryLeavesOutUnchanged) {
    const char* const documents[] = {
        R"({"name":"a string long enough to be allocated","list":[1,[2,{"x":null}],"three"]})",
        R"([{"a":1,"a":[2]},"\u00e9\ud83d\ude00",[],{}])",
        R"("just a string that needs an allocation of its own")",
    };
    const Value previous[] = {Value(), Value(json::Array{1, "old string, long enough here"}),
                              Value(json::Object{{"old", json::Array{}}})};
    for (const char* document : documents) {
        for (const Value& before : previous) {
            for_each_failing_allocation(
                [&] { return Value(before); },
                [&](Value& out) { static_cast<void>(json::parse(document, out)); },
                [&](Value& out) { EXPECT_EQ(out, before) << document; });
        }
    }
}

} // namespace
