#ifndef JSON_DETAIL_GRAMMAR_GAPS_HPP
#define JSON_DETAIL_GRAMMAR_GAPS_HPP

// What the grammar meets between tokens: comments, a byte order mark before the text, and the
// notes of failures that stand on them.

#include <json/detail/grammar_loop.hpp>

#include <algorithm>
#include <cstddef>
#include <string>
#include <string_view>

namespace json::detail {

// A UTF-8 byte order mark at the start of the text is skipped or refused; SUCCESS once what
// starts the text is known to be none (or was skipped).
template <typename Handler>
ParseResult Grammar<Handler>::byte_order_mark() {
    static constexpr std::string_view mark = "\xEF\xBB\xBF";
    const auto available = std::min(static_cast<std::size_t>(end - cursor), mark.size());
    const bool could_be_mark = std::string_view(cursor, available) == mark.substr(0, available);
    if (available < mark.size() && could_be_mark && !last) {
        return need_more(); // the next piece tells
    }
    if (available < mark.size() || !could_be_mark) {
        at_start = false; // the grammar reads what is there
        return ParseResult::SUCCESS;
    }
    if (!options.allow_bom) {
        return refuse(Refusal::BYTE_ORDER_MARK, ParseResult::MISSING_LEADING_DIGIT,
                      "a UTF-8 byte order mark (EF BB BF) is not JSON; ParseOptions::allow_bom "
                      "skips it");
    }
    cursor += mark.size();
    at_start = false;
    return ParseResult::SUCCESS;
}

// Records the note of a failure at the cursor. A failure on a '/' that starts what looks like
// a comment is about that comment, whatever the grammar expected there.
template <typename Handler>
ParseResult Grammar<Handler>::fail(ParseResult result, std::string_view note) {
    if (at('/') && end - cursor < 2 && !last) {
        return need_more(); // whether it starts a comment is known from the next piece
    }
    if (at('/')) {
        const bool comment_like = end - cursor >= 2 && (cursor[1] == '/' || cursor[1] == '*');
        if (!options.allow_comments && comment_like) {
            refused = Refusal::COMMENT;
            note = "comments are not JSON; ParseOptions::allow_comments accepts them";
        } else if (options.allow_comments) {
            note = comment_like ? "the comment is not closed" : "a comment starts with // or /*";
        }
    }
    failure_note = note;
    return result;
}

// Skips comments, each with the whitespace after it. Stops at anything else, or on a '/' that
// starts no complete comment, where the caller then fails. False when the piece ends inside a
// comment, or on a '/' that the next piece may make one.
template <typename Handler>
bool Grammar<Handler>::skip_comments() {
    while (at('/')) {
        if (end - cursor < 2) {
            return last;
        }
        if (cursor[1] == '/') {
            const char* const line_end =
                std::find_if(cursor + 2, end, [](char c) { return c == '\n' || c == '\r'; });
            if (line_end == end && !last) {
                return false;
            }
            cursor = line_end;
        } else if (cursor[1] == '*') {
            static constexpr std::string_view closing = "*/";
            const char* const closed = std::search(cursor + 2, end, closing.begin(), closing.end());
            if (closed == end) {
                return last;
            }
            cursor = closed + closing.size();
        } else {
            return true;
        }
        cursor = detail::skip_whitespace(cursor, end);
    }
    return true;
}

} // namespace json::detail

#endif
