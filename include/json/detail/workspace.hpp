#ifndef JSON_DETAIL_WORKSPACE_HPP
#define JSON_DETAIL_WORKSPACE_HPP

// The memory a reader's working stacks start in: a buffer on the caller's stack, so that a
// small document is read without a single allocation for them.

#include <cstddef>
#include <memory_resource>

namespace json::detail {

/// A memory resource that hands out WORKSPACE_SIZE bytes of its own storage first and then
/// asks the heap, in blocks that grow geometrically. Nothing is given back before the
/// workspace ends: a stack that grows by doubling leaves its earlier storage behind, at most as
/// much again as it finally holds. One per parse, owned by the function that parses, so that
/// calls share nothing.
class Workspace {
  public:
    /// Enough for the stacks of a document nested a few dozen levels deep with a few dozen
    /// values per open container.
    static constexpr std::size_t WORKSPACE_SIZE = 4096;

    Workspace() = default;
    Workspace(const Workspace&) = delete;
    Workspace& operator=(const Workspace&) = delete;

    std::pmr::memory_resource* resource() { return &memory; }

  private:
    alignas(std::max_align_t) std::byte storage[WORKSPACE_SIZE];
    // The heap behind it is named: the process-wide default resource could be replaced by
    // anyone, at any time.
    std::pmr::monotonic_buffer_resource memory{storage, sizeof storage,
                                               std::pmr::new_delete_resource()};
};

} // namespace json::detail

#endif
