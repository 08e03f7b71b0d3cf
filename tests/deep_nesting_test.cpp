// Documents nested far deeper than any call stack could recurse through.
#include <json/json.hpp>

#include <gtest/gtest.h>

#include <cstring>
#include <ostream>
#include <streambuf>

namespace {

using json::Array;
using json::Object;
using json::Value;

constexpr int DEPTH = 100'000;

// A chain of `depth` containers, each the only child of the one before, built top-down so that
// nothing is copied.
Value nested_arrays(int depth) {
    Value root = Array{};
    Value* innermost = &root;
    for (int level = 1; level < depth; ++level) {
        Array& items = boost::get<Array>(*innermost);
        items.push_back(Array{});
        innermost = &items.back();
    }
    return root;
}

Value nested_objects(int depth) {
    Value root = Object{};
    Value* innermost = &root;
    for (int level = 1; level < depth; ++level) {
        innermost = &(boost::get<Object>(*innermost)["k"] = Object{});
    }
    return root;
}

// Counts bytes, newlines and flushes without keeping the text (pretty text of a deep chain is
// tens of gigabytes of indentation).
class CountingSink : public std::streambuf {
  public:
    std::size_t bytes = 0;
    std::size_t newlines = 0;
    std::size_t flushes = 0;

  protected:
    int_type overflow(int_type c) override {
        ++bytes;
        newlines += c == '\n';
        return c;
    }
    std::streamsize xsputn(const char* text, std::streamsize count) override {
        bytes += static_cast<std::size_t>(count);
        const char* end = text + count;
        while ((text = static_cast<const char*>(std::memchr(text, '\n', end - text))) != nullptr) {
            ++newlines;
            ++text;
        }
        return count;
    }
    int sync() override {
        ++flushes;
        return 0;
    }
};

void expect_every_operation_survives(const Value& deep, char open, char close) {
    Value copy = deep;
    EXPECT_EQ(copy, deep);

    Value assigned_same = Array{1};
    assigned_same = deep;
    Value assigned_other = "text";
    assigned_other = deep;
    EXPECT_EQ(assigned_other, deep);
    assigned_same = assigned_other; // same alternative, both deep
    EXPECT_EQ(assigned_same, deep);

    const std::string compact = json::serialize(deep);
    ASSERT_EQ(compact.size(), std::size_t{2} * DEPTH + (open == '{' ? 4u * (DEPTH - 1) : 0u));
    EXPECT_EQ(compact.front(), open);
    EXPECT_EQ(compact.back(), close);

    CountingSink sink;
    std::ostream out(&sink);
    json::Serializer serializer;
    serializer.pretty_print(true);
    serializer.write(out, deep);
    // Every container but the innermost puts its child and its closing bracket on new lines.
    EXPECT_EQ(sink.newlines, std::size_t{2} * (DEPTH - 1));
    EXPECT_EQ(sink.flushes, sink.newlines);
}

TEST(DeepNesting, ArraysHundredThousandDeep) {
    expect_every_operation_survives(nested_arrays(DEPTH), '[', ']');
}

TEST(DeepNesting, ObjectsHundredThousandDeep) {
    expect_every_operation_survives(nested_objects(DEPTH), '{', '}');
}

std::string nested_array_text(int depth) {
    return std::string(static_cast<std::size_t>(depth), '[') +
           std::string(static_cast<std::size_t>(depth), ']');
}

std::string nested_object_text(int depth) {
    std::string text;
    for (int level = 0; level < depth; ++level) {
        text += R"({"k":)";
    }
    return text + "{}" + std::string(static_cast<std::size_t>(depth), '}');
}

// Deep texts are refused by the default depth limit and parsed, written and released once the
// limit allows them: the parser keeps its open containers on the heap, not the call stack.
TEST(DeepNesting, TextsTenThousandAndAMillionDeep) {
    for (int depth : {10'000, 1'000'000}) {
        for (const std::string& text : {nested_array_text(depth), nested_object_text(depth)}) {
            Value out;
            const json::ParseReport refused = json::parse(text, out, {});
            EXPECT_TRUE(refused.too_deep) << depth;
            EXPECT_EQ(refused.offset, text[0] == '[' ? 512u : 512u * 5);
            const auto limit = static_cast<std::size_t>(depth) + 1;
            ASSERT_TRUE(json::parse(text, out, json::ParseOptions{limit})) << depth;
            EXPECT_EQ(json::serialize(out), text);
        }
    }
}

TEST(DeepNesting, AMillionLevelsBuiltInALoop) {
    constexpr int depth = 1'000'000;
    const Value arrays = nested_arrays(depth);
    EXPECT_EQ(json::serialize(arrays), nested_array_text(depth));
    const Value objects = nested_objects(depth);
    EXPECT_EQ(json::serialize(objects).size(), std::size_t{2} * depth + 4u * (depth - 1));
}

TEST(DeepNesting, DifferentDeepTreesCompareUnequal) {
    Value left = nested_arrays(DEPTH);
    Value right = nested_arrays(DEPTH);
    Value* innermost = &right;
    while (!boost::get<Array>(*innermost).empty()) {
        innermost = &boost::get<Array>(*innermost)[0];
    }
    boost::get<Array>(*innermost).push_back(1);
    EXPECT_NE(left, right);
}

TEST(DeepNesting, AssigningADeepSubtreeToItsOwnRoot) {
    Value deep = nested_objects(DEPTH);
    deep = boost::get<Object>(deep)["k"];
    EXPECT_EQ(json::serialize(deep).size(), std::size_t{2} * (DEPTH - 1) + 4u * (DEPTH - 2));
}

} // namespace
