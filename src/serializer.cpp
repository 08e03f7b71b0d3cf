#include <json/serializer.hpp>

#include "write_visitor.hpp"

#include <sstream>

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
    detail::WriteVisitor record(out, pretty, 0);
    boost::apply_visitor(record, value);
}

namespace {

std::string write_to_string(const Value& value, bool pretty) {
    Serializer serializer;
    serializer.pretty_print(pretty);
    std::ostringstream text;
    serializer.write(text, value);
    return text.str();
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
