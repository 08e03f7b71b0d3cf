#ifndef JSONFMT_FILE_OUTPUT_HPP
#define JSONFMT_FILE_OUTPUT_HPP

// Where jsonfmt's text goes: a file descriptor written in large pieces, and a file replaced
// safely.

#include <array>
#include <streambuf>
#include <string>
#include <sys/types.h>

namespace jsonfmt {

/// A stream buffer that writes to a file descriptor in pieces of its own size, so that the
/// memory the output takes stays bounded however long the text is. The writer flushes its
/// stream at every newline of pretty text; sync() hands nothing on for that (a system call
/// per line would cost more than the line): finish() writes what is left.
class DescriptorBuffer : public std::streambuf {
  public:
    explicit DescriptorBuffer(int descriptor);
    DescriptorBuffer(const DescriptorBuffer&) = delete;
    DescriptorBuffer& operator=(const DescriptorBuffer&) = delete;

    /// Writes everything buffered. False when this or an earlier write failed; error() says
    /// why.
    bool finish();
    /// The errno of the first failed write, or 0.
    int error() const { return failure; }

  protected:
    int_type overflow(int_type c) override;
    int sync() override { return failure == 0 ? 0 : -1; }

  private:
    bool write_out(const char* bytes, std::size_t count);

    int descriptor;
    int failure = 0;
    std::array<char, std::size_t{64} * 1024> buffer{};
};

/// Whether `name` exists and is something other than a regular file (a device, a FIFO, a
/// directory), following symbolic links.
bool is_special_file(const std::string& name);

/// A temporary file in the directory of the file `name` (the file a symbolic link leads to),
/// renamed over that file by commit() once it has been written and flushed to disk. Until
/// then the original is untouched; a Replacement that is not committed removes its file, and
/// so does SIGHUP, SIGINT or SIGTERM while it exists (one Replacement at a time).
///
/// Only a file that can be replaced without a trace is taken: a regular file with a single
/// link, that the user may write, whose owner and group the temporary file can take on. A
/// refusal throws std::runtime_error naming the file and the reason; a failing system call
/// throws std::system_error naming the step.
class Replacement {
  public:
    /// Which names a Replacement takes.
    enum class Target {
        EXISTING,       ///< an existing file only
        EXISTING_OR_NEW ///< also a name where nothing is yet: a new file, made as open(2) would
    };

    Replacement(const std::string& name, Target target);
    ~Replacement();
    Replacement(const Replacement&) = delete;
    Replacement& operator=(const Replacement&) = delete;

    /// The temporary file's descriptor, open for writing.
    int descriptor() const { return temporary; }
    /// Flushes the temporary file to disk, gives it the original's permission bits (those of a
    /// new file: 0666 less the umask) and renames it over the original.
    void commit();

  private:
    void create_temporary();
    void give_ownership(uid_t owner, gid_t group, const std::string& name);
    void discard() noexcept;

    std::string path;
    std::string temporary_path;
    mode_t mode = 0;
    int temporary = -1;
};

} // namespace jsonfmt

#endif
