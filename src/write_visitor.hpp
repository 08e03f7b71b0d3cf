#ifndef JSON_SRC_WRITE_VISITOR_HPP
#define JSON_SRC_WRITE_VISITOR_HPP

#include "text_layout.hpp"

#include <json/value.hpp>

#include <cstddef>

namespace json::detail {

/// Writes `value` at `level` in the layout's text: what serialize writes for it, at that depth.
/// A member holding Undefined is left out, an Undefined element is written null, and an
/// Undefined value writes nothing.
///
/// Containers are written from an explicit stack of open containers rather than recursively,
/// so the call stack stays flat however deep the document is. Throws what the layout throws,
/// and std::bad_alloc, leaving the text written so far.
void write_value(TextLayout& layout, const Value& value, std::size_t level);

} // namespace json::detail

#endif
