#include <json/builders.hpp>

namespace json {

Element::Element(const Value& value) {
    values.push_back(value);
}

// The one item is built in place from the other Element's items: the same Array its
// conversion would give, without a temporary Value to copy.
Element::Element(const Element& other) {
    values.emplace_back(other.values);
}

const Element &Element::operator,(const Element&other) const {
    // Range insertion copies the new items before releasing any old storage and rolls back
    // completely if a copy fails, so appending an Element to itself is sound too.
    values.insert(values.end(), other.values.begin(), other.values.end());
    return *this;
}

Element::operator Value() const {
    return Value(values);
}

Property::Property(const std::string& name) : name(name) {}

const Property& Property::operator=(const Value& value) const {
    auto member = members.lower_bound(name);
    if (member == members.end() || member->first != name) {
        member = members.emplace_hint(member, name, Value());
    }
    member->second = value;
    return *this;
}

const Property& Property::operator=(const Property& other) const {
    // Converted before a member is looked up: `other` may be this Property, and its Object
    // must not contain a member created for the assignment.
    const Value nested = other;
    return *this = nested;
}

const Property &Property::operator,(const Property&other) const {
    for (const auto& member : other.members) {
        // Insertion with a hint looks the key up first and copies nothing when it is
        // present, so the first occurrence of a key wins.
        members.insert(members.end(), member);
    }
    return *this;
}

Property::operator Value() const {
    return Value(members);
}

} // namespace json
