#include "descriptor_input.hpp"

#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <unistd.h>

namespace jsonfmt {

DescriptorInput::DescriptorInput(const std::string& name)
    : descriptor(name == "-" ? STDIN_FILENO : ::open(name.c_str(), O_RDONLY | O_CLOEXEC)),
      owned(name != "-"), pieces{std::vector<char>(PIECE), std::vector<char>(PIECE)} {
    if (descriptor < 0) {
        failure = errno;
    }
    setg(pieces[current].data(), pieces[current].data(), pieces[current].data());
}

DescriptorInput::~DescriptorInput() {
    if (owned && descriptor >= 0) {
        ::close(descriptor);
    }
}

DescriptorInput::int_type DescriptorInput::underflow() {
    if (failure != 0) {
        return traits_type::eof();
    }
    const std::size_t read_before = static_cast<std::size_t>(egptr() - eback());
    std::vector<char>& next = pieces[1 - current];
    ssize_t got = 0;
    do {
        got = ::read(descriptor, next.data(), next.size());
    } while (got < 0 && errno == EINTR);
    if (got <= 0) {
        failure = got < 0 ? errno : 0;
        return traits_type::eof();
    }
    current = 1 - current;
    current_start += read_before;
    previous_size = read_before;
    setg(next.data(), next.data(), next.data() + got);
    return traits_type::to_int_type(next[0]);
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
