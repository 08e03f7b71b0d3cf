#ifndef JSON_DETAIL_RUN_PARSER_HPP
#define JSON_DETAIL_RUN_PARSER_HPP

// Setting a parser up and running it over a text or a stream: the one way every reader
// (json::parse, json::validate, json::parse_events) drives the grammar.

#include <json/detail/export.hpp>
#include <json/detail/grammar.hpp>
#include <json/detail/workspace.hpp>
#include <json/parse_options.hpp>

#include <algorithm>
#include <cstddef>
#include <iosfwd>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

namespace json::detail {

/// Where a text read so far stands: how many bytes lie before a point of it, on which line
/// that point is and where that line starts. A line ends with a line feed, a carriage return,
/// or both in that order (one line end). The pieces of a stream are counted as they are left
/// behind, so that a failure in the piece at hand is placed from the start of the text.
struct TextPosition {
    std::size_t offset = 0;     // bytes counted
    std::size_t line = 1;       // the line `offset` is on
    std::size_t line_start = 0; // the offset of that line's first byte
    bool after_return = false;  // the last byte counted was a carriage return

    void advance(std::string_view text) {
        if (text.empty()) {
            return;
        }
        if (text.find('\r') == std::string_view::npos && !after_return) {
            // Line feeds alone, as in most texts: counted at once.
            const std::size_t last_newline = text.rfind('\n');
            if (last_newline != std::string_view::npos) {
                line += static_cast<std::size_t>(std::count(text.begin(), text.end(), '\n'));
                line_start = offset + last_newline + 1;
            }
        } else {
            for (std::size_t at = 0; at < text.size(); ++at) {
                if (text[at] != '\n' && text[at] != '\r') {
                    continue;
                }
                // The line feed of a CR LF pair ends no line of its own.
                const bool pair_end =
                    text[at] == '\n' && (at == 0 ? after_return : text[at - 1] == '\r');
                line += pair_end ? 0 : 1;
                line_start = offset + at + 1;
            }
        }
        after_return = text.back() == '\r';
        offset += text.size();
    }

    /// Places a failure at `at` (from the start of the text) in `report`, `rest` being the
    /// text from `offset` on.
    void locate(ParseReport& report, std::string_view rest, std::size_t at) const {
        TextPosition there = *this;
        there.advance(rest.substr(0, at - offset));
        report.offset = at;
        report.line = there.line;
        report.column = at - there.line_start + 1;
    }
};

/// The report of a grammar that ended with `result`, a failure at its failure_offset().
template <typename Grammar>
ParseReport failure_report(ParseResult result, Grammar& grammar, const TextPosition& position,
                           std::string_view rest) {
    ParseReport report;
    report.result = result;
    report.refusal = grammar.refusal();
    report.note = grammar.take_note();
    position.locate(report, rest, grammar.failure_offset());
    return report;
}

/// Reads a std::istream in pieces for the grammar, as the standard input functions read:
/// whitespace is not skipped, a stream that failed before anything was read is not readable,
/// and a stream buffer that throws sets badbit (its own exception passes on when the caller
/// enabled exceptions for badbit). Memory: only what it is asked to append.
class JSONVALUE_API StreamPieces {
  public:
    explicit StreamPieces(std::istream& in);

    /// Appends up to `count` bytes of the stream to `text`; false when none follows them (the
    /// stream ended, or failed: failure() says so). Sets eofbit at the end of the stream.
    /// Throws what the stream buffer throws when the caller enabled exceptions for badbit,
    /// and std::bad_alloc.
    bool append(std::string& text, std::size_t count);

    /// Why the stream gave no more text although it did not end, or null.
    const char* failure() const { return failure_note; }

  private:
    std::istream& in;
    bool started = false;
    const char* failure_note = nullptr;
};

/// The refusal of a text longer than `max_size` bytes (ParseOptions::max_size), placed at its
/// start: it is refused as a whole.
JSONVALUE_API ParseReport too_large(std::size_t max_size);

/// Feeds `grammar` the text of `in` piece by piece and reports the outcome; a text longer than
/// `max_size` is refused once max_size + 1 bytes are read, without reading further. Memory:
/// the open containers, the longest token and one piece, never the whole text.
template <typename Grammar>
ParseReport feed_stream(std::istream& in, Grammar& grammar, TextPosition& position,
                        std::string& rest, std::size_t max_size) {
    constexpr std::size_t piece = std::size_t{64} * 1024;
    StreamPieces pieces(in);
    std::size_t asked = piece;
    for (;;) {
        // The bytes read so far are at most max_size here (the loop ends when they are more),
        // and at most one byte beyond max_size is asked for.
        const std::size_t allowed = max_size - (position.offset + rest.size());
        const bool more = pieces.append(rest, allowed < asked ? allowed + 1 : asked);
        if (pieces.failure() != nullptr) {
            ParseReport report;
            report.result = ParseResult::UNEXPECTED_END_OF_INPUT;
            report.note = pieces.failure();
            position.locate(report, rest, position.offset + rest.size());
            return report;
        }
        if (position.offset + rest.size() > max_size) {
            return too_large(max_size);
        }
        const ParseResult result = grammar.feed(rest.data(), rest.data() + rest.size(), !more);
        if (result != Grammar::NEED_MORE) {
            return result == ParseResult::SUCCESS ? ParseReport()
                                                  : failure_report(result, grammar, position, rest);
        }
        // The rest of the piece is a token begun: it is read again with the next piece. A
        // token that takes many pieces makes them grow, so that it is read again only as
        // often as its length doubles.
        const std::size_t consumed = grammar.consumed();
        position.advance(std::string_view(rest).substr(0, consumed));
        rest.erase(0, consumed);
        asked = consumed == 0 ? asked + rest.size() : piece;
    }
}

template <typename Handler, typename = void>
struct explains_refusals : std::false_type {};
template <typename Handler>
struct explains_refusals<
    Handler, std::void_t<decltype(std::declval<Handler&>().explain(std::declval<ParseReport&>()))>>
    : std::true_type {};

/// Runs the grammar with `handler` over `text`, whole, and reports the outcome; a text longer
/// than ParseOptions::max_size is refused before the grammar sees it. A handler that refuses
/// the document itself (the document builder, the validator) has an explain(ParseReport&) that
/// puts its reason in the report.
template <typename Handler>
ParseReport run_parser(Handler& handler, const ParseOptions& options, Workspace& workspace,
                       std::string_view text) {
    if (text.size() > options.max_size) {
        return too_large(options.max_size);
    }
    Grammar<Handler> grammar(handler, options, workspace);
    const ParseResult result = grammar.feed(text.data(), text.data() + text.size(), true);
    ParseReport report = result == ParseResult::SUCCESS
                             ? ParseReport()
                             : failure_report(result, grammar, TextPosition(), text);
    if constexpr (explains_refusals<Handler>::value) {
        handler.explain(report);
    }
    return report;
}

/// The same over the rest of `in`, read in pieces (see feed_stream).
template <typename Handler>
ParseReport run_parser(Handler& handler, const ParseOptions& options, Workspace& workspace,
                       std::istream& in) {
    Grammar<Handler> grammar(handler, options, workspace);
    TextPosition position;
    std::string rest;
    ParseReport report = feed_stream(in, grammar, position, rest, options.max_size);
    if constexpr (explains_refusals<Handler>::value) {
        handler.explain(report);
    }
    return report;
}

} // namespace json::detail

#endif
