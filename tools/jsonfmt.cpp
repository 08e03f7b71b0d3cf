// jsonfmt: validates JSON documents and writes them pretty (4-space) or compact.
#include <json/json.hpp>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstdio>
#include <cstring>
#include <string>
#include <string_view>
#include <vector>

namespace {

constexpr const char* VERSION = "0.1.0";

constexpr const char* USAGE = R"(Usage: jsonfmt [OPTIONS] [FILE...]
Reads each FILE (standard input when there is none, or for "-"), checks that it holds exactly
one JSON document and writes it to standard output, pretty (4-space indentation) by default.

Options:
  -c, --compact      write compact text, without whitespace
      --check        only check the documents; write nothing
      --max-depth N  refuse documents nested deeper than N (default 512)
  -h, --help         show this help and exit
      --version      show the version and exit

Exit status: 0 when every document is valid, 1 when one is invalid, 2 for usage or I/O errors.
)";

enum ExitStatus { VALID = 0, INVALID = 1, TROUBLE = 2 };

struct Settings {
    bool compact = false;
    bool check_only = false;
    json::ParseOptions parse_options;
    std::vector<std::string> files;
};

// Reads all of `file` into `text`; false (with errno set) when it cannot.
bool read_all(std::FILE* file, std::string& text) {
    char buffer[1 << 16];
    std::size_t got = 0;
    while ((got = std::fread(buffer, 1, sizeof buffer, file)) > 0) {
        text.append(buffer, got);
    }
    return std::ferror(file) == 0;
}

bool read_input(const std::string& name, std::string& text) {
    if (name == "-") {
        return read_all(stdin, text);
    }
    std::FILE* file = std::fopen(name.c_str(), "rb");
    if (file == nullptr) {
        return false;
    }
    const bool ok = read_all(file, text);
    const int saved = errno;
    std::fclose(file);
    errno = saved;
    return ok;
}

// The line holding the failure, cut to a window around it on long (minified) lines, and a
// caret under the failing byte; tabs before the caret are kept so that it lines up.
void show_failure_line(std::string_view text, const json::ParseReport& report) {
    constexpr std::size_t before = 60;
    constexpr std::size_t after = 20;
    const std::size_t line_start = report.offset - (report.column - 1);
    std::size_t line_end = text.find('\n', line_start);
    if (line_end == std::string_view::npos) {
        line_end = text.size();
    }
    std::size_t from = line_start;
    std::string lead;
    if (report.offset - line_start > before) {
        from = report.offset - before;
        lead = "...";
    }
    const std::size_t to = std::min(line_end, report.offset + after);
    const std::string_view shown = text.substr(from, to - from);
    std::string caret = std::string(lead.size(), ' ');
    for (std::size_t i = from; i < report.offset; ++i) {
        caret += text[i] == '\t' ? '\t' : ' ';
    }
    std::fprintf(stderr, "%s%.*s%s\n%s^\n", lead.c_str(), static_cast<int>(shown.size()),
                 shown.data(), to < line_end ? "..." : "", caret.c_str());
}

ExitStatus format_one(const std::string& name, const Settings& settings) {
    const std::string shown_name = name == "-" ? "<stdin>" : name;
    std::string text;
    if (!read_input(name, text)) {
        std::fprintf(stderr, "jsonfmt: %s: %s\n", shown_name.c_str(), std::strerror(errno));
        return TROUBLE;
    }
    json::Value document;
    const json::ParseReport report = json::parse(text, document, settings.parse_options);
    if (!report) {
        std::fprintf(stderr, "%s:%zu:%zu: error: %s\n", shown_name.c_str(), report.line,
                     report.column, report.message().c_str());
        show_failure_line(text, report);
        return INVALID;
    }
    if (!settings.check_only) {
        // The whole text at once: one write, never a flush per line.
        std::string output =
            settings.compact ? json::serialize(document) : json::pretty_print(document);
        output += '\n';
        if (std::fwrite(output.data(), 1, output.size(), stdout) != output.size()) {
            std::fprintf(stderr, "jsonfmt: writing the output: %s\n", std::strerror(errno));
            return TROUBLE;
        }
    }
    return VALID;
}

bool parse_depth(const char* text, std::size_t& depth) {
    const char* end = text + std::strlen(text);
    const auto [stop, error] = std::from_chars(text, end, depth);
    return error == std::errc() && stop == end && depth > 0;
}

// Fills `settings` from the command line; returns an exit status when the program is done.
bool read_arguments(int argc, char** argv, Settings& settings, ExitStatus& status) {
    bool options_end = false;
    for (int i = 1; i < argc; ++i) {
        const std::string_view argument = argv[i];
        if (options_end || argument == "-" || argument.empty() || argument[0] != '-') {
            settings.files.emplace_back(argument);
        } else if (argument == "--") {
            options_end = true;
        } else if (argument == "-c" || argument == "--compact") {
            settings.compact = true;
        } else if (argument == "--check") {
            settings.check_only = true;
        } else if (argument == "--max-depth") {
            if (i + 1 == argc || !parse_depth(argv[i + 1], settings.parse_options.max_depth)) {
                std::fprintf(stderr, "jsonfmt: --max-depth needs a positive number\n");
                status = TROUBLE;
                return true;
            }
            ++i;
        } else if (argument == "-h" || argument == "--help") {
            std::fputs(USAGE, stdout);
            status = VALID;
            return true;
        } else if (argument == "--version") {
            std::printf("jsonfmt %s\n", VERSION);
            status = VALID;
            return true;
        } else {
            std::fprintf(stderr, "jsonfmt: unknown option '%s' (try --help)\n", argv[i]);
            status = TROUBLE;
            return true;
        }
    }
    if (settings.files.empty()) {
        settings.files.emplace_back("-");
    }
    return false;
}

} // namespace

int main(int argc, char** argv) {
    Settings settings;
    ExitStatus status = VALID;
    if (read_arguments(argc, argv, settings, status)) {
        return status;
    }
    for (const std::string& name : settings.files) {
        status = std::max(status, format_one(name, settings));
    }
    if (std::fflush(stdout) != 0) {
        std::fprintf(stderr, "jsonfmt: writing the output: %s\n", std::strerror(errno));
        status = TROUBLE;
    }
    return status;
}
