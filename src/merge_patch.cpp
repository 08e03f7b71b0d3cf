// JSON Merge Patch (RFC 7396): applying one, and the one between two documents. Both walk
// nested objects from work lists, so the call stack stays bounded.
#include <json/patch.hpp>

#include <string>
#include <utility>
#include <vector>

namespace json {

namespace {

// What a merge patch makes of anything but an object: the patch, less its members (and
// theirs, through objects) that are null.
void drop_null_members(Value& merged) {
    if (!merged.is_object()) {
        return;
    }
    std::vector<Object*> objects{&merged.as_object()};
    while (!objects.empty()) {
        Object& members = *objects.back();
        objects.pop_back();
        for (auto member = members.begin(); member != members.end();) {
            if (member->second.is_null()) {
                member = members.erase(member);
                continue;
            }
            if (member->second.is_object()) {
                objects.push_back(&member->second.as_object());
            }
            ++member;
        }
    }
}

// A change to one member of an object of the document: the member removed, replaced or added.
struct MemberChange {
    Object* object;
    Object::iterator member;  // the member there now, or the object's end
    Object::node_type merged; // what takes its place (empty for a removal)
};

// The changes an object patch makes to an object of the document, made ready without
// touching the document: every allocation happens here.
std::vector<MemberChange> prepare(Object& document, const Object& patch) {
    std::vector<MemberChange> changes;
    std::vector<std::pair<Object*, const Object*>> pending{{&document, &patch}};
    while (!pending.empty()) {
        const auto [target, changed] = pending.back();
        pending.pop_back();
        for (const auto& [name, value] : *changed) {
            if (value.is_undefined()) {
                continue;
            }
            const auto member = target->find(name);
            const bool present = member != target->end();
            if (value.is_null()) {
                if (present) {
                    changes.push_back({target, member, {}});
                }
            } else if (value.is_object() && present && member->second.is_object()) {
                pending.emplace_back(&member->second.as_object(), &value.as_object());
            } else {
                Object scratch;
                drop_null_members(scratch.emplace(name, value).first->second);
                changes.push_back({target, member, scratch.extract(scratch.begin())});
            }
        }
    }
    return changes;
}

// The member `name` of `members`, or null when it has none or it holds Undefined.
const Value* member(const Object& members, const std::string& name) {
    const auto found = members.find(name);
    return found == members.end() || found->second.is_undefined() ? nullptr : &found->second;
}

// One step of merge_diff: an object of the result, the two objects it tells apart, and where
// it stands in its parent in the result (so that it can be dropped when it stays empty).
struct ObjectDiff {
    const Object* source;
    const Object* target;
    Object* out;
    Object* parent;
    const std::string* name;
};

} // namespace

void apply_merge_patch(Value& document, const Value& patch) {
    if (!patch.is_object() || !document.is_object()) {
        Value merged(patch);
        if (patch.is_object()) {
            drop_null_members(merged); // merged into an empty object
        }
        document.swap(merged);
        return;
    }
    // From here on nothing can fail: nodes change places, and what goes is released.
    for (MemberChange& change : prepare(document.as_object(), patch.as_object())) {
        if (change.member != change.object->end()) {
            change.object->erase(change.member);
        }
        if (change.merged) {
            change.object->insert(std::move(change.merged));
        }
    }
}

Value merge_diff(const Value& source, const Value& target) {
    if (!source.is_object() || !target.is_object()) {
        return target;
    }
    Object result;
    std::vector<ObjectDiff> steps{
        {&source.as_object(), &target.as_object(), &result, nullptr, nullptr}};
    // Objects of both are looked at in the order they were found; their results are filled
    // in place, and emptied ones dropped afterwards, innermost first.
    for (std::size_t at = 0; at < steps.size(); ++at) {
        const ObjectDiff step = steps[at];
        for (const auto& [name, value] : *step.source) {
            if (!value.is_undefined() && member(*step.target, name) == nullptr) {
                step.out->emplace(name, nullptr);
            }
        }
        for (const auto& [name, value] : *step.target) {
            const Value* const before = member(*step.source, name);
            if (value.is_undefined()) {
                continue;
            }
            // Two objects are not compared first, which would walk them once per level.
            if (before != nullptr && before->is_object() && value.is_object()) {
                auto& child = step.out->emplace(name, Object()).first->second.as_object();
                steps.push_back(
                    {&before->as_object(), &value.as_object(), &child, step.out, &name});
            } else if (before == nullptr || *before != value) {
                step.out->emplace(name, value);
            }
        }
    }
    for (auto step = steps.rbegin(); step != steps.rend() && step->parent != nullptr; ++step) {
        if (step->out->empty()) {
            step->parent->erase(*step->name);
        }
    }
    return Value(std::move(result));
}

} // namespace json
