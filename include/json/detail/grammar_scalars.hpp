#ifndef JSON_DETAIL_GRAMMAR_SCALARS_HPP
#define JSON_DETAIL_GRAMMAR_SCALARS_HPP

// How the grammar reads the literals null, true and false, and numbers, which go to the
// handler as their literal text.

#include <json/detail/grammar_loop.hpp>
#include <json/detail/number_syntax.hpp>

#include <cstddef>
#include <cstring>
#include <string_view>

namespace json::detail {

template <typename Handler>
ParseResult Grammar<Handler>::literal(std::string_view word, ParseResult mismatch) {
    const auto available = static_cast<std::size_t>(end - cursor);
    if (available < word.size() || std::string_view(cursor, word.size()) != word) {
        if (!last && available < word.size() &&
            std::string_view(cursor, available) == word.substr(0, available)) {
            return need_more();
        }
        return fail(mismatch);
    }
    cursor += word.size();
    if (word[0] == 'n') {
        return tell_value([this] { return handler.null(); });
    }
    const bool truth = word[0] == 't';
    return tell_value([this, truth] { return handler.boolean(truth); });
}

template <typename Handler>
inline ParseResult Grammar<Handler>::number() {
    const char* const start = cursor;
    // The literal goes to the handler NUL-terminated: a short number is copied to the stack,
    // only a longer one goes through a reused string. Where the piece has them, its next 32
    // bytes are copied before the number is scanned (usually all of it), so that those stores
    // have reached the cache when a number reader takes the text in wide loads: loads over
    // stores still in flight would wait for them.
    constexpr std::size_t short_number = 64;
    constexpr std::size_t copied_ahead = 32;
    char text[short_number];
    const bool copy_ahead = end - start >= static_cast<std::ptrdiff_t>(copied_ahead);
    if (copy_ahead) {
        std::memcpy(text, start, copied_ahead);
    }
    // Scanned with local pointers, which the compiler keeps in registers (the member would be
    // written back at every digit); `cursor` takes the end at every exit.
    const NumberScan scan = scan_number(start, end);
    const char* const here = scan.end;
    if (here == end && !last) {
        return need_more(); // more digits may follow, or the text it still needs
    }
    if (scan.error != ParseResult::SUCCESS) {
        cursor = here;
        return fail(scan.error, scan.error == ParseResult::MISSING_LEADING_DIGIT
                                    ? "no JSON value starts here"
                                    : std::string_view());
    }
    cursor = here;
    const auto length = static_cast<std::size_t>(here - start);
    const char* literal_text = text;
    if (length < short_number) {
        if (!copy_ahead || length >= copied_ahead) {
            std::memcpy(text, start, length);
        }
        text[length] = '\0';
    } else {
        long_number.assign(start, here);
        literal_text = long_number.c_str();
    }
    return tell_value([this, literal_text, length] {
        return handler.number(std::string_view(literal_text, length));
    });
}

} // namespace json::detail

#endif
