#include <json/serializer.hpp>

#include "string_stream.hpp"
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

std::string write_to_string(const Value& value, bool pretty) {
    Serializer serializer;
    serializer.pretty_print(pretty);
    detail::StringStream text;
    serializer.write(text, value);
    return text.take();
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
