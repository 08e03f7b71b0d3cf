#ifndef JSONFMT_OUTPUT_HPP
#define JSONFMT_OUTPUT_HPP

// The one way a document goes from the parser to the writer, and so the one place that decides
// its verdict: --check runs it too, with the text thrown away.

#include "color_buffer.hpp"
#include "file_output.hpp"
#include "key_sorter.hpp"
#include "pointer_filter.hpp"
#include "raw_string.hpp"
#include "settings.hpp"

#include <json/events.hpp>
#include <json/writer.hpp>

#include <ostream>
#include <stdexcept>
#include <streambuf>
#include <string>

namespace jsonfmt {

/// What became of one document.
struct DocumentResult {
    json::ParseReport report;
    std::string pointer_problem; // why --pointer found no value, or empty
    std::string unwritable;      // why --ascii could not write a string, or empty
    bool cut = false;            // part of its text went out before it failed

    bool written() const { return report && pointer_problem.empty() && unwritable.empty(); }
};

/// A stream buffer that keeps nothing: where --check writes.
class Discard : public std::streambuf {
  protected:
    int_type overflow(int_type c) override { return traits_type::not_eof(c); }
    std::streamsize xsputn(const char*, std::streamsize count) override { return count; }
};

/// Writes documents, or the values at the pointer, onto one output as they are parsed, coloured
/// with --color.
class Output {
  public:
    /// `keeps_cut_text`: whether text written goes out for good (standard output, a device),
    /// not into a file that a failure discards.
    Output(const Settings& settings, int descriptor, std::string destination, bool keeps_cut_text)
        : settings(settings), destination(std::move(destination)), keeps_cut_text(keeps_cut_text),
          buffer(descriptor), colors(buffer),
          stream(settings.color ? static_cast<std::streambuf*>(&colors) : &buffer),
          discarding(&discarded) {}

    /// Parses one document with `parse`, called with the handler of its events, and writes it
    /// and a newline (with --check, into nothing). A document that fails is taken back, unless
    /// more of its text than the buffer holds went out: then what went out stays, ended by a
    /// newline (and the colour it was in), and the result says so.
    template <typename Parse>
    DocumentResult document(Parse&& parse) {
        std::ostream& out = settings.check_only ? discarding : stream;
        buffer.begin_document();
        DocumentResult result;
        try {
            result = verdict(parse, out);
        } catch (const std::invalid_argument& error) { // --ascii and a string that is not UTF-8
            result.unwritable = error.what();
        } catch (...) {
            take_back();
            stream.clear();
            throw;
        }
        // A Writer that went before its document was complete set failbit.
        out.clear(out.rdstate() & ~std::ios::failbit);
        if (result.written()) {
            out.put('\n');
        } else if (!take_back()) {
            stream.put('\n');
            result.cut = keeps_cut_text;
        }
        return result;
    }

    const std::string& name() const { return destination; }

    /// Hands on what is written so far, so that a message that follows comes after it where
    /// both go to one terminal. A failure is kept for finish() to report.
    void flush() { buffer.finish(); }

    /// Hands everything written on; false (after saying why) when writing failed.
    bool finish();

  private:
    // Takes the document's text back, its colours with it: true. False when part of it went
    // out already: then a colour that is on ends where its text stops.
    bool take_back() {
        if (buffer.abandon_document()) {
            colors.forget();
            return true;
        }
        colors.cut();
        return false;
    }

    // The document's events go to a Writer, through the pointer's filter, the raw string's
    // check and the key sorter when asked for. --check does not sort: the order of members
    // changes no verdict, and it holds nothing but the text.
    template <typename Parse>
    DocumentResult verdict(Parse& parse, std::ostream& out) {
        json::Writer writer(out, settings.write_options);
        if (settings.sort_keys && !settings.check_only) {
            KeySorter sorter(writer);
            return parse_into(sorter, parse);
        }
        return parse_into(writer, parse);
    }

    // A string written raw goes around the colours (it is not JSON) to where the text goes.
    template <typename Sink, typename Parse>
    DocumentResult parse_into(Sink& sink, Parse& parse) {
        std::streambuf* const text =
            settings.check_only ? static_cast<std::streambuf*>(&discarded) : &buffer;
        RawString<Sink> value(sink, settings.raw ? text : nullptr);
        DocumentResult result;
        if (!settings.pointer) {
            result.report = parse(value);
            return result;
        }
        PointerFilter<RawString<Sink>> filter(*settings.pointer, value);
        result.report = parse(filter);
        if (result.report) {
            result.pointer_problem = filter.problem();
        }
        return result;
    }

    const Settings& settings;
    std::string destination;
    bool keeps_cut_text;
    DescriptorBuffer buffer;
    ColorBuffer colors; // used with --color only
    std::ostream stream;
    Discard discarded;
    std::ostream discarding;
};

} // namespace jsonfmt

#endif
