#ifndef JSONFMT_COLOR_BUFFER_HPP
#define JSONFMT_COLOR_BUFFER_HPP

// --color: the JSON text the writer lays out, coloured for a terminal on its way out.

#include <streambuf>
#include <string_view>
#include <vector>

namespace jsonfmt {

/// A stream buffer that passes JSON text on to another one with each token wrapped in a
/// terminal colour (an ANSI escape sequence before it, the reset sequence after it), in the
/// colours jq users know: member names, strings, numbers, literals and punctuation. Whitespace
/// goes through uncoloured; adjacent punctuation (`],`) shares one colour.
///
/// The text must be valid JSON, as a json::Writer writes it in any layout, followed by
/// whitespace, one document after another: it is read as it comes, in pieces of any size, and
/// nothing is held back. Whether a string is a member name is known when it opens (after `{`,
/// or after `,` in an object), so no token waits for what follows it; memory is one bit per
/// open container.
class ColorBuffer : public std::streambuf {
  public:
    explicit ColorBuffer(std::streambuf& target) : target(target) {}

    /// Forgets the document under way: its text was taken back from the target.
    void forget();
    /// Ends the document under way where its text stops, short of its end: the reset sequence
    /// goes out when a colour is on, so that the terminal is not left coloured. A failed write
    /// is the target's to report, as for the rest of the text.
    void cut();

  protected:
    int_type overflow(int_type c) override;
    std::streamsize xsputn(const char* text, std::streamsize count) override;
    int sync() override { return target.pubsync(); }

  private:
    // The token the text is in.
    enum class Token { NONE, STRING, STRING_ESCAPE, SCALAR, PUNCTUATION };

    bool pass(std::string_view text);
    bool start(char first);
    void follow_structure(char punctuation);

    std::streambuf& target;
    Token token = Token::NONE;
    std::vector<bool> objects; // for each open container, outermost first: is it an object
    bool name_next = false;    // whether a string that opens is a member name
};

} // namespace jsonfmt

#endif
