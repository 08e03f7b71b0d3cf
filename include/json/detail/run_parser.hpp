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
#include <limits>
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

/// The report of a grammar that ended with `result`, a failure at its failure_offset() from
/// `start`, where the grammar began reading.
template <typename Grammar>
ParseReport failure_report(ParseResult result, Grammar& grammar, const TextPosition& position,
                           std::string_view rest, std::size_t start = 0) {
    ParseReport report;
    report.result = result;
    report.refusal = grammar.refusal();
    report.note = grammar.take_note();
    position.locate(report, rest, start + grammar.failure_offset());
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

/// A stream read in pieces for grammars: the text read and not yet consumed, and where that
/// rest starts in the stream. Memory: one piece and the longest token, never the whole text.
/// A stream longer than `max_size` bytes is refused once max_size + 1 bytes are read, without
/// reading further.
class StreamFeed {
  public:
    explicit StreamFeed(std::istream& in,
                        std::size_t max_size = std::numeric_limits<std::size_t>::max())
        : pieces(in), max_size(max_size) {}

    /// Reads another piece and feeds `grammar` the rest with it; the grammar began reading at
    /// offset `start` of the stream. Returns Grammar::NEED_MORE while the grammar needs more
    /// text, otherwise the outcome, with `report` set (a stream that failed included). Throws
    /// what StreamPieces::append and the grammar's handler throw, and std::bad_alloc.
    template <typename Grammar>
    ParseResult feed(Grammar& grammar, ParseReport& report, std::size_t start = 0) {
        const bool more = read();
        if (failed()) {
            report = stream_failure();
            return report.result;
        }
        if (rest_start.offset + rest.size() > max_size) {
            report = too_large(max_size);
            return report.result;
        }
        const ParseResult result = grammar.feed(rest.data(), rest.data() + rest.size(), !more);
        if (result != Grammar::NEED_MORE) {
            report = result == ParseResult::SUCCESS
                         ? ParseReport()
                         : failure_report(result, grammar, rest_start, rest, start);
            return result;
        }
        // The rest of the piece is a token begun: it is read again with the next piece. A
        // token that takes many pieces makes them grow, so that it is read again only as
        // often as its length doubles.
        const std::size_t consumed = grammar.consumed();
        drop(consumed);
        asked = consumed == 0 ? asked + rest.size() : PIECE;
        return result;
    }

    /// Appends the next piece to the rest; false when none follows (the stream ended, or
    /// failed: failed() says so). Throws as StreamPieces::append.
    bool read() {
        // At most max_size bytes are read before this (the feed ends when there are more), and
        // at most one byte beyond max_size is asked for.
        const std::size_t allowed = max_size - (rest_start.offset + rest.size());
        return pieces.append(rest, allowed < asked ? allowed + 1 : asked);
    }
    /// Whether the stream gave no more text although it did not end.
    bool failed() const { return pieces.failure() != nullptr; }
    /// The report of that failure, placed just after the last byte read.
    ParseReport stream_failure() const {
        ParseReport report;
        report.result = ParseResult::UNEXPECTED_END_OF_INPUT;
        report.note = pieces.failure();
        rest_start.locate(report, rest, rest_start.offset + rest.size());
        return report;
    }
    /// Leaves the first `count` bytes of the rest behind.
    void drop(std::size_t count) {
        rest_start.advance(std::string_view(rest).substr(0, count));
        rest.erase(0, count);
    }
    /// The text read and not yet consumed.
    std::string_view unconsumed() const { return rest; }
    /// Where it starts in the stream.
    const TextPosition& position() const { return rest_start; }

  private:
    static constexpr std::size_t PIECE = std::size_t{64} * 1024;
    StreamPieces pieces;
    TextPosition rest_start;
    std::string rest;
    std::size_t asked = PIECE;
    std::size_t max_size;
};

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

/// The same over the rest of `in`, read in pieces (see StreamFeed).
template <typename Handler>
ParseReport run_parser(Handler& handler, const ParseOptions& options, Workspace& workspace,
                       std::istream& in) {
    Grammar<Handler> grammar(handler, options, workspace);
    StreamFeed feed(in, options.max_size);
    ParseReport report;
    while (feed.feed(grammar, report) == Grammar<Handler>::NEED_MORE) {
    }
    if constexpr (explains_refusals<Handler>::value) {
        handler.explain(report);
    }
    return report;
}

} // namespace json::detail

#endif
