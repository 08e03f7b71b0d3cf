#ifndef JSON_WRITER_HPP
#define JSON_WRITER_HPP

#include <json/detail/export.hpp>
#include <json/serializer.hpp>
#include <json/value.hpp>

#include <iosfwd>
#include <string>
#include <string_view>

namespace json {

/// Writes JSON text from events, without a document: one top-level value, made of scalars and
/// of containers opened and closed in turn, members written in the order their events come.
///
/// The text is the one json::serialize writes with the same WriteOptions: events that walk a
/// Value (members in key order, members holding Undefined left out, Undefined elements as
/// null) give serialize(value, options) byte for byte. On a stream the Writer holds a buffer of
/// a fixed size, not the text, so memory does not grow with the text, only with the depth of
/// nesting.
///
/// It never writes invalid JSON, whatever the options. An event out of place (a member name
/// outside an object or where its value is due, a value where a member name belongs, a
/// container closed that is not the innermost open one, a second top-level value) throws
/// std::logic_error; a number text that is not a JSON number, and a string or member name that
/// is not well-formed UTF-8 (anywhere inside a value() too), throw std::invalid_argument
/// naming the offending byte; such a call writes nothing and the Writer goes on as if it had
/// not been made. Two options write what a strict reader refuses, for callers who ask for it
/// by name: WriteOptions::allow_invalid_utf8 passes such bytes through. NaN and the
/// infinities, which have no JSON number, are written as the strings "NaN", "Inf" and "-Inf"
/// as json::serialize writes them, valid JSON that reads back as strings; with
/// WriteOptions::reject_non_finite they are refused instead (std::invalid_argument). Any other
/// exception (std::bad_alloc, the stream's own) leaves the text written so far and the Writer
/// unusable: each later event throws std::logic_error.
///
/// An incomplete document is never handed on silently: when the Writer is destroyed after its
/// top-level value began but before it was complete (a parse that failed half-way, an
/// exception), a string is cut back to what it held before the Writer was made, and a stream
/// is given nothing more of what the Writer holds and gets failbit set (so that a caller who
/// checks the stream sees it; what went out already, when the Writer's buffer filled or at
/// flush(), cannot be taken back).
///
/// The events are those a handler of parsing events receives, so a Writer can be handed to an
/// event parser as it is. Each returns true.
class JSONVALUE_API Writer {
  public:
    /// Appends the text to `text`. The Writer gathers the text in a buffer of its own and,
    /// once it outgrows that, writes into the string's own storage, whose size may run ahead
    /// of the text: while a value is being written the string may lag behind the text or run
    /// ahead of it, and it holds exactly what it held before plus the text written once the
    /// top-level value is complete, after flush(), and once the Writer is destroyed. Until
    /// then the string must not be changed but through the Writer. Throws std::bad_alloc.
    explicit Writer(std::string& text, const WriteOptions& options = {});
    /// Writes the text onto `out` as json::serialize writes it (newlines and escapes do not
    /// depend on the stream's locale or flags), through the stream's write() whenever its
    /// buffer is full and once the top-level value is complete; nothing else flushes the
    /// stream but flush(). A bad stream receives nothing. Throws std::bad_alloc.
    explicit Writer(std::ostream& out, const WriteOptions& options = {});
    /// A complete document: hands on what is still buffered, as flush() does but without
    /// flushing the stream; an exception from the stream is swallowed (call flush() first to
    /// see it). An incomplete one: see above. Throws nothing.
    ~Writer();
    Writer(const Writer&) = delete;
    Writer& operator=(const Writer&) = delete;

    /// The literal null.
    bool null();
    /// true or false.
    bool boolean(bool value);
    /// A number written as its text is given, which must be a JSON number (`-0.5e+3`, not
    /// `01`, `1.`, `+1`, `.5`, `NaN` or an empty text). Linear in the text's length.
    bool number(std::string_view literal);
    /// A number in the shortest text that reads back to the same value, as serialize writes
    /// it; NaN and the infinities, which have no JSON number, as the strings "NaN", "Inf" and
    /// "-Inf" as serialize writes them, or refused with WriteOptions::reject_non_finite.
    bool number(double value);
    /// A string, given in UTF-8 and escaped as the options ask. Linear in its length. Throws
    /// std::invalid_argument when it is not well-formed UTF-8 (see above).
    bool string(std::string_view utf8);
    /// The name of the next member of the innermost open object, as string() takes it.
    bool key(std::string_view utf8);
    /// Opens an array.
    bool begin_array();
    /// Closes the innermost open array.
    bool end_array();
    /// Opens an object.
    bool begin_object();
    /// Closes the innermost open object; throws std::logic_error when a member name was given
    /// without its value.
    bool end_object();
    /// A whole document in place: the text serialize writes for it, indented for its depth.
    /// Undefined has no text: as an element it is written null and inside `document` members
    /// holding it are left out, as serialize does; alone at the top level it writes nothing
    /// (the top-level value is still to come). As a member's value it throws
    /// std::invalid_argument (serialize would leave out the whole member, whose name is
    /// already written). Its strings and member names are checked before anything is written
    /// (and its numbers, with reject_non_finite): a refusal names the place in `document`.
    /// Linear in the size of the document, with a bounded call stack.
    bool value(const Value& document);

    /// Whether the top-level value is complete. Throws nothing.
    bool complete() const noexcept;
    /// Hands on every byte written so far: the string then holds exactly the text; the stream
    /// is given it with write() and then flushed. Throws what the stream throws.
    void flush();

  private:
    class State;
    // Owned; a plain pointer, so that this header does not bring in <memory>.
    State* state;
};

} // namespace json

#endif
