#include "key_sorter.hpp"

#include <algorithm>
#include <cstring>

namespace jsonfmt {

bool KeySorter::null() {
    return recording() ? record(Event::null) : out.null();
}

bool KeySorter::boolean(bool value) {
    return recording() ? record(value ? Event::boolean_true : Event::boolean_false)
                       : out.boolean(value);
}

bool KeySorter::number(std::string_view literal) {
    return recording() ? record(Event::number, literal) : out.number(literal);
}

bool KeySorter::string(std::string_view utf8) {
    return recording() ? record(Event::string, utf8) : out.string(utf8);
}

// Member names come only inside an object, which is being recorded.
bool KeySorter::key(std::string_view utf8) {
    member_starts.push_back(record_text.size());
    return record(Event::key, utf8);
}

bool KeySorter::begin_array() {
    return recording() ? record(Event::begin_array) : out.begin_array();
}

bool KeySorter::end_array() {
    return recording() ? record(Event::end_array) : out.end_array();
}

bool KeySorter::begin_object() {
    record(Event::begin_object);
    open_objects.push_back({record_text.size(), member_starts.size()});
    return true;
}

bool KeySorter::end_object() {
    sort_members(open_objects.back());
    member_starts.resize(open_objects.back().first_member);
    open_objects.pop_back();
    record(Event::end_object);
    if (!recording()) {
        play();
        record_text.clear();
    }
    return true;
}

bool KeySorter::record(Event event) {
    record_text += static_cast<char>(event);
    return true;
}

// The text's length goes first, as the bytes of a std::size_t.
bool KeySorter::record(Event event, std::string_view text) {
    const std::size_t length = text.size();
    record_text += static_cast<char>(event);
    record_text.append(reinterpret_cast<const char*>(&length), sizeof length);
    record_text.append(text);
    return true;
}

// The name of the member whose record starts at `member_start` (with its key event).
std::string_view KeySorter::name_at(std::size_t member_start) const {
    std::size_t length = 0;
    std::memcpy(&length, record_text.data() + member_start + 1, sizeof length);
    return std::string_view(record_text).substr(member_start + 1 + sizeof length, length);
}

// Rearranges the members of `object`, the innermost open one, which run from its first
// member's start to the end of the record. string_view compares bytes as unsigned char.
void KeySorter::sort_members(const OpenObject& object) {
    const auto first = member_starts.begin() + static_cast<std::ptrdiff_t>(object.first_member);
    const auto by_name = [this](std::size_t left, std::size_t right) {
        return name_at(left) < name_at(right);
    };
    if (std::is_sorted(first, member_starts.end(), by_name)) {
        return;
    }
    order.assign(first, member_starts.end());
    std::stable_sort(order.begin(), order.end(), by_name);
    const std::size_t end = record_text.size();
    sorted.clear();
    for (const std::size_t start : order) {
        const auto next = std::upper_bound(first, member_starts.end(), start);
        sorted.append(record_text, start, (next == member_starts.end() ? end : *next) - start);
    }
    record_text.replace(object.members_start, sorted.size(), sorted);
}

// Plays the record of a top-level object to the Writer.
void KeySorter::play() {
    const char* at = record_text.data();
    const char* const end = at + record_text.size();
    while (at != end) {
        const auto event = static_cast<Event>(*at++);
        std::string_view text;
        if (event == Event::number || event == Event::string || event == Event::key) {
            std::size_t length = 0;
            std::memcpy(&length, at, sizeof length);
            text = std::string_view(at + sizeof length, length);
            at += sizeof length + length;
        }
        switch (event) {
        case Event::null:
            out.null();
            break;
        case Event::boolean_false:
            out.boolean(false);
            break;
        case Event::boolean_true:
            out.boolean(true);
            break;
        case Event::number:
            out.number(text);
            break;
        case Event::string:
            out.string(text);
            break;
        case Event::key:
            out.key(text);
            break;
        case Event::begin_array:
            out.begin_array();
            break;
        case Event::end_array:
            out.end_array();
            break;
        case Event::begin_object:
            out.begin_object();
            break;
        case Event::end_object:
            out.end_object();
            break;
        }
    }
}

} // namespace jsonfmt
