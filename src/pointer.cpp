#include "messages.hpp"

#include <json/pointer.hpp>
#include <json/value.hpp>

#include <algorithm>
#include <charconv>
#include <stdexcept>
#include <string>

namespace json {

namespace {

// The element a token names: "0", or digits without a leading zero. An index too large for
// std::size_t is past the end of every array.
std::size_t element_index(std::string_view token) {
    const bool digits = !token.empty() &&
                        token.find_first_not_of("0123456789") == std::string_view::npos &&
                        (token[0] != '0' || token.size() == 1);
    if (!digits) {
        return Pointer::NOT_AN_INDEX;
    }
    std::size_t index = 0;
    const std::from_chars_result read =
        std::from_chars(token.data(), token.data() + token.size(), index);
    return read.ec == std::errc() && index < Pointer::NOT_AN_INDEX ? index
                                                                   : Pointer::NOT_AN_INDEX - 1;
}

// The member name a well-formed token stands for: "~1" is '/', "~0" is '~'.
std::string member_name(std::string_view token) {
    std::string name;
    name.reserve(token.size());
    for (std::size_t i = 0; i < token.size(); ++i) {
        if (token[i] == '~') {
            name += token[++i] == '0' ? '~' : '/';
        } else {
            name += token[i];
        }
    }
    return name;
}

[[noreturn]] void refuse(std::string_view text, const char* reason) {
    throw std::invalid_argument("JSON Pointer \"" + std::string(text) + "\" " + reason);
}

} // namespace

Pointer::Pointer(std::string_view text) : written(text) {
    if (!text.empty() && text.front() != '/') {
        refuse(text, "does not start with '/'");
    }
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '~' &&
            (i + 1 == text.size() || (text[i + 1] != '0' && text[i + 1] != '1'))) {
            refuse(text, "has a '~' not followed by '0' or '1'");
        }
    }
    for (std::size_t start = 0; start < text.size();) {
        const std::size_t end = std::min(text.find('/', start + 1), text.size());
        add_step(start, end);
        start = end;
    }
}

void Pointer::add_step(std::size_t start, std::size_t end) {
    const std::string_view token = std::string_view(written).substr(start + 1, end - start - 1);
    steps.push_back({member_name(token), element_index(token), end});
}

std::string_view Pointer::token(std::size_t step) const noexcept {
    const std::size_t start = step == 0 ? 0 : steps[step - 1].end;
    return std::string_view(written).substr(start + 1, steps[step].end - start - 1);
}

std::string_view Pointer::prefix(std::size_t count) const noexcept {
    return std::string_view(written).substr(0, count == 0 ? 0 : steps[count - 1].end);
}

Pointer& Pointer::push_back(std::string_view name) {
    const std::size_t start = written.size();
    written += '/';
    try {
        written += escape_pointer_token(name);
        add_step(start, written.size());
    } catch (...) {
        written.resize(start);
        throw;
    }
    return *this;
}

Pointer& Pointer::push_back(std::size_t index) {
    return push_back(std::to_string(index));
}

void Pointer::pop_back() noexcept {
    steps.pop_back();
    written.resize(steps.empty() ? 0 : steps.back().end);
}

Value* Pointer::child(Value& parent, std::size_t step) const noexcept {
    if (parent.is_object()) {
        return parent.find(steps[step].name);
    }
    if (parent.is_array() && steps[step].index < parent.as_array().size()) {
        return &parent.as_array()[steps[step].index];
    }
    return nullptr;
}

Value* Pointer::find(Value& root, std::size_t count) const noexcept {
    Value* current = &root;
    for (std::size_t step = 0; step < count && current != nullptr; ++step) {
        current = child(*current, step);
    }
    return current;
}

const Value* Pointer::find(const Value& root, std::size_t count) const noexcept {
    return find(const_cast<Value&>(root), count);
}

std::size_t Pointer::found_steps(const Value& root, std::size_t count) const noexcept {
    Value* current = const_cast<Value*>(&root);
    for (std::size_t step = 0; step < count; ++step) {
        current = child(*current, step);
        if (current == nullptr) {
            return step;
        }
    }
    return count;
}

Value* Pointer::find(Value& root) const noexcept {
    return find(root, size());
}

const Value* Pointer::find(const Value& root) const noexcept {
    return find(root, size());
}

Value& Pointer::at(Value& root) const {
    Value* parent = &root;
    for (std::size_t step = 0; step < size(); ++step) {
        Value* const next = child(*parent, step);
        if (next == nullptr) {
            throw std::out_of_range(std::string(prefix(step + 1)) + ": " +
                                    why_missing(step, *parent));
        }
        parent = next;
    }
    return *parent;
}

const Value& Pointer::at(const Value& root) const {
    return at(const_cast<Value&>(root));
}

std::string Pointer::why_missing(std::size_t step, const Value& parent) const {
    return why_missing(step, parent.kind(), parent.is_array() ? parent.as_array().size() : 0);
}

std::string Pointer::why_missing(std::size_t step, Kind parent, std::size_t elements) const {
    if (parent == Kind::OBJECT) {
        return "no member \"" + name(step) + "\"";
    }
    if (parent != Kind::ARRAY) {
        return std::string("expected JSON object or array, found ") + kind_name(parent);
    }
    if (index(step) == NOT_AN_INDEX) {
        // Digits that are no index can only have a leading zero.
        const bool digits = !token(step).empty() &&
                            token(step).find_first_not_of("0123456789") == std::string_view::npos;
        return "\"" + std::string(token(step)) + "\" is no index of a " + kind_name(Kind::ARRAY) +
               (digits ? ": it has a leading zero" : "");
    }
    return detail::index_out_of_range(token(step), elements);
}

std::string escape_pointer_token(std::string_view name) {
    std::string token;
    token.reserve(name.size());
    for (const char c : name) {
        if (c == '~') {
            token += "~0";
        } else if (c == '/') {
            token += "~1";
        } else {
            token += c;
        }
    }
    return token;
}

} // namespace json
