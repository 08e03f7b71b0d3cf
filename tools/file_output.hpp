#ifndef JSONFMT_FILE_OUTPUT_HPP
#define JSONFMT_FILE_OUTPUT_HPP

// Where jsonfmt's text goes: a file descriptor written in large pieces, and a file replaced
// safely in place.

#include <array>
#include <streambuf>
#include <string>

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

/// A temporary file in the directory of the file `name` (the file a symbolic link leads to),
/// renamed over that file by commit() once it has been written and flushed to disk, with the
/// original's permission bits. Until then the
/// original is untouched; a Replacement that is not committed removes its file. Failures
/// throw std::system_error naming the step.
class Replacement {
  public:
    explicit Replacement(const std::string& name);
    ~Replacement();
    Replacement(const Replacement&) = delete;
    Replacement& operator=(const Replacement&) = delete;

    /// The temporary file's descriptor, open for writing.
    int descriptor() const { return temporary; }
    /// Flushes the temporary file to disk, gives it the original's permission bits and
    /// renames it over the original.
    void commit();

  private:
    std::string path;
    std::string temporary_path;
    unsigned mode = 0;
    int temporary = -1;
};

} // namespace jsonfmt

#endif
