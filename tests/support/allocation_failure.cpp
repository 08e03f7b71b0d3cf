#include "support/allocation_failure.hpp"

#include <cstdlib>

#include <malloc.h>

namespace {

// Plain counters: the tests that use them run on one thread.
std::size_t live = 0;
std::size_t live_size = 0; // bytes of the live blocks, as malloc_usable_size counts them
std::size_t made = 0;
std::size_t fail_at = 0; // absolute number of the allocation to fail; 0 for none
bool fail_after = false; // whether every allocation after it fails too
bool failed = false;

} // namespace

// The other forms of operator new and delete call these by default, except under valgrind, which
// supplies its own versions of libstdc++'s: the sized delete that the library's containers call
// is replaced too, so that every block taken here comes back here.
void* operator new(std::size_t size) {
    ++made;
    void* block = nullptr;
    if (fail_at != 0 && (made == fail_at || (fail_after && made > fail_at))) {
        failed = true;
    } else {
        block = std::malloc(size == 0 ? 1 : size);
    }
    if (block == nullptr) {
        throw std::bad_alloc();
    }
    ++live;
    live_size += malloc_usable_size(block);
    return block;
}

void operator delete(void* block) noexcept {
    if (block != nullptr) {
        --live;
        live_size -= malloc_usable_size(block);
        std::free(block);
    }
}

void operator delete(void* block, std::size_t) noexcept {
    operator delete(block);
}

namespace test_support {

std::size_t live_blocks() {
    return live;
}

std::size_t live_bytes() {
    return live_size;
}

std::size_t allocations_made() {
    return made;
}

void start_failing(std::size_t n, Exhaustion mode) {
    fail_at = made + n;
    fail_after = mode == Exhaustion::EVERY;
    failed = false;
}

bool stop_failing() {
    fail_at = 0;
    return failed;
}

} // namespace test_support
