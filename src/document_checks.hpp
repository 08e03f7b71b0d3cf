#ifndef JSON_SRC_DOCUMENT_CHECKS_HPP
#define JSON_SRC_DOCUMENT_CHECKS_HPP

// The options that concern a document rather than its text (exact_numbers,
// reject_duplicate_keys), applied alike by the document builder and the validator.

#include "messages.hpp"
#include "number.hpp"

#include <json/parse_options.hpp>

#include <cstddef>
#include <string>
#include <string_view>
#include <unordered_set>
#include <utility>
#include <vector>

namespace json::detail {

/// A handler's refusal of the document (the builder's, the validator's): which, and where
/// when that is not the token being reported. Each refuse function returns false, for the
/// handler to return.
class DocumentRefusal {
  public:
    /// A number that exact_numbers refuses.
    [[gnu::cold]] bool inexact(std::string_view literal) {
        return refuse(Refusal::INEXACT_NUMBER, ParseResult::INVALID_EXPONENT,
                      shown(literal) + " cannot be held exactly by a double; "
                                       "ParseOptions::exact_numbers refuses every number a "
                                       "double changes");
    }
    /// A number read as `value` with a change the options do not allow.
    [[gnu::cold]] bool changed(std::string_view literal, double value, NumberChange change) {
        return refuse(
            Refusal::INEXACT_NUMBER, ParseResult::INVALID_EXPONENT,
            change == NumberChange::OVERFLOW
                ? shown(literal) + " is beyond the range of a double: read it as text through "
                                   "json::parse_events, or allow it as an infinity with "
                                   "ParseOptions::allow_overflow"
                : shown(literal) + " cannot be held exactly by a double (the nearest is " +
                      exact_integer_text(value) +
                      "): read it as text through json::parse_events, or allow it "
                      "rounded with ParseOptions::allow_inexact_integers");
    }
    /// A member name given a second time, at the token being reported.
    [[gnu::cold]] bool repeated_name(std::string_view name) {
        return refuse(Refusal::DUPLICATE_KEY, ParseResult::MISSING_TRAILING_BRACE,
                      "the object already has a member named " + quoted(name) +
                          "; without ParseOptions::reject_duplicate_keys the last one wins");
    }

    /// When the grammar stopped because of this refusal, puts it in `report` (the place is
    /// the grammar's: the token being reported).
    void explain(ParseReport& report) {
        if (report.refusal != Refusal::STOPPED || refused == Refusal::NONE) {
            return;
        }
        report.refusal = refused;
        report.result = result;
        report.note = std::move(note);
    }

  private:
    // A literal as a message shows it: its first forty characters.
    static std::string shown(std::string_view literal) {
        constexpr std::size_t most = 40;
        return literal.size() <= most ? std::string(literal)
                                      : std::string(literal.substr(0, most)) + "...";
    }
    bool refuse(Refusal why, ParseResult code, std::string text) {
        refused = why;
        result = code;
        note = std::move(text);
        return false;
    }

    Refusal refused = Refusal::NONE;
    ParseResult result = ParseResult::SUCCESS;
    std::string note;
};

/// `literal` (NUL-terminated) read into `value` as json::parse keeps it, as `options` say:
/// rounded, or refused when a double cannot hold it as written (see ParseOptions); false, with
/// the refusal recorded, when it is refused.
inline bool read_kept_number(std::string_view literal, const ParseOptions& options,
                             DocumentRefusal& refusal, double& value) {
    if (options.exact_numbers) {
        return read_number_exactly(literal, value) || refusal.inexact(literal);
    }
    if (read_short_number(literal, value)) {
        return true; // such numbers never change
    }
    const NumberChange change = read_number_checked(literal, value);
    const bool allowed =
        change == NumberChange::NONE ||
        (change == NumberChange::INEXACT_INTEGER && options.allow_inexact_integers) ||
        (change == NumberChange::OVERFLOW && options.allow_overflow);
    return allowed || refusal.changed(literal, value, change);
}

/// Whether json::parse keeps `literal` as `options` say, without reading it where it cannot
/// change (most numbers): the validator's check.
inline bool number_is_kept(std::string_view literal, const ParseOptions& options,
                           DocumentRefusal& refusal) {
    double value = 0.0;
    return (!options.exact_numbers && !may_change(literal)) ||
           read_kept_number(literal, options, refusal, value);
}

/// The member names of the open objects, where repeated names are refused: the second of
/// them is found when it comes. Memory: the names of the open objects.
class MemberNames {
  public:
    void open_object() { open_objects.emplace_back(); }
    void close_object() { open_objects.pop_back(); }
    /// False when the innermost open object already has a member of this name. Kept out of
    /// line: only documents parsed with reject_duplicate_keys call it.
    [[gnu::noinline]] bool add(std::string_view name) {
        return open_objects.back().emplace(name).second;
    }

  private:
    std::vector<std::unordered_set<std::string>> open_objects;
};

} // namespace json::detail

#endif
