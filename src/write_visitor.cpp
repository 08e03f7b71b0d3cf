#include "write_visitor.hpp"

#include <number_text.hpp>

#include <array>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <string_view>
#include <vector>

namespace json::detail {

namespace {

// For each byte: 0 when it is written as it is, 'u' for a \u escape, otherwise the letter that
// follows the backslash of its two-character escape.
constexpr std::array<char, 256> make_escape_table() {
    std::array<char, 256> table{};
    for (int byte = 0; byte < 0x20; ++byte) {
        table[byte] = 'u';
    }
    table['\b'] = 'b';
    table['\t'] = 't';
    table['\n'] = 'n';
    table['\f'] = 'f';
    table['\r'] = 'r';
    table['"'] = '"';
    table['/'] = '/';
    table['\\'] = '\\';
    return table;
}

constexpr std::array<char, 256> ESCAPES = make_escape_table();

// The text of a number: the number-text library's for finite values, JSON strings for NaN and
// the infinities, which it never sees. `buffer` is zero-filled by the caller.
template <typename Number>
std::string_view number_text(Number number, char (&buffer)[80], int (*format)(char*, Number)) {
    if (std::isnan(number)) {
        return "\"NaN\"";
    }
    if (number > std::numeric_limits<Number>::max()) {
        return "\"Inf\"";
    }
    if (number < -std::numeric_limits<Number>::max()) {
        return "\"-Inf\"";
    }
    format(buffer, number);
    return std::string_view(buffer, strnlen(buffer, sizeof buffer));
}

} // namespace

// Writes the contents of one container, and of every container inside it, from an explicit
// stack of open containers.
class WriteVisitor::ContainerWriter {
  public:
    explicit ContainerWriter(const WriteVisitor& record) : record(record) {}

    template <typename Container>
    void write(const Container& container, int level) {
        open(container, level);
        while (!open_containers.empty()) {
            Frame& top = open_containers.back();
            const Value* next = top.is_object ? next_member(top) : next_item(top);
            if (next == nullptr) {
                close(top);
                open_containers.pop_back();
            } else {
                write_value(*next, top.level + 1);
            }
        }
    }

  private:
    struct Frame {
        int level;
        bool is_object;
        bool empty;
        Array::const_iterator item, items_end;
        Object::const_iterator member, members_end;
    };

    void open(const Array& items, int level) {
        record.write_bytes("[", 1);
        open_containers.push_back({level, false, true, items.begin(), items.end(), {}, {}});
    }

    void open(const Object& members, int level) {
        record.write_bytes("{", 1);
        open_containers.push_back({level, true, true, {}, {}, members.begin(), members.end()});
    }

    // The next element, after its separator; null at the end of the array.
    const Value* next_item(Frame& frame) {
        if (frame.item == frame.items_end) {
            return nullptr;
        }
        start_entry(frame);
        return &*frame.item++;
    }

    // The value of the next member, after its separator, key and colon; null at the end of
    // the object. Members holding Undefined are skipped: they have no JSON text.
    const Value* next_member(Frame& frame) {
        while (frame.member != frame.members_end &&
               frame.member->second.which() == UNDEFINED_INDEX) {
            ++frame.member;
        }
        if (frame.member == frame.members_end) {
            return nullptr;
        }
        start_entry(frame);
        const auto& [key, value] = *frame.member++;
        record.write_string(key);
        record.write_bytes(":", 1);
        return &value;
    }

    void start_entry(Frame& frame) {
        if (!frame.empty) {
            record.write_bytes(",", 1);
        }
        frame.empty = false;
        if (record.pretty) {
            record.new_line();
            record.write_indent(4 * frame.level + 4);
        }
    }

    void close(const Frame& frame) {
        if (record.pretty) {
            if (!frame.empty) {
                record.new_line();
            }
            record.write_indent(4 * frame.level);
        }
        record.write_bytes(frame.is_object ? "}" : "]", 1);
    }

    // An element or member value at `level`: containers are opened here and finished by the
    // loop; an Undefined element stands as null so that the array stays valid JSON.
    void write_value(const Value& value, int level) {
        switch (value.which()) {
        case ARRAY_INDEX:
            open(boost::get<Array>(value), level);
            break;
        case OBJECT_INDEX:
            open(boost::get<Object>(value), level);
            break;
        case UNDEFINED_INDEX:
            record.write_bytes("null", 4);
            break;
        default:
            boost::apply_visitor(WriteVisitor(record.out, record.pretty, level), value);
        }
    }

    const WriteVisitor& record;
    std::vector<Frame> open_containers;
};

WriteVisitor::WriteVisitor(std::ostream& out, bool pretty, int indent)
    : out(out), pretty(pretty), indent(indent) {}

void WriteVisitor::operator()(const Null&) const {
    write_bytes("null", 4);
}

void WriteVisitor::operator()(bool boolean) const {
    if (boolean) {
        write_bytes("true", 4);
    } else {
        write_bytes("false", 5);
    }
}

void WriteVisitor::write_array(const Array& items) const {
    ContainerWriter(*this).write(items, indent);
}

void WriteVisitor::write_object(const Object& members) const {
    ContainerWriter(*this).write(members, indent);
}

void WriteVisitor::write_string(const std::string& text) const {
    write_bytes("\"", 1);
    const char* run = text.data();
    const char* const end = run + text.size();
    for (const char* byte = run; byte != end; ++byte) {
        const char escape = ESCAPES[static_cast<unsigned char>(*byte)];
        if (escape == 0) {
            continue;
        }
        // Bytes that need no escape go out as one run per write.
        write_bytes(run, static_cast<std::size_t>(byte - run));
        if (escape == 'u') {
            write_unicode_escape(static_cast<unsigned char>(*byte));
        } else {
            const char pair[2] = {'\\', escape};
            write_bytes(pair, 2);
        }
        run = byte + 1;
    }
    write_bytes(run, static_cast<std::size_t>(end - run));
    write_bytes("\"", 1);
}

void WriteVisitor::write_number(double number) const {
    char buffer[80] = {};
    const std::string_view text = number_text(number, buffer, getDoubleValueStr);
    write_bytes(text.data(), text.size());
}

void WriteVisitor::write_number(float number) const {
    char buffer[80] = {};
    const std::string_view text = number_text(number, buffer, getFloatValueStr);
    write_bytes(text.data(), text.size());
}

void WriteVisitor::new_line() const {
    out << std::endl;
}

void WriteVisitor::write_indent(int count) const {
    // Deep documents indent by thousands of spaces: write them in large pieces.
    static const std::string spaces(1024, ' ');
    const int chunk = static_cast<int>(spaces.size());
    for (; count > 0; count -= chunk) {
        write_bytes(spaces.data(), static_cast<std::size_t>(count < chunk ? count : chunk));
    }
}

void WriteVisitor::write_bytes(const char* bytes, std::size_t count) const {
    if (count != 0) {
        out.write(bytes, static_cast<std::streamsize>(count));
    }
}

// \u and four hex digits through the stream's own formatting. The fill character is left at
// '0' afterwards; the format flags are restored once the digits are out.
void WriteVisitor::write_unicode_escape(unsigned char byte) const {
    const std::ios_base::fmtflags saved = out.flags();
    write_bytes("\\u", 2);
    out.width(4);
    out.fill('0');
    out.setf(std::ios_base::hex, std::ios_base::basefield);
    out << static_cast<int>(byte);
    out.flags(saved);
}

} // namespace json::detail
