#ifndef JSON_SRC_STRING_STREAM_HPP
#define JSON_SRC_STRING_STREAM_HPP

#include <ostream>
#include <streambuf>
#include <string>
#include <vector>

namespace json::detail {

/// An output stream in its default state, like a std::ostringstream, built for handing its
/// text over at the end. A std::ostringstream copies its text once more in str() (C++17), and
/// its buffer, grown by doubling, copies the text while it grows and touches fresh pages at
/// each step. This one gathers the text in pieces of a fixed size, which the allocator
/// reuses, and joins them once, into a string of the exact size; a text of one piece is
/// handed over without any copy.
class StringStream : public std::ostream {
  public:
    StringStream() : std::ostream(nullptr) { init(&buffer); }

    /// The text written, moved out of the stream.
    std::string take() { return buffer.take(); }

  private:
    class PieceBuffer : public std::streambuf {
      public:
        std::string take() {
            if (pieces.size() == 1) {
                return std::move(pieces.front());
            }
            std::size_t size = 0;
            for (const std::string& piece : pieces) {
                size += piece.size();
            }
            std::string text;
            text.reserve(size);
            for (const std::string& piece : pieces) {
                text += piece;
            }
            return text;
        }

      private:
        static constexpr std::size_t PIECE = 64 * 1024;

        int_type overflow(int_type c) override {
            if (!traits_type::eq_int_type(c, traits_type::eof())) {
                const char byte = traits_type::to_char_type(c);
                xsputn(&byte, 1);
            }
            return traits_type::not_eof(c);
        }

        std::streamsize xsputn(const char* bytes, std::streamsize count) override {
            auto left = static_cast<std::size_t>(count);
            while (left > 0) {
                if (pieces.empty() || pieces.back().size() == PIECE) {
                    pieces.emplace_back().reserve(PIECE);
                }
                std::string& piece = pieces.back();
                const std::size_t taken = std::min(left, PIECE - piece.size());
                piece.append(bytes, taken);
                bytes += taken;
                left -= taken;
            }
            return count;
        }

        std::vector<std::string> pieces;
    };

    PieceBuffer buffer;
};

} // namespace json::detail

#endif
