#include "document_modes.hpp"

#include "color_buffer.hpp"
#include "descriptor_input.hpp"
#include "diagnostics.hpp"
#include "file_output.hpp"
#include "settings.hpp"

#include <json/events.hpp>
#include <json/patch.hpp>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <istream>
#include <optional>
#include <ostream>
#include <stdexcept>
#include <unistd.h>

namespace jsonfmt {

namespace {

std::string shown_name(const std::string& name) {
    return name == "-" ? "<stdin>" : name;
}

// A number a double cannot hold and a repeated name are valid JSON that the document would
// change: said as jsonfmt says it of an unpaired surrogate, without the library's option that
// the note names after its ';'.
std::string build_failure_message(const json::ParseReport& report) {
    if (report.refusal != json::Refusal::INEXACT_NUMBER &&
        report.refusal != json::Refusal::DUPLICATE_KEY) {
        return failure_message(report);
    }
    return "valid JSON, but building the document would change it: " +
           report.note.substr(0, report.note.find(';'));
}

enum class Read { DONE, INVALID, UNREADABLE };

// Reads `name` ("-": standard input) into `document`, numbers a double cannot hold exactly and
// repeated names refused, and says on standard error why not, with the failing line. When
// everything must survive (--in-place without --lossy), a text with a comment or byte order
// mark that `options` admit is refused at the first of them.
Read read_document(const std::string& name, json::ParseOptions options, bool keep_everything,
                   json::Value& document) {
    options.exact_numbers = true;
    options.reject_duplicate_keys = true;
    json::ParseOptions first = options;
    if (keep_everything) {
        first.allow_comments = false;
        first.allow_bom = false;
    }
    DescriptorInput input(name);
    std::istream in(&input);
    const json::ParseReport report = json::parse(in, document, first);
    if (input.open_error() != 0) {
        complain(shown_name(name) + ": " + std::strerror(input.open_error()));
        return Read::UNREADABLE;
    }
    if (input.read_error() != 0) {
        complain(shown_name(name) + ": read failed: " + std::strerror(input.read_error()));
        return Read::UNREADABLE;
    }
    if (report) {
        return Read::DONE;
    }
    std::string message = build_failure_message(report);
    if (keep_everything) {
        DescriptorInput again(name);
        std::istream text(&again);
        if (json::validate(text, options)) {
            message = report.refusal == json::Refusal::BYTE_ORDER_MARK
                          ? "--in-place would drop the byte order mark (add --lossy to allow that)"
                          : "--in-place would drop this comment (add --lossy to allow that)";
        }
    }
    std::fprintf(stderr, "%s:%zu:%zu: error: %s\n", shown_name(name).c_str(), report.line,
                 report.column, message.c_str());
    const std::size_t before = std::min(report.offset, SHOWN_BEFORE);
    const auto kept = input.kept(report.offset - before, report.offset + SHOWN_AFTER + 1);
    show_failure_line(kept.text, kept.start, report);
    return Read::INVALID;
}

// Where the text goes: standard output (no path), a file written as it is (a device, a FIFO),
// or a file replaced once everything is written; coloured when `color` says so.
class Destination {
  public:
    Destination(const std::string& path, Replacement::Target target, bool color)
        : name(path.empty() ? "standard output" : path), descriptor(open(path, target)),
          buffer(descriptor), colors(buffer),
          out(color ? static_cast<std::streambuf*>(&colors) : &buffer) {}
    ~Destination() {
        if (owned) {
            ::close(descriptor);
        }
    }
    Destination(const Destination&) = delete;
    Destination& operator=(const Destination&) = delete;

    std::ostream& stream() { return out; }
    // Where text that is not JSON goes, around the colours.
    std::streambuf& text() { return buffer; }

    // Hands on what is written so far, so that a message that follows comes after it where
    // both go to one terminal; a failure is kept for finish().
    void flush() { buffer.finish(); }

    // Hands everything on; a replaced file takes the text's place only when `commit` is true.
    // False (after saying why) when writing failed.
    bool finish(bool commit) {
        bool written = buffer.finish() && out;
        int error = buffer.error();
        if (owned && ::close(std::exchange(descriptor, -1)) != 0 && written) {
            written = false;
            error = errno;
        }
        owned = false;
        if (!written) {
            complain("writing " + name + ": " + std::strerror(error));
            return false;
        }
        if (commit && replacement) {
            replacement->commit();
        }
        return true;
    }

  private:
    int open(const std::string& path, Replacement::Target target) {
        if (path.empty()) {
            return STDOUT_FILENO;
        }
        if (is_special_file(path)) {
            const int opened = ::open(path.c_str(), O_WRONLY | O_CLOEXEC);
            if (opened < 0) {
                throw std::runtime_error(path + ": " + std::strerror(errno));
            }
            owned = true;
            return opened;
        }
        return replacement.emplace(path, target).descriptor();
    }

    std::string name;
    std::optional<Replacement> replacement;
    bool owned = false;
    int descriptor;
    DescriptorBuffer buffer;
    ColorBuffer colors;
    std::ostream out;
};

// Writes `value` and a newline, a string as its text with --raw; false (after saying why) when
// --ascii cannot write one of its strings.
bool write_value(Destination& destination, const json::Value& value, const DocumentRun& run,
                 const std::string& where) {
    if (run.raw && value.is_string()) {
        const std::string& text = value.as_string();
        destination.text().sputn(text.data(), static_cast<std::streamsize>(text.size()));
        destination.stream().put('\n');
        return true;
    }
    std::string text;
    try {
        text = json::serialize(value, run.write_options);
    } catch (const std::invalid_argument& error) {
        std::fprintf(stderr, "%s: --ascii: %s\n", where.c_str(), error.what());
        return false;
    }
    destination.stream().write(text.data(), static_cast<std::streamsize>(text.size())).put('\n');
    return true;
}

// Patches the document `name` and writes it (or the value at the pointer) onto `destination`,
// unless that is null (--check).
ExitStatus patch_document(const DocumentRun& run, const json::Value& patch, const std::string& name,
                          Destination* destination) {
    json::Value document;
    const bool keep_everything = run.in_place && !run.lossy &&
                                 (run.parse_options.allow_comments || run.parse_options.allow_bom);
    const Read read = read_document(name, run.parse_options, keep_everything, document);
    if (read != Read::DONE) {
        return read == Read::INVALID ? INVALID : TROUBLE;
    }
    const std::string where = shown_name(name);
    const json::PatchReport report = json::apply_patch(document, patch);
    if (!report) {
        std::fprintf(stderr, "%s: %s\n", where.c_str(), report.message.c_str());
        return INVALID;
    }
    const json::Value* value = &document;
    if (run.pointer != nullptr) {
        try {
            value = &run.pointer->at(document);
        } catch (const std::out_of_range& missing) {
            std::fprintf(stderr, "%s: no value at %s\n", where.c_str(), missing.what());
            return INVALID;
        }
    }
    return destination == nullptr || write_value(*destination, *value, run, where) ? VALID
                                                                                   : INVALID;
}

// Each file rewritten on its own, when its patch applies; or all onto one destination,
// replaced only when every one does.
int run_patch(const DocumentRun& run) {
    json::Value patch;
    if (!read_patch(run.options.patch, patch)) {
        return TROUBLE;
    }
    if (run.check_only) {
        int status = VALID;
        for (const std::string& name : run.files) {
            status = std::max<int>(status, patch_document(run, patch, name, nullptr));
        }
        return status;
    }
    int status = VALID;
    const auto patch_onto = [&](const std::string& path, Replacement::Target target,
                                const std::vector<std::string>& names) {
        try {
            Destination destination(path, target, run.color);
            int written = VALID;
            for (const std::string& name : names) {
                destination.flush();
                written = std::max<int>(written, patch_document(run, patch, name, &destination));
            }
            status = std::max(status, destination.finish(written == VALID) ? written : TROUBLE);
        } catch (const std::runtime_error& error) { // a refusal, or a failing system call
            complain(error.what());
            status = TROUBLE;
        }
    };
    if (run.in_place) {
        for (const std::string& name : run.files) {
            patch_onto(name, Replacement::Target::EXISTING, {name});
        }
    } else {
        patch_onto(run.output_path, Replacement::Target::EXISTING_OR_NEW, run.files);
    }
    return status;
}

// A merge patch cannot set a member to null: when the target has one that the source has not,
// the patch is refused rather than written wrong.
int run_diff(const DocumentRun& run, bool merge) {
    const std::vector<std::string>& names = merge ? run.options.merge_diff : run.options.diff;
    json::Value source;
    json::Value target;
    if (read_document(names[0], run.parse_options, false, source) != Read::DONE ||
        read_document(names[1], run.parse_options, false, target) != Read::DONE) {
        return TROUBLE;
    }
    const json::Value patch = merge ? json::merge_diff(source, target) : json::diff(source, target);
    if (merge) {
        json::Value merged = source;
        json::apply_merge_patch(merged, patch);
        if (merged != target) {
            complain(shown_name(names[1]) +
                     ": a member is null there that no merge patch can set (null removes a "
                     "member); --diff can say it");
            return TROUBLE;
        }
    }
    const ExitStatus status = source == target ? VALID : INVALID;
    if (run.check_only) {
        return status;
    }
    try {
        Destination destination(run.output_path, Replacement::Target::EXISTING_OR_NEW, run.color);
        const bool written = write_value(destination, patch, run, shown_name(names[1]));
        return destination.finish(written) && written ? status : TROUBLE;
    } catch (const std::runtime_error& error) {
        complain(error.what());
        return TROUBLE;
    }
}

} // namespace

void add_patch_options(CLI::App& app, PatchOptions& options) {
    CLI::Option* patch =
        app.add_option("--patch", options.patch,
                       "apply the JSON Patch (RFC 6902) in FILE to each document, all or nothing; "
                       "builds each document, so members come out in byte order of their names")
            ->type_name("FILE")
            ->excludes("--lines");
    CLI::Option* merge_patch =
        app.add_option("--merge-patch", options.merge_patch,
                       "apply the JSON Merge Patch (RFC 7396) in FILE to each document as it "
                       "streams by: what the patch does not touch stays as it is")
            ->type_name("FILE")
            ->excludes(patch);
    CLI::Option* diff = app.add_option("--diff", options.diff,
                                       "write the JSON Patch that turns the first FILE into the "
                                       "second; builds both, as --patch does")
                            ->type_name("FILE")
                            ->expected(2);
    CLI::Option* merge_diff = app.add_option("--merge-diff", options.merge_diff,
                                             "write the JSON Merge Patch that turns the first FILE "
                                             "into the second; builds both, as --patch does")
                                  ->type_name("FILE")
                                  ->expected(2);
    for (CLI::Option* comparing : {diff, merge_diff}) {
        comparing->excludes(patch)
            ->excludes(merge_patch)
            ->excludes("--lines")
            ->excludes("--in-place")
            ->excludes("--pointer");
    }
    merge_diff->excludes(diff);
}

std::string patch_usage_error(const PatchOptions& options, const std::vector<std::string>& files) {
    const bool comparing = !options.diff.empty() || !options.merge_diff.empty();
    const char* const mode = options.diff.empty() ? "--merge-diff" : "--diff";
    if (comparing && !files.empty()) {
        return std::string(mode) + " compares its own two files: it takes no FILE";
    }
    if (comparing) {
        const std::vector<std::string>& names =
            options.diff.empty() ? options.merge_diff : options.diff;
        return names[0] == "-" && names[1] == "-"
                   ? std::string(mode) + ": standard input cannot be both A and B"
                   : std::string();
    }
    const bool from_input = files.empty() || std::count(files.begin(), files.end(), "-") != 0;
    for (const std::string* patch : {&options.patch, &options.merge_patch}) {
        if (*patch == "-" && from_input) {
            return "standard input cannot give both the patch and a document";
        }
    }
    return {};
}

int run_document_mode(const DocumentRun& run) {
    if (!run.options.patch.empty()) {
        return run_patch(run);
    }
    return run_diff(run, run.options.diff.empty());
}

bool read_patch(const std::string& name, json::Value& patch) {
    return read_document(name, json::ParseOptions(), false, patch) == Read::DONE;
}

} // namespace jsonfmt
