// jsonfmt: validates JSON documents (whole files or JSON Lines) and writes them pretty (2-space
// by default) or compact, whole or the value at a JSON Pointer, to standard output, a file, or
// back into each file. Nothing the document model would change passes unless --lossy says so.
#include "file_output.hpp"

#include <json/json.hpp>

#include <CLI/CLI.hpp>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
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
    std::string pointer;
    bool has_pointer = false;
    std::string output_path;
    Layout layout;
    json::ParseOptions parse_options;
    json::WriteOptions write_options;
    std::vector<std::string> files;
};

void complain(const std::string& message) {
    std::fprintf(stderr, "jsonfmt: %s\n", message.c_str());
}

// Reads all of `file` into `text`; false (with errno set) when it cannot.
bool read_all(std::FILE* file, std::string& text) {
    char buffer[1 << 16];
    std::size_t got = 0;
    while ((got = std::fread(buffer, 1, sizeof buffer, file)) > 0) {
        text.append(buffer, got);
    }
    return std::ferror(file) == 0;
}

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

// The line holding the failure, cut to a window around it on long (minified) lines, and a
// caret under the failing byte; tabs before the caret are kept so that it lines up. The line
// is written byte for byte, NUL bytes included.
void show_failure_line(std::string_view text, const json::ParseReport& report) {
    constexpr std::size_t before = 60;
    constexpr std::size_t after = 20;
    const std::size_t line_start = report.offset - (report.column - 1);
    std::size_t line_end = text.find('\n', line_start);
    if (line_end == std::string_view::npos) {
        line_end = text.size();
    }
    std::size_t from = line_start;
    std::string shown;
    if (report.offset - line_start > before) {
        from = report.offset - before;
        shown = "...";
    }
    const std::size_t to = std::min(line_end, report.offset + after);
    std::string caret(shown.size(), ' ');
    for (std::size_t i = from; i < report.offset; ++i) {
        caret += text[i] == '\t' ? '\t' : ' ';
    }
    shown.append(text.substr(from, to - from)).append(to < line_end ? "...\n" : "\n");
    shown.append(caret).append("^\n");
    std::fwrite(shown.data(), 1, shown.size(), stderr);
}

// The parser's note with jsonfmt's flag in place of each library option it names. jsonfmt turns
// exact_numbers and reject_duplicate_keys on by default, so "without" them is "with --lossy";
// the other options are off by default, and the flag that turns each on takes its name.
std::string with_flag_names(std::string note) {
    static constexpr std::pair<std::string_view, std::string_view> OPTION_TO_FLAG[] = {
        {"the allow_comments option", "--allow-comments"},
        {"the allow_trailing_commas option", "--allow-trailing-commas"},
        {"the allow_invalid_utf8 option", "--lossy"},
        {"the allow_lone_surrogates option", "--lossy"},
        {"without the exact_numbers option", "with --lossy"},
        {"without the reject_duplicate_keys option", "with --lossy"},
    };
    for (const auto& [option, flag] : OPTION_TO_FLAG) {
        if (const std::size_t at = note.find(option); at != std::string::npos) {
            note.replace(at, option.size(), flag);
        }
    }
    return note;
}

// Whether `refusal` is of text that is JSON, but that the document model would change.
bool changes_valid_json(json::Refusal refusal) {
    return refusal == json::Refusal::INEXACT_NUMBER || refusal == json::Refusal::DUPLICATE_KEY ||
           refusal == json::Refusal::LONE_SURROGATE;
}

// What a failed parse is reported as. A refusal of bad UTF-8 or of valid JSON is said by its
// note alone: the grammar's code that comes with it only approximates the reason.
std::string failure_message(const json::ParseReport& report) {
    json::ParseReport shown = report;
    shown.note = with_flag_names(report.note);
    if (changes_valid_json(report.refusal)) {
        return "valid JSON, but jsonfmt would change it: " + shown.note;
    }
    return report.refusal == json::Refusal::INVALID_UTF8 ? shown.note : shown.message();
}

// A document that is not written: where (the parser's report) and why.
struct Rejection {
    json::ParseReport report;
    std::string message;
};

// Whether a comment the options let through would be lost: --in-place replaces the file with
// text that has none, and only --lossy allows that.
bool comments_must_survive(const Settings& settings) {
    return settings.in_place && settings.parse_options.allow_comments && !settings.lossy;
}

// Parses `text` into `document` as the settings ask; nothing when it parsed. Where comments
// must survive, the text is parsed without them first (one parse when there are none), and
// only when that fails with them: if that succeeds, the only difference between the two
// parses, a comment, is where the first one failed.
std::optional<Rejection> parse_document(std::string_view text, json::Value& document,
                                        const Settings& settings) {
    const bool guarding_comments = comments_must_survive(settings);
    json::ParseOptions options = settings.parse_options;
    options.allow_comments = options.allow_comments && !guarding_comments;
    const json::ParseReport report = json::parse(text, document, options);
    if (report) {
        return std::nullopt;
    }
    if (!guarding_comments) {
        return Rejection{report, failure_message(report)};
    }
    const json::ParseReport with_comments = json::parse(text, document, settings.parse_options);
    if (!with_comments) {
        return Rejection{with_comments, failure_message(with_comments)};
    }
    return Rejection{report, "--in-place would drop this comment (add --lossy to allow that)"};
}

// Writes parsed documents, or the values at the pointer, onto one output.
class Writer {
  public:
    Writer(const Settings& settings, int descriptor, std::string destination)
        : settings(settings), destination(std::move(destination)), buffer(descriptor),
          stream(&buffer) {}

    // Writes `document` (or its value at the pointer) and a newline. INVALID when the pointer
    // finds nothing or --ascii cannot write a string, TROUBLE when writing fails.
    ExitStatus write(const json::Value& document, const std::string& where) {
        const json::Value* value = &document;
        if (settings.has_pointer) {
            try {
                value = &document.at_pointer(settings.pointer);
            } catch (const std::out_of_range& error) {
                // The message starts with the pointer, up to the first step not found.
                flush();
                std::fprintf(stderr, "%s: no value at %s\n", where.c_str(), error.what());
                return INVALID;
            }
        }
        if (settings.check_only) {
            return VALID;
        }
        try {
            write_value(*value);
        } catch (const std::invalid_argument& error) { // --ascii and a string that is not UTF-8
            flush();
            std::fprintf(stderr, "%s: --ascii: %s\n", where.c_str(), error.what());
            return INVALID;
        }
        stream.put('\n');
        return VALID;
    }

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
    // Writes `value` onto the stream. ASCII-only text fails on a string that is not UTF-8,
    // which only --lossy lets in: then the text is made whole before any of it goes out, so
    // that no half of it is written anywhere (streamed, it could not be taken back).
    void write_value(const json::Value& value) {
        const json::WriteOptions& options = settings.write_options;
        if (options.ascii_only && settings.parse_options.allow_invalid_utf8) {
            const std::string text = json::serialize(value, options);
            stream.write(text.data(), static_cast<std::streamsize>(text.size()));
        } else {
            json::write(stream, value, options);
        }
    }

    const Settings& settings;
    std::string destination;
    jsonfmt::DescriptorBuffer buffer;
    std::ostream stream;
};

ExitStatus report_rejection(const std::string& where, std::string_view text,
                            const Rejection& rejection, std::size_t line, Writer& writer) {
    writer.flush();
    const json::ParseReport& report = rejection.report;
    std::fprintf(stderr, "%s:%zu:%zu: error: %s\n", where.c_str(), line + report.line - 1,
                 report.column, rejection.message.c_str());
    show_failure_line(text, report);
    return INVALID;
}

// One document per file.
ExitStatus format_document(const std::string& name, const std::string& shown_name,
                           const Settings& settings, Writer& writer) {
    std::string text;
    {
        const Input input(name);
        if (input.file == nullptr || !read_all(input.file, text)) {
            complain(shown_name + ": " + std::strerror(errno));
            return TROUBLE;
        }
    }
    json::Value document;
    if (const auto rejection = parse_document(text, document, settings)) {
        return report_rejection(shown_name, text, *rejection, 1, writer);
    }
    return writer.write(document, shown_name);
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

// JSON Lines: every line that is not blank is a document; memory follows the longest line.
ExitStatus format_lines(const std::string& name, const std::string& shown_name,
                        const Settings& settings, Writer& writer) {
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
        std::string_view text(line.data, static_cast<std::size_t>(length));
        if (!text.empty() && text.back() == '\n') {
            text.remove_suffix(1);
        }
        if (text.find_first_not_of(" \t\r") == std::string_view::npos) {
            continue;
        }
        json::Value document;
        const auto rejection = parse_document(text, document, settings);
        const std::string where = shown_name + ":" + std::to_string(number);
        status = std::max(status,
                          rejection ? report_rejection(shown_name, text, *rejection, number, writer)
                                    : writer.write(document, where));
    }
    // getline returns -1 at the end of the file and on a failure alike: only the end sets the
    // end-of-file flag. Running out of memory for a long line sets no flag at all, only errno.
    if (std::feof(input.file) == 0) {
        if (errno == ENOMEM) {
            throw std::bad_alloc();
        }
        writer.flush();
        complain(shown_name + ": " + std::strerror(errno));
        return TROUBLE;
    }
    return status;
}

ExitStatus format_file(const std::string& name, const Settings& settings, Writer& writer) {
    const std::string shown_name = name == "-" ? "<stdin>" : name;
    try {
        return settings.lines ? format_lines(name, shown_name, settings, writer)
                              : format_document(name, shown_name, settings, writer);
    } catch (const std::bad_alloc&) {
        complain(shown_name + ": out of memory");
        return TROUBLE;
    }
}

// Formats each of `files` onto `descriptor`, handing each file's text on before the next
// file's messages.
ExitStatus format_files(const std::vector<std::string>& files, const Settings& settings,
                        int descriptor, const std::string& destination) {
    Writer writer(settings, descriptor, destination);
    ExitStatus status = VALID;
    for (const std::string& name : files) {
        status = std::max(status, format_file(name, settings, writer));
        if (!writer.finish()) {
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
        const ExitStatus status = format_files(files, settings, replacement.descriptor(), target);
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
    ExitStatus status = format_files(settings.files, settings, descriptor, name);
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

// By default nothing passes that the document model would change: a number a double cannot
// hold exactly, a repeated member name (the model keeps one member), bytes that are not UTF-8
// and unpaired surrogates. --lossy accepts them all as the library's lenient settings do.
void choose_leniency(json::ParseOptions& options, bool lossy) {
    options.exact_numbers = !lossy;
    options.reject_duplicate_keys = !lossy;
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
                 "accept what the output cannot keep as written: 1e400 or 1234567890123456789 "
                 "rounded to a double, {\"a\":1,\"a\":2} keeping the last member, \"\\ud800\" "
                 "as U+FFFD, bytes that are not UTF-8 copied; with -i, comments dropped");
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
    CLI::App app("Checks JSON documents and writes them pretty (2-space indentation, keys "
                 "sorted) or compact.\nReads each FILE, or standard input when there is none "
                 "or for \"-\".",
                 "jsonfmt");
    app.set_help_flag("-h,--help", "show this help and exit");
    add_layout_options(app, settings);
    add_reading_options(app, settings);
    app.add_flag("--check", settings.check_only,
                 "only check the documents, under the same rules; write nothing");
    app.add_flag("-l,--lines", settings.lines,
                 "JSON Lines: one document per non-blank line, written compact")
        ->excludes("--indent")
        ->excludes("--tab")
        ->excludes("--library-layout");
    app.add_option("-p,--pointer", settings.pointer, "write only the value at this JSON Pointer")
        ->type_name("PTR");
    app.add_option("-o,--output", settings.output_path, "write to FILE, not standard output")
        ->type_name("FILE");
    app.add_flag("-i,--in-place", settings.in_place, "rewrite each FILE with its formatted text");
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
               "a pointer finds nothing or --ascii cannot write it, 2 for usage errors, I/O\n"
               "errors and running out of memory.");
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
    settings.has_pointer = app.count("--pointer") != 0;
    choose_leniency(settings.parse_options, settings.lossy);
    settings.write_options = chosen_layout(settings.layout, settings.lines);
    std::string usage_error;
    if (settings.has_pointer) {
        try {
            json::Value().find_pointer(settings.pointer);
        } catch (const std::invalid_argument& error) {
            usage_error = std::string("--pointer: ") + error.what();
        }
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
    if (settings.in_place && (settings.check_only || settings.has_pointer)) {
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
    return false;
}

int run(const Settings& settings) {
    using Target = jsonfmt::Replacement::Target;
    if (settings.in_place) {
        ExitStatus status = VALID;
        for (const std::string& name : settings.files) {
            status = std::max(status, replace(name, Target::EXISTING, {name}, settings));
        }
        return status;
    }
    if (settings.output_path.empty() || settings.check_only) {
        return format_files(settings.files, settings, STDOUT_FILENO, "standard output");
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
