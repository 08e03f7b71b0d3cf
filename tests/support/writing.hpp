#ifndef JSON_TESTS_WRITING_HPP
#define JSON_TESTS_WRITING_HPP

// What the tests of the writers write onto: a stream buffer that keeps the text it is given,
// notes where each flush came, and can be made to refuse its writes.

#include <cstddef>
#include <streambuf>
#include <string>
#include <vector>

namespace test_support {

/// Keeps the text and its size at each flush; once `broken`, refuses every write (the stream
/// sets badbit, and throws when its exceptions ask for that). Without `keep_text` it drops the
/// text and only notes the flushes: the pretty text of a deeply nested document is tens of
/// gigabytes of indentation.
class WrittenText : public std::streambuf {
  public:
    std::string text;
    std::vector<std::size_t> flushes;
    bool broken = false;
    bool keep_text = true;

  protected:
    int_type overflow(int_type c) override {
        if (keep_text) {
            text.push_back(traits_type::to_char_type(c));
        }
        return broken ? traits_type::eof() : c;
    }
    std::streamsize xsputn(const char* bytes, std::streamsize count) override {
        if (keep_text) {
            text.append(bytes, static_cast<std::size_t>(count));
        }
        return broken ? 0 : count;
    }
    int sync() override {
        flushes.push_back(text.size());
        return 0;
    }
};

} // namespace test_support

#endif
