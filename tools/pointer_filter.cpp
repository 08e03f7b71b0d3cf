#include "pointer_filter.hpp"

#include <json/value.hpp>

#include <charconv>
#include <utility>

namespace jsonfmt {

namespace {

// The element a token names: "0", or digits without a leading zero; npos for any other token
// ("-", the element after the last, never exists) and for one beyond std::size_t, which no
// array reaches.
std::size_t element_index(std::string_view token) {
    std::size_t index = std::string_view::npos;
    const bool digits = !token.empty() &&
                        token.find_first_not_of("0123456789") == std::string_view::npos &&
                        (token[0] != '0' || token.size() == 1);
    if (digits &&
        std::from_chars(token.data(), token.data() + token.size(), index).ec != std::errc()) {
        index = std::string_view::npos - 1; // an index, but out of every array's range
    }
    return digits ? index : std::string_view::npos;
}

const char* kind_name(PointerPath::Kind kind) {
    switch (kind) {
    case PointerPath::Kind::null:
        return "JSON null";
    case PointerPath::Kind::boolean:
        return "JSON boolean";
    case PointerPath::Kind::number:
        return "JSON number";
    case PointerPath::Kind::string:
        return "JSON string";
    case PointerPath::Kind::array:
        return "JSON array";
    case PointerPath::Kind::object:
        return "JSON object";
    }
    return "";
}

} // namespace

PointerPath::PointerPath(std::string_view pointer) : pointer(pointer) {
    for (std::size_t start = 0; start < pointer.size();) {
        const std::size_t end = std::min(pointer.find('/', start + 1), pointer.size());
        const std::string_view token = pointer.substr(start + 1, end - start - 1);
        steps.push_back({std::string(token), json::detail::pointer_member_name(token),
                         element_index(token), end});
        start = end;
    }
}

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
    const bool wanted = open.elements++ == steps[path.size() - 1].index;
    open.matched = open.matched || wanted;
    return wanted;
}

bool PointerPath::value(Kind kind) {
    const bool container = kind == Kind::array || kind == Kind::object;
    if (value_open > 0) {
        value_open += container ? 1 : 0;
        return true;
    }
    if (depth != path.size() || !is_wanted_next()) {
        depth += container ? 1 : 0;
        return false;
    }
    if (path.size() == steps.size()) {
        found = true;
        value_open = container ? 1 : 0;
        return true;
    }
    if (container) {
        ++depth;
        path.push_back({kind == Kind::object});
    } else {
        fail(path.size(), std::string("expected JSON object or array, found ") + kind_name(kind));
    }
    return false;
}

bool PointerPath::key(std::string_view name) {
    if (value_open > 0) {
        return true;
    }
    if (depth == path.size() && !path.empty()) {
        Open& open = path.back();
        const Step& step = steps[path.size() - 1];
        open.current_matches = name == step.name;
        if (open.current_matches && std::exchange(open.matched, true) && !ambiguous) {
            // The value at the pointer is not passed on again.
            ambiguous = true;
            failure = pointer.substr(0, step.end) + ": the object has more than one member \"" +
                      step.name + "\"";
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
        const Step& step = steps[path.size() - 1];
        path.pop_back();
        if (open.is_object && !open.matched) {
            fail(path.size(), "no member \"" + step.name + "\"");
        } else if (!open.matched) {
            fail(path.size(), step.index == std::string_view::npos
                                  ? "\"" + step.token + "\" is no index of a JSON array"
                                  : "index " + step.token + " out of range for a JSON array of " +
                                        std::to_string(open.elements) + " elements");
        }
    }
    --depth;
    return false;
}

// Records the first way the path left the document: at step `step`, the first not found.
void PointerPath::fail(std::size_t step, std::string reason) {
    if (failure.empty()) {
        failure = pointer.substr(0, steps[step].end) + ": " + std::move(reason);
    }
}

std::string PointerPath::problem() const {
    if (ambiguous) {
        return "no single value at " + failure;
    }
    return found ? std::string() : "no value at " + failure;
}

} // namespace jsonfmt
