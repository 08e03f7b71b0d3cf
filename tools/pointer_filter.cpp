#include "pointer_filter.hpp"

#include <utility>

namespace jsonfmt {

// Whether the value that starts now, directly inside the innermost container on the path (or
// at the top level), is the one the next step names. Counts the elements of an array.
bool PointerPath::is_wanted_next() {
    if (path.empty()) {
        return true;
    }
    Open& open = path.back();
    if (open.is_object) {
        return open.current_matches;
    }
    const bool wanted = open.elements++ == pointer.index(path.size() - 1);
    open.matched = open.matched || wanted;
    return wanted;
}

bool PointerPath::value(json::Kind kind) {
    const bool container = kind == json::Kind::ARRAY || kind == json::Kind::OBJECT;
    if (value_open > 0) {
        value_open += container ? 1 : 0;
        return true;
    }
    if (depth != path.size() || !is_wanted_next()) {
        depth += container ? 1 : 0;
        return false;
    }
    if (path.size() == pointer.size()) {
        found = true;
        value_open = container ? 1 : 0;
        return true;
    }
    if (container) {
        ++depth;
        path.push_back({kind == json::Kind::OBJECT});
    } else {
        fail(path.size(), pointer.why_missing(path.size(), kind, 0));
    }
    return false;
}

bool PointerPath::key(std::string_view name) {
    if (value_open > 0) {
        return true;
    }
    if (depth == path.size() && !path.empty()) {
        Open& open = path.back();
        const std::size_t step = path.size() - 1;
        open.current_matches = name == pointer.name(step);
        if (open.current_matches && std::exchange(open.matched, true) && !ambiguous) {
            // The value at the pointer is not passed on again.
            ambiguous = true;
            failure = std::string(pointer.prefix(step + 1)) +
                      ": the object has more than one member \"" + pointer.name(step) + "\"";
        }
        open.current_matches = open.current_matches && !ambiguous;
    }
    return false;
}

bool PointerPath::close() {
    if (value_open > 0) {
        --value_open;
        return true;
    }
    if (depth == path.size() && !path.empty()) {
        const Open open = path.back();
        path.pop_back();
        if (!open.matched) {
            fail(path.size(),
                 pointer.why_missing(path.size(),
                                     open.is_object ? json::Kind::OBJECT : json::Kind::ARRAY,
                                     open.elements));
        }
    }
    --depth;
    return false;
}

// Records the first way the path left the document: at step `step`, the first not found.
void PointerPath::fail(std::size_t step, const std::string& reason) {
    if (failure.empty()) {
        failure = std::string(pointer.prefix(step + 1)) + ": " + reason;
    }
}

std::string PointerPath::problem() const {
    if (ambiguous) {
        return "no single value at " + failure;
    }
    return found ? std::string() : "no value at " + failure;
}

} // namespace jsonfmt
