// Eight threads read one shared, unchanging Value at once (copy it, write it both ways) and
// parse texts of their own. Built and run under ThreadSanitizer by the test command.
#include <json/json.hpp>

#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

namespace {

using json::Array;
using json::Object;
using json::Value;

Value shared_document() {
    Array items;
    for (int i = 0; i < 200; ++i) {
        items.push_back(Object{{"id", i},
                               {"name", "item number " + std::to_string(i) + " \xC3\xA9\x01"},
                               {"tags", Array{"a", nullptr, true, 1.5f}}});
    }
    return Object{{"items", items}, {"count", 200}};
}

TEST(Threads, SharedValueReadByEightThreads) {
    const Value shared = shared_document();
    const std::string compact = json::serialize(shared);
    const std::string pretty = json::pretty_print(shared);
    std::vector<int> failures(8, 0);
    std::vector<std::thread> threads;
    for (int t = 0; t < 8; ++t) {
        threads.emplace_back([&, t] {
            for (int round = 0; round < 20; ++round) {
                const Value copy = shared;
                const std::string own_text = R"({"thread":)" + std::to_string(t) + R"(,"round":)" +
                                             std::to_string(round) +
                                             R"(,"text":"\u00e9\ud83d\ude00"})";
                Value own;
                failures[t] += copy != shared;
                failures[t] += json::serialize(shared) != compact;
                failures[t] += json::pretty_print(copy) != pretty;
                failures[t] += json::parse(own_text, own) != json::ParseResult::SUCCESS;
                failures[t] +=
                    own !=
                    Object{{"thread", t}, {"round", round}, {"text", "\xC3\xA9\xF0\x9F\x98\x80"}};
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(failures, std::vector<int>(8, 0));
}

} // namespace
