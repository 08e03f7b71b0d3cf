// JSON Patch (RFC 6902): the examples of its appendix A, the ways an operation fails and what
// it says, and all or nothing: after any failure, and after std::bad_alloc at any allocation,
// the document is as it was.
#include "support/allocation_failure.hpp"
#include "support/documents.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <string>

namespace {

using json::Array;
using json::Value;
using test_support::parsed;

// A document, a patch, and what comes of it: the document after, or the failure's message
// (it starts with "operation ") with the document left as it was.
struct Row {
    const char* document;
    const char* patch;
    const char* outcome;
};

const Row ROWS[] = {
    // The examples of the RFC's appendix A.
    {R"({"foo":"bar"})", R"([{"op":"add","path":"/baz","value":"qux"}])",
     R"({"baz":"qux","foo":"bar"})"},
    {R"({"foo":["bar","baz"]})", R"([{"op":"add","path":"/foo/1","value":"qux"}])",
     R"({"foo":["bar","qux","baz"]})"},
    {R"({"baz":"qux","foo":"bar"})", R"([{"op":"remove","path":"/baz"}])", R"({"foo":"bar"})"},
    {R"({"foo":["bar","qux","baz"]})", R"([{"op":"remove","path":"/foo/1"}])",
     R"({"foo":["bar","baz"]})"},
    {R"({"baz":"qux","foo":"bar"})", R"([{"op":"replace","path":"/baz","value":"boo"}])",
     R"({"baz":"boo","foo":"bar"})"},
    {R"({"foo":{"bar":"baz","waldo":"fred"},"qux":{"corge":"grault"}})",
     R"([{"op":"move","from":"/foo/waldo","path":"/qux/thud"}])",
     R"({"foo":{"bar":"baz"},"qux":{"corge":"grault","thud":"fred"}})"},
    {R"({"foo":["all","grass","cows","eat"]})",
     R"([{"op":"move","from":"/foo/1","path":"/foo/3"}])",
     R"({"foo":["all","cows","eat","grass"]})"},
    {R"({"baz":"qux","foo":["a",2,"c"]})",
     R"([{"op":"test","path":"/baz","value":"qux"},{"op":"test","path":"/foo/1","value":2}])",
     R"({"baz":"qux","foo":["a",2,"c"]})"},
    {R"({"baz":"qux"})", R"([{"op":"test","path":"/baz","value":"bar"}])",
     "operation 0 (test /baz): the value differs"},
    {R"({"foo":"bar"})", R"([{"op":"add","path":"/child","value":{"grandchild":{}}}])",
     R"({"child":{"grandchild":{}},"foo":"bar"})"},
    {R"({"foo":"bar"})", R"([{"op":"add","path":"/baz","value":"qux","xyz":123}])",
     R"({"baz":"qux","foo":"bar"})"},
    {R"({"foo":"bar"})", R"([{"op":"add","path":"/baz/bat","value":"qux"}])",
     "operation 0 (add /baz/bat): no member \"baz\""},
    {R"({"/":9,"~1":10})", R"([{"op":"test","path":"/~01","value":10}])", R"({"/":9,"~1":10})"},
    {R"({"/":9,"~1":10})", R"([{"op":"test","path":"/~01","value":"10"}])",
     "operation 0 (test /~01): the value differs"},
    {R"({"foo":["bar"]})", R"([{"op":"add","path":"/foo/-","value":["abc","def"]}])",
     R"({"foo":["bar",["abc","def"]]})"},
    // Each edit the patch makes, in arrays of scalars, of containers and of both, with room and
    // without, at the top and inside, between kinds.
    {R"({"a":[1,2,3]})",
     R"([{"op":"add","path":"/a/0","value":0},{"op":"add","path":"/a/2","value":"x"},
        {"op":"add","path":"/a/-","value":true},{"op":"remove","path":"/a/1"},
        {"op":"remove","path":"/a/0"},{"op":"remove","path":"/a/3"}])",
     R"({"a":["x",2,3]})"},
    {R"({"a":[{"i":0},{"i":1}]})",
     R"([{"op":"add","path":"/a/1","value":{"i":9}},{"op":"add","path":"/a/0","value":{"j":1}},
        {"op":"remove","path":"/a/2"},{"op":"replace","path":"/a/0","value":[]},
        {"op":"move","from":"/a/0","path":"/a/-"},{"op":"add","path":"/a/0/k","value":[[]]}])",
     R"({"a":[{"i":0,"k":[[]]},{"i":1},[]]})"},
    {R"({"a":[1,[2],{"3":3},"4"]})",
     R"([{"op":"remove","path":"/a/0"},{"op":"add","path":"/a/1","value":null},
        {"op":"replace","path":"/a/2","value":{"x":[]}},{"op":"move","from":"/a/0/0","path":"/a/3"},
        {"op":"copy","from":"/a/2","path":"/a/0"},{"op":"replace","path":"/a/1","value":7}])",
     R"({"a":[{"x":[]},7,null,{"x":[]},2,"4"]})"},
    {R"({"a":{"b":1},"c":"s"})",
     R"([{"op":"replace","path":"/a","value":[1]},{"op":"add","path":"/c","value":{"d":null}},
        {"op":"add","path":"/e","value":"new"},{"op":"remove","path":"/a/0"},
        {"op":"replace","path":"/c/d","value":false},{"op":"add","path":"/c/d","value":1.5}])",
     R"({"a":[],"c":{"d":1.5},"e":"new"})"},
    {R"({"a":1})",
     R"([{"op":"replace","path":"","value":[1,2]},{"op":"add","path":"/-","value":3}])", "[1,2,3]"},
    {"[1]", R"([{"op":"add","path":"","value":5}])", "5"},
    {R"("x")", R"([{"op":"add","path":"","value":{"a":1}},{"op":"add","path":"/b","value":2}])",
     R"({"a":1,"b":2})"},
    {R"({"a":{"b":[1]}})", R"([{"op":"move","from":"/a","path":""}])", R"({"b":[1]})"},
    {R"({"a":[1,2]})", R"([{"op":"move","from":"/a/0","path":"/a/0"}])", R"({"a":[1,2]})"},
    {R"({"a":{"b":1}})", R"([{"op":"copy","from":"/a","path":"/a/c"}])",
     R"({"a":{"b":1,"c":{"b":1}}})"},
    {R"({"a":[[1],[2]]})",
     R"([{"op":"move","from":"/a/1","path":"/a/0"},{"op":"move","from":"/a/0/0","path":"/a/1/-"}])",
     R"({"a":[[],[1,2]]})"},
    {R"({"-":1,"":0})",
     R"([{"op":"replace","path":"/-","value":2},{"op":"move","from":"/","path":"/x"}])",
     R"({"-":2,"x":0})"},
    {R"({"a":[1]})",
     R"([{"op":"test","path":"/a/0","value":1.0},{"op":"test","path":"/a","value":[1e0]}])",
     R"({"a":[1]})"},
    {R"({"a":1})", "[]", R"({"a":1})"},
    // How operations fail, and how a patch that is no list of operations does.
    {R"({"a":1})", R"({"op":"add"})",
     "operation 0: expected a JSON array of operations, found JSON object"},
    {"[]", R"([{"op":"test","path":"","value":[]},"add"])",
     "operation 1: expected a JSON object, found JSON string"},
    {"{}", R"([{"path":"/a"}])", "operation 0: no \"op\" member"},
    {"{}", R"([{"op":1}])", "operation 0: \"op\" is a JSON number, not a JSON string"},
    {"{}", R"([{"op":"add","path":"/a","value":1},{"op":"spam"}])",
     "operation 1: unknown op \"spam\""},
    {"{}", R"([{"op":"add","value":1}])", "operation 0 (add): no \"path\" member"},
    {"{}", R"([{"op":"remove","path":["a"]}])",
     "operation 0 (remove): \"path\" is a JSON array, not a JSON string"},
    {"{}", R"([{"op":"add","path":"a","value":1}])",
     "operation 0 (add a): JSON Pointer \"a\" does not start with '/'"},
    {R"({"a":1})", R"([{"op":"replace","path":"/a"}])",
     "operation 0 (replace /a): no \"value\" member"},
    {R"({"a":1})", R"([{"op":"replace","path":"/b","value":1}])",
     "operation 0 (replace /b): no member \"b\""},
    {R"({"a":1})", R"([{"op":"move","path":"/b"}])", "operation 0 (move /b): no \"from\" member"},
    {R"({"a":{}})", R"([{"op":"copy","from":"/a/b","path":"/c"}])",
     "operation 0 (copy /c): from /a/b: no member \"b\""},
    {R"({"a":[1,2]})", R"([{"op":"add","path":"/a/01","value":3}])",
     "operation 0 (add /a/01): \"01\" is no index of a JSON array: it has a leading zero"},
    {R"({"a":[1,2]})", R"([{"op":"remove","path":"/a/00"}])",
     "operation 0 (remove /a/00): \"00\" is no index of a JSON array: it has a leading zero"},
    {R"({"a":[1,2]})", R"([{"op":"add","path":"/a/3","value":3}])",
     "operation 0 (add /a/3): index 3 out of range for a JSON array of 2 elements"},
    {R"({"a":[1,2]})", R"([{"op":"add","path":"/a/x","value":3}])",
     "operation 0 (add /a/x): \"x\" is no index of a JSON array"},
    {R"({"a":[1,2]})", R"([{"op":"replace","path":"/a/2","value":3}])",
     "operation 0 (replace /a/2): index 2 out of range for a JSON array of 2 elements"},
    {R"({"a":[1]})", R"([{"op":"remove","path":"/a/-"}])",
     "operation 0 (remove /a/-): \"-\" names no element, only the place after the last"},
    {R"({"a":[{}]})", R"([{"op":"add","path":"/a/-/b","value":1}])",
     "operation 0 (add /a/-/b): \"-\" names no element, only the place after the last"},
    {R"({"a":[1]})", R"([{"op":"move","from":"/a/-","path":"/b"}])",
     "operation 0 (move /b): from /a/-: \"-\" names no element, only the place after the last"},
    {R"({"a":1})", R"([{"op":"add","path":"/a/b","value":1}])",
     "operation 0 (add /a/b): expected JSON object or array, found JSON number"},
    {R"({"a":{"b":{}}})", R"([{"op":"move","from":"/a","path":"/a/b/c"}])",
     "operation 0 (move /a/b/c): the path lies inside \"from\" /a: a value cannot move into "
     "itself"},
    {R"({"a":{"b":{}}})", R"([{"op":"move","from":"","path":"/a"}])",
     "operation 0 (move /a): the path lies inside \"from\" \"\": a value cannot move into itself"},
    {R"({"a":1})", R"([{"op":"remove","path":""}])",
     "operation 0 (remove \"\"): the whole document cannot be removed"},
    {R"({"a":1,"b":[1,2]})",
     R"([{"op":"add","path":"/c","value":3},{"op":"remove","path":"/b/0"},
        {"op":"test","path":"/a","value":2}])",
     "operation 2 (test /a): the value differs"},
};

bool fails(const Row& row) {
    return std::string(row.outcome).rfind("operation ", 0) == 0;
}

// Calls `check` with each row whose patch succeeds.
template <typename Check>
void for_each_success(Check check) {
    for (const Row& row : ROWS) {
        if (!fails(row)) {
            check(row);
        }
    }
}

void expect_outcome(const Row& row) {
    const Value before = parsed(row.document);
    Value document = before;
    const json::PatchReport report = json::apply_patch(document, parsed(row.patch));
    const std::string outcome = row.outcome;
    if (fails(row)) {
        EXPECT_FALSE(report) << row.patch;
        EXPECT_EQ(report.message, outcome);
        EXPECT_EQ(report.operation, std::stoul(outcome.substr(10)));
        EXPECT_EQ(document, before) << "changed by a failed patch: " << row.patch;
    } else {
        EXPECT_TRUE(report) << row.patch << ": " << report.message;
        EXPECT_EQ(document, parsed(outcome)) << row.patch << " gave " << json::serialize(document);
    }
}

TEST(Patch, AppliesTheRfcExamplesTheEditsAndTheFailures) {
    for (const Row& row : ROWS) {
        expect_outcome(row);
    }
}

// The patch of each row that succeeds, with an operation that fails after it: every edit it
// made is taken back.
TEST(Patch, TakesBackEveryEditWhenALaterOperationFails) {
    const Value failing = parsed(R"({"op":"test","path":"","value":"none of them"})");
    for_each_success([&failing](const Row& row) {
        Value patch = parsed(row.patch);
        patch.as_array().push_back(failing);
        const Value before = parsed(row.document);
        Value document = before;
        const json::PatchReport report = json::apply_patch(document, patch);
        EXPECT_EQ(report.operation, patch.as_array().size() - 1) << report.message;
        EXPECT_EQ(document, before) << row.patch << " was left as " << json::serialize(document);
    });
}

// With any allocation failing (or every one from it on), the document is as it was.
TEST(Patch, LeavesTheDocumentAsItWasWhenMemoryRunsOut) {
    for_each_success([](const Row& row) {
        test_support::expect_patch_undone_when_memory_runs_out(
            parsed(row.document), parsed(row.patch), parsed(row.outcome),
            [](Value& document, const Value& patch) {
                static_cast<void>(json::apply_patch(document, patch));
            });
    });
}

// No copy of the document: an edit allocates for what it puts in (and the patch's pointers
// and the log), not for the 3000 values around it, as long as an array it changes has room or
// holds no containers; a failure allocates nothing to go back.
TEST(Patch, CopiesNothingOfTheDocument) {
    const struct {
        const char* patch;
        std::size_t most;
    } rows[] = {
        {R"([{"op":"replace","path":"/name","value":1},{"op":"test","path":"/name","value":1}])",
         10},
        {R"([{"op":"remove","path":"/numbers/0"},{"op":"add","path":"/numbers/5","value":"s"}])",
         15},
        {R"([{"op":"add","path":"/records/0","value":{}},{"op":"remove","path":"/name"},
             {"op":"copy","from":"/records/1/tags","path":"/name"}])",
         25},
        {R"([{"op":"remove","path":"/numbers/0"},{"op":"test","path":"","value":0}])", 15},
    };
    for (const auto& row : rows) {
        Value document = parsed(R"({"numbers":[],"records":[],"name":"x"})");
        Array& numbers = document.as_object()["numbers"].as_array();
        Array& records = document.as_object()["records"].as_array();
        records.reserve(1001);
        for (int i = 0; i < 1000; ++i) {
            numbers.push_back(i);
            records.push_back(parsed(R"({"id":1,"tags":["a"]})"));
        }
        const Value patch = parsed(row.patch);
        const std::size_t allocations = test_support::allocations_made();
        static_cast<void>(json::apply_patch(document, patch));
        EXPECT_LE(test_support::allocations_made() - allocations, row.most) << row.patch;
    }
}

} // namespace
