#ifndef JSON_TESTS_DOCUMENTS_HPP
#define JSON_TESTS_DOCUMENTS_HPP

// The documents the tests read and write: parse and write options by letter, nested texts,
// texts that must parse, and the files of the parsing test suite and the benchmarks
// (JSON_TEST_PARSING_DIR, JSON_BENCH_DATA_DIR).

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <string_view>
#include <vector>

namespace test_support {

/// Options from letters: c comments, t trailing commas, u invalid UTF-8, s lone surrogates,
/// d duplicates refused, x exact numbers, b byte order mark skipped, i inexact integers rounded,
/// o numbers beyond the range of double as infinities.
inline json::ParseOptions options_from(std::string_view letters,
                                       std::size_t max_depth = json::ParseOptions().max_depth) {
    const auto has = [letters](char letter) { return letters.find(letter) != letters.npos; };
    json::ParseOptions options;
    options.max_depth = max_depth;
    options.allow_comments = has('c');
    options.allow_trailing_commas = has('t');
    options.allow_invalid_utf8 = has('u');
    options.allow_lone_surrogates = has('s');
    options.reject_duplicate_keys = has('d');
    options.exact_numbers = has('x');
    options.allow_bom = has('b');
    options.allow_inexact_integers = has('i');
    options.allow_overflow = has('o');
    return options;
}

/// Write options from letters: p pretty, t indentation by tabs, 2 or 0 spaces per level, e empty
/// containers unpadded, s a space after colons, / slashes unescaped, a ASCII only, n non-finite
/// numbers refused, u invalid UTF-8 written as it is.
inline json::WriteOptions write_options_from(std::string_view letters) {
    const auto has = [letters](char letter) { return letters.find(letter) != letters.npos; };
    json::WriteOptions options;
    options.pretty = has('p');
    options.indent_with_tab = has('t');
    options.indent = has('2') ? 2 : has('0') ? 0 : options.indent;
    options.pad_empty_containers = !has('e');
    options.space_after_colon = has('s');
    options.escape_slash = !has('/');
    options.ascii_only = has('a');
    options.reject_non_finite = has('n');
    options.allow_invalid_utf8 = has('u');
    return options;
}

/// The compact text of `depth` arrays, or objects with the one member "k", nested around the
/// text `innermost`.
inline std::string nested(std::size_t depth, bool objects, std::string_view innermost) {
    std::string text;
    for (std::size_t level = 0; level < depth; ++level) {
        text += objects ? R"({"k":)" : "[";
    }
    return text.append(innermost).append(depth, objects ? '}' : ']');
}

/// What `text` parses to; a text that does not parse fails the test.
inline json::Value parsed(std::string_view text, const json::ParseOptions& options = {}) {
    json::Value out;
    EXPECT_TRUE(json::parse(text, out, options)) << text.substr(0, 80);
    return out;
}

inline std::string read_file(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

/// The parsing test suite: y_ files must parse, n_ files must fail, i_ files may do either.
inline std::vector<std::filesystem::path> suite_files() {
    const std::filesystem::directory_iterator files(JSON_TEST_PARSING_DIR);
    return {begin(files), end(files)};
}

/// The benchmark documents; twitter.json's 64-bit ids parse only when rounding is asked for
/// (options_from("i")).
inline std::vector<std::filesystem::path> bench_files() {
    const std::filesystem::path bench = JSON_BENCH_DATA_DIR;
    return {bench / "twitter.json", bench / "citm_catalog.json", bench / "canada.json"};
}

} // namespace test_support

#endif
