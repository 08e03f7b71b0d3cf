#ifndef JSONFMT_SOURCES_HPP
#define JSONFMT_SOURCES_HPP

// Where a document's text comes from: a whole file read in pieces, or one line of JSON Lines.

#include "descriptor_input.hpp"
#include "diagnostics.hpp"

#include <json/events.hpp>

#include <algorithm>
#include <istream>
#include <string>
#include <string_view>
#include <utility>

namespace jsonfmt {

/// A whole file, or standard input, read in pieces: memory does not follow its length.
class StreamSource {
  public:
    explicit StreamSource(std::string name) : name(std::move(name)), input(this->name) {}

    /// The errno of a failure to open the file, or 0.
    int open_error() const { return input.open_error(); }
    /// The errno of a failure to read it, or 0: the document is refused then.
    int read_error() const { return input.read_error(); }

    template <typename Handler>
    json::ParseReport parse(Handler& handler, const json::ParseOptions& options) {
        std::istream in(&input);
        return json::parse_events(in, handler, options);
    }

    /// The same file read again from its start (only a regular file, as --in-place takes, can).
    StreamSource again() const { return StreamSource(name); }

    /// See lines_hint(), looked for in the pieces kept.
    std::string lines_hint(const json::ParseReport& report) const {
        const auto kept = input.kept(0, report.offset + 1);
        return jsonfmt::lines_hint(kept.text, kept.start, report);
    }

    /// The failing line, as far as the pieces kept around the failure hold it.
    void show(const json::ParseReport& report) const {
        const std::size_t before = std::min(report.offset, SHOWN_BEFORE);
        const auto kept = input.kept(report.offset - before, report.offset + SHOWN_AFTER + 1);
        show_failure_line(kept.text, kept.start, report);
    }

  private:
    std::string name;
    DescriptorInput input;
};

/// One line of JSON Lines, in memory.
struct LineSource {
    std::string_view text;

    int open_error() const { return 0; }
    int read_error() const { return 0; }

    template <typename Handler>
    json::ParseReport parse(Handler& handler, const json::ParseOptions& options) const {
        return json::parse_events(text, handler, options);
    }

    LineSource again() const { return *this; }

    /// Nothing: this is JSON Lines already.
    std::string lines_hint(const json::ParseReport&) const { return {}; }

    void show(const json::ParseReport& report) const { show_failure_line(text, 0, report); }
};

} // namespace jsonfmt

#endif
