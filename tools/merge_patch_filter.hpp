#ifndef JSONFMT_MERGE_PATCH_FILTER_HPP
#define JSONFMT_MERGE_PATCH_FILTER_HPP

// --merge-patch: a JSON Merge Patch (RFC 7396) applied to the parsing events of a document as
// they stream by.

#include <json/events.hpp>
#include <json/value.hpp>

#include <cstddef>
#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace jsonfmt {

/// Follows a merge patch through the events of one document and says what becomes of each:
/// the members the patch names are replaced or removed where they stand, an object it names
/// is merged member by member, the members it adds come at the end of their object, and all
/// else passes as it is (order, number literals, repeated names). A value the patch replaces
/// is skipped and its replacement given as JSON text. Memory: the patch, and for each open
/// object that the patch reaches, the names of it that have been seen.
///
/// A name the patch touches that an object of the document has twice cannot be patched
/// without choosing between them: it is refused where it comes the second time.
class MergePatchPath {
  public:
    explicit MergePatchPath(const json::Value& patch) : pending(&patch) {}

    /// What becomes of an event.
    enum class Fate {
        PASS,    ///< passed on
        SKIP,    ///< dropped, with everything in the value it starts
        REPLACE, ///< a value dropped, and replacement() written in its place
        REFUSE   ///< a member name refused: problem() says why
    };
    /// A value starts: a scalar, or a container that opens. Never REFUSE.
    Fate value(json::Kind kind);
    /// A member name: PASS, SKIP (a member removed, its value is skipped next) or REFUSE.
    Fate key(std::string_view name);
    /// A container closes: whether its end is passed on. Before it, the members additions()
    /// holds are to be written.
    bool close();

    /// The JSON text of the value that REPLACE writes.
    const std::string& replacement() const { return replacing; }
    /// The members an object that closes gets at its end: names and JSON texts.
    const std::vector<std::pair<std::string, std::string>>& additions() const { return added; }
    /// Why the parse was stopped, or empty.
    const std::string& problem() const { return refusal; }

  private:
    // An object of the document that the patch reaches, and its members the patch names that
    // have been seen.
    struct Patched {
        const json::Object* patch;
        std::set<const json::Value*> seen;
    };

    const json::Value* pending;   // the patch for the value that starts next, or null
    bool remove_next = false;     // the value that starts next belongs to a removed member
    std::size_t skipped_open = 0; // containers open inside a dropped value
    std::size_t passed_open = 0;  // containers open that the patch does not reach
    std::vector<Patched> patched; // innermost last
    std::string replacing;
    std::vector<std::pair<std::string, std::string>> added;
    std::string refusal;
};

/// A handler of parsing events that passes on to `next` the events of the document the merge
/// patch makes: next receives the events of a document, as if it had been written patched.
template <typename Next>
class MergePatchFilter {
  public:
    MergePatchFilter(const json::Value& patch, Next& next) : path(patch), next(next) {}

    bool null() {
        return start(Kind::NULL_VALUE, [this] { return next.null(); });
    }
    bool boolean(bool value) {
        return start(Kind::BOOLEAN, [&] { return next.boolean(value); });
    }
    bool number(std::string_view literal) {
        return start(Kind::NUMBER, [&] { return next.number(literal); });
    }
    bool string(std::string_view utf8) {
        return start(Kind::STRING, [&] { return next.string(utf8); });
    }
    bool key(std::string_view utf8) {
        const Fate fate = path.key(utf8);
        return fate == Fate::PASS ? next.key(utf8) : fate == Fate::SKIP;
    }
    bool begin_array() {
        return start(Kind::ARRAY, [this] { return next.begin_array(); });
    }
    bool end_array() { return !path.close() || next.end_array(); }
    bool begin_object() {
        return start(Kind::OBJECT, [this] { return next.begin_object(); });
    }
    bool end_object() {
        if (!path.close()) {
            return true;
        }
        for (const auto& [name, text] : path.additions()) {
            if (!next.key(name) || !write(text)) {
                return false;
            }
        }
        return next.end_object();
    }

    /// See MergePatchPath::problem().
    const std::string& problem() const { return path.problem(); }

  private:
    using Kind = json::Kind;
    using Fate = MergePatchPath::Fate;

    template <typename Pass>
    bool start(Kind kind, Pass pass) {
        const Fate fate = path.value(kind);
        if (fate == Fate::REPLACE) {
            return write(path.replacement());
        }
        return fate == Fate::SKIP || pass();
    }

    // The events of a value from the patch, read from its text.
    bool write(const std::string& text) {
        return static_cast<bool>(json::parse_events(text, next));
    }

    MergePatchPath path;
    Next& next;
};

/// Parses with `parse` (called with a handler) through a MergePatchFilter into `handler`;
/// `problem` gets the filter's problem.
template <typename Handler, typename Parse>
json::ParseReport parse_merged(const json::Value& patch, Handler& handler, Parse parse,
                               std::string& problem) {
    MergePatchFilter<Handler> filter(patch, handler);
    json::ParseReport report = parse(filter);
    problem = filter.problem();
    return report;
}

} // namespace jsonfmt

#endif
