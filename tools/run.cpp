#include "run.hpp"

#include "diagnostics.hpp"
#include "file_output.hpp"
#include "line_reader.hpp"
#include "merge_patch_filter.hpp"
#include "output.hpp"
#include "sources.hpp"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <new>
#include <stdexcept>
#include <string>
#include <system_error>
#include <unistd.h>

namespace jsonfmt {

namespace {

// Says where a parse failed and why, and shows the line; `line` is the line the text starts on.
template <typename Source>
void report_located(const Source& source, const std::string& name, std::size_t line,
                    const json::ParseReport& report, const std::string& message) {
    std::fprintf(stderr, "%s:%zu:%zu: error: %s\n", name.c_str(), line + report.line - 1,
                 report.column, message.c_str());
    source.show(report);
}

// Reports a failed parse, with a hint where the text may be JSON Lines. Where --in-place must
// keep everything, the text was parsed without comments and byte order marks: if it parses
// with them, the first of them is where the first parse failed, and it is what the rewrite
// would drop.
template <typename Source>
void report_parse_failure(const Source& source, const std::string& name, std::size_t line,
                          const json::ParseReport& report, const Settings& settings) {
    if (!in_place_keeps_everything(settings)) {
        report_located(source, name, line, report,
                       failure_message(report) + source.lines_hint(report));
        return;
    }
    auto again = source.again();
    json::NoOpHandler nothing;
    const json::ParseReport with_all = again.parse(nothing, settings.parse_options);
    if (with_all) {
        report_located(source, name, line, report,
                       report.refusal == json::Refusal::BYTE_ORDER_MARK
                           ? "--in-place would drop the byte order mark (add --lossy to allow "
                             "that)"
                           : "--in-place would drop this comment (add --lossy to allow that)");
    } else {
        report_located(again, name, line, with_all,
                       failure_message(with_all) + again.lines_hint(with_all));
    }
}

// Formats one document of `source`: the whole of `name`, or its line `line` (0 for a whole
// file), reporting what went wrong.
template <typename Source>
ExitStatus format_source(Source& source, const std::string& name, std::size_t line,
                         const Settings& settings, Output& output) {
    json::ParseOptions options = settings.parse_options;
    if (in_place_keeps_everything(settings)) {
        options.allow_comments = false;
        options.allow_bom = false;
    }
    std::string unmergeable; // why --merge-patch stopped the parse
    const DocumentResult result = output.document([&](auto& handler) {
        const auto parse = [&](auto& first) { return source.parse(first, options); };
        return settings.merge_patch
                   ? parse_merged(*settings.merge_patch, handler, parse, unmergeable)
                   : parse(handler);
    });
    if (result.written()) {
        return VALID;
    }
    output.flush();
    const std::string where = line == 0 ? name : name + ":" + std::to_string(line);
    ExitStatus status = INVALID;
    if (source.open_error() != 0) {
        complain(name + ": " + std::strerror(source.open_error()));
        status = TROUBLE;
    } else if (source.read_error() != 0) {
        complain(where + ": read failed: " + std::strerror(source.read_error()));
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
        complain(where + ": part of its text went to " + output.name() + " already");
    }
    return status;
}

// JSON Lines: every line that is not blank is a document. Memory follows the longest line; a
// line too long for it is reported and skipped, and the lines after it still go out.
ExitStatus format_lines(const std::string& name, const std::string& shown_name,
                        const Settings& settings, Output& output) {
    DescriptorInput input(name);
    if (input.open_error() != 0) {
        complain(shown_name + ": " + std::strerror(input.open_error()));
        return TROUBLE;
    }
    LineReader lines(input);
    ExitStatus status = VALID;
    try {
        while (lines.next()) {
            const std::string where = shown_name + ":" + std::to_string(lines.line().number);
            const LineSource source{lines.text()};
            try {
                if (!lines.line().held) {
                    throw std::bad_alloc();
                }
                if (source.text.find_first_not_of(" \t\r") != std::string_view::npos) {
                    status = std::max(status, format_source(source, shown_name, lines.line().number,
                                                            settings, output));
                }
            } catch (const std::bad_alloc&) {
                output.flush();
                complain(where + ": out of memory: the line is " +
                         std::to_string(lines.line().length) + " bytes");
                status = TROUBLE;
            }
        }
    } catch (const std::system_error&) {
        output.flush();
        complain(shown_name + ":" + std::to_string(lines.line().number) +
                 ": read failed: " + std::strerror(input.read_error()));
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
ExitStatus replace(const std::string& target, Replacement::Target kind,
                   const std::vector<std::string>& files, const Settings& settings) {
    try {
        Replacement replacement(target, kind);
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

} // namespace

ExitStatus run(const Settings& settings) {
    using Target = Replacement::Target;
    if (settings.patches.builds_documents()) {
        return static_cast<ExitStatus>(run_document_mode(
            {settings.patches, settings.files, settings.parse_options, settings.write_options,
             settings.pointer ? &*settings.pointer : nullptr, settings.output_path,
             settings.in_place, settings.check_only, settings.lossy, settings.raw,
             settings.color}));
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
    if (is_special_file(settings.output_path)) {
        return write_special_file(settings.output_path, settings);
    }
    return replace(settings.output_path, Target::EXISTING_OR_NEW, settings.files, settings);
}

} // namespace jsonfmt
