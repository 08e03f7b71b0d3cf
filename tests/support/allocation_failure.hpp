#ifndef JSON_TESTS_ALLOCATION_FAILURE_HPP
#define JSON_TESTS_ALLOCATION_FAILURE_HPP

// Test executables that link allocation_failure.cpp replace the global operator new: it can
// be told to fail one chosen allocation, and it counts the blocks alive, so a test can run an
// operation once for every allocation it makes, failing that one, and check for leaks.

#include <cstddef>
#include <gtest/gtest.h>
#include <new>

namespace test_support {

/// Blocks allocated through operator new and not yet freed.
std::size_t live_blocks();

/// Allocations made since the program started.
std::size_t allocations_made();

/// While alive, the `n`-th allocation from now throws std::bad_alloc (only that one).
class FailAllocation {
  public:
    explicit FailAllocation(std::size_t n);
    ~FailAllocation();
    FailAllocation(const FailAllocation&) = delete;
    FailAllocation& operator=(const FailAllocation&) = delete;
    /// Whether the chosen allocation was reached (and failed).
    bool triggered() const;
};

/// Runs `operation(state)` on a fresh `state = setup()` with the 1st, 2nd, ... allocation of
/// the operation failing, until a run completes without reaching the failing allocation. After
/// each run that ends in std::bad_alloc `check(state)` is called (it may use gtest assertions),
/// and once the state is destroyed no block may have leaked. A failure may also be absorbed:
/// releasing a tree uses a work list when it can get one and recurses when it cannot. Returns
/// the number of allocations the operation makes.
template <typename Setup, typename Operation, typename Check>
std::size_t for_each_failing_allocation(Setup setup, Operation operation, Check check) {
    for (std::size_t n = 1;; ++n) {
        const std::size_t before = live_blocks();
        bool completed = false;
        {
            auto state = setup();
            bool threw = false;
            {
                FailAllocation failure(n);
                try {
                    operation(state);
                } catch (const std::bad_alloc&) {
                    threw = true;
                }
                completed = !failure.triggered();
            }
            if (threw) {
                check(state);
            }
        }
        EXPECT_EQ(live_blocks(), before) << "leak with allocation " << n << " failing";
        if (completed || ::testing::Test::HasFailure()) {
            return n - 1;
        }
    }
}

} // namespace test_support

#endif
