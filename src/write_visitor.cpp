#include "write_visitor.hpp"

#include <json/detail/byte_scan.hpp>
#include <number_text.hpp>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <limits>
#include <type_traits>
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

// The length of the NUL-terminated text in a number buffer of `size` bytes, read one byte at a
// time on purpose: the text was stored a byte or two at a time an instant ago, and a wider load
// over those stores cannot be served from the store buffer and waits for them to reach the
// cache, which costs more than the few byte loads of a number's text.
template <std::size_t size>
std::size_t text_length(const char* text) {
    std::size_t length = 0;
    while (length != size && text[length] != '\0') {
        ++length;
    }
    return length;
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
    // Built in place by emplace_back: a frame assembled on the stack and then copied in was
    // read back as whole blocks before its narrow fields had reached memory, which stalled
    // every opened container.
    struct Frame {
        Frame(int level, const Array& items)
            : level(level), is_object(false), item(items.begin()), items_end(items.end()) {}
        Frame(int level, const Object& members)
            : level(level), is_object(true), member(members.begin()), members_end(members.end()) {}

        int level;
        bool is_object;
        bool empty = true;
        Array::const_iterator item, items_end;
        Object::const_iterator member, members_end;
    };

    void open(const Array& items, int level) {
        record.write_bytes("[", 1);
        open_containers.emplace_back(level, items);
    }

    void open(const Object& members, int level) {
        record.write_bytes("{", 1);
        open_containers.emplace_back(level, members);
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
        record.write_member_name(key);
        return &value;
    }

    void start_entry(Frame& frame) {
        if (!frame.empty) {
            record.write_bytes(",", 1);
        }
        frame.empty = false;
        if (record.pretty) {
            record.new_line(4 * frame.level + 4);
        }
    }

    void close(const Frame& frame) {
        if (record.pretty) {
            if (!frame.empty) {
                record.new_line(4 * frame.level);
            } else {
                record.write_indent(4 * frame.level);
            }
        }
        record.write_bytes(frame.is_object ? "}" : "]", 1);
    }

    // An element or member value at `level`: containers are opened here and finished by the
    // loop; an Undefined element stands as null so that the array stays valid JSON.
    void write_value(const Value& value, int level) {
        switch (value.which()) {
        case ARRAY_INDEX:
            write_container(boost::get<Array>(value), level);
            break;
        case OBJECT_INDEX:
            write_container(boost::get<Object>(value), level);
            break;
        case UNDEFINED_INDEX:
            record.write_bytes("null", 4);
            break;
        default:
            // A scalar's text does not depend on its level: the record itself writes it.
            boost::apply_visitor(record, value);
        }
    }

    // An empty container has nothing left to write after its brackets, so it is written whole
    // instead of being opened; it is the same text open() and close() would give.
    template <typename Container>
    void write_container(const Container& container, int level) {
        if (!container.empty()) {
            open(container, level);
            return;
        }
        const char* const brackets = std::is_same_v<Container, Object> ? "{}" : "[]";
        if (record.pretty) {
            record.write_bytes(brackets, 1);
            record.write_indent(4 * level);
            record.write_bytes(brackets + 1, 1);
        } else {
            record.write_bytes(brackets, 2);
        }
    }

    const WriteVisitor& record;
    std::vector<Frame> open_containers;
};

WriteVisitor::WriteVisitor(OutputBuffer& buffer, bool pretty, int indent)
    : buffer(buffer), pretty(pretty), indent(indent) {}

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
    write_quoted<false>(text);
}

void WriteVisitor::write_member_name(const std::string& name) const {
    write_quoted<true>(name);
}

template <bool with_colon>
inline void WriteVisitor::write_quoted(const std::string& text) const {
    constexpr std::size_t short_size = 16;
    constexpr std::size_t colon = with_colon ? 1 : 0;
    if (text.size() < short_size && text.capacity() >= short_size - 1 &&
        short_run_is_plain<true>(text.data(), text.size())) {
        // Most keys and many values: a short string with nothing to escape. Its storage holds
        // at least sixteen bytes (capacity plus the NUL), so all of them are copied at once
        // and only the string's own are kept; a member name's colon comes in the same piece.
        char* const quoted = buffer.reserve(short_size + 2 + colon);
        quoted[0] = '"';
        std::memcpy(quoted + 1, text.data(), short_size);
        quoted[1 + text.size()] = '"';
        if (with_colon) {
            quoted[2 + text.size()] = ':';
        }
        buffer.commit(quoted + text.size() + 2 + colon);
        return;
    }
    write_escaped<with_colon>(text);
}

// Kept out of line, so that the short path above stays small enough to be inlined.
template <bool with_colon>
__attribute__((noinline)) void WriteVisitor::write_escaped(const std::string& text) const {
    buffer.put('"');
    const char* run = text.data();
    const char* const end = run + text.size();
    for (;;) {
        // Bytes that need no escape go out as one run.
        const char* const byte = find_special_byte<true>(run, end);
        write_bytes(run, static_cast<std::size_t>(byte - run));
        if (byte == end) {
            break;
        }
        const char escape = ESCAPES[static_cast<unsigned char>(*byte)];
        if (escape == 'u') {
            buffer.unicode_escape(static_cast<unsigned char>(*byte));
        } else {
            const char pair[2] = {'\\', escape};
            write_bytes(pair, 2);
        }
        run = byte + 1;
    }
    buffer.put('"');
    if (with_colon) {
        buffer.put(':');
    }
}

void WriteVisitor::write_number(double number) const {
    write_number_text(number, getDoubleValueStr);
}

void WriteVisitor::write_number(float number) const {
    write_number_text(number, getFloatValueStr);
}

// NaN and the infinities are written as strings; every finite number is formatted by the
// number-text library straight into 80 zeroed bytes of the buffer, then kept up to its NUL.
template <typename Number>
void WriteVisitor::write_number_text(Number number, int (*format)(char*, Number)) const {
    if (std::isnan(number)) {
        write_bytes("\"NaN\"", 5);
    } else if (number > std::numeric_limits<Number>::max()) {
        write_bytes("\"Inf\"", 5);
    } else if (number < -std::numeric_limits<Number>::max()) {
        write_bytes("\"-Inf\"", 6);
    } else {
        constexpr std::size_t size = 80;
        char* const text = buffer.reserve(size);
        std::memset(text, 0, size);
        format(text, number);
        buffer.commit(text + text_length<size>(text));
    }
}

void WriteVisitor::write_indent(int count) const {
    if (count > 0) {
        buffer.fill(' ', static_cast<std::size_t>(count));
    }
}

void OutputBuffer::new_line_on_stream(std::size_t indent) {
    if (!widened_newline_known) {
        // widen() throws std::bad_cast for a locale without std::ctype<char>: the text so far
        // must be on the stream by then. Once it has answered, its answer is reused.
        flush();
        widened_newline = out->widen('\n');
        widened_newline_known = true;
    }
    put(widened_newline);
    flush();
    out->flush();
    fill(' ', indent);
}

// On a stream: \u, then the digits from the stream's own formatting, with its flags restored
// afterwards and its fill character left at '0'. In a string: what a default stream writes.
void OutputBuffer::unicode_escape(unsigned char byte) {
    if (out == nullptr) {
        static constexpr char HEX[] = "0123456789abcdef";
        const char escape[6] = {'\\', 'u', '0', '0', HEX[byte >> 4], HEX[byte & 0xF]};
        append(escape, sizeof escape);
        return;
    }
    const std::ios_base::fmtflags saved = out->flags();
    append("\\u", 2);
    flush();
    out->width(4);
    out->fill('0');
    out->setf(std::ios_base::hex, std::ios_base::basefield);
    *out << static_cast<int>(byte);
    out->flags(saved);
}

} // namespace json::detail
