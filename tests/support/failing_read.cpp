// Loaded with LD_PRELOAD, makes read(2) fail with EIO once the process has read
// FAILING_READ_AFTER bytes in all (the read that reaches the limit is cut to it), as a disk
// that breaks part-way through a file would.
#include <cerrno>
#include <cstddef>
#include <cstdlib>
#include <dlfcn.h>
#include <unistd.h>

namespace {

std::size_t bytes_read = 0;

} // namespace

extern "C" __attribute__((visibility("default"))) ssize_t read(int descriptor, void* into,
                                                               std::size_t count) {
    using Read = ssize_t (*)(int, void*, std::size_t);
    static const auto real_read = reinterpret_cast<Read>(dlsym(RTLD_NEXT, "read"));
    const char* const limit_text = std::getenv("FAILING_READ_AFTER");
    if (limit_text == nullptr) {
        return real_read(descriptor, into, count);
    }
    const auto limit = static_cast<std::size_t>(std::strtoull(limit_text, nullptr, 10));
    if (bytes_read >= limit) {
        errno = EIO;
        return -1;
    }
    const ssize_t got =
        real_read(descriptor, into, count < limit - bytes_read ? count : limit - bytes_read);
    bytes_read += got > 0 ? static_cast<std::size_t>(got) : 0;
    return got;
}
