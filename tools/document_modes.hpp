#ifndef JSONFMT_DOCUMENT_MODES_HPP
#define JSONFMT_DOCUMENT_MODES_HPP

// The modes that change documents by patches or compare them: --patch, --diff and --merge-diff
// build whole documents (their members come out in byte order of their names); --merge-patch
// streams, but its patch is built.

#include <json/parse.hpp>
#include <json/pointer.hpp>
#include <json/serializer.hpp>

#include <CLI/CLI.hpp>

#include <string>
#include <vector>

namespace jsonfmt {

/// The patch options as given on the command line.
struct PatchOptions {
    std::string patch;                   ///< --patch FILE
    std::string merge_patch;             ///< --merge-patch FILE
    std::vector<std::string> diff;       ///< --diff A B
    std::vector<std::string> merge_diff; ///< --merge-diff A B

    /// Whether a mode that builds documents is asked for.
    bool builds_documents() const { return !patch.empty() || !diff.empty() || !merge_diff.empty(); }
};

/// Adds the four options, each excluding the others and what makes no sense with it: --diff
/// and --merge-diff go with neither --lines, --in-place nor --pointer, --patch not with
/// --lines. Call it once those options are added.
void add_patch_options(CLI::App& app, PatchOptions& options);

/// Why the command line cannot be run, or empty: --diff with FILE arguments, standard input
/// asked to give two texts. `files` are the FILE arguments as given.
std::string patch_usage_error(const PatchOptions& options, const std::vector<std::string>& files);

/// What the modes that build documents take of jsonfmt's other settings.
struct DocumentRun {
    const PatchOptions& options;
    const std::vector<std::string>& files; ///< the documents --patch changes
    json::ParseOptions parse_options;      ///< as the reading flags say
    json::WriteOptions write_options;      ///< as the layout flags say
    const json::Pointer* pointer;          ///< --pointer, or null
    const std::string& output_path;        ///< --output, or empty
    bool in_place;
    bool check_only;
    bool lossy;
    bool raw;   ///< --raw: a string written as its text
    bool color; ///< the text coloured for a terminal
};

/// Runs --patch, --diff or --merge-diff; returns the exit status. --patch: 0 when every
/// document was patched, 1 when one does not parse, is refused or the patch fails on it, 2 for
/// trouble. --diff and --merge-diff as diff(1): 0 when the documents are equal, 1 when they
/// differ, 2 for trouble (a document that does not parse or is refused included).
int run_document_mode(const DocumentRun& run);

/// Reads the patch file `name` ("-" for standard input) into `patch`, refusing what a
/// double cannot hold exactly and repeated names; says why not on standard error.
bool read_patch(const std::string& name, json::Value& patch);

} // namespace jsonfmt

#endif
