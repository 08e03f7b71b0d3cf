// Documents nested far deeper than any call stack could recurse through: copying, assigning,
// comparing, writing, parsing and destroying them must not recurse once per level.
#include "support/documents.hpp"
#include "support/writing.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <ostream>

namespace {

using namespace json;
using test_support::nested;

constexpr std::size_t DEPTH = 100'000;

Value parsed(const std::string& text) {
    return test_support::parsed(text, ParseOptions{text.size()});
}

TEST(DeepNesting, ArraysAndObjectsHundredThousandDeep) {
    for (const bool objects : {false, true}) {
        const std::string text = nested(DEPTH, objects, "[]");
        const Value deep = parsed(text);
        Value copy = deep;
        EXPECT_EQ(copy, deep);
        Value assigned = Array{1};
        assigned = deep;
        Value other = "text";
        other = deep;
        assigned = other;
        EXPECT_EQ(assigned, deep);
        EXPECT_EQ(serialize(deep), text);
        EXPECT_NE(deep, parsed(nested(DEPTH, objects, "[1]")));

        // Every container but the innermost puts its child and its closing bracket on new lines.
        test_support::WrittenText counter;
        counter.keep_text = false;
        std::ostream out(&counter);
        Serializer serializer;
        serializer.pretty_print(true);
        serializer.write(out, deep);
        EXPECT_EQ(counter.flushes.size(), 2 * DEPTH);

        copy = objects ? boost::get<Object>(copy)["k"] : boost::get<Array>(copy)[0];
        EXPECT_EQ(serialize(copy), nested(DEPTH - 1, objects, "[]"));
    }
}

// Refused by the default depth limit, then parsed, written and released under a raised one.
TEST(DeepNesting, TextsAMillionDeep) {
    for (bool objects : {false, true}) {
        const std::string text = nested(1'000'000, objects, "1");
        Value out;
        const ParseReport refused = parse(text, out, {});
        EXPECT_EQ(refused.refusal, Refusal::TOO_DEEP);
        EXPECT_EQ(refused.offset, objects ? 512u * 5 : 512u);
        EXPECT_EQ(serialize(parsed(text)), text);
    }
}

} // namespace
