#ifndef JSON_DETAIL_UTF16_HPP
#define JSON_DETAIL_UTF16_HPP

// The grammar's conversion of a run of \u escapes: one text-encoding converter for a whole
// parse, made when the first run comes.

#include <json/detail/export.hpp>

#include <cstddef>
#include <string>

namespace json::detail {

/// Appends UTF-16 code units to a UTF-8 text, through the text-encoding library's converter,
/// which it makes once, at its first use, and keeps (json::detail::u16_to_u8 makes one per
/// call). An unpaired surrogate becomes U+FFFD.
class JSONVALUE_API Utf16Decoder {
  public:
    Utf16Decoder() noexcept;
    ~Utf16Decoder();
    Utf16Decoder(const Utf16Decoder&) = delete;
    Utf16Decoder& operator=(const Utf16Decoder&) = delete;

    /// Appends the UTF-8 text of the `count` code units at `units` to `text`. Linear. Throws
    /// std::bad_alloc and what the converter throws; `text` keeps its bytes then.
    void append(std::string& text, const char16_t* units, std::size_t count);

  private:
    class Converter;
    // Owned; a plain pointer, so that this header does not bring in <memory>.
    Converter* converter = nullptr;
};

} // namespace json::detail

#endif
