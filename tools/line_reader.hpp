#ifndef JSONFMT_LINE_READER_HPP
#define JSONFMT_LINE_READER_HPP

// --lines: a file taken one line at a time, in memory that follows the longest line.

#include "descriptor_input.hpp"

#include <cstddef>
#include <string>

namespace jsonfmt {

/// Reads the lines of a DescriptorInput, each without its line feed. A line too long for the
/// memory there is is not the end of the file: it is skipped and measured, and the lines after
/// it are read as usual.
class LineReader {
  public:
    explicit LineReader(DescriptorInput& input) : input(input) {}

    /// What the last call of next() read.
    struct Line {
        std::size_t number = 0; ///< 1 for the first line
        std::size_t length = 0; ///< its length in bytes, without the line feed
        bool held = true;       ///< false when it did not fit in memory: text() is empty
    };

    /// Reads the next line; false at the end of the file. Throws std::system_error when a read
    /// fails.
    bool next();
    const Line& line() const { return current; }
    /// The text of the line read last (empty when it was not held).
    const std::string& text() const { return held_text; }

  private:
    DescriptorInput& input;
    Line current;
    std::string held_text;
};

} // namespace jsonfmt

#endif
