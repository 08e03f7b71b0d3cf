#include <json/writer.hpp>

#include "text_layout.hpp"
#include "write_visitor.hpp"

#include <json/detail/byte_scan.hpp>

#include <stdexcept>
#include <vector>

namespace json {

namespace {

// Whether `text` is a JSON number: -?(0|[1-9][0-9]*)(\.[0-9]+)?([eE][+-]?[0-9]+)?
bool is_json_number(std::string_view text) {
    const char* at = text.data();
    const char* const end = at + text.size();
    const auto next_is = [&](char c) { return at != end && *at == c; };
    // Skips one or more digits; false when there is none.
    const auto skip_digits = [&] {
        const char* const from = at;
        at = detail::skip_digits(at, end);
        return at != from;
    };
    if (next_is('-')) {
        ++at;
    }
    if (next_is('0')) {
        ++at;
    } else if (!skip_digits()) {
        return false;
    }
    if (next_is('.')) {
        ++at;
        if (!skip_digits()) {
            return false;
        }
    }
    if (next_is('e') || next_is('E')) {
        ++at;
        if (next_is('+') || next_is('-')) {
            ++at;
        }
        if (!skip_digits()) {
            return false;
        }
    }
    return at == end;
}

} // namespace

// The open containers and what each event may do next. Each event checks first that it may
// come (throwing before it writes anything), then writes; an exception while writing leaves
// the Writer failed.
class Writer::State {
  public:
    State(std::string& text, const WriteOptions& options)
        : buffer(text), layout(buffer, options), stream(nullptr) {}
    State(std::ostream& out, const WriteOptions& options)
        : buffer(out, detail::StreamText::plain), layout(buffer, options), stream(&out) {}

    // Checks that a value may come now.
    void expect_value() const {
        expect_usable();
        if (open.empty()) {
            if (finished) {
                throw std::logic_error("json::Writer: a second top-level value");
            }
        } else if (open.back().is_object && !member_value_due) {
            throw std::logic_error("json::Writer: a value where a member name belongs");
        }
    }

    // Checks that a member name may come now.
    void expect_key() const {
        expect_usable();
        if (open.empty() || !open.back().is_object) {
            throw std::logic_error("json::Writer: a member name outside an object");
        }
        if (member_value_due) {
            throw std::logic_error("json::Writer: a member name where a value belongs");
        }
    }

    // Checks that the innermost open container is an object (or an array) that may close.
    void expect_close(bool is_object) const {
        expect_usable();
        if (open.empty() || open.back().is_object != is_object) {
            throw std::logic_error(is_object ? "json::Writer: end_object with no object open"
                                             : "json::Writer: end_array with no array open");
        }
        if (member_value_due) {
            throw std::logic_error("json::Writer: an object closed after a member name");
        }
    }

    bool member_value_is_due() const { return member_value_due; }

    // Runs `write` (which the checks have allowed); an exception from it leaves the Writer
    // failed, its text cut short.
    template <typename Writing>
    bool write(Writing&& writing) {
        try {
            writing();
        } catch (...) {
            failed = true;
            throw;
        }
        return true;
    }

    // What goes before a value: in an array, its separator and line.
    void start_value() {
        if (!open.empty() && !open.back().is_object) {
            start_entry();
        }
        member_value_due = false;
    }

    // After a value: when it was the top-level one, its text is handed on whole.
    void end_value() {
        if (open.empty()) {
            finished = true;
            buffer.flush();
        }
    }

    void key(std::string_view name) {
        start_entry();
        layout.member_name(name);
        member_value_due = true;
    }

    void begin(bool is_object) {
        start_value();
        layout.open(is_object ? '{' : '[');
        open.push_back({is_object, true});
    }

    void end() {
        const Frame top = open.back();
        layout.close(top.is_object ? '}' : ']', top.empty, open.size() - 1);
        open.pop_back();
        end_value();
    }

    // The level of the next value.
    std::size_t level() const { return open.size(); }

    bool complete() const { return finished; }

    void flush() {
        buffer.flush();
        if (stream != nullptr) {
            stream->flush();
        }
    }

    void hand_on() { buffer.flush(); }

    detail::OutputBuffer buffer;
    detail::TextLayout layout;

  private:
    struct Frame {
        bool is_object;
        bool empty;
    };

    void expect_usable() const {
        if (failed) {
            throw std::logic_error("json::Writer: an earlier write failed");
        }
    }

    void start_entry() {
        Frame& top = open.back();
        layout.start_entry(top.empty, open.size() - 1);
        top.empty = false;
    }

    std::ostream* stream;
    std::vector<Frame> open; // innermost last
    bool member_value_due = false;
    bool finished = false;
    bool failed = false;
};

Writer::Writer(std::string& text, const WriteOptions& options)
    : state(std::make_unique<State>(text, options)) {}

Writer::Writer(std::ostream& out, const WriteOptions& options)
    : state(std::make_unique<State>(out, options)) {}

Writer::~Writer() {
    try {
        state->hand_on();
    } catch (...) { // NOLINT(bugprone-empty-catch): a destructor cannot report it
    }
}

bool Writer::null() {
    state->expect_value();
    return state->write([this] {
        state->start_value();
        state->layout.null();
        state->end_value();
    });
}

bool Writer::boolean(bool value) {
    state->expect_value();
    return state->write([this, value] {
        state->start_value();
        state->layout.boolean(value);
        state->end_value();
    });
}

bool Writer::number(std::string_view literal) {
    state->expect_value();
    if (!is_json_number(literal)) {
        throw std::invalid_argument("json::Writer: not a JSON number: \"" + std::string(literal) +
                                    '"');
    }
    return state->write([this, literal] {
        state->start_value();
        state->layout.number_text(literal);
        state->end_value();
    });
}

bool Writer::number(double value) {
    state->expect_value();
    return state->write([this, value] {
        state->start_value();
        state->layout.number(value);
        state->end_value();
    });
}

bool Writer::string(std::string_view utf8) {
    state->expect_value();
    state->layout.check_string(utf8);
    return state->write([this, utf8] {
        state->start_value();
        state->layout.string(utf8);
        state->end_value();
    });
}

bool Writer::key(std::string_view utf8) {
    state->expect_key();
    state->layout.check_string(utf8);
    return state->write([this, utf8] { state->key(utf8); });
}

bool Writer::begin_array() {
    state->expect_value();
    return state->write([this] { state->begin(false); });
}

bool Writer::end_array() {
    state->expect_close(false);
    return state->write([this] { state->end(); });
}

bool Writer::begin_object() {
    state->expect_value();
    return state->write([this] { state->begin(true); });
}

bool Writer::end_object() {
    state->expect_close(true);
    return state->write([this] { state->end(); });
}

bool Writer::value(const Value& document) {
    state->expect_value();
    if (document.which() == detail::UNDEFINED_INDEX) {
        if (state->member_value_is_due()) {
            throw std::invalid_argument(
                "json::Writer: Undefined as a member's value, which has no JSON text");
        }
        if (state->level() == 0) {
            return true; // no text, and the top-level value still to come
        }
    }
    return state->write([this, &document] {
        state->start_value();
        if (document.which() == detail::UNDEFINED_INDEX) {
            state->layout.null(); // an element, as serialize writes it
        } else {
            detail::write_value(state->layout, document, state->level());
        }
        state->end_value();
    });
}

bool Writer::complete() const noexcept {
    return state->complete();
}

void Writer::flush() {
    state->flush();
}

} // namespace json
