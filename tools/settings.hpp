#ifndef JSONFMT_SETTINGS_HPP
#define JSONFMT_SETTINGS_HPP

// What a jsonfmt run was asked to do, as its command line said it.

#include "document_modes.hpp"

#include <json/parse_options.hpp>
#include <json/pointer.hpp>
#include <json/serializer.hpp>
#include <json/value.hpp>

#include <optional>
#include <string>
#include <vector>

namespace jsonfmt {

/// The exit status: the worst of all documents'.
enum ExitStatus { VALID = 0, INVALID = 1, TROUBLE = 2 };

/// The layout options as given; the writer's options are made from them.
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
    bool raw = false;                     // --raw: a string written as its text
    bool color = false;                   // --color, as it turned out for the output
    std::optional<json::Pointer> pointer; // --pointer
    std::string output_path;
    Layout layout;
    json::ParseOptions parse_options;
    json::WriteOptions write_options;
    std::vector<std::string> files;
    PatchOptions patches;
    std::optional<json::Value> merge_patch; // --merge-patch, read
};

/// Whether --in-place must refuse what its rewrite would drop: a comment or a byte order mark
/// that the options let through, unless --lossy allows that.
inline bool in_place_keeps_everything(const Settings& settings) {
    return settings.in_place && !settings.lossy &&
           (settings.parse_options.allow_comments || settings.parse_options.allow_bom);
}

} // namespace jsonfmt

#endif
