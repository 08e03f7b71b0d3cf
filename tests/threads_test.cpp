// Eight threads read one shared, unchanging Value at once (copy it, compare it, write it both
// ways) and parse its text. Built and run under ThreadSanitizer by the test command.
#include <json/json.hpp>

#include <gtest/gtest.h>

#include <thread>

namespace {

using namespace json;

TEST(Threads, SharedValueReadByEightThreads) {
    Array items;
    for (int i = 0; i < 200; ++i) {
        items.push_back(Object{{"id", i},
                               {"name", "item " + std::to_string(i) + " \xC3\xA9\x01/"},
                               {"tags", Array{"a", nullptr, true, 1.5f, Array{}, Object{}}}});
    }
    const Value shared = Object{{"items", items}, {"count", 200}};
    const std::string compact = serialize(shared), pretty = pretty_print(shared);
    std::vector<int> failures(8, 0);
    std::vector<std::thread> threads;
    for (int t = 0; t < 8; ++t) {
        threads.emplace_back([&, t] {
            for (int round = 0; round < 20; ++round) {
                const Value copy = shared;
                Value parsed;
                const bool read = parse(compact, parsed) == ParseResult::SUCCESS;
                failures[t] += copy != shared || serialize(shared) != compact ||
                               pretty_print(copy) != pretty || !read ||
                               serialize(parsed) != compact;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(failures, std::vector<int>(8, 0));
}

} // namespace
