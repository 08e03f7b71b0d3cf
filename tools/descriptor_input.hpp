#ifndef JSONFMT_DESCRIPTOR_INPUT_HPP
#define JSONFMT_DESCRIPTOR_INPUT_HPP

// Where jsonfmt's text comes from: a file descriptor read in pieces, the last two of which are
// kept so that a failure can be shown in its line.

#include <array>
#include <cstddef>
#include <streambuf>
#include <string>
#include <string_view>
#include <vector>

namespace jsonfmt {

/// A stream buffer that reads a file descriptor (standard input for "-", or a file it opens
/// and closes) in pieces of up to 64 KiB, with one read(2) each, so that text from a pipe is
/// taken as it comes. The piece before the current one is kept too: a parser reading through
/// the buffer fails within the last bytes it took, and kept() gives them back for the message.
///
/// Only the end of the file ends the text. A read interrupted by a signal is made again, one
/// on a descriptor in non-blocking mode that has nothing yet waits for input (poll(2)), and
/// any other failure throws std::system_error, so that a reader never takes the text read
/// so far for the whole of it; read_error() keeps the errno.
class DescriptorInput : public std::streambuf {
  public:
    /// Reads `name`, or standard input for "-". When the file does not open, open_error() says
    /// why and the text is empty.
    explicit DescriptorInput(const std::string& name);
    ~DescriptorInput() override;
    DescriptorInput(const DescriptorInput&) = delete;
    DescriptorInput& operator=(const DescriptorInput&) = delete;

    /// The errno of a failed open, or 0.
    int open_error() const { return open_failure; }
    /// The errno of a failed read, or 0.
    int read_error() const { return read_failure; }

    /// The bytes read and not yet taken, read first when there are none; empty at the end of
    /// the file. Throws std::system_error when the read fails.
    std::string_view peek();
    /// Takes `count` bytes of those peek() gave.
    void take(std::size_t count) { gbump(static_cast<int>(count)); }

    /// The bytes from offset `from` up to `to` (counted from the start of the text) that are
    /// still kept, and the offset of the first of them: a part of the range when its start
    /// was dropped or its end not read yet, an empty text when none of it is kept.
    struct Kept {
        std::string text;
        std::size_t start;
    };
    Kept kept(std::size_t from, std::size_t to) const;

  protected:
    int_type underflow() override;

  private:
    static constexpr std::size_t PIECE = std::size_t{64} * 1024;

    int descriptor;
    bool owned;
    int open_failure = 0;
    int read_failure = 0;
    std::array<std::vector<char>, 2> pieces; // the current one and the one before, alternating
    std::size_t current = 0;                 // which of them is the current one
    std::size_t current_start = 0;           // the offset of its first byte in the text
    std::size_t previous_size = 0;           // how many bytes the one before holds
};

} // namespace jsonfmt

#endif
