#ifndef JSON_DETAIL_WORKSPACE_HPP
#define JSON_DETAIL_WORKSPACE_HPP

// The memory a reader's working stacks start in: a buffer on the caller's stack, so that a
// small document is read without a single allocation for them.

#include <cstddef>
#include <functional>
#include <memory>
#include <memory_resource>

namespace json::detail {

/// A memory resource that hands out the WORKSPACE_SIZE bytes of its own storage first, one
/// block after another, and then takes blocks from the heap and gives them back. A block of the
/// storage is given back only when it is the last one handed out (a stack that grows leaves its
/// earlier storage behind there; the heap gets back what it gave). One per parse, owned by the
/// function that parses, so that calls share nothing. The standard's monotonic resource would
/// do the first part, but it keeps every heap block too until it ends, and its allocation is a
/// call into the library: here it is a few instructions.
class Workspace final : public std::pmr::memory_resource {
  public:
    /// Enough for the stacks of a document nested a few dozen levels deep with a few dozen
    /// values per open container.
    static constexpr std::size_t WORKSPACE_SIZE = 4096;

    Workspace() = default;
    Workspace(const Workspace&) = delete;
    Workspace& operator=(const Workspace&) = delete;
    ~Workspace() override = default;

    std::pmr::memory_resource* resource() { return this; }

  private:
    void* do_allocate(std::size_t bytes, std::size_t alignment) override {
        void* place = next;
        std::size_t space = WORKSPACE_SIZE - static_cast<std::size_t>(next - storage);
        if (std::align(alignment, bytes, place, space) != nullptr) {
            next = static_cast<std::byte*>(place) + bytes;
            return place;
        }
        return heap()->allocate(bytes, alignment);
    }
    void do_deallocate(void* block, std::size_t bytes, std::size_t alignment) override {
        auto* const first = static_cast<std::byte*>(block);
        // std::less orders any two pointers; the built-in < only those into one array.
        const std::less<const std::byte*> before;
        if (before(first, storage) || !before(first, storage + WORKSPACE_SIZE)) {
            heap()->deallocate(block, bytes, alignment);
        } else if (first + bytes == next) {
            next = first;
        }
    }
    bool do_is_equal(const std::pmr::memory_resource& other) const noexcept override {
        return this == &other;
    }
    // Named: the process-wide default resource could be replaced by anyone, at any time.
    static std::pmr::memory_resource* heap() { return std::pmr::new_delete_resource(); }

    alignas(std::max_align_t) std::byte storage[WORKSPACE_SIZE];
    std::byte* next = storage;
};

} // namespace json::detail

#endif
