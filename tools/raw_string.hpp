#ifndef JSONFMT_RAW_STRING_HPP
#define JSONFMT_RAW_STRING_HPP

// --raw: a document (or the value at the pointer) that is a string is written as its text.

#include <streambuf>
#include <string_view>

namespace jsonfmt {

/// A handler of the parsing events of one value that passes them on to `next`, except when
/// raw text is asked for (a buffer given) and the value is a string: its text then goes onto
/// that buffer as it is, without quotes or escapes (not JSON, so not through `next`).
template <typename Next>
class RawString {
  public:
    /// `raw`: where a string's text goes, or null to pass every event on.
    RawString(Next& next, std::streambuf* raw) : next(next), raw(raw) {}

    bool null() { return started() && next.null(); }
    bool boolean(bool value) { return started() && next.boolean(value); }
    bool number(std::string_view literal) { return started() && next.number(literal); }
    bool string(std::string_view utf8) {
        if (raw != nullptr && !began) {
            began = true;
            // A failed write is the buffer's to report, as for all the text written there.
            raw->sputn(utf8.data(), static_cast<std::streamsize>(utf8.size()));
            return true;
        }
        return started() && next.string(utf8);
    }
    bool key(std::string_view utf8) { return next.key(utf8); }
    bool begin_array() { return started() && next.begin_array(); }
    bool end_array() { return next.end_array(); }
    bool begin_object() { return started() && next.begin_object(); }
    bool end_object() { return next.end_object(); }

  private:
    // The value has begun, as something else than a string written raw.
    bool started() {
        began = true;
        return true;
    }

    Next& next;
    std::streambuf* raw;
    bool began = false;
};

} // namespace jsonfmt

#endif
