// JSON Patch and diff against nlohmann-json: a patch of ten operations applied to canada.json
// (2.2 MB), and the diff between citm_catalog.json and a copy with seeded random edits. The
// patch puts back what it changes, so it applies to the same document in every iteration:
// jsonvalue's apply_patch works in place, nlohmann's patch() on a copy of the document (what
// it returns) and its patch_inplace() in place.
#include <json/json.hpp>

#include <benchmark/benchmark.h>
#include <nlohmann/json.hpp>

#include <fstream>
#include <iterator>
#include <random>
#include <stdexcept>
#include <string>

namespace {

std::string read_bench_document(const char* name) {
    std::ifstream file(std::string(JSON_BENCH_DATA_DIR) + "/" + name + ".json", std::ios::binary);
    if (!file) {
        throw std::runtime_error(std::string("cannot read ") + name);
    }
    return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
}

json::Value parsed(const std::string& text) {
    json::Value document;
    if (json::parse(text, document) != json::ParseResult::SUCCESS) {
        throw std::runtime_error("jsonvalue refused a benchmark document");
    }
    return document;
}

// Ten operations of every kind, members and array elements, that leave canada.json as it was.
const char* const CANADA_PATCH = R"([
    {"op": "test", "path": "/type", "value": "FeatureCollection"},
    {"op": "add", "path": "/features/0/properties/patched", "value": true},
    {"op": "replace", "path": "/features/0/properties/name", "value": "Kanada"},
    {"op": "copy", "from": "/features/0/geometry/coordinates/0/0/0",
     "path": "/features/0/properties/first"},
    {"op": "move", "from": "/features/0/properties/first", "path": "/features/0/properties/start"},
    {"op": "add", "path": "/features/0/geometry/coordinates/0/0/1", "value": [0.5, 0.25]},
    {"op": "remove", "path": "/features/0/geometry/coordinates/0/0/1"},
    {"op": "remove", "path": "/features/0/properties/start"},
    {"op": "remove", "path": "/features/0/properties/patched"},
    {"op": "replace", "path": "/features/0/properties/name", "value": "Canada"}
])";

// citm_catalog.json with 50 seeded edits: numbers changed, members removed and added.
std::string edited_citm(const std::string& text) {
    json::Value document = parsed(text);
    std::mt19937 random(7);
    json::Object& events = document.as_object()["events"].as_object();
    for (int edit = 0; edit < 50; ++edit) {
        auto event =
            std::next(events.begin(), static_cast<std::ptrdiff_t>(random() % events.size()));
        json::Object& members = event->second.as_object();
        switch (random() % 3) {
        case 0:
            members["id"] = static_cast<double>(random() % 100000);
            break;
        case 1:
            members.erase("subTopicIds");
            break;
        default:
            members["note"] = "edited " + std::to_string(edit);
        }
    }
    return json::serialize(document);
}

void apply_patch_jsonvalue(benchmark::State& state) {
    json::Value document = parsed(read_bench_document("canada"));
    const json::Value patch = parsed(CANADA_PATCH);
    for (auto _ : state) {
        const json::PatchReport report = json::apply_patch(document, patch);
        benchmark::DoNotOptimize(report.operation);
        if (!report) {
            state.SkipWithError(report.message.c_str());
            break;
        }
    }
}

void apply_patch_nlohmann_copy(benchmark::State& state) {
    const nlohmann::json document = nlohmann::json::parse(read_bench_document("canada"));
    const nlohmann::json patch = nlohmann::json::parse(CANADA_PATCH);
    for (auto _ : state) {
        benchmark::DoNotOptimize(document.patch(patch));
    }
}

void apply_patch_nlohmann_in_place(benchmark::State& state) {
    nlohmann::json document = nlohmann::json::parse(read_bench_document("canada"));
    const nlohmann::json patch = nlohmann::json::parse(CANADA_PATCH);
    for (auto _ : state) {
        document.patch_inplace(patch);
        benchmark::ClobberMemory();
    }
}

void diff_jsonvalue(benchmark::State& state) {
    const std::string original = read_bench_document("citm_catalog");
    const json::Value source = parsed(original);
    const json::Value target = parsed(edited_citm(original));
    for (auto _ : state) {
        benchmark::DoNotOptimize(json::diff(source, target));
    }
    state.counters["operations"] =
        static_cast<double>(json::diff(source, target).as_array().size());
}

void diff_nlohmann(benchmark::State& state) {
    const std::string original = read_bench_document("citm_catalog");
    const nlohmann::json source = nlohmann::json::parse(original);
    const nlohmann::json target = nlohmann::json::parse(edited_citm(original));
    for (auto _ : state) {
        benchmark::DoNotOptimize(nlohmann::json::diff(source, target));
    }
    state.counters["operations"] = static_cast<double>(nlohmann::json::diff(source, target).size());
}

BENCHMARK(apply_patch_jsonvalue)->Name("patch/jsonvalue/canada");
BENCHMARK(apply_patch_nlohmann_copy)->Name("patch/nlohmann/canada");
BENCHMARK(apply_patch_nlohmann_in_place)->Name("patch_inplace/nlohmann/canada");
BENCHMARK(diff_jsonvalue)->Name("diff/jsonvalue/citm_catalog");
BENCHMARK(diff_nlohmann)->Name("diff/nlohmann/citm_catalog");

} // namespace
