// jsonfmt: validates JSON documents (whole files or JSON Lines) and writes them pretty (2-space
// by default) or compact, whole or the value at a JSON Pointer, to standard output, a file, or
// back into each file. The text streams from parser to writer: no document is built, so member
// order, repeated names and number literals come out as they came in.
#include "descriptor_input.hpp"
#include "diagnostics.hpp"
#include "document_modes.hpp"
#include "file_output.hpp"
#include "key_sorter.hpp"
#include "merge_patch_filter.hpp"
#include "pointer_filter.hpp"

#include <json/json.hpp>

#include <CLI/CLI.hpp>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <istream>
#include <new>
#include <optional>
#include <ostream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>
#include <vector>

namespace {

constexpr const char* VERSION = "0.1.0";

enum ExitStatus { VALID = 0, INVALID = 1, TROUBLE = 2 };

// The layout options as given; chosen_layout() turns them into the writer's options.
struct Layout {
    bool compact = false;
    unsigned indent = 2;
    bool tab = false;
    bool ascii = false;
    bool library = false;
};

struct Settings {
    bool check_only = false;
    bool lines = false;
    bool in_place = false;
    bool lossy = false;
    bool sort_keys = false;
    std::string pointer_text;
    std::optional<json::Pointer> pointer; // --pointer, read
    std::string output_path;
    Layout layout;
    json::ParseOptions parse_options;
    json::WriteOptions write_options;
    std::vector<std::string> files;
    jsonfmt::PatchOptions patches;
    std::optional<json::Value> merge_patch; // --merge-patch, read
};

void complain(const std::string& message) {
    std::fprintf(stderr, "jsonfmt: %s\n", message.c_str());
}

// A whole file, or standard input, read in pieces: memory does not follow its length.
class StreamSource {
  public:
    explicit StreamSource(std::string name) : name(std::move(name)), input(this->name) {}

    // The errno of a failure to open or read the file, or 0.
    int error() const { return input.error(); }

    template <typename Handler>
    json::ParseReport parse(Handler& handler, const json::ParseOptions& options) {
        std::istream in(&input);
        return json::parse_events(in, handler, options);
    }

    // The same file read again from its start (only a regular file, as --in-place takes, can).
    StreamSource again() const { return StreamSource(name); }

    // The failing line, as far as the pieces kept around the failure hold it.
    void show(const json::ParseReport& report) const {
        const std::size_t before = std::min(report.offset, jsonfmt::SHOWN_BEFORE);
        const auto kept =
            input.kept(report.offset - before, report.offset + jsonfmt::SHOWN_AFTER + 1);
        jsonfmt::show_failure_line(kept.text, kept.start, report);
    }

  private:
    std::string name;
    jsonfmt::DescriptorInput input;
};

// One line of JSON Lines, in memory.
struct LineSource {
    std::string_view text;

    int error() const { return 0; }

    template <typename Handler>
    json::ParseReport parse(Handler& handler, const json::ParseOptions& options) const {
        return json::parse_events(text, handler, options);
    }

    LineSource again() const { return *this; }

    void show(const json::ParseReport& report) const {
        jsonfmt::show_failure_line(text, 0, report);
    }
};

// What became of one document.
struct DocumentResult {
    json::ParseReport report;
    std::string pointer_problem; // why --pointer found no value, or empty
    std::string unwritable;      // why --ascii could not write a string, or empty
    bool cut = false;            // part of its text went out before it failed

    bool written() const { return report && pointer_problem.empty() && unwritable.empty(); }
};

// Parses with `parse` into `sink`, through the pointer's filter when there is one.
template <typename Sink, typename Parse>
DocumentResult parse_into(const Settings& settings, Sink& sink, Parse& parse) {
    DocumentResult result;
    if (!settings.pointer) {
        result.report = parse(sink);
        return result;
    }
    jsonfmt::PointerFilter<Sink> filter(*settings.pointer, sink);
    result.report = parse(filter);
    if (result.report) {
        result.pointer_problem = filter.problem();
    }
    return result;
}

// Writes documents, or the values at the pointer, onto one output as they are parsed.
class Output {
  public:
    // `keeps_cut_text`: whether text written goes out for good (standard output, a device),
    // not into a file that a failure discards.
    Output(const Settings& settings, int descriptor, std::string destination, bool keeps_cut_text)
        : settings(settings), destination(std::move(destination)), keeps_cut_text(keeps_cut_text),
          buffer(descriptor), stream(&buffer) {}

    // Parses one document with `parse`, called with the handler of its events, and writes it
    // and a newline (nothing with --check). A document that fails is taken back, unless more
    // of its text than the buffer holds went out: then the text up to the failure stays,
    // ended by a newline, and the result says so.
    template <typename Parse>
    DocumentResult document(Parse&& parse) {
        buffer.begin_document();
        DocumentResult result;
        try {
            result = settings.check_only ? check(parse) : write(parse);
        } catch (const std::invalid_argument& error) { // --ascii and a string that is not UTF-8
            result.unwritable = error.what();
        } catch (...) {
            buffer.abandon_document();
            throw;
        }
        if (!result.written() && !buffer.abandon_document()) {
            stream.put('\n');
            result.cut = keeps_cut_text;
        }
        return result;
    }

    const std::string& name() const { return destination; }

    // Hands on what is written so far, so that a message that follows comes after it where
    // both go to one terminal. A failure is kept for finish() to report.
    void flush() { buffer.finish(); }

    // Hands everything written on; false (after saying why) when writing failed.
    bool finish() {
        if (!buffer.finish() || !stream) {
            complain("writing " + destination + ": " + std::strerror(buffer.error()));
            return false;
        }
        return true;
    }

  private:
    template <typename Parse>
    DocumentResult check(Parse& parse) {
        json::NoOpHandler nothing;
        return parse_into(settings, nothing, parse);
    }

    // The Writer goes before the document is taken back: it hands on what it holds.
    template <typename Parse>
    DocumentResult write(Parse& parse) {
        json::Writer writer(stream, settings.write_options);
        DocumentResult result;
        if (settings.sort_keys) {
            jsonfmt::KeySorter sorter(writer);
            result = parse_into(settings, sorter, parse);
        } else {
            result = parse_into(settings, writer, parse);
        }
        if (result.written()) {
            stream.put('\n');
        }
        return result;
    }

    const Settings& settings;
    std::string destination;
    bool keeps_cut_text;
    jsonfmt::DescriptorBuffer buffer;
    std::ostream stream;
};

// Whether a comment the options let through would be lost: --in-place replaces the file with
// text that has none, and only --lossy allows that.
bool comments_must_survive(const Settings& settings) {
    return settings.in_place && settings.parse_options.allow_comments && !settings.lossy;
}

// Says where a parse failed and why, and shows the line; `line` is the line the text starts on.
template <typename Source>
void report_located(const Source& source, const std::string& name, std::size_t line,
                    const json::ParseReport& report, const std::string& message) {
    std::fprintf(stderr, "%s:%zu:%zu: error: %s\n", name.c_str(), line + report.line - 1,
                 report.column, message.c_str());
    source.show(report);
}

// Reports a failed parse. Where comments must survive, the text was parsed without them: if
// it parses with them, the only difference, a comment, is where the first parse failed.
template <typename Source>
void report_parse_failure(const Source& source, const std::string& name, std::size_t line,
                          const json::ParseReport& report, const Settings& settings) {
    if (!comments_must_survive(settings)) {
        report_located(source, name, line, report, jsonfmt::failure_message(report));
        return;
    }
    auto again = source.again();
    json::NoOpHandler nothing;
    const json::ParseReport with_comments = again.parse(nothing, settings.parse_options);
    if (with_comments) {
        report_located(source, name, line, report,
                       "--in-place would drop this comment (add --lossy to allow that)");
    } else {
        report_located(again, name, line, with_comments, jsonfmt::failure_message(with_comments));
    }
}

// Formats one document of `source`: the whole of `name`, or its line `line` (0 for a whole
// file), reporting what went wrong.
template <typename Source>
ExitStatus format_source(Source& source, const std::string& name, std::size_t line,
                         const Settings& settings, Output& output) {
    json::ParseOptions options = settings.parse_options;
    options.allow_comments = options.allow_comments && !comments_must_survive(settings);
    std::string unmergeable; // why --merge-patch stopped the parse
    const DocumentResult result = output.document([&](auto& handler) {
        const auto parse = [&](auto& first) { return source.parse(first, options); };
        return settings.merge_patch
                   ? jsonfmt::parse_merged(*settings.merge_patch, handler, parse, unmergeable)
                   : parse(handler);
    });
    if (result.written()) {
        return VALID;
    }
    output.flush();
    const std::string where = line == 0 ? name : name + ":" + std::to_string(line);
    ExitStatus status = INVALID;
    if (source.error() != 0) {
        complain(name + ": " + std::strerror(source.error()));
        status = TROUBLE;
    } else if (!result.report && !unmergeable.empty()) {
        report_located(source, name, std::max<std::size_t>(line, 1), result.report, unmergeable);
    } else if (!result.report) {
        report_parse_failure(source, name, std::max<std::size_t>(line, 1), result.report, settings);
    } else if (!result.unwritable.empty()) {
        std::fprintf(stderr, "%s: --ascii: %s\n", where.c_str(), result.unwritable.c_str());
    } else {
        std::fprintf(stderr, "%s: %s\n", where.c_str(), result.pointer_problem.c_str());
    }
    if (result.cut) {
        complain(where + ": its text up to the failure went to " + output.name() + " already");
    }
    return status;
}

// The buffer getline(3) reads each line into, grown to the longest line and freed at the end.
struct LineBuffer {
    LineBuffer() = default;
    ~LineBuffer() { std::free(data); } // NOLINT(cppcoreguidelines-no-malloc): getline's memory
    LineBuffer(const LineBuffer&) = delete;
    LineBuffer& operator=(const LineBuffer&) = delete;
    char* data = nullptr;
    std::size_t capacity = 0;
};

// An open input file (standard input for "-"), closed when it goes.
struct Input {
    explicit Input(const std::string& name)
        : file(name == "-" ? stdin : std::fopen(name.c_str(), "rb")), owned(name != "-") {}
    ~Input() {
        if (owned && file != nullptr) {
            std::fclose(file);
        }
    }
    Input(const Input&) = delete;
    Input& operator=(const Input&) = delete;
    std::FILE* file;
    bool owned;
};

// JSON Lines: every line that is not blank is a document; memory follows the longest line.
ExitStatus format_lines(const std::string& name, const std::string& shown_name,
                        const Settings& settings, Output& output) {
    const Input input(name);
    if (input.file == nullptr) {
        complain(shown_name + ": " + std::strerror(errno));
        return TROUBLE;
    }
    LineBuffer line;
    ExitStatus status = VALID;
    ssize_t length = 0;
    for (std::size_t number = 1; (length = ::getline(&line.data, &line.capacity, input.file)) >= 0;
         ++number) {
        LineSource source{std::string_view(line.data, static_cast<std::size_t>(length))};
        if (!source.text.empty() && source.text.back() == '\n') {
            source.text.remove_suffix(1);
        }
        if (source.text.find_first_not_of(" \t\r") != std::string_view::npos) {
            status = std::max(status, format_source(source, shown_name, number, settings, output));
        }
    }
    // getline returns -1 at the end of the file and on a failure alike: only the end sets the
    // end-of-file flag. Running out of memory for a long line sets no flag at all, only errno.
    if (std::feof(input.file) == 0) {
        if (errno == ENOMEM) {
            throw std::bad_alloc();
        }
        output.flush();
        complain(shown_name + ": " + std::strerror(errno));
        return TROUBLE;
    }
    return status;
}

ExitStatus format_file(const std::string& name, const Settings& settings, Output& output) {
    const std::string shown_name = name == "-" ? "<stdin>" : name;
    try {
        if (settings.lines) {
            return format_lines(name, shown_name, settings, output);
        }
        StreamSource source(name);
        return format_source(source, shown_name, 0, settings, output);
    } catch (const std::bad_alloc&) {
        output.flush();
        complain(shown_name + ": out of memory");
        return TROUBLE;
    }
}

// Formats each of `files` onto `descriptor`, handing each file's text on before the next
// file's messages.
ExitStatus format_files(const std::vector<std::string>& files, const Settings& settings,
                        int descriptor, const std::string& destination, bool keeps_cut_text) {
    Output output(settings, descriptor, destination, keeps_cut_text);
    ExitStatus status = VALID;
    for (const std::string& name : files) {
        status = std::max(status, format_file(name, settings, output));
        if (!output.finish()) {
            return TROUBLE;
        }
    }
    return status;
}

// Replaces `target` with the formatted text of `files`, only when every document is valid and
// written: otherwise the target stays as it was.
ExitStatus replace(const std::string& target, jsonfmt::Replacement::Target kind,
                   const std::vector<std::string>& files, const Settings& settings) {
    try {
        jsonfmt::Replacement replacement(target, kind);
        const ExitStatus status =
            format_files(files, settings, replacement.descriptor(), target, false);
        if (status == VALID) {
            replacement.commit();
        }
        return status;
    } catch (const std::runtime_error& error) { // a refusal, or a failing system call
        complain(error.what());
        return TROUBLE;
    } catch (const std::bad_alloc&) {
        complain(target + ": out of memory");
        return TROUBLE;
    }
}

// Writes into a file that is not replaced but written as it is: a device, a FIFO.
ExitStatus write_special_file(const std::string& name, const Settings& settings) {
    const int descriptor = ::open(name.c_str(), O_WRONLY | O_CLOEXEC);
    if (descriptor < 0) {
        complain(name + ": " + std::strerror(errno));
        return TROUBLE;
    }
    ExitStatus status = format_files(settings.files, settings, descriptor, name, true);
    if (::close(descriptor) != 0) {
        complain("writing " + name + ": " + std::strerror(errno));
        status = TROUBLE;
    }
    return status;
}

// Writes what a --help or --version call printed; a failed write is trouble like any other.
int finish_standard_output(int status) {
    std::fflush(stdout);
    if (std::ferror(stdout) != 0) {
        complain(std::string("writing standard output: ") + std::strerror(errno));
        return TROUBLE;
    }
    return status;
}

// Whether `path` names an existing file that is also one of `files` (by device and inode, so
// that another spelling or a link is caught too).
bool is_one_of(const std::string& path, const std::vector<std::string>& files) {
    struct stat output {};
    if (::stat(path.c_str(), &output) != 0) {
        return false;
    }
    return std::any_of(files.begin(), files.end(), [&output](const std::string& name) {
        struct stat input {};
        const bool found =
            name == "-" ? ::fstat(STDIN_FILENO, &input) == 0 : ::stat(name.c_str(), &input) == 0;
        return found && input.st_dev == output.st_dev && input.st_ino == output.st_ino;
    });
}

// Numbers and repeated member names pass through unchanged; what cannot is refused unless
// --lossy accepts it: bytes that are not UTF-8 (copied), unpaired surrogates (U+FFFD).
void choose_leniency(json::ParseOptions& options, bool lossy) {
    options.allow_invalid_utf8 = lossy;
    options.allow_lone_surrogates = lossy;
}

// The writer's options for the layout flags: the common two-space layout, or the library's own
// pretty text (--library-layout). Compact text (--compact, and each line of --lines) is the
// library's, but with the slash as itself as in the pretty layout.
json::WriteOptions chosen_layout(const Layout& layout, bool lines) {
    if (layout.library) {
        json::WriteOptions library;
        library.pretty = true;
        return library;
    }
    json::WriteOptions options = json::COMMON_PRETTY;
    options.indent = layout.indent;
    options.indent_with_tab = layout.tab;
    options.ascii_only = layout.ascii;
    if (layout.compact || lines) {
        options.pretty = false;
        options.space_after_colon = false;
    }
    return options;
}

// Adds the options that say what is read: JSON as it is, or more, or lossily.
void add_reading_options(CLI::App& app, Settings& settings) {
    app.add_flag("--allow-comments", settings.parse_options.allow_comments,
                 "accept // and /* */ comments, as in {\"a\": 1 // one}; they are not written");
    app.add_flag("--allow-trailing-commas", settings.parse_options.allow_trailing_commas,
                 "accept one comma before ] or }, as in [1, 2,]");
    app.add_flag("--lossy", settings.lossy,
                 "accept what cannot be written as it was read: bytes that are not UTF-8 "
                 "(copied as they are), \"\\ud800\" (as U+FFFD); with -i, comments dropped. "
                 "Numbers and repeated names need no flag: they are written as they are");
}

// Adds the options that say how the text is laid out.
void add_layout_options(CLI::App& app, Settings& settings) {
    Layout& layout = settings.layout;
    CLI::Option* compact =
        app.add_flag("-c,--compact", layout.compact, "write compact text: {\"a\":[1,2]}");
    CLI::Option* indent =
        app.add_option("--indent", layout.indent,
                       "indent pretty text N spaces per level, 0 to 16 (default 2); 0 keeps "
                       "the line breaks")
            ->type_name("N")
            ->check(CLI::Range(0U, 16U));
    CLI::Option* tab =
        app.add_flag("--tab", layout.tab, "indent pretty text one tab per level")->excludes(indent);
    app.add_flag("--ascii", layout.ascii,
                 "write every character above U+007F as a \\u escape: \"caf\\u00e9\"");
    CLI::Option* library =
        app.add_flag("--library-layout", layout.library,
                     "the library's own pretty text: 4 spaces, {\"a\":1}, [    ] for an empty "
                     "array, \\/ for /")
            ->excludes(indent)
            ->excludes(tab)
            ->excludes("--ascii");
    compact->excludes(indent)->excludes(tab)->excludes(library);
}

// Fills `settings` from the command line; returns an exit status when the program is done.
bool read_arguments(int argc, char** argv, Settings& settings, int& status) {
    CLI::App app("Checks JSON documents and writes them pretty (2-space indentation) or "
                 "compact,\nmembers, repeated names and numbers as they are.\nReads each FILE, "
                 "or standard input when there is none or for \"-\".",
                 "jsonfmt");
    app.set_help_flag("-h,--help", "show this help and exit");
    add_layout_options(app, settings);
    add_reading_options(app, settings);
    app.add_flag("--sort-keys", settings.sort_keys,
                 "write each object's members in byte order of their names (holds each "
                 "top-level object in memory)");
    app.add_flag("--check", settings.check_only,
                 "only check the documents, under the same rules; write nothing");
    app.add_flag("-l,--lines", settings.lines,
                 "JSON Lines: one document per non-blank line, written compact")
        ->excludes("--indent")
        ->excludes("--tab")
        ->excludes("--library-layout");
    app.add_option("-p,--pointer", settings.pointer_text,
                   "write only the value at this JSON Pointer")
        ->type_name("PTR");
    app.add_option("-o,--output", settings.output_path, "write to FILE, not standard output")
        ->type_name("FILE");
    app.add_flag("-i,--in-place", settings.in_place, "rewrite each FILE with its formatted text");
    jsonfmt::add_patch_options(app, settings.patches);
    app.add_option("--max-depth", settings.parse_options.max_depth,
                   "refuse nesting deeper than N (default 512)")
        ->type_name("N")
        ->check(CLI::Validator(
            [](const std::string& text) {
                return text.find_first_not_of("0123456789") == std::string::npos &&
                               text.find_first_not_of('0') != std::string::npos
                           ? std::string()
                           : std::string("needs a positive number");
            },
            ""));
    app.set_version_flag("--version", std::string("jsonfmt ") + VERSION,
                         "show the version and exit");
    app.add_option("FILE", settings.files, "the documents to read")->type_name("");
    app.footer("Exit status: 0 when every document is valid, 1 when one is invalid or refused,\n"
               "a pointer finds nothing, --ascii cannot write it or a patch fails on it, 2 for\n"
               "usage errors, I/O errors and running out of memory. --diff and --merge-diff:\n"
               "0 when the documents are equal, 1 when they differ, 2 for any trouble.");
    try {
        app.parse(argc, argv);
    } catch (const CLI::CallForHelp&) {
        std::printf("%s\n", app.help().c_str());
        status = finish_standard_output(VALID);
        return true;
    } catch (const CLI::CallForVersion& version) {
        std::printf("%s\n", version.what());
        status = finish_standard_output(VALID);
        return true;
    } catch (const CLI::ParseError& error) {
        complain(std::string(error.what()) + " (try --help)");
        status = TROUBLE;
        return true;
    }
    choose_leniency(settings.parse_options, settings.lossy);
    settings.write_options = chosen_layout(settings.layout, settings.lines);
    std::string usage_error;
    if (app.count("--pointer") != 0) {
        try {
            settings.pointer.emplace(settings.pointer_text);
        } catch (const std::invalid_argument& error) {
            usage_error = std::string("--pointer: ") + error.what();
        }
    }
    if (std::string refused = jsonfmt::patch_usage_error(settings.patches, settings.files);
        !refused.empty()) {
        usage_error = std::move(refused);
    }
    if (settings.files.empty()) {
        settings.files.emplace_back("-");
    }
    if (settings.in_place &&
        std::find(settings.files.begin(), settings.files.end(), "-") != settings.files.end()) {
        usage_error = "--in-place needs files: it cannot rewrite standard input";
    }
    if (settings.in_place && !settings.output_path.empty()) {
        usage_error = "--in-place writes back into each FILE: it does not go with --output";
    }
    if (settings.in_place && (settings.check_only || settings.pointer)) {
        usage_error = "--in-place rewrites whole files: it goes with neither --check nor --pointer";
    }
    if (!settings.output_path.empty() && is_one_of(settings.output_path, settings.files)) {
        usage_error = "--output " + settings.output_path +
                      " is also an input: writing it would destroy it (use --in-place)";
    }
    if (!usage_error.empty()) {
        complain(usage_error + " (try --help)");
        status = TROUBLE;
        return true;
    }
    if (!settings.patches.merge_patch.empty() &&
        !jsonfmt::read_patch(settings.patches.merge_patch, settings.merge_patch.emplace())) {
        status = TROUBLE;
        return true;
    }
    return false;
}

int run(const Settings& settings) {
    using Target = jsonfmt::Replacement::Target;
    if (settings.patches.builds_documents()) {
        return jsonfmt::run_document_mode(
            {settings.patches, settings.files, settings.parse_options, settings.write_options,
             settings.pointer ? &*settings.pointer : nullptr, settings.output_path,
             settings.in_place, settings.check_only, settings.lossy});
    }
    if (settings.in_place) {
        ExitStatus status = VALID;
        for (const std::string& name : settings.files) {
            status = std::max(status, replace(name, Target::EXISTING, {name}, settings));
        }
        return status;
    }
    if (settings.output_path.empty() || settings.check_only) {
        return format_files(settings.files, settings, STDOUT_FILENO, "standard output", true);
    }
    if (jsonfmt::is_special_file(settings.output_path)) {
        return write_special_file(settings.output_path, settings);
    }
    return replace(settings.output_path, Target::EXISTING_OR_NEW, settings.files, settings);
}

// Opens /dev/null on each of descriptors 0 to 2 that is closed, so that no file this program
// opens takes one of them (a diagnostic would land in the output file). Opened the other way
// round (standard input for writing only, the outputs for reading only), so that reading or
// writing a closed standard stream still fails as it did. False when /dev/null does not open.
bool occupy_standard_descriptors() {
    for (int descriptor = STDIN_FILENO; descriptor <= STDERR_FILENO; ++descriptor) {
        if (::fcntl(descriptor, F_GETFD) < 0 &&
            ::open("/dev/null", descriptor == STDIN_FILENO ? O_WRONLY : O_RDONLY) != descriptor) {
            return false;
        }
    }
    return true;
}

} // namespace

int main(int argc, char** argv) {
    if (!occupy_standard_descriptors()) {
        return TROUBLE;
    }
    try {
        Settings settings;
        int status = VALID;
        if (read_arguments(argc, argv, settings, status)) {
            return status;
        }
        return run(settings);
    } catch (const std::bad_alloc&) {
        complain("out of memory");
        return TROUBLE;
    } catch (const std::exception& error) {
        complain(error.what());
        return TROUBLE;
    }
}
