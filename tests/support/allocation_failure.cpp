#include "support/allocation_failure.hpp"

#include <json/value.hpp>

#include <cstdlib>

namespace {

// Plain counters: the tests that use them run on one thread.
std::size_t live = 0;
std::size_t made = 0;
std::size_t fail_at = 0; // absolute allocation number to fail; 0 for none
bool failed = false;

void* allocate(std::size_t size) {
    ++made;
    if (made == fail_at) {
        failed = true;
        throw std::bad_alloc();
    }
    void* block = std::malloc(size == 0 ? 1 : size);
    if (block == nullptr) {
        throw std::bad_alloc();
    }
    ++live;
    return block;
}

void release(void* block) noexcept {
    if (block != nullptr) {
        --live;
        std::free(block);
    }
}

// The library makes two constant empty containers on the first copy of a container and keeps
// them until exit: make them before any test counts blocks.
const json::Value warm_up = json::Value(json::Value(json::Array{json::Object{}}));

} // namespace

void* operator new(std::size_t size) {
    return allocate(size);
}
void* operator new[](std::size_t size) {
    return allocate(size);
}
void operator delete(void* block) noexcept {
    release(block);
}
void operator delete[](void* block) noexcept {
    release(block);
}
void operator delete(void* block, std::size_t) noexcept {
    release(block);
}
void operator delete[](void* block, std::size_t) noexcept {
    release(block);
}

namespace test_support {

std::size_t live_blocks() {
    return live;
}

std::size_t allocations_made() {
    return made;
}

FailAllocation::FailAllocation(std::size_t n) {
    fail_at = made + n;
    failed = false;
}

FailAllocation::~FailAllocation() {
    fail_at = 0;
}

bool FailAllocation::triggered() const {
    return failed;
}

} // namespace test_support
