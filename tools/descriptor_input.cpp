#include "descriptor_input.hpp"

#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <poll.h>
#include <system_error>
#include <unistd.h>

namespace jsonfmt {

DescriptorInput::DescriptorInput(const std::string& name)
    : descriptor(name == "-" ? STDIN_FILENO : ::open(name.c_str(), O_RDONLY | O_CLOEXEC)),
      owned(name != "-"), pieces{std::vector<char>(PIECE), std::vector<char>(PIECE)} {
    if (descriptor < 0) {
        open_failure = errno;
    }
    setg(pieces[current].data(), pieces[current].data(), pieces[current].data());
}

DescriptorInput::~DescriptorInput() {
    if (owned && descriptor >= 0) {
        ::close(descriptor);
    }
}

namespace {

// One read(2) of up to `size` bytes: made again when a signal interrupts it, and after waiting
// for input when the descriptor is non-blocking and has none yet. Returns what read(2) returns.
ssize_t read_some(int descriptor, char* into, std::size_t size) {
    for (;;) {
        const ssize_t got = ::read(descriptor, into, size);
        if (got >= 0 || (errno != EINTR && errno != EAGAIN && errno != EWOULDBLOCK)) {
            return got;
        }
        pollfd waiting{descriptor, POLLIN, 0};
        if (errno != EINTR && ::poll(&waiting, 1, -1) < 0 && errno != EINTR) {
            return -1;
        }
    }
}

} // namespace

DescriptorInput::int_type DescriptorInput::underflow() {
    if (open_failure != 0) {
        return traits_type::eof();
    }
    const auto read_before = static_cast<std::size_t>(egptr() - eback());
    std::vector<char>& next = pieces[1 - current];
    const ssize_t got = read_some(descriptor, next.data(), next.size());
    if (got < 0) {
        read_failure = errno;
        throw std::system_error(read_failure, std::generic_category(), "read failed");
    }
    if (got == 0) {
        return traits_type::eof();
    }
    current = 1 - current;
    current_start += read_before;
    previous_size = read_before;
    setg(next.data(), next.data(), next.data() + got);
    return traits_type::to_int_type(next[0]);
}

std::string_view DescriptorInput::peek() {
    if (gptr() == egptr() && traits_type::eq_int_type(underflow(), traits_type::eof())) {
        return {};
    }
    return {gptr(), static_cast<std::size_t>(egptr() - gptr())};
}

DescriptorInput::Kept DescriptorInput::kept(std::size_t from, std::size_t to) const {
    const std::size_t previous_start = current_start - previous_size;
    const std::size_t end = current_start + static_cast<std::size_t>(egptr() - eback());
    Kept shown{{}, std::max(from, previous_start)};
    to = std::min(to, end);
    // The part in the piece before, then the part in the current one.
    for (std::size_t at = shown.start; at < to; ++at) {
        shown.text += at < current_start ? pieces[1 - current][at - previous_start]
                                         : eback()[at - current_start];
    }
    return shown;
}

} // namespace jsonfmt
