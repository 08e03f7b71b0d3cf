#include <json/serializer.hpp>

#include "write_visitor.hpp"

namespace json {

Serializer::Serializer() : pretty(false) {}

Serializer::~Serializer() = default;

void Serializer::pretty_print(bool on) {
    pretty = on;
}

bool Serializer::pretty_print() const {
    return pretty;
}

void Serializer::write(std::ostream& out, const Value& value) {
    detail::OutputBuffer buffer(out);
    detail::WriteVisitor record(buffer, pretty, 0);
    boost::apply_visitor(record, value);
    buffer.flush();
}

namespace {

// The text a Serializer would write into a std::ostringstream in its default state, written
// straight into the string instead: nobody else sees that stream, so the stream's
// bookkeeping (a flush per newline in pretty mode, a copy of the text at the end) buys
// nothing.
std::string write_to_string(const Value& value, bool pretty) {
    std::string text;
    detail::OutputBuffer buffer(text);
    detail::WriteVisitor record(buffer, pretty, 0);
    boost::apply_visitor(record, value);
    buffer.flush();
    return text;
}

} // namespace

std::string serialize(const Value& value) {
    return write_to_string(value, false);
}

std::string pretty_print(const Value& value) {
    return write_to_string(value, true);
}

std::ostream& operator<<(std::ostream& out, const Value& value) {
    Serializer().write(out, value);
    return out;
}

} // namespace json
