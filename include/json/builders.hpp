#ifndef JSON_BUILDERS_HPP
#define JSON_BUILDERS_HPP

#include <json/detail/export.hpp>
#include <json/value.hpp>

#include <string>
#include <type_traits>

namespace json {

/// Builds a JSON array as a comma-separated expression: `(Element(1), Element("two"))`
/// converts to the Value [1,"two"]. The comma appends the items of its right operand to its
/// left operand and returns the left operand, so a chain of temporaries never copies an
/// Element; the chain is converted to a Value within the same full expression.
///
/// Copying an Element nests it: the copy holds one item, the array of the original's items.
/// That is how `Element((Element(1), Element(2)))` becomes the single item [1,2]. Copy
/// assignment is deleted, since neither nesting nor replacing would be what every reader of
/// `a = b` expects.
class JSONVALUE_API Element {
  public:
    /// One item, a copy of `value` (an Array value is one nested item, never spliced).
    /// Strong guarantee.
    Element(const Value& value);

    /// One item from anything a Value is made from: `Element(1.5)`, `Element("x")`,
    /// `Element(Property("k") = 1)`; a string literal becomes a string. It also lets a plain
    /// value stand as the right operand of the comma: `(Element(1), 2)`.
    template <typename T,
              std::enable_if_t<std::is_constructible_v<Value, const T&> &&
                                   !std::is_same_v<T, Value> && !std::is_same_v<T, Element>,
                               int> = 0>
    Element(const T& value) : Element(Value(value)) {}

    /// One item: an Array holding copies of the items of `other`. Strong guarantee.
    Element(const Element& other);

    Element& operator=(const Element&) = delete;

    /// Appends copies of the items of `other` (which may be this Element) and returns *this.
    /// Strong guarantee: on std::bad_alloc the items are exactly as before.
    const Element& operator,(const Element& other) const;

    /// A Value holding an Array with copies of the items, its storage allocated once at the
    /// exact size. The Element is unchanged. Strong guarantee.
    operator Value() const;

  private:
    mutable Array values;
};

/// Builds a JSON object as a comma-separated expression of named assignments:
/// `(Property("a") = 1, Property("b") = "x")` converts to {"a":1,"b":"x"}. Assigning a Property
/// (or a chain of them) to a Property nests it as an object member. In a comma chain the first
/// occurrence of a key wins; the result carries the name of the leftmost operand.
///
/// Copy construction copies the name and the members; the copy is independent.
class JSONVALUE_API Property {
  public:
    /// An empty Property named `name`. Explicit, so that assigning a std::string to a Property
    /// is never ambiguous between a string value and a Property.
    explicit Property(const std::string& name);

    /// A copy: the same name and copies of the members.
    Property(const Property& other) = default;

    /// Sets the member `name` to a copy of `value`; returns *this. On std::bad_alloc a member
    /// created for the purpose stays, holding what Value's failed assignment leaves.
    const Property& operator=(const Value& value) const;

    /// Sets the member `name` to an Object holding copies of the members of `other` (which may
    /// be this Property, taken as it was before the call); returns *this. Nothing changes if
    /// building that Object fails.
    const Property& operator=(const Property& other) const;

    /// Copies in each member of `other` whose key is not present yet; returns *this. On
    /// std::bad_alloc the members inserted before the failure stay (basic guarantee).
    const Property& operator,(const Property& other) const;

    /// A Value holding an Object with copies of the members, copied node for node without key
    /// searches. The Property is unchanged. Strong guarantee.
    operator Value() const;

  private:
    mutable Object members;
    std::string name;
};

} // namespace json

#endif
