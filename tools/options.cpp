#include "options.hpp"

#include "diagnostics.hpp"

#include <json/version.hpp>

#include <CLI/CLI.hpp>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

namespace jsonfmt {

namespace {

// What cannot be written as it was read is refused unless --lossy accepts it: bytes that are
// not UTF-8 (copied as they are), unpaired surrogates (U+FFFD). Numbers and repeated member
// names pass through unchanged.
void choose_leniency(Settings& settings) {
    settings.parse_options.allow_invalid_utf8 = settings.lossy;
    settings.parse_options.allow_lone_surrogates = settings.lossy;
    settings.write_options.allow_invalid_utf8 = settings.lossy;
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
    app.add_flag("--allow-bom", settings.parse_options.allow_bom,
                 "accept a UTF-8 byte order mark (EF BB BF) at the start; it is not written");
    app.add_flag("--lossy", settings.lossy,
                 "accept what cannot be written as it was read: bytes that are not UTF-8 "
                 "(copied as they are), \"\\ud800\" (as U+FFFD); with -i, comments and a byte "
                 "order mark dropped. Numbers and repeated names need no flag: they are written "
                 "as they are");
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

// Adds the options for a person at a terminal: colours, and a string's own text. --raw
// refuses --ascii: a string written raw keeps every character that --ascii promises to escape.
void add_terminal_options(CLI::App& app, Settings& settings, std::string& color) {
    app.add_option("--color", color,
                   "colour the text for a terminal: auto (the default: when standard output is "
                   "a terminal and NO_COLOR is not set), always or never")
        ->type_name("WHEN")
        ->check(CLI::IsMember({"auto", "always", "never"}));
    app.add_flag("-r,--raw", settings.raw,
                 "write a string (the document, or the value at --pointer) as its text, without "
                 "quotes or escapes; other values as JSON")
        ->excludes("--ascii");
}

// Whether the text is coloured: with --color=always; with auto, when it goes to standard
// output, that is a terminal, and NO_COLOR is unset or empty (as no-color.org has it). --check
// writes nothing, and --in-place writes files.
bool colored(const std::string& color, const Settings& settings) {
    if (color == "never" || settings.check_only || settings.in_place) {
        return false;
    }
    if (color == "always") {
        return true;
    }
    const char* const no_color = std::getenv("NO_COLOR");
    return settings.output_path.empty() && ::isatty(STDOUT_FILENO) == 1 &&
           (no_color == nullptr || *no_color == '\0');
}

// --max-depth: a positive number of levels, up to the largest the parser counts.
std::string depth_problem(const std::string& text, std::size_t& depth) {
    constexpr std::size_t largest = std::numeric_limits<std::size_t>::max();
    const char* const end = text.data() + text.size();
    const std::from_chars_result read = std::from_chars(text.data(), end, depth);
    if (read.ec == std::errc::result_out_of_range) {
        return "--max-depth: " + text + " is more than the largest depth allowed, " +
               std::to_string(largest);
    }
    if (read.ec != std::errc() || read.ptr != end || text.front() == '+' || depth == 0) {
        return "--max-depth: needs a positive number";
    }
    return {};
}

// Writes what a --help or --version call printed; a failed write is trouble like any other.
ExitStatus finish_standard_output(ExitStatus status) {
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

// What the options ask that cannot be done, or an empty text. `color` is --color's word.
std::string usage_problem(const Settings& settings, const std::string& color) {
    if (settings.in_place &&
        std::find(settings.files.begin(), settings.files.end(), "-") != settings.files.end()) {
        return "--in-place needs files: it cannot rewrite standard input";
    }
    if (settings.in_place && !settings.output_path.empty()) {
        return "--in-place writes back into each FILE: it does not go with --output";
    }
    if (settings.in_place && (settings.check_only || settings.pointer)) {
        return "--in-place rewrites whole files: it goes with neither --check nor --pointer";
    }
    if (settings.in_place && settings.raw) {
        return "--raw writes a string as text that is not JSON: it cannot rewrite a JSON file "
               "(--in-place)";
    }
    if (settings.in_place && color == "always") {
        return "--color=always writes a terminal's colour codes: it cannot rewrite a JSON file "
               "(--in-place)";
    }
    if (!settings.output_path.empty() && is_one_of(settings.output_path, settings.files)) {
        return "--output " + settings.output_path +
               " is also an input: writing it would destroy it (use --in-place)";
    }
    return {};
}

} // namespace

std::optional<ExitStatus> read_arguments(int argc, char** argv, Settings& settings) {
    CLI::App app("Checks JSON documents and writes them pretty (2-space indentation) or "
                 "compact,\nmembers, repeated names and numbers as they are.\nReads each FILE, "
                 "or standard input when there is none or for \"-\".",
                 "jsonfmt");
    app.set_help_flag("-h,--help", "show this help and exit");
    add_layout_options(app, settings);
    add_reading_options(app, settings);
    std::string color = "auto";
    add_terminal_options(app, settings, color);
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
    std::string pointer;
    app.add_option("-p,--pointer", pointer, "write only the value at this JSON Pointer")
        ->type_name("PTR");
    app.add_option("-o,--output", settings.output_path, "write to FILE, not standard output")
        ->type_name("FILE");
    app.add_flag("-i,--in-place", settings.in_place, "rewrite each FILE with its formatted text");
    add_patch_options(app, settings.patches);
    std::string max_depth;
    app.add_option("--max-depth", max_depth, "refuse nesting deeper than N (default 512)")
        ->type_name("N");
    app.set_version_flag("--version", std::string("jsonfmt ") + JSONVALUE_VERSION_STRING,
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
        return finish_standard_output(VALID);
    } catch (const CLI::CallForVersion& version) {
        std::printf("%s\n", version.what());
        return finish_standard_output(VALID);
    } catch (const CLI::ParseError& error) {
        complain(std::string(error.what()) + " (try --help)");
        return TROUBLE;
    }
    settings.write_options = chosen_layout(settings.layout, settings.lines);
    choose_leniency(settings);
    const std::vector<std::string> given_files = settings.files;
    if (settings.files.empty()) {
        settings.files.emplace_back("-");
    }
    std::string problem;
    if (!max_depth.empty()) {
        problem = depth_problem(max_depth, settings.parse_options.max_depth);
    }
    if (problem.empty() && app.count("--pointer") != 0) {
        try {
            settings.pointer.emplace(pointer);
        } catch (const std::invalid_argument& error) {
            problem = std::string("--pointer: ") + error.what();
        }
    }
    if (problem.empty()) {
        problem = patch_usage_error(settings.patches, given_files);
    }
    if (problem.empty()) {
        problem = usage_problem(settings, color);
    }
    if (!problem.empty()) {
        complain(problem + " (try --help)");
        return TROUBLE;
    }
    settings.color = colored(color, settings);
    if (!settings.patches.merge_patch.empty() &&
        !read_patch(settings.patches.merge_patch, settings.merge_patch.emplace())) {
        return TROUBLE;
    }
    return std::nullopt;
}

} // namespace jsonfmt
