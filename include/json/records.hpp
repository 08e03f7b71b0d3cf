#ifndef JSON_RECORDS_HPP
#define JSON_RECORDS_HPP

// Reading a stream of records one at a time, each as a Value: the elements of a top-level
// array, or JSON texts one after another (JSON Lines, concatenated JSON).

#include <json/detail/export.hpp>
#include <json/fwd.hpp>
#include <json/parse_options.hpp>

#include <iosfwd>

namespace json {

/// Reads records from a std::istream one at a time, each handed over as a Value, with the
/// grammar of json::parse, in memory bounded by the largest record and a piece of the text: the
/// stream is read in pieces of 64 KiB, and the records one piece completes wait for next() as
/// Values (for the smallest records, such as `0` or `{}`, a few dozen times the piece's size).
/// Nothing handed over is kept.
///
///     json::RecordReader reader(in);
///     json::Value record;
///     while (reader.next(record)) {
///         total += json::value_to<double>(record.at("amount"));
///     }
///     if (!reader.report()) { /* the failure, with its line and column in the stream */ }
///
/// The options act on each record as json::parse applies them to a document:
/// reject_duplicate_keys and exact_numbers refuse the record that breaks them, max_depth
/// counts from the record's own top level with Layout::LINES; with Layout::ARRAY the
/// enclosing array is one level of it, so that the reader reads all the records of exactly
/// the texts json::parse accepts, and fails where it fails, with the same report. max_size
/// does not apply: a stream of records may be as long as it likes, since none of it is kept.
///
/// Lines, columns and offsets count from where the stream was when the reader was made. The
/// stream must outlive the reader; it is read as json::parse(std::istream&) reads it, and ends
/// as it does.
class JSONVALUE_API RecordReader {
  public:
    /// How the records lie in the stream.
    enum class Layout {
        /// The elements of one top-level array: `[{"id": 1}, {"id": 2}]`. A top-level value
        /// that is not an array fails with MISSING_LEADING_BRACKET at its first character; an
        /// empty array has no record, and an empty stream fails with EMPTY_INPUT, as
        /// json::parse does.
        ARRAY,
        /// JSON texts one after another, each directly after the one before or after
        /// whitespace: JSON Lines (a text on each line) and concatenated JSON. Any JSON value
        /// is a record; a stream of whitespace alone has none. After a failure, next() goes
        /// on with the text after the next line break (a line feed or a carriage return): the
        /// rest of the bad line is skipped, records on it after the failure included.
        LINES,
    };

    /// A reader of the records of `in` laid out as `layout` says, parsed with `options`.
    /// Reads nothing yet; constant time. Throws std::bad_alloc.
    explicit RecordReader(std::istream& in, const ParseOptions& options = {},
                          Layout layout = Layout::ARRAY);
    /// Throws nothing.
    ~RecordReader();
    RecordReader(const RecordReader&) = delete;
    RecordReader& operator=(const RecordReader&) = delete;

    /// Stores the next record in `record` and returns true, or returns false at the end of the
    /// records or at a failure, leaving `record` as it was; report() then says which. Records
    /// before a failure are all handed over first. With Layout::LINES, a call after a failure
    /// goes on after the line break that follows it. Linear in the length of the text read;
    /// memory as said above. Throws std::bad_alloc and, as json::parse(std::istream&) does,
    /// what the stream throws for the exceptions enabled on it; `record` is then as it was and
    /// the reader at its end: next() returns false, and report() gives UNEXPECTED_END_OF_INPUT
    /// with the note "an exception stopped the reading".
    bool next(Value& record);

    /// After next() returned false: success at the end of the records, otherwise the failure,
    /// with its line, column and offset in the stream and, for a refusal (reject_duplicate_keys,
    /// exact_numbers, max_depth, ...), its Refusal, as json::parse reports them; a stream that
    /// cannot give the text fails as with json::parse(std::istream&). Before that, success.
    /// Constant time; throws nothing.
    const ParseReport& report() const noexcept;

    /// Whether next() has nothing more to give: after the end of the records, after any failure
    /// with Layout::ARRAY, and with Layout::LINES after a failure of the stream itself or an
    /// exception, which no line break can be found after. A loop over the records of a JSON
    /// Lines stream, skipping bad ones, runs while it is false. Constant time; throws nothing.
    bool at_end() const noexcept;

  private:
    class State;
    // Owned; a plain pointer, so that this header does not bring in <memory>.
    State* state;
};

} // namespace json

#endif
