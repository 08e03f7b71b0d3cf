// diff: the patch it writes for small pairs, and the round trip apply_patch(source, diff(source,
// target)) == target (and the same with merge_diff) over the benchmark documents with seeded
// random edits, and over documents nested far deeper than any call stack allows.
#include "support/documents.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

namespace {

using json::Array;
using json::Object;
using json::Value;

using test_support::parsed;

// The patch either way turns one into the other; with `merge`, the merge patch from source to
// target does it too (target has no member that became null).
void expect_round_trips(const Value& source, const Value& target, const std::string& what,
                        bool merge = true) {
    for (const bool forward : {true, false}) {
        const Value& from = forward ? source : target;
        const Value& to = forward ? target : source;
        Value patched = from;
        const json::PatchReport report = json::apply_patch(patched, json::diff(from, to));
        ASSERT_TRUE(report) << what << ": " << report.message;
        EXPECT_TRUE(patched == to) << what << (forward ? "" : ", backwards");
    }
    Value merged = source;
    json::apply_merge_patch(merged, json::merge_diff(source, target));
    EXPECT_TRUE(!merge || merged == target) << what << ", merge patch";
}

TEST(Diff, WritesAReadablePatch) {
    const struct {
        const char* source;
        const char* target;
        const char* patch;
    } rows[] = {
        {R"({"a":1,"b":[1,2,3],"c":{"d":"x"}})", R"({"b":[1,5],"c":{"d":"x","e":null},"f":true})",
         R"([{"op":"remove","path":"/a"},{"op":"replace","path":"/b/1","value":5},)"
         R"({"op":"remove","path":"/b/2"},{"op":"add","path":"/c/e","value":null},)"
         R"({"op":"add","path":"/f","value":true}])"},
        {R"({"a":[1,{"b":2}]})", R"({"a":[1,{"b":2}]})", "[]"},
        {"[1]", R"({"a":1})", R"([{"op":"replace","path":"","value":{"a":1}}])"},
        {R"([1,"1",null])", R"([1.0,"1",false])",
         R"([{"op":"replace","path":"/2","value":false}])"},
        {R"({"a/b":{"~":1}})", R"({"a/b":{"~":2}})",
         R"([{"op":"replace","path":"/a~1b/~0","value":2}])"},
        {"[[1],3]", "[[1,2,3],3,[4]]",
         R"([{"op":"add","path":"/0/1","value":2},{"op":"add","path":"/0/2","value":3},)"
         R"({"op":"add","path":"/2","value":[4]}])"},
        {"[1,2,3,4]", "[0,2]",
         R"([{"op":"replace","path":"/0","value":0},{"op":"remove","path":"/3"},)"
         R"({"op":"remove","path":"/2"}])"},
        {R"({"a":{"b":[]}})", R"({"a":[{"b":[]}]})",
         R"([{"op":"replace","path":"/a","value":[{"b":[]}]}])"},
    };
    json::WriteOptions plain_slash;
    plain_slash.escape_slash = false;
    for (const auto& row : rows) {
        const Value source = parsed(row.source), target = parsed(row.target);
        EXPECT_EQ(json::serialize(json::diff(source, target), plain_slash), row.patch)
            << row.source;
        expect_round_trips(source, target, row.source, false);
    }
}

// A member holding Undefined is no member: nothing to remove, nothing to add.
TEST(Diff, TakesMembersHoldingUndefinedForAbsent) {
    const Value source = Object{{"a", Value()}, {"b", 1}};
    const Value target = Object{{"b", 1}, {"c", Value()}};
    EXPECT_EQ(json::diff(source, target), Array{});
    EXPECT_EQ(json::merge_diff(source, target), Object{});
}

// Seeded random edits of a document: a value picked anywhere is replaced by another of any kind,
// or, in a container, a member or element is added or removed. What is put in holds no null, so
// that the merge patch expresses it too.
class Editor {
  public:
    explicit Editor(unsigned seed) : random(seed) {}

    void edit(Value& document, int edits) {
        for (int i = 0; i < edits; ++i) {
            std::vector<Value*> values{&document};
            for (std::size_t at = 0; at < values.size(); ++at) {
                if (values[at]->is_array()) {
                    for (Value& element : values[at]->as_array()) {
                        values.push_back(&element);
                    }
                } else if (values[at]->is_object()) {
                    for (auto& member : values[at]->as_object()) {
                        values.push_back(&member.second);
                    }
                }
            }
            edit_one(*values[pick(values.size())]);
        }
    }

  private:
    std::size_t pick(std::size_t count) {
        return std::uniform_int_distribution<std::size_t>(0, count - 1)(random);
    }

    Value fresh() {
        const Value kinds[] = {static_cast<double>(pick(1000)) / 8,
                               "text " + std::to_string(pick(100)),
                               pick(2) == 0,
                               Array{1, pick(10), "x"},
                               Object{{"n", pick(10)}, {"list", Array{}}},
                               Object{}};
        return kinds[pick(std::size(kinds))];
    }

    void edit_one(Value& value) {
        const std::size_t change = pick(3); // 0 adds, 1 removes, 2 replaces the value
        if (change != 2 && value.is_object() && !value.as_object().empty()) {
            Object& members = value.as_object();
            if (change == 0) {
                members.emplace("new " + std::to_string(pick(1000)), fresh());
            } else {
                members.erase(std::next(members.begin(), static_cast<long>(pick(members.size()))));
            }
        } else if (change != 2 && value.is_array() && !value.as_array().empty()) {
            Array& elements = value.as_array();
            const auto at = elements.begin() + static_cast<long>(pick(elements.size()));
            if (change == 0) {
                elements.insert(at, fresh());
            } else {
                elements.erase(at);
            }
        } else {
            value = fresh();
        }
    }

    std::mt19937 random;
};

TEST(Diff, RoundTripsOverTheBenchmarkDocumentsWithRandomEdits) {
    for (const auto& path : test_support::bench_files()) {
        const std::string name = path.filename();
        const Value original =
            parsed(test_support::read_file(path), test_support::options_from("i"));
        ASSERT_TRUE(original.is_object()) << name;
        EXPECT_EQ(json::diff(original, original), Array{}) << name;
        for (unsigned seed = 1; seed <= 3; ++seed) {
            Value edited = original;
            Editor(seed).edit(edited, static_cast<int>(4 * seed));
            ASSERT_FALSE(edited == original) << name << " seed " << seed;
            expect_round_trips(original, edited, name + (" seed " + std::to_string(seed)));
        }
    }
}

// 100000 levels: nothing here recurses once per level.
TEST(Diff, WorksOnDocumentsOfAnyDepth) {
    constexpr std::size_t depth = 100000;
    const auto deep = [](bool objects, std::string_view innermost) {
        return parsed(test_support::nested(depth, objects, innermost),
                      test_support::options_from("", depth + 1));
    };
    const Value arrays_1 = deep(false, "1"), arrays_2 = deep(false, "2");
    const Value patch = json::diff(arrays_1, arrays_2);
    ASSERT_EQ(patch.as_array().size(), 1u);
    EXPECT_EQ(patch.as_array()[0].at("path").as_string().size(), 2 * depth);
    expect_round_trips(arrays_1, arrays_2, "arrays");
    expect_round_trips(deep(true, "1"), deep(true, R"({"b":2})"), "objects");
}

} // namespace
