// The parsing test suite: y_ files must parse, n_ files must fail, i_ files may do either
// (without a crash or a sanitizer report). Accepted documents, and the benchmark documents,
// must survive a write and a second parse unchanged.
#include <json/json.hpp>

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>

namespace {

namespace fs = std::filesystem;

std::string read_file(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

std::vector<fs::path> files_in(const fs::path& directory) {
    std::vector<fs::path> paths;
    for (const auto& entry : fs::directory_iterator(directory)) {
        paths.push_back(entry.path());
    }
    std::sort(paths.begin(), paths.end());
    return paths;
}

void expect_round_trip(const std::string& name, const json::Value& document) {
    const std::string first = json::serialize(document);
    json::Value again;
    ASSERT_EQ(json::parse(first, again), json::ParseResult::SUCCESS) << name;
    EXPECT_EQ(again, document) << name;
    EXPECT_EQ(json::serialize(again), first) << name << ": writing is not stable";
    json::Value from_pretty;
    ASSERT_EQ(json::parse(json::pretty_print(document), from_pretty), json::ParseResult::SUCCESS);
    EXPECT_EQ(from_pretty, document) << name;
}

TEST(Conformance, TestSuite) {
    const std::vector<fs::path> paths =
        files_in(fs::path(JSON_DATA_DIR) / "JSONTestSuite/test_parsing");
    ASSERT_EQ(paths.size(), 318u);
    int accepted = 0, refused = 0, either = 0;
    for (const fs::path& path : paths) {
        const std::string name = path.filename().string();
        const std::string text = read_file(path);
        json::Value document;
        const json::ParseResult result = json::parse(text, document);
        if (name.front() == 'y') {
            EXPECT_EQ(result, json::ParseResult::SUCCESS) << name;
            expect_round_trip(name, document);
            ++accepted;
        } else if (name.front() == 'n') {
            EXPECT_NE(result, json::ParseResult::SUCCESS) << name;
            ++refused;
        } else {
            ++either;
        }
    }
    EXPECT_EQ(accepted, 95);
    EXPECT_EQ(refused, 188);
    EXPECT_EQ(either, 35);
}

TEST(Conformance, BenchmarkDocumentsRoundTrip) {
    for (const char* name : {"twitter.json", "citm_catalog.json", "canada.json"}) {
        json::Value document;
        ASSERT_EQ(json::parse(read_file(fs::path(JSON_DATA_DIR) / "bench" / name), document),
                  json::ParseResult::SUCCESS)
            << name;
        expect_round_trip(name, document);
    }
}

} // namespace
