#ifndef JSON_DETAIL_WORKSPACE_HPP
#define JSON_DETAIL_WORKSPACE_HPP

// The memory a reader's working stacks start in: a buffer on the caller's stack, so that a
// small document is read without a single allocation for them.

#include <cstddef>
#include <cstdint>
#include <memory>
#include <new>
#include <type_traits>
#include <utility>

namespace json::detail {

/// Hands out the WORKSPACE_SIZE bytes of its own storage first, one block after another, and
/// then takes blocks from the heap and gives them back. A block of the storage is given back
/// only when it is the last one handed out (a stack that grows leaves its earlier storage behind
/// there; the heap gets back what it gave). One per parse, owned by the function that parses,
/// so that calls share nothing. The standard's memory resources would need a virtual call per
/// allocation, and its monotonic one keeps every heap block until it ends; here an allocation
/// from the storage is a few inlined instructions.
class Workspace {
  public:
    /// Enough for the stacks of a document nested a few dozen levels deep with a few dozen
    /// values per open container.
    static constexpr std::size_t WORKSPACE_SIZE = 4096;

    Workspace() = default;
    Workspace(const Workspace&) = delete;
    Workspace& operator=(const Workspace&) = delete;
    ~Workspace() = default;

    /// `bytes` aligned for any type of at most `alignment` (a power of two, at most that of
    /// std::max_align_t, as the storage is); throws std::bad_alloc.
    void* allocate(std::size_t bytes, std::size_t alignment) {
        const std::size_t start = (used + alignment - 1) & ~(alignment - 1);
        if (start <= WORKSPACE_SIZE && bytes <= WORKSPACE_SIZE - start) {
            used = start + bytes;
            return storage + start;
        }
        return ::operator new(bytes);
    }
    /// Gives back a block from allocate(); nothrow.
    void deallocate(void* block, std::size_t bytes) noexcept {
        // Where the block starts from the storage's start, as addresses: one unsigned
        // comparison tells a block of the storage from the heap's (pointers themselves may be
        // compared only within one array).
        const std::uintptr_t offset =
            reinterpret_cast<std::uintptr_t>(block) - reinterpret_cast<std::uintptr_t>(storage);
        if (offset >= WORKSPACE_SIZE) {
            ::operator delete(block); // unsized: not every compiler declares the sized form
        } else if (offset + bytes == used) {
            used = offset;
        }
    }

  private:
    alignas(std::max_align_t) std::byte storage[WORKSPACE_SIZE];
    std::size_t used = 0; // the bytes of the storage handed out, the last block's end
};

/// A stack of T kept in a Workspace, which takes its first room when it is made: a few inlined
/// stores, where an empty std::vector with an allocator of the Workspace and its reserve() cost an
/// out-of-line call for every element type with a constructor of its own (a reader sets up several
/// stacks per parse, and a small document is read in a few hundred instructions). It grows as
/// std::vector does, doubling its room and moving its elements, which must not throw when moved.
template <typename T>
class WorkspaceStack {
    static_assert(std::is_nothrow_move_constructible_v<T>);

  public:
    /// Room for `capacity` elements (at least one); throws std::bad_alloc.
    WorkspaceStack(Workspace& workspace, std::size_t capacity)
        : workspace(workspace), first(take(capacity)), last(first), limit(first + capacity) {}
    WorkspaceStack(const WorkspaceStack&) = delete;
    WorkspaceStack& operator=(const WorkspaceStack&) = delete;
    ~WorkspaceStack() {
        std::destroy(first, last);
        workspace.deallocate(first, room() * sizeof(T));
    }

    std::size_t size() const { return static_cast<std::size_t>(last - first); }
    bool empty() const { return last == first; }
    T* begin() { return first; }
    T* end() { return last; }
    T& operator[](std::size_t at) { return first[at]; }
    T& back() { return last[-1]; }

    /// Constructs an element on top; returns it. Amortized constant time; throws what T's
    /// constructor throws and std::bad_alloc, the stack unchanged then.
    template <typename... Arguments>
    T& emplace_back(Arguments&&... arguments) {
        if (last == limit) {
            grow();
        }
        T* const made = ::new (static_cast<void*>(last)) T(std::forward<Arguments>(arguments)...);
        ++last;
        return *made;
    }
    void pop_back() { std::destroy_at(--last); }
    /// Drops the elements from `size` on (`size` at most size()).
    void shrink_to(std::size_t size) {
        T* const kept = first + size;
        std::destroy(kept, last);
        last = kept;
    }

  private:
    std::size_t room() const { return static_cast<std::size_t>(limit - first); }
    T* take(std::size_t count) {
        if (count > std::size_t(-1) / sizeof(T)) {
            throw std::bad_array_new_length();
        }
        return static_cast<T*>(workspace.allocate(count * sizeof(T), alignof(T)));
    }
    [[gnu::noinline]] void grow() {
        const std::size_t size = this->size();
        const std::size_t larger = 2 * room();
        T* const moved = take(larger);
        std::uninitialized_move(first, last, moved);
        std::destroy(first, last);
        workspace.deallocate(first, room() * sizeof(T));
        first = moved;
        last = moved + size;
        limit = moved + larger;
    }

    Workspace& workspace;
    T* first;
    T* last;
    T* limit;
};

} // namespace json::detail

#endif
