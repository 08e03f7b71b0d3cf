#ifndef JSON_SRC_DOCUMENT_CHECKS_HPP
#define JSON_SRC_DOCUMENT_CHECKS_HPP

// The options that concern a document rather than its text (exact_numbers,
// reject_duplicate_keys), applied alike by the document builder and the validator.

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
    [[gnu::cold]] bool inexact(std::string_view literal) {
        constexpr std::size_t shown = 40;
        std::string text(literal.substr(0, shown));
        if (literal.size() > shown) {
            text += "...";
        }
        text += " cannot be held exactly by a double; without the exact_numbers option it is "
                "rounded";
        return refuse(Refusal::INEXACT_NUMBER, ParseResult::INVALID_EXPONENT, std::move(text));
    }
    /// A member name given a second time, at the token being reported.
    [[gnu::cold]] bool repeated_name() {
        return refuse(Refusal::DUPLICATE_KEY, ParseResult::MISSING_TRAILING_BRACE,
                      "the object already has a member of this name; without the "
                      "reject_duplicate_keys option the last one wins");
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
