#include "file_output.hpp"

#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <stdexcept>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>
#include <utility>

namespace jsonfmt {

namespace {

[[noreturn]] void throw_errno(const std::string& what) {
    throw std::system_error(errno, std::generic_category(), what);
}

// The signals that end the program with its temporary file removed.
constexpr int CLEANED_UP_SIGNALS[] = {SIGHUP, SIGINT, SIGTERM};

// The temporary file of the Replacement alive, for the signal handler to remove; null when
// there is none.
std::atomic<const char*> pending_temporary{nullptr};
static_assert(std::atomic<const char*>::is_always_lock_free, "read in a signal handler");

// Removes the pending temporary file, then ends the program by the signal, as it would have
// ended without the handler.
void remove_temporary_and_end(int signal) {
    if (const char* temporary = pending_temporary.load(); temporary != nullptr) {
        ::unlink(temporary);
    }
    std::signal(signal, SIG_DFL);
    std::raise(signal); // delivered once the handler returns and unblocks it
}

// Installs the handler for each signal that is not ignored: a command started with its
// interrupts ignored (in the background) keeps ignoring them.
void clean_up_on_signals() {
    for (const int signal : CLEANED_UP_SIGNALS) {
        struct sigaction current {};
        if (::sigaction(signal, nullptr, &current) == 0 && current.sa_handler != SIG_IGN) {
            struct sigaction action {};
            action.sa_handler = remove_temporary_and_end;
            sigemptyset(&action.sa_mask);
            ::sigaction(signal, &action, nullptr);
        }
    }
}

// Holds the cleaned-up signals back while it lives, so that no temporary file comes into being
// without the handler knowing it.
class SignalsHeld {
  public:
    SignalsHeld() {
        sigset_t held;
        sigemptyset(&held);
        for (const int signal : CLEANED_UP_SIGNALS) {
            sigaddset(&held, signal);
        }
        ::sigprocmask(SIG_BLOCK, &held, &previous);
    }
    ~SignalsHeld() { ::sigprocmask(SIG_SETMASK, &previous, nullptr); }
    SignalsHeld(const SignalsHeld&) = delete;
    SignalsHeld& operator=(const SignalsHeld&) = delete;

  private:
    sigset_t previous{};
};

// The permission bits open(2) gives a new file: 0666 less the umask, which can only be read by
// setting it.
mode_t new_file_mode() {
    const mode_t mask = ::umask(0);
    ::umask(mask);
    return 0666 & ~mask;
}

// The file `name` leads to: a symbolic link stays a link, the file it leads to is replaced.
std::string resolved(const std::string& name) {
    char* resolved = ::realpath(name.c_str(), nullptr);
    if (resolved == nullptr) {
        throw_errno(name);
    }
    std::string path = resolved;
    std::free(resolved); // NOLINT(cppcoreguidelines-no-malloc): realpath's own allocation
    return path;
}

[[noreturn]] void refuse(const std::string& name, const std::string& reason) {
    throw std::runtime_error(name + ": " + reason);
}

// Refuses a file that a renamed copy would not take the place of: anything but a regular file
// (a device or FIFO would become a plain file), a file with other hard links (they would keep
// the old text) and a file the user may not write (judged as open(2) would: root may write
// any file).
void check_replaceable(const std::string& name, const struct stat& file) {
    if (!S_ISREG(file.st_mode)) {
        refuse(name, "not a regular file: only a regular file is rewritten");
    }
    if (file.st_nlink > 1) {
        refuse(name, "has " + std::to_string(file.st_nlink) +
                         " hard links: rewriting it would break them");
    }
    if (::faccessat(AT_FDCWD, name.c_str(), W_OK, AT_EACCESS) != 0) {
        throw_errno(name);
    }
}

} // namespace

DescriptorBuffer::DescriptorBuffer(int descriptor)
    : descriptor(descriptor), buffer(std::size_t{1} << 20) {
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

// The buffer is full: the text before the current document goes out and the document's text
// moves to the front, so that a document is held whole while it fits; one that fills the
// buffer alone goes out too.
DescriptorBuffer::int_type DescriptorBuffer::overflow(int_type c) {
    const std::size_t held = static_cast<std::size_t>(pptr() - pbase());
    const std::size_t kept = document_start == 0 ? 0 : held - document_start;
    if (!write_out(pbase(), held - kept)) {
        return traits_type::eof();
    }
    document_went_out = document_went_out || kept == 0;
    std::memmove(buffer.data(), buffer.data() + (held - kept), kept);
    setp(buffer.data(), buffer.data() + buffer.size());
    pbump(static_cast<int>(kept));
    document_start = 0;
    if (!traits_type::eq_int_type(c, traits_type::eof())) {
        *pptr() = traits_type::to_char_type(c);
        pbump(1);
    }
    return traits_type::not_eof(c);
}

bool DescriptorBuffer::finish() {
    const bool written = write_out(pbase(), static_cast<std::size_t>(pptr() - pbase()));
    setp(buffer.data(), buffer.data() + buffer.size());
    document_start = 0;
    return written;
}

void DescriptorBuffer::begin_document() {
    document_start = static_cast<std::size_t>(pptr() - pbase());
    document_went_out = false;
}

bool DescriptorBuffer::abandon_document() {
    if (document_went_out) {
        return false;
    }
    setp(buffer.data(), buffer.data() + buffer.size());
    pbump(static_cast<int>(document_start));
    return true;
}

bool is_special_file(const std::string& name) {
    struct stat file {};
    return ::stat(name.c_str(), &file) == 0 && !S_ISREG(file.st_mode);
}

Replacement::Replacement(const std::string& name, Target target) {
    struct stat original {};
    if (::stat(name.c_str(), &original) != 0) {
        if (errno != ENOENT || target == Target::EXISTING) {
            throw_errno(name);
        }
        path = name;
        mode = new_file_mode();
        create_temporary();
        return;
    }
    check_replaceable(name, original);
    path = resolved(name);
    mode = original.st_mode & 07777U;
    create_temporary();
    try {
        give_ownership(original.st_uid, original.st_gid, name);
    } catch (...) {
        discard();
        throw;
    }
}

Replacement::~Replacement() {
    discard();
}

void Replacement::create_temporary() {
    [[maybe_unused]] static const bool handled = (clean_up_on_signals(), true);
    // Beside the file, so that the rename stays within one file system.
    const std::size_t slash = path.rfind('/');
    const std::string directory = slash == std::string::npos ? "" : path.substr(0, slash + 1);
    const std::string base = slash == std::string::npos ? path : path.substr(slash + 1);
    std::string pattern = directory + "." + base + ".jsonfmt-XXXXXX";
    const SignalsHeld held;
    temporary = ::mkstemp(pattern.data());
    if (temporary < 0) {
        throw_errno(path + ": creating a temporary file");
    }
    temporary_path = std::move(pattern);
    pending_temporary = temporary_path.c_str();
}

// Where the temporary file's owner or group differ from the original's (another user's file,
// or a group the directory did not give), it takes the original's; when that is not permitted
// the replacement would change hands: refused.
void Replacement::give_ownership(uid_t owner, gid_t group, const std::string& name) {
    struct stat made {};
    if (::fstat(temporary, &made) != 0) {
        throw_errno(temporary_path);
    }
    if ((made.st_uid != owner || made.st_gid != group) && ::fchown(temporary, owner, group) != 0) {
        throw_errno(name + ": keeping its owner and group");
    }
}

void Replacement::commit() {
    // The mode after fchown, which clears the set-user-ID and set-group-ID bits.
    if (::fsync(temporary) != 0 || ::fchmod(temporary, mode) != 0 ||
        ::close(std::exchange(temporary, -1)) != 0) {
        throw_errno(path + ": writing " + temporary_path);
    }
    if (::rename(temporary_path.c_str(), path.c_str()) != 0) {
        throw_errno(path + ": replacing it");
    }
    pending_temporary = nullptr;
    temporary_path.clear();
}

void Replacement::discard() noexcept {
    if (temporary >= 0) {
        ::close(std::exchange(temporary, -1));
    }
    if (!temporary_path.empty()) {
        ::unlink(temporary_path.c_str());
    }
    pending_temporary = nullptr;
}

} // namespace jsonfmt
