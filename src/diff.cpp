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
    Differ(const Value& source, const Value& target) { compare(source, target); }

    // Walks the containers opened until none is left.
    void run() {
        while (!open.empty()) {
            if (!walk(open.size() - 1)) {
                open.pop_back();
                if (!open.empty()) {
                    path.pop_back(); // the token of the container just walked
                }
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
    // Two containers of one kind being compared: how far their elements or members are.
    struct Open {
        const Value* source;
        const Value* target;
        std::size_t index = 0; // arrays
        Object::const_iterator source_member{};
        Object::const_iterator target_member{};
    };

    // Compares the values at `path`: two containers of one kind are opened, to be walked;
    // anything else that differs is replaced. Returns whether a container was opened.
    bool compare(const Value& source, const Value& target) {
        if (source.which() == target.which() && (source.is_array() || source.is_object())) {
            Open pair{&source, &target};
            if (source.is_object()) {
                pair.source_member = source.as_object().begin();
                pair.target_member = target.as_object().begin();
            }
            open.push_back(pair);
            return true;
        }
        if (source != target) {
            add_operation("replace", &target);
        }
        return false;
    }

    // Compares the children under `token`; returns whether a container was opened, which
    // keeps the token on the path until it has been walked.
    template <typename Token>
    bool compare_child(const Token& token, const Value& source, const Value& target) {
        path.push_back(token);
        const bool opened = compare(source, target);
        if (!opened) {
            path.pop_back();
        }
        return opened;
    }

    template <typename Token>
    void add_operation_at(const char* op, const Token& token, const Value* value) {
        path.push_back(token);
        add_operation(op, value);
        path.pop_back();
    }

    void add_operation(const char* op, const Value* value) {
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
        const Array& source = open[at].source->as_array();
        const Array& target = open[at].target->as_array();
        const std::size_t common = std::min(source.size(), target.size());
        while (open[at].index < common) {
            const std::size_t index = open[at].index++;
            if (compare_child(index, source[index], target[index])) {
                return true;
            }
        }
        for (std::size_t index = common; index < target.size(); ++index) {
            add_operation_at("add", index, &target[index]);
        }
        for (std::size_t index = source.size(); index > common; --index) {
            add_operation_at("remove", index - 1, nullptr);
        }
        return false;
    }

    // Both objects' members in key order at once; a member holding Undefined is absent.
    bool walk_object(std::size_t at) {
        const Object& source = open[at].source->as_object();
        const Object& target = open[at].target->as_object();
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
                add_operation_at("remove", from->first, nullptr);
                ++from;
            } else if (from == source.end() || to->first < from->first) {
                add_operation_at("add", to->first, &to->second);
                ++to;
            } else {
                open[at].source_member = std::next(from);
                open[at].target_member = std::next(to);
                if (compare_child(from->first, from->second, to->second)) {
                    return true;
                }
                ++from;
                ++to;
            }
        }
    }

    std::vector<Open> open; // the containers being walked, innermost last
    Pointer path;           // where the innermost comparison stands
    std::vector<Object> made;
};

} // namespace

Value diff(const Value& source, const Value& target) {
    Differ differ(source, target);
    differ.run();
    return differ.patch();
}

} // namespace json
