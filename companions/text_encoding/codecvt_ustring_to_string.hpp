#ifndef CODECVT_USTRING_TO_STRING_HPP
#define CODECVT_USTRING_TO_STRING_HPP

// Text encoding: conversion of UTF-16 text to a named byte encoding. Exported in the global
// namespace; programs may substitute their own library with the same class.

#include <cstddef>
#include <string>

#define TEXT_ENCODING_API __attribute__((visibility("default")))

/// Converts UTF-16 text (char16_t code units in the machine's byte order) to the byte
/// encoding named at construction. "UTF-8" (any case, also "UTF8") is converted by the class
/// itself, exactly as RFC 3629 says; any other name goes through glibc's iconv.
///
/// Malformed UTF-16, a surrogate without its partner, becomes U+FFFD when `replace_malformed`
/// is true, and makes do_convert throw std::range_error when it is false. A character the
/// target encoding cannot represent makes do_convert throw std::range_error.
class TEXT_ENCODING_API codecvt_ustring_to_string {
  public:
    /// Throws std::invalid_argument, naming the encoding, when iconv does not know it.
    codecvt_ustring_to_string(const std::string& encoding, bool replace_malformed);
    ~codecvt_ustring_to_string();
    codecvt_ustring_to_string(const codecvt_ustring_to_string&) = delete;
    codecvt_ustring_to_string& operator=(const codecvt_ustring_to_string&) = delete;

    /// The `count` code units at `text` in the target encoding. A 0 unit is converted like any
    /// other. Throws std::bad_alloc and std::range_error (see above).
    std::string do_convert(const char16_t* text, std::size_t count) const;

  private:
    std::string encoding;
    bool replace_malformed;
    void* iconv_descriptor; // null for UTF-8, which needs no iconv
};

#endif
