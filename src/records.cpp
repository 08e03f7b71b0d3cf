// Records one at a time: the grammar reads the stream in pieces, a document builder makes
// each record it completes, and next() hands them over in order.
#include "document_builder.hpp"

#include <json/detail/run_parser.hpp>
#include <json/records.hpp>

#include <cstddef>
#include <deque>
#include <new>
#include <optional>
#include <string_view>
#include <utility>

namespace json {

namespace {

// The grammar's handler: hands the events of each record to a document builder, which makes
// one record after another, and puts each record it completes in `finished`. The records lie
// `record_depth` containers deep in the text: 1 in a top-level array, 0 for texts one after
// another.
class RecordSplitter {
  public:
    RecordSplitter(const ParseOptions& options, detail::Workspace& workspace,
                   std::size_t record_depth, std::deque<Value>& finished)
        : builder(options, workspace), record_depth(record_depth), finished(finished) {}

    bool null() {
        return value([this] { return builder.null(); });
    }
    bool boolean(bool truth) {
        return value([this, truth] { return builder.boolean(truth); });
    }
    bool number(std::string_view literal) {
        return value([this, literal] { return builder.number(literal); });
    }
    bool string(std::string_view text) {
        return value([this, text] { return builder.string(text); });
    }
    bool key(std::string_view name) { return builder.key(name); }
    bool begin_array() {
        // The array around the records is not part of any.
        return depth++ < record_depth || builder.begin_array();
    }
    bool begin_object() {
        if (depth < record_depth) {
            return outside_the_array();
        }
        ++depth;
        return builder.begin_object();
    }
    bool end_array() { return --depth < record_depth || (builder.end_array() && completed()); }
    bool end_object() {
        --depth;
        return builder.end_object() && completed();
    }

    /// Puts the reason of a refusal in `report`, when it is the handler's.
    void explain(ParseReport& report) {
        if (!top_level_not_an_array) {
            builder.explain(report);
            return;
        }
        report.result = ParseResult::MISSING_LEADING_BRACKET;
        report.refusal = Refusal::NONE;
        report.note = "the records are the elements of a top-level array; "
                      "RecordReader::Layout::LINES reads JSON texts one after another";
    }

  private:
    template <typename Event>
    bool value(Event event) {
        return depth < record_depth ? outside_the_array() : event() && completed();
    }
    // A value is complete: a record, when it lies at the records' depth.
    bool completed() {
        if (depth == record_depth) {
            builder.take_into([this](auto&& initial) -> Value& {
                return finished.emplace_back(std::forward<decltype(initial)>(initial));
            });
        }
        return true;
    }
    // A top-level value that is not an array, where the records are its elements.
    bool outside_the_array() {
        top_level_not_an_array = true;
        return false;
    }

    detail::DocumentBuilder builder;
    const std::size_t record_depth;
    std::size_t depth = 0; // the containers open in the text
    std::deque<Value>& finished;
    bool top_level_not_an_array = false;
};

using RecordGrammar = detail::Grammar<RecordSplitter>;

} // namespace

class RecordReader::State {
  public:
    State(std::istream& in, const ParseOptions& options, Layout layout)
        : options(options), layout(layout), feed(in) {
        start_session(this->options);
    }

    bool next(Value& record);
    const ParseReport& report() const { return outcome; }
    bool at_end() const { return stage == Stage::ENDED; }
    void stop_at_exception() noexcept;

  private:
    // Where the reading stands.
    enum class Stage {
        READING,       // the grammar reads on
        STOPPED,       // at the end or a failure (the outcome), which next() is still to report
        AFTER_FAILURE, // a failure reported with Layout::LINES: next() goes on after its line
        ENDED,         // the end or a failure reported, which the reader cannot go on after
    };

    // A grammar with its handler, from where it began reading to its end: one for the whole
    // stream, or with Layout::LINES one more after each failure.
    struct Session {
        Session(const ParseOptions& options, Layout layout, std::deque<Value>& finished,
                std::size_t start)
            : splitter(options, workspace, layout == Layout::ARRAY ? 1 : 0, finished),
              grammar(splitter, options, workspace, layout == Layout::LINES), start(start) {}
        detail::Workspace workspace;
        RecordSplitter splitter;
        RecordGrammar grammar;
        const std::size_t start; // the offset in the stream where the grammar began
    };

    void read_piece();
    void go_past_line_break();
    void start_session(const ParseOptions& session_options) {
        session.emplace(session_options, layout, finished, feed.position().offset);
    }

    const ParseOptions options;
    const Layout layout;
    detail::StreamFeed feed;
    std::optional<Session> session;
    std::deque<Value> finished; // records complete and not yet handed over
    Stage stage = Stage::READING;
    ParseReport outcome;
};

bool RecordReader::State::next(Value& record) {
    if (finished.empty() && stage == Stage::AFTER_FAILURE) {
        go_past_line_break();
    }
    while (finished.empty() && stage == Stage::READING) {
        read_piece();
    }
    if (finished.empty()) {
        if (stage == Stage::STOPPED) {
            const bool line_to_skip = layout == Layout::LINES && !outcome && !feed.failed();
            stage = line_to_skip ? Stage::AFTER_FAILURE : Stage::ENDED;
        }
        return false;
    }
    record.swap(finished.front());
    finished.pop_front();
    return true;
}

// Feeds the grammar another piece of the stream, which may complete records, the last one, or
// end the reading with a failure.
void RecordReader::State::read_piece() {
    const ParseResult result = feed.feed(session->grammar, outcome, session->start);
    if (result == RecordGrammar::NEED_MORE) {
        return;
    }
    session->splitter.explain(outcome);
    if (layout == Layout::LINES && result == ParseResult::EMPTY_INPUT) {
        outcome = ParseReport(); // no record after the last one: the end
    }
    stage = Stage::STOPPED;
}

// After a failure with Layout::LINES: leaves the text behind up to the first line break from
// the failure on, and that break, reading on as far as it takes, and starts a fresh grammar
// after it. A byte order mark is allowed only at the start of the stream, even with allow_bom.
void RecordReader::State::go_past_line_break() {
    std::size_t from = outcome.offset - feed.position().offset;
    for (;;) {
        const std::size_t line_break = feed.unconsumed().find_first_of("\n\r", from);
        if (line_break != std::string_view::npos) {
            feed.drop(line_break + 1);
            break;
        }
        feed.drop(feed.unconsumed().size());
        from = 0;
        const bool more = feed.read();
        if (feed.failed() || (!more && feed.unconsumed().empty())) {
            // The stream failed, or the failure was on the last line: the end.
            outcome = feed.failed() ? feed.stream_failure() : ParseReport();
            stage = Stage::STOPPED;
            return;
        }
    }
    ParseOptions after_start = options;
    after_start.allow_bom = false;
    start_session(after_start);
    outcome = ParseReport();
    stage = Stage::READING;
}

void RecordReader::State::stop_at_exception() noexcept {
    finished.clear();
    stage = Stage::ENDED;
    outcome = ParseReport();
    outcome.result = ParseResult::UNEXPECTED_END_OF_INPUT;
    feed.position().locate(outcome, {}, feed.position().offset); // where the rest starts
    try {
        outcome.note = "an exception stopped the reading";
    } catch (const std::bad_alloc&) { // NOLINT(bugprone-empty-catch): the note is left out
    }
}

RecordReader::RecordReader(std::istream& in, const ParseOptions& options, Layout layout)
    : state(new State(in, options, layout)) {}

RecordReader::~RecordReader() {
    delete state;
}

bool RecordReader::next(Value& record) {
    try {
        return state->next(record);
    } catch (...) {
        state->stop_at_exception();
        throw;
    }
}

const ParseReport& RecordReader::report() const noexcept {
    return state->report();
}

bool RecordReader::at_end() const noexcept {
    return state->at_end();
}

} // namespace json
