#include <json/serializer.hpp>

#include "write_visitor.hpp"

#include <algorithm>
#include <ios>
#include <limits>
#include <ostream>

namespace json {

namespace {

WriteOptions in_mode(bool pretty) {
    WriteOptions options;
    options.pretty = pretty;
    return options;
}

} // namespace

Serializer::Serializer() : pretty(false) {}

Serializer::~Serializer() = default;

void Serializer::pretty_print(bool on) {
    pretty = on;
}

bool Serializer::pretty_print() const {
    return pretty;
}

void Serializer::write(std::ostream& out, const Value& value) {
    json::write(out, value, in_mode(pretty));
}

std::ostream& write(std::ostream& out, const Value& value, const WriteOptions& options) {
    detail::OutputBuffer buffer(out, detail::StreamText::formatted);
    detail::TextLayout layout(buffer, options);
    detail::write_value(layout, value, 0);
    buffer.flush();
    return out;
}

// The text a formatted stream would hold if it were a std::ostringstream in its default state,
// written into the string instead: nobody else sees that stream, so the stream's bookkeeping
// (a flush per newline in pretty mode, a copy of the text at the end) buys nothing. A small
// document is gathered and appended whole: one allocation of its own size.
std::string serialize(const Value& value, const WriteOptions& options) {
    std::string text;
    detail::OutputBuffer buffer(text);
    detail::TextLayout layout(buffer, options);
    detail::write_value(layout, value, 0);
    buffer.flush();
    return text;
}

std::string serialize(const Value& value) {
    return serialize(value, WriteOptions());
}

std::string pretty_print(const Value& value) {
    return serialize(value, in_mode(true));
}

std::ostream& operator<<(std::ostream& out, const Value& value) {
    WriteOptions options;
    if (const std::streamsize width = out.width(); width > 0) {
        options.pretty = true;
        options.indent = static_cast<unsigned>(
            std::min<std::streamsize>(width, std::numeric_limits<unsigned>::max()));
        out.width(0); // used up, as by the standard inserters
    }
    return json::write(out, value, options);
}

} // namespace json
