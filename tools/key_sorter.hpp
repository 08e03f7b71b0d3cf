#ifndef JSONFMT_KEY_SORTER_HPP
#define JSONFMT_KEY_SORTER_HPP

// --sort-keys: parsing events passed on to a json::Writer with the members of every object in
// byte order of their names.

#include <json/writer.hpp>

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace jsonfmt {

/// A handler of parsing events that passes them on to a json::Writer, each object's members
/// in ascending byte order of their names (compared as unsigned bytes), members of the same
/// name in the order they came. Nothing else changes: number literals, strings and repeated
/// names are passed on as they are, and the Writer lays out the sorted events as it would lay
/// out any.
///
/// Values outside every object go straight through. An object's events are recorded until it
/// closes, its members then rearranged in the record; the outermost object's record is played
/// to the Writer when it closes. Memory: the record of the largest top-level object.
class KeySorter {
  public:
    explicit KeySorter(json::Writer& out) : out(out) {}

    bool null();
    bool boolean(bool value);
    bool number(std::string_view literal);
    bool string(std::string_view utf8);
    bool key(std::string_view utf8);
    bool begin_array();
    bool end_array();
    bool begin_object();
    bool end_object();

  private:
    enum class Event : char {
        null,
        boolean_false,
        boolean_true,
        number,
        string,
        key,
        begin_array,
        end_array,
        begin_object,
        end_object
    };

    // An object that is open in the record.
    struct OpenObject {
        std::size_t members_start; // where its first member starts in the record
        std::size_t first_member;  // its first entry in member_starts
    };

    bool recording() const { return !open_objects.empty(); }
    bool record(Event event);
    bool record(Event event, std::string_view text);
    std::string_view name_at(std::size_t member_start) const;
    void sort_members(const OpenObject& object);
    void play();

    json::Writer& out;
    std::string record_text;                // the events recorded, each a byte and its text
    std::vector<OpenObject> open_objects;   // innermost last
    std::vector<std::size_t> member_starts; // where each member of the open objects starts
    std::vector<std::size_t> order;         // reused while sorting
    std::string sorted;                     // reused while sorting
};

} // namespace jsonfmt

#endif
