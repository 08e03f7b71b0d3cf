#ifndef JSON_CONVERT_OPTIONS_HPP
#define JSON_CONVERT_OPTIONS_HPP

// How json::value_to treats the members of a struct described with Boost.Describe.

namespace json {

/// What json::value_to does with a struct's members that the document leaves out, and with
/// members of the document that the struct does not describe. Both flags are off by default:
/// every described member but a std::optional one must be there, and unknown members are
/// ignored. The options reach every struct inside the one converted (in members, sequences,
/// maps, tuples and optionals), but not those a user's from_json converts: it gets no options.
/// An aggregate: C++20 callers can write `{.missing_members_keep_defaults = true}`.
struct ConvertOptions {
    /// A described member the document leaves out (or that holds Undefined) keeps the value it
    /// has in the struct made by `T{}`: its default member initialiser, what T's default
    /// constructor gives it, or zero. A std::optional member too keeps its default then,
    /// instead of becoming nullopt.
    /// Off: a missing member fails with std::out_of_range "missing member".
    bool missing_members_keep_defaults = false;
    /// A member of the document whose name the struct does not describe (a misspelt key, say)
    /// fails with std::invalid_argument "unknown member (the struct has no member of this
    /// name)", its JSON Pointer in front: "/server/portt: unknown member ...". Each struct's
    /// Object is checked before any of its members is converted. Members holding Undefined
    /// are absent, never unknown.
    bool reject_unknown_members = false;
};

/// Both options, for reading a config file: what the file leaves out keeps the struct's
/// default, and a key the struct does not know, which would otherwise be ignored silently
/// while its member kept the default (a misspelt "portt"), is refused.
inline constexpr ConvertOptions CONFIG_RULES = {true, true};

} // namespace json

#endif
