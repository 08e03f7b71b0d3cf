// The JSON Patch (RFC 6902) between two documents: both walked together, depth first, from a
// work list of the containers being compared, so the call stack stays bounded.
#include <json/patch.hpp>
#include <json/pointer.hpp>

#include <algorithm>
#include <iterator>
#include <string>
#include <utility>
#include <vector>

namespace json {

namespace {

class Differ {
  public:
    Differ(const Value& source, const Value& target) { compare(source, target, nullptr); }

    // Walks the containers opened until none is left.
    void run() {
        while (!open.empty()) {
            if (!walk(open.size() - 1)) {
                open.pop_back();
            }
        }
    }

    // The operations as a patch; each Object is taken over by its Value, none copied.
    Value patch() {
        Array operations;
        operations.reserve(made.size());
        for (Object& operation : made) {
            operations.emplace_back(std::move(operation));
        }
        return Value(std::move(operations));
    }

  private:
    // A step of a path: a member name, or an element's index when there is no name. Paths are
    // written only for operations, from the steps of the open containers.
    struct Token {
        const std::string* name;
        std::size_t index;
    };

    // Two containers of one kind being compared, the step to them from the ones before, and how
    // far their elements or members are.
    struct Open {
        const Value* source;
        const Value* target;
        Token token;
        std::size_t index = 0; // arrays
        Object::const_iterator source_member{};
        Object::const_iterator target_member{};
    };

    // Compares the values at `token` in the innermost open containers (at the top when null):
    // two containers of one kind are opened, to be walked; anything else that differs is
    // replaced. Returns whether a container was opened.
    [[gnu::always_inline]] bool compare(const Value& source, const Value& target,
                                        const Token* token) {
        if (source.which() == target.which() && (source.is_array() || source.is_object())) {
            Open pair{&source, &target, token == nullptr ? Token{} : *token};
            if (source.is_object()) {
                pair.source_member = boost::get<Object>(source).begin();
                pair.target_member = boost::get<Object>(target).begin();
            }
            open.push_back(pair);
            return true;
        }
        if (differ(source, target)) {
            add_operation("replace", token, &target);
        }
        return false;
    }

    // operator!= for values that are not containers of one kind, with the leaves most
    // documents are made of compared inline. (Here and below boost::get, inline, rather than
    // the library's own checked accessors: the kinds are known.)
    [[gnu::always_inline]] static bool differ(const Value& source, const Value& target) {
        if (source.which() == target.which() && source.which() == detail::DOUBLE_INDEX) {
            return boost::get<double>(source) != boost::get<double>(target);
        }
        if (source.which() == target.which() && source.is_string()) {
            return boost::get<std::string>(source) != boost::get<std::string>(target);
        }
        return source != target;
    }

    static void append(Pointer& path, const Token& token) {
        if (token.name != nullptr) {
            path.push_back(*token.name);
        } else {
            path.push_back(token.index);
        }
    }

    // An operation at `token` in the innermost open containers (at the top when null).
    void add_operation(const char* op, const Token* token, const Value* value) {
        Pointer path;
        for (std::size_t at = 1; at < open.size(); ++at) {
            append(path, open[at].token);
        }
        if (token != nullptr) {
            append(path, *token);
        }
        Object operation;
        operation.emplace("op", op);
        operation.emplace("path", path.text());
        if (value != nullptr) {
            operation.emplace("value", *value);
        }
        made.push_back(std::move(operation));
    }

    // Goes on with the container `at` of the list; returns false when it is through, true
    // when it opened another container first. Where it stands is stored before a child is
    // compared: opening one may move the list.
    bool walk(std::size_t at) {
        return open[at].source->is_array() ? walk_array(at) : walk_object(at);
    }

    bool walk_array(std::size_t at) {
        const auto& source = boost::get<Array>(*open[at].source);
        const auto& target = boost::get<Array>(*open[at].target);
        const std::size_t common = std::min(source.size(), target.size());
        while (open[at].index < common) {
            const Token token{nullptr, open[at].index++};
            if (compare(source[token.index], target[token.index], &token)) {
                return true;
            }
        }
        for (std::size_t index = common; index < target.size(); ++index) {
            const Token token{nullptr, index};
            add_operation("add", &token, &target[index]);
        }
        for (std::size_t index = source.size(); index > common; --index) {
            const Token token{nullptr, index - 1};
            add_operation("remove", &token, nullptr);
        }
        return false;
    }

    // Both objects' members in key order at once; a member holding Undefined is absent.
    bool walk_object(std::size_t at) {
        const auto& source = boost::get<Object>(*open[at].source);
        const auto& target = boost::get<Object>(*open[at].target);
        auto from = open[at].source_member;
        auto to = open[at].target_member;
        for (;;) {
            while (from != source.end() && from->second.is_undefined()) {
                ++from;
            }
            while (to != target.end() && to->second.is_undefined()) {
                ++to;
            }
            if (from == source.end() && to == target.end()) {
                return false;
            }
            if (to == target.end() || (from != source.end() && from->first < to->first)) {
                const Token token{&from->first, 0};
                add_operation("remove", &token, nullptr);
                ++from;
            } else if (from == source.end() || to->first < from->first) {
                const Token token{&to->first, 0};
                add_operation("add", &token, &to->second);
                ++to;
            } else {
                open[at].source_member = std::next(from);
                open[at].target_member = std::next(to);
                const Token token{&from->first, 0};
                if (compare(from->second, to->second, &token)) {
                    return true;
                }
                ++from;
                ++to;
            }
        }
    }

    std::vector<Open> open; // the containers being walked, innermost last
    std::vector<Object> made;
};

} // namespace

Value diff(const Value& source, const Value& target) {
    Differ differ(source, target);
    differ.run();
    return differ.patch();
}

} // namespace json
