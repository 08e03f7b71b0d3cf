#include "merge_patch_filter.hpp"

#include <json/patch.hpp>
#include <json/serializer.hpp>

namespace jsonfmt {

namespace {

bool is_container(json::Kind kind) {
    return kind == json::Kind::ARRAY || kind == json::Kind::OBJECT;
}

// The text of what a merge patch value puts in where there is no object to merge it into:
// the value, less the null members of its objects.
std::string merged_text(const json::Value& patch) {
    json::Value merged;
    json::apply_merge_patch(merged, patch);
    return json::serialize(merged);
}

} // namespace

MergePatchPath::Fate MergePatchPath::value(json::Kind kind) {
    const std::size_t opened = is_container(kind) ? 1 : 0;
    if (skipped_open > 0) {
        skipped_open += opened;
        return Fate::SKIP;
    }
    if (remove_next) {
        remove_next = false;
        skipped_open = opened;
        return Fate::SKIP;
    }
    const json::Value* const patch = std::exchange(pending, nullptr);
    if (patch == nullptr) {
        passed_open += opened;
        return Fate::PASS;
    }
    if (patch->is_object() && kind == json::Kind::OBJECT) {
        patched.push_back({&patch->as_object(), {}});
        return Fate::PASS;
    }
    replacing = merged_text(*patch);
    skipped_open = opened;
    return Fate::REPLACE;
}

MergePatchPath::Fate MergePatchPath::key(std::string_view name) {
    if (skipped_open > 0) {
        return Fate::SKIP;
    }
    if (passed_open > 0) {
        return Fate::PASS;
    }
    Patched& object = patched.back();
    const auto member = object.patch->find(std::string(name));
    if (member == object.patch->end() || member->second.is_undefined()) {
        return Fate::PASS;
    }
    if (!object.seen.insert(&member->second).second) {
        refusal = "the object has more than one member \"" + member->first +
                  "\": the merge patch cannot tell which one it changes";
        return Fate::REFUSE;
    }
    if (member->second.is_null()) {
        remove_next = true;
        return Fate::SKIP;
    }
    pending = &member->second;
    return Fate::PASS;
}

bool MergePatchPath::close() {
    added.clear();
    if (skipped_open > 0) {
        --skipped_open;
        return false;
    }
    if (passed_open > 0) {
        --passed_open;
        return true;
    }
    const Patched closing = std::move(patched.back());
    patched.pop_back();
    for (const auto& [name, value] : *closing.patch) {
        if (!value.is_null() && !value.is_undefined() && closing.seen.count(&value) == 0) {
            added.emplace_back(name, merged_text(value));
        }
    }
    return true;
}

} // namespace jsonfmt
