#include "color_buffer.hpp"

#include <utility>

namespace jsonfmt {

namespace {

// jq's default colours (select graphic rendition codes).
constexpr std::string_view RESET = "\033[0m";
constexpr std::string_view NULL_COLOR = "\033[1;30m";
constexpr std::string_view BOOLEAN_COLOR = "\033[0;39m"; // false and true alike
constexpr std::string_view NUMBER_COLOR = "\033[0;39m";
constexpr std::string_view STRING_COLOR = "\033[0;32m";
constexpr std::string_view NAME_COLOR = "\033[34;1m";
constexpr std::string_view PUNCTUATION_COLOR = "\033[1;39m"; // arrays' and objects' alike

bool is_whitespace(char c) {
    return c == ' ' || c == '\t' || c == '\n' || c == '\r';
}

bool is_punctuation(char c) {
    return c == '[' || c == ']' || c == '{' || c == '}' || c == ',' || c == ':';
}

// The bytes of a number or of true, false and null.
bool is_scalar_byte(char c) {
    return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || c == 'E' || c == '-' || c == '+' ||
           c == '.';
}

} // namespace

void ColorBuffer::forget() {
    token = Token::NONE;
    objects.clear();
    name_next = false;
}

void ColorBuffer::cut() {
    if (token != Token::NONE) {
        pass(RESET);
    }
    forget();
}

ColorBuffer::int_type ColorBuffer::overflow(int_type c) {
    if (traits_type::eq_int_type(c, traits_type::eof())) {
        return traits_type::not_eof(c);
    }
    const char byte = traits_type::to_char_type(c);
    return xsputn(&byte, 1) == 1 ? c : traits_type::eof();
}

// Each byte either goes on with the token it is in, or ends it (the reset goes out before the
// byte) and is whitespace or starts a token (its colour goes out before it). The text in
// between is handed on in runs.
std::streamsize ColorBuffer::xsputn(const char* text, std::streamsize count) {
    const std::string_view all(text, static_cast<std::size_t>(count));
    std::size_t passed = 0; // the bytes of `all` handed on
    const auto pass_up_to = [&](std::size_t end) {
        const bool passing = pass(all.substr(passed, end - passed));
        passed = end;
        return passing;
    };
    for (std::size_t at = 0; at < all.size(); ++at) {
        const char c = all[at];
        switch (token) {
        case Token::STRING:
            if (c == '\\') {
                token = Token::STRING_ESCAPE;
            } else if (c == '"') {
                token = Token::NONE;
                if (!pass_up_to(at + 1) || !pass(RESET)) {
                    return 0;
                }
            }
            continue;
        case Token::STRING_ESCAPE:
            token = Token::STRING;
            continue;
        case Token::SCALAR:
            if (is_scalar_byte(c)) {
                continue;
            }
            break;
        case Token::PUNCTUATION:
            if (is_punctuation(c)) {
                follow_structure(c);
                continue;
            }
            break;
        case Token::NONE:
            break;
        }
        if (token != Token::NONE) {
            token = Token::NONE;
            if (!pass_up_to(at) || !pass(RESET)) {
                return 0;
            }
        }
        if (!is_whitespace(c) && (!pass_up_to(at) || !start(c))) {
            return 0;
        }
    }
    return pass_up_to(all.size()) ? count : 0;
}

bool ColorBuffer::pass(std::string_view text) {
    const auto size = static_cast<std::streamsize>(text.size());
    return size == 0 || target.sputn(text.data(), size) == size;
}

// A token starts with `first`: its colour goes out, and the structure follows it.
bool ColorBuffer::start(char first) {
    if (first == '"') {
        token = Token::STRING;
        return pass(std::exchange(name_next, false) ? NAME_COLOR : STRING_COLOR);
    }
    if (is_punctuation(first)) {
        token = Token::PUNCTUATION;
        follow_structure(first);
        return pass(PUNCTUATION_COLOR);
    }
    token = Token::SCALAR;
    if (first == 'n') {
        return pass(NULL_COLOR);
    }
    return pass(first == 't' || first == 'f' ? BOOLEAN_COLOR : NUMBER_COLOR);
}

// A string that opens is a member name right after `{`, and after `,` in an object.
void ColorBuffer::follow_structure(char punctuation) {
    switch (punctuation) {
    case '{':
    case '[':
        objects.push_back(punctuation == '{');
        name_next = punctuation == '{';
        break;
    case '}':
    case ']':
        if (!objects.empty()) {
            objects.pop_back();
        }
        name_next = false;
        break;
    case ',':
        name_next = !objects.empty() && objects.back();
        break;
    default: // ':'
        name_next = false;
        break;
    }
}

} // namespace jsonfmt
