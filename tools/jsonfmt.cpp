// jsonfmt: validates JSON documents (whole files or JSON Lines) and writes them pretty
// (4-space) or compact, whole or the value at a JSON Pointer, to standard output, a file, or
// back into each file.
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

struct Settings {
    bool compact = false;
    bool check_only = false;
    bool lines = false;
    bool in_place = false;
    std::string pointer;
    bool has_pointer = false;
    std::string output_path;
    json::ParseOptions parse_options;
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

// Writes parsed documents, or the values at the pointer, onto one output.
class Writer {
  public:
    Writer(const Settings& settings, int descriptor, std::string destination)
        : settings(settings), destination(std::move(destination)), buffer(descriptor),
          stream(&buffer) {
        serializer.pretty_print(!settings.compact && !settings.lines);
    }

    // Writes `document` (or its value at the pointer) and a newline. INVALID when the pointer
    // finds nothing, TROUBLE when writing fails.
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
        if (!settings.check_only) {
            serializer.write(stream, *value);
            stream.put('\n');
        }
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
    const Settings& settings;
    std::string destination;
    jsonfmt::DescriptorBuffer buffer;
    std::ostream stream;
    json::Serializer serializer;
};

ExitStatus report_parse_failure(const std::string& where, std::string_view text,
                                const json::ParseReport& report, std::size_t line, Writer& writer) {
    writer.flush();
    std::fprintf(stderr, "%s:%zu:%zu: error: %s\n", where.c_str(), line + report.line - 1,
                 report.column, report.message().c_str());
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
    const json::ParseReport report = json::parse(text, document, settings.parse_options);
    if (!report) {
        return report_parse_failure(shown_name, text, report, 1, writer);
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
        const json::ParseReport report = json::parse(text, document, settings.parse_options);
        const std::string where = shown_name + ":" + std::to_string(number);
        status = std::max(status,
                          report ? writer.write(document, where)
                                 : report_parse_failure(shown_name, text, report, number, writer));
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

// Fills `settings` from the command line; returns an exit status when the program is done.
bool read_arguments(int argc, char** argv, Settings& settings, int& status) {
    CLI::App app("Checks JSON documents and writes them pretty (4-space indentation, keys "
                 "sorted) or compact.\nReads each FILE, or standard input when there is none "
                 "or for \"-\".",
                 "jsonfmt");
    app.set_help_flag("-h,--help", "show this help and exit");
    app.add_flag("-c,--compact", settings.compact, "write compact text, without whitespace");
    app.add_flag("--check", settings.check_only, "only check the documents; write nothing");
    app.add_flag("-l,--lines", settings.lines, "JSON Lines: one document per non-blank line");
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
    app.footer("Exit status: 0 when every document is valid, 1 when one is invalid or a pointer\n"
               "finds nothing, 2 for usage errors, I/O errors and running out of memory.");
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
