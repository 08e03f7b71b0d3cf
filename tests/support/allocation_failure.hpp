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

/// Runs `operation` with the 1st, 2nd, ... allocation failing until a run completes without
/// reaching the failing allocation. After each failed run `check` is called (it may use gtest
/// assertions) and no block may have leaked. Returns the number of allocations the operation
/// makes.
template <typename Operation, typename Check>
std::size_t for_each_failing_allocation(Operation operation, Check check) {
    for (std::size_t n = 1;; ++n) {
        const std::size_t before = live_blocks();
        bool threw = false;
        {
            FailAllocation failure(n);
            try {
                operation();
            } catch (const std::bad_alloc&) {
                threw = true;
            }
            if (!failure.triggered()) {
                EXPECT_FALSE(threw);
                return n - 1;
            }
        }
        EXPECT_TRUE(threw) << "allocation " << n << " failed but no std::bad_alloc arrived";
        check();
        EXPECT_EQ(live_blocks(), before) << "leak after failing allocation " << n;
    }
}

} // namespace test_support

#endif
