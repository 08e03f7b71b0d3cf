#include "diagnostics.hpp"

#include <algorithm>
#include <cstdio>
#include <utility>

namespace jsonfmt {

namespace {

// The parser's note with jsonfmt's flag in place of each library option it names: each is off
// by default, and the flag that turns it on takes its name.
std::string with_flag_names(std::string note) {
    static constexpr std::pair<std::string_view, std::string_view> OPTION_TO_FLAG[] = {
        {"ParseOptions::allow_comments", "--allow-comments"},
        {"ParseOptions::allow_trailing_commas", "--allow-trailing-commas"},
        {"ParseOptions::allow_invalid_utf8", "--lossy"},
        {"ParseOptions::allow_lone_surrogates", "--lossy"},
        {"ParseOptions::allow_bom", "--allow-bom"},
        {"ParseOptions::max_depth", "--max-depth"},
    };
    for (const auto& [option, flag] : OPTION_TO_FLAG) {
        if (const std::size_t at = note.find(option); at != std::string::npos) {
            note.replace(at, option.size(), flag);
        }
    }
    return note;
}

} // namespace

void complain(const std::string& message) {
    std::fprintf(stderr, "jsonfmt: %s\n", message.c_str());
}

// The library's message, which leads with the reason of a refusal, in jsonfmt's words. An
// unpaired surrogate is valid JSON, which only a change (to U+FFFD) could write: said so.
std::string failure_message(const json::ParseReport& report) {
    json::ParseReport shown = report;
    shown.note = with_flag_names(report.note);
    if (report.refusal == json::Refusal::LONE_SURROGATE) {
        return "valid JSON, but jsonfmt would change it: " + shown.note;
    }
    return shown.message();
}

// The parser's note when a complete value is followed by more than whitespace.
std::string lines_hint(std::string_view text, std::size_t start, const json::ParseReport& report) {
    constexpr std::string_view goes_on = "the text goes on after the JSON value";
    constexpr std::string_view value_starts = "{[\"-0123456789tfn";
    if (report.note != goes_on || report.offset < start || report.offset - start >= text.size() ||
        value_starts.find(text[report.offset - start]) == std::string_view::npos) {
        return {};
    }
    const std::string_view before = text.substr(0, report.offset - start);
    const std::size_t value_end = before.find_last_not_of(" \t\r\n");
    const std::string_view between =
        value_end == std::string_view::npos ? before : before.substr(value_end + 1);
    return between.find_first_of("\r\n") == std::string_view::npos
               ? std::string()
               : " (the text looks like JSON Lines: try --lines)";
}

// The line is cut to a window around the failure on long (minified) lines, or where the text
// at hand ends; tabs before the caret are kept so that it lines up. The line is written byte
// for byte, NUL bytes included.
void show_failure_line(std::string_view text, std::size_t start, const json::ParseReport& report) {
    if (report.offset < start || report.offset > start + text.size()) {
        return;
    }
    const std::size_t failure = report.offset - start;
    const std::size_t line_start = report.offset - (report.column - 1);
    // Where the window starts in `text`: the line's start, or a point after it ("...").
    std::size_t from = failure - std::min(failure, SHOWN_BEFORE);
    std::string shown;
    if (line_start >= start + from) {
        from = line_start - start;
    } else {
        shown = "...";
    }
    const std::size_t line_end = std::min(text.find_first_of("\r\n", failure), text.size());
    const std::size_t to = std::min(line_end, failure + SHOWN_AFTER);
    std::string caret(shown.size(), ' ');
    for (std::size_t i = from; i < failure; ++i) {
        caret += text[i] == '\t' ? '\t' : ' ';
    }
    shown.append(text.substr(from, to - from)).append(to < line_end ? "...\n" : "\n");
    shown.append(caret).append("^\n");
    std::fwrite(shown.data(), 1, shown.size(), stderr);
}

} // namespace jsonfmt
