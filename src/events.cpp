#include "document_checks.hpp"
#include "number.hpp"

#include <json/events.hpp>

#include <algorithm>
#include <ios>
#include <istream>
#include <new>
#include <string>

namespace json {

namespace detail {

namespace {

// Sets badbit after the stream buffer threw, as the standard input functions do: without the
// std::ios::failure that setstate would throw when the caller enabled exceptions for badbit,
// so that the buffer's own exception can be rethrown instead.
void set_bad_without_throwing(std::istream& in) {
    const std::ios::iostate enabled = in.exceptions();
    in.exceptions(std::ios::goodbit);
    in.setstate(std::ios::badbit);
    try {
        in.exceptions(enabled); // sets the mask back first, then throws as the state is bad
    } catch (const std::ios::failure&) { // NOLINT(bugprone-empty-catch): replaced by the cause
    }
}

// Appends up to `count` bytes of `buffer`; false when it has ended. Only bytes the buffer holds
// are taken, so that every byte it handed over is in `text` before it is asked to refill: a
// buffer that throws while it refills has given all the bytes before the failure. Once some
// bytes are in, it is asked for more only when it says more are there (showmanyc), so that
// text from a pipe is taken as it comes, not when `count` bytes have come.
bool append_from(std::streambuf& buffer, std::string& text, std::size_t count) {
    using traits = std::streambuf::traits_type;
    std::size_t appended = 0;
    while (appended < count) {
        if (appended != 0 && buffer.in_avail() <= 0) {
            return true;
        }
        if (traits::eq_int_type(buffer.sgetc(), traits::eof())) { // refills an empty buffer
            return false;
        }
        // What the refilled buffer holds; a buffer without a get area gives one byte at a time.
        const std::streamsize held = buffer.in_avail();
        const std::size_t taken =
            held > 0 ? std::min(static_cast<std::size_t>(held), count - appended) : 1;
        const std::size_t before = text.size();
        text.resize(before + taken);
        const std::streamsize got =
            buffer.sgetn(&text[before], static_cast<std::streamsize>(taken));
        text.resize(before + static_cast<std::size_t>(got));
        appended += static_cast<std::size_t>(got);
    }
    return true;
}

// The handler of json::validate: builds nothing, and applies the options that concern a
// document as the document builder does.
class Validator {
  public:
    explicit Validator(const ParseOptions& options) : options(options) {}

    bool null() { return true; }
    bool boolean(bool) { return true; }
    // The literal is NUL-terminated (the grammar's copy).
    bool number(std::string_view literal) { return number_is_kept(literal, options, refusal); }
    bool string(std::string_view) { return true; }
    bool key(std::string_view name) {
        return !options.reject_duplicate_keys || repeated.add(name) || refusal.repeated_name(name);
    }
    bool begin_array() { return true; }
    bool end_array() { return true; }
    bool begin_object() {
        if (options.reject_duplicate_keys) {
            repeated.open_object();
        }
        return true;
    }
    bool end_object() {
        if (options.reject_duplicate_keys) {
            repeated.close_object();
        }
        return true;
    }

    void explain(ParseReport& report) { refusal.explain(report); }

  private:
    const ParseOptions options;
    DocumentRefusal refusal;
    MemberNames repeated;
};

} // namespace

ParseReport too_large(std::size_t max_size) {
    ParseReport report;
    report.result = ParseResult::UNEXPECTED_END_OF_INPUT;
    report.refusal = Refusal::TOO_LARGE;
    report.line = 1;
    report.column = 1;
    report.note = "the text is longer than the " + std::to_string(max_size) +
                  " bytes ParseOptions::max_size allows";
    return report;
}

StreamPieces::StreamPieces(std::istream& in) : in(in) {}

bool StreamPieces::append(std::string& text, std::size_t count) {
    if (!started) {
        started = true;
        // Failed before anything is read (a file that did not open): not an empty text.
        const bool unreadable = in.fail();
        const std::istream::sentry ready(in, true); // whitespace is the grammar's business
        if (!ready) {
            failure_note = unreadable ? "the stream was not readable" : nullptr;
            return false; // otherwise at the end already: an empty text
        }
    }
    try {
        if (append_from(*in.rdbuf(), text, count)) {
            return true;
        }
    } catch (const std::bad_alloc&) {
        throw;
    } catch (...) {
        set_bad_without_throwing(in);
        if ((in.exceptions() & std::ios::badbit) != 0) {
            throw;
        }
        failure_note = "the stream failed while it was read";
        return false;
    }
    in.setstate(std::ios::eofbit);
    return false;
}

} // namespace detail

ParseReport validate(std::string_view text, const ParseOptions& options) {
    detail::Validator validator(options);
    detail::Workspace workspace;
    return detail::run_parser(validator, options, workspace, text);
}

ParseReport validate(std::istream& in, const ParseOptions& options) {
    detail::Validator validator(options);
    detail::Workspace workspace;
    return detail::run_parser(validator, options, workspace, in);
}

} // namespace json
