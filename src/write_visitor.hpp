#ifndef JSON_SRC_WRITE_VISITOR_HPP
#define JSON_SRC_WRITE_VISITOR_HPP

#include "output_buffer.hpp"

#include <json/value.hpp>

#include <algorithm>
#include <string>

namespace json::detail {

/// The writer record of one Serializer::write call: where the text goes (a stream or a
/// string, behind an OutputBuffer), the mode and the nesting level of the value it writes. Applied
/// to a Value with boost::apply_visitor, it writes the alternative the Value holds.
///
/// Containers are written from an explicit stack of open containers rather than by applying a
/// child record recursively, so the call stack stays flat however deep the document is; the
/// text is the one the recursive layout describes, level L + 1 for the contents of a container
/// at level L.
class WriteVisitor : public boost::static_visitor<void> {
  public:
    WriteVisitor(OutputBuffer& buffer, bool pretty, int indent);

    void operator()(const Undefined&) const {}
    void operator()(const Null&) const;
    void operator()(bool boolean) const;
    void operator()(double number) const { write_number(number); }
    void operator()(const std::string& text) const { write_string(text); }
    void operator()(const Array& items) const { write_array(items); }
    void operator()(const Object& members) const { write_object(members); }
    void operator()(float number) const { write_number(number); }

    /// The quoted, escaped string of a string value.
    void write_string(const std::string& text) const;
    /// A member name as write_string writes it, and its colon.
    void write_member_name(const std::string& name) const;
    /// The number's text; NaN and the infinities as the strings "NaN", "Inf", "-Inf".
    void write_number(double number) const;
    void write_number(float number) const;
    void write_array(const Array& items) const;
    void write_object(const Object& members) const;
    /// The widened '\n', then a flush (exactly what std::endl does), then `indent` spaces.
    void new_line(int indent) const {
        buffer.new_line(static_cast<std::size_t>(std::max(indent, 0)));
    }
    /// `count` spaces.
    void write_indent(int count) const;

  private:
    class ContainerWriter;

    void write_bytes(const char* bytes, std::size_t count) const { buffer.append(bytes, count); }
    template <bool with_colon>
    void write_quoted(const std::string& text) const;
    /// write_quoted's general case: a string of any length, its escapes written out.
    template <bool with_colon>
    void write_escaped(const std::string& text) const;
    template <typename Number>
    void write_number_text(Number number, int (*format)(char*, Number)) const;

    OutputBuffer& buffer;
    bool pretty;
    int indent;
};

} // namespace json::detail

#endif
