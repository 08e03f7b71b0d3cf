#ifndef JSON_TESTS_ALLOCATION_FAILURE_HPP
#define JSON_TESTS_ALLOCATION_FAILURE_HPP

// Test executables that link allocation_failure.cpp replace the global operator new: it counts
// the blocks alive and can be told to fail a chosen allocation (or every allocation from a
// chosen one on), so a test can run an operation once for every allocation it makes, failing
// that one, and check for leaks. Nothing is allocated ahead of the tests: a block that the
// library keeps after an operation counts as a leak of that operation.

#include <json/json.hpp>

#include <cstddef>
#include <gtest/gtest.h>
#include <new>
#include <utility>

namespace test_support {

/// Blocks allocated through operator new and not yet freed.
std::size_t live_blocks();

/// Bytes held by those blocks (their usable size, at least what was asked for).
std::size_t live_bytes();

/// Allocations made since the program started.
std::size_t allocations_made();

/// Which allocations fail.
enum class Exhaustion {
    ONE,   ///< the chosen allocation only
    EVERY, ///< the chosen allocation and every one after it: memory stays exhausted
};

/// From now on the `n`-th allocation (and with Exhaustion::EVERY every one after it) throws
/// std::bad_alloc, until stop_failing(), which says whether an allocation failed.
void start_failing(std::size_t n, Exhaustion mode);
bool stop_failing();

/// What for_each_failing_allocation saw.
struct FailureRuns {
    std::size_t allocations = 0; ///< allocations the operation makes when none fails
    std::size_t absorbed = 0;    ///< runs in which an allocation failed but nothing was thrown
};

/// Runs `operation(state)` on a fresh `state = setup()` with the 1st, 2nd, ... allocation of
/// the operation failing (as `mode` says), until a run completes without a failing allocation.
/// After each run that ends in std::bad_alloc `check(state)` is called (it may use gtest
/// assertions), and once the state is destroyed no block may have leaked. A failure may also
/// be absorbed: releasing a tree uses a work list when it can get one and recurses when it
/// cannot; such runs are counted, not checked.
template <typename Setup, typename Operation, typename Check>
FailureRuns for_each_failing_allocation(Setup setup, Operation operation, Check check,
                                        Exhaustion mode) {
    FailureRuns runs;
    for (std::size_t n = 1;; ++n) {
        const std::size_t before = live_blocks();
        bool failed = false;
        {
            auto state = setup();
            bool threw = false;
            start_failing(n, mode);
            try {
                operation(state);
            } catch (const std::bad_alloc&) {
                threw = true;
            }
            failed = stop_failing();
            runs.absorbed += failed && !threw ? 1 : 0;
            if (threw) {
                check(state);
            }
        }
        EXPECT_EQ(live_blocks(), before) << "leak with allocation " << n << " failing";
        if (!failed || ::testing::Test::HasFailure()) {
            runs.allocations = n - 1;
            return runs;
        }
    }
}

/// for_each_failing_allocation with one allocation failing at a time, then with memory
/// exhausted from it on; `check(state, exhausted)` is told which. Returns the first one's runs,
/// with the runs absorbed in both.
template <typename Setup, typename Operation, typename Check>
FailureRuns for_each_failure_mode(Setup setup, Operation operation, Check check) {
    const auto checked = [&check](bool exhausted) {
        return [&check, exhausted](auto& state) { check(state, exhausted); };
    };
    FailureRuns runs =
        for_each_failing_allocation(setup, operation, checked(false), Exhaustion::ONE);
    runs.absorbed +=
        for_each_failing_allocation(setup, operation, checked(true), Exhaustion::EVERY).absorbed;
    return runs;
}

/// Runs `apply(document, patch)` on a copy of `before` once for every allocation it makes,
/// with that allocation failing, and again with memory exhausted from it on: the document is
/// left as it was, but for the one case the patch functions name: a top-level array made an
/// object or the other way round (as `result` is to `before`), with memory exhausted, may leave
/// false.
template <typename Apply>
void expect_patch_undone_when_memory_runs_out(const json::Value& before, const json::Value& patch,
                                              const json::Value& result, Apply apply) {
    const auto container = [](const json::Value& value) {
        return value.is_array() || value.is_object();
    };
    const bool kind_changes =
        before.which() != result.which() && container(before) && container(result);
    for_each_failure_mode(
        [&] { return std::make_pair(before, patch); },
        [&apply](std::pair<json::Value, json::Value>& state) { apply(state.first, state.second); },
        [&](const std::pair<json::Value, json::Value>& state, bool exhausted) {
            EXPECT_TRUE(state.first == before ||
                        (kind_changes && exhausted && state.first == false))
                << json::serialize(patch) << " left " << json::serialize(state.first);
        });
}

} // namespace test_support

#endif
