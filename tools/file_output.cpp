#include "file_output.hpp"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>
#include <vector>

namespace jsonfmt {

namespace {

[[noreturn]] void throw_errno(const std::string& what) {
    throw std::system_error(errno, std::generic_category(), what);
}

} // namespace

DescriptorBuffer::DescriptorBuffer(int descriptor) : descriptor(descriptor) {
    setp(buffer.data(), buffer.data() + buffer.size());
}

bool DescriptorBuffer::write_out(const char* bytes, std::size_t count) {
    while (count != 0 && failure == 0) {
        const ssize_t written = ::write(descriptor, bytes, count);
        if (written < 0) {
            if (errno != EINTR) {
                failure = errno;
            }
            continue;
        }
        bytes += written;
        count -= static_cast<std::size_t>(written);
    }
    return failure == 0;
}

DescriptorBuffer::int_type DescriptorBuffer::overflow(int_type c) {
    if (!finish()) {
        return traits_type::eof();
    }
    if (!traits_type::eq_int_type(c, traits_type::eof())) {
        *pptr() = traits_type::to_char_type(c);
        pbump(1);
    }
    return traits_type::not_eof(c);
}

bool DescriptorBuffer::finish() {
    const bool written = write_out(pbase(), static_cast<std::size_t>(pptr() - pbase()));
    setp(buffer.data(), buffer.data() + buffer.size());
    return written;
}

Replacement::Replacement(const std::string& name) {
    // A symbolic link stays a link: the file it leads to is the one replaced.
    char* resolved = ::realpath(name.c_str(), nullptr);
    if (resolved == nullptr) {
        throw_errno(name);
    }
    path = resolved;
    std::free(resolved); // NOLINT(cppcoreguidelines-no-malloc): realpath's own allocation
    struct stat original {};
    if (::stat(path.c_str(), &original) != 0) {
        throw_errno(path);
    }
    mode = original.st_mode & 07777U;
    // Beside the original, so that the rename stays within one file system.
    const std::size_t slash = path.rfind('/');
    const std::string directory = slash == std::string::npos ? "" : path.substr(0, slash + 1);
    const std::string base = slash == std::string::npos ? path : path.substr(slash + 1);
    temporary_path = directory + "." + base + ".jsonfmt-XXXXXX";
    std::vector<char> pattern(temporary_path.begin(), temporary_path.end());
    pattern.push_back('\0');
    temporary = ::mkstemp(pattern.data());
    if (temporary < 0) {
        throw_errno(path + ": creating a temporary file");
    }
    temporary_path = pattern.data();
}

Replacement::~Replacement() {
    if (temporary >= 0) {
        ::close(temporary);
        ::unlink(temporary_path.c_str());
    }
}

void Replacement::commit() {
    if (::fsync(temporary) != 0 || ::fchmod(temporary, mode) != 0) {
        throw_errno(path + ": writing " + temporary_path);
    }
    const int descriptor = temporary;
    temporary = -1;
    if (::close(descriptor) != 0) {
        const int saved = errno;
        ::unlink(temporary_path.c_str());
        errno = saved;
        throw_errno(path + ": writing " + temporary_path);
    }
    if (::rename(temporary_path.c_str(), path.c_str()) != 0) {
        const int saved = errno;
        ::unlink(temporary_path.c_str());
        errno = saved;
        throw_errno(path + ": replacing it");
    }
}

} // namespace jsonfmt
