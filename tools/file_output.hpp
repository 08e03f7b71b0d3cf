#ifndef JSONFMT_FILE_OUTPUT_HPP
#define JSONFMT_FILE_OUTPUT_HPP

// Where jsonfmt's text goes: a file descriptor written in large pieces, and a file replaced
// safely.

#include <streambuf>
#include <string>
#include <sys/types.h>
#include <vector>

namespace jsonfmt {

/// A stream buffer that writes to a file descriptor in pieces of its own size, so that the
/// memory the output takes stays bounded however long the text is. The writer flushes its
/// stream at every newline of pretty text; sync() hands nothing on for that (a system call
/// per line would cost more than the line): finish() writes what is left.
///
/// The text of one document is held until it is complete while it fits the buffer (1 MiB), so
/// that a document that fails halfway can be taken back whole: abandon_document(). A longer
/// document streams out as it is made, and only its part still held can be taken back.
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

    /// Marks the start of a document's text.
    void begin_document();
    /// Takes back the text of the document begun last, when none of it has gone out: true.
    /// False when part of it was written already: what is held of it stays, so that the text
    /// that goes out is the document's up to where it stopped, never a piece from its middle.
    bool abandon_document();

  protected:
    int_type overflow(int_type c) override;
    int sync() override { return failure == 0 ? 0 : -1; }

  private:
    bool write_out(const char* bytes, std::size_t count);

    int descriptor;
    int failure = 0;
    std::vector<char> buffer;
    std::size_t document_start = 0; // where the current document's text starts in the buffer
    bool document_went_out = false; // whether part of it was written already
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
