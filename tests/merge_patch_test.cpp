// JSON Merge Patch (RFC 7396): the examples of its appendix A and its section 3, merge_diff
// giving back a patch for each, and the document as it was when memory runs out.
#include "support/allocation_failure.hpp"
#include "support/documents.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <string>

namespace {

using json::Value;
using test_support::parsed;

struct Row {
    const char* original;
    const char* patch;
    const char* result;
};

const Row RFC_EXAMPLES[] = {
    {R"({"a":"b"})", R"({"a":"c"})", R"({"a":"c"})"},
    {R"({"a":"b"})", R"({"b":"c"})", R"({"a":"b","b":"c"})"},
    {R"({"a":"b"})", R"({"a":null})", "{}"},
    {R"({"a":"b","b":"c"})", R"({"a":null})", R"({"b":"c"})"},
    {R"({"a":["b"]})", R"({"a":"c"})", R"({"a":"c"})"},
    {R"({"a":"c"})", R"({"a":["b"]})", R"({"a":["b"]})"},
    {R"({"a":{"b":"c"}})", R"({"a":{"b":"d","c":null}})", R"({"a":{"b":"d"}})"},
    {R"({"a":[{"b":"c"}]})", R"({"a":[1]})", R"({"a":[1]})"},
    {R"(["a","b"])", R"(["c","d"])", R"(["c","d"])"},
    {R"({"a":"b"})", R"(["c"])", R"(["c"])"},
    {R"({"a":"foo"})", "null", "null"},
    {R"({"a":"foo"})", R"("bar")", R"("bar")"},
    {R"({"e":null})", R"({"a":1})", R"({"a":1,"e":null})"},
    {"[1,2]", R"({"a":"b","c":null})", R"({"a":"b"})"},
    {"{}", R"({"a":{"bb":{"ccc":null}}})", R"({"a":{"bb":{}}})"},
    // Section 3's example.
    {R"({"title":"Goodbye!","author":{"givenName":"John","familyName":"Doe"},
         "tags":["example","sample"],"content":"This will be unchanged"})",
     R"({"title":"Hello!","phoneNumber":"+01-123-456-7890","author":{"familyName":null},
         "tags":["example"]})",
     R"({"title":"Hello!","author":{"givenName":"John"},"tags":["example"],
         "content":"This will be unchanged","phoneNumber":"+01-123-456-7890"})"},
    // Nulls inside an array are values; an object put in where none was loses its nulls.
    {R"({"a":1,"b":{"c":[null,{"d":null}]}})",
     R"({"a":{"x":null,"y":[null]},"b":{"c":{"e":null}}})", R"({"a":{"y":[null]},"b":{"c":{}}})"},
};

// Each example's patch gives its result; none of the results sets a member to null that the
// original did not have so, and merge_diff finds a patch for each.
TEST(MergePatch, AppliesTheRfcExamplesAndMergeDiffGivesAPatchForEach) {
    for (const Row& row : RFC_EXAMPLES) {
        const Value original = parsed(row.original), result = parsed(row.result);
        for (const Value& patch : {parsed(row.patch), json::merge_diff(original, result)}) {
            Value document = original;
            json::apply_merge_patch(document, patch);
            EXPECT_EQ(document, result)
                << json::serialize(patch) << " gave " << json::serialize(document);
        }
    }
    const struct {
        const char* source;
        const char* target;
        const char* patch;
    } rows[] = {
        {R"({"a":{"b":1,"c":[1]},"d":2})", R"({"a":{"b":1,"c":[1]},"d":2})", "{}"},
        {R"({"a":{"b":1,"c":[1]},"d":2})", R"({"a":{"b":1,"c":[2]},"e":3})",
         R"({"a":{"c":[2]},"d":null,"e":3})"},
        {R"({"a":{"b":{"c":1}}})", R"({"a":{"b":{"c":1.0}}})", "{}"},
        {R"({"a":1})", "[1]", "[1]"},
        {"[1]", "[1]", "[1]"},
        // What no merge patch can say: a member set to null is removed by it.
        {R"({"a":1})", R"({"a":null})", R"({"a":null})"},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(json::serialize(json::merge_diff(parsed(row.source), parsed(row.target))),
                  row.patch)
            << row.source << " to " << row.target;
    }
}

// The patch may be a part of the document it changes.
TEST(MergePatch, TakesAPatchFromInsideTheDocument) {
    Value document = parsed(R"({"keep":1,"patch":{"patch":null,"keep":{"x":[1]}}})");
    json::apply_merge_patch(document, document.at("patch"));
    EXPECT_EQ(document, parsed(R"({"keep":{"x":[1]}})"));
    document = parsed(R"({"a":[1,{"b":2}]})");
    json::apply_merge_patch(document, document.at("a"));
    EXPECT_EQ(document, parsed(R"([1,{"b":2}])"));
}

TEST(MergePatch, LeavesTheDocumentAsItWasWhenMemoryRunsOut) {
    for (const Row& row : RFC_EXAMPLES) {
        test_support::expect_patch_undone_when_memory_runs_out(
            parsed(row.original), parsed(row.patch), parsed(row.result), json::apply_merge_patch);
    }
}

} // namespace
