// The parse options a fuzz target tries: the switches of json::ParseOptions taken from the
// bits of the input's first byte, so that every combination is explored with every text.
#ifndef JSONVALUE_FUZZ_PARSE_OPTIONS_HPP
#define JSONVALUE_FUZZ_PARSE_OPTIONS_HPP

#include <json/parse_options.hpp>

#include <cstddef>
#include <cstdint>
#include <string_view>

// Splits the input into the options (its first byte) and the text (the rest).
inline json::ParseOptions options_and_text(const std::uint8_t* data, std::size_t size,
                                           std::string_view& text) {
    json::ParseOptions options;
    if (size == 0) {
        text = {};
        return options;
    }
    const unsigned switches = data[0];
    options.allow_comments = (switches & 1U) != 0;
    options.allow_trailing_commas = (switches & 2U) != 0;
    options.allow_invalid_utf8 = (switches & 4U) != 0;
    options.allow_lone_surrogates = (switches & 8U) != 0;
    options.reject_duplicate_keys = (switches & 16U) != 0;
    options.exact_numbers = (switches & 32U) != 0;
    options.allow_bom = (switches & 64U) != 0;
    options.allow_inexact_integers = (switches & 128U) != 0; // the two number switches together
    options.allow_overflow = (switches & 128U) != 0;
    text = std::string_view(reinterpret_cast<const char*>(data + 1), size - 1);
    return options;
}

#endif
