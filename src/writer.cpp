#include <json/writer.hpp>

#include "text_layout.hpp"
#include "write_visitor.hpp"

#include <json/detail/number_syntax.hpp>
#include <json/detail/utf8.hpp>
#include <json/pointer.hpp>

#include <stdexcept>
#include <string>
#include <vector>

namespace json {

// The open containers and what each event may do next. Each event checks first that it may
// come (throwing before it writes anything), then writes; an exception while writing leaves
// the Writer failed.
class Writer::State {
  public:
    State(std::string& text, const WriteOptions& options)
        : buffer(text), layout(buffer, options), text(&text), text_size_before(text.size()),
          stream(nullptr), check_utf8(checks_utf8(options)) {}
    State(std::ostream& out, const WriteOptions& options)
        : buffer(out, detail::StreamText::plain), layout(buffer, options), text(nullptr),
          stream(&out), check_utf8(checks_utf8(options)) {}

    // Checks that `utf8`, a string or member name, can be written: well-formed UTF-8 unless
    // the options let anything through. `place` says where it is, for a message.
    void check_string(std::string_view utf8, const std::string& place = "a string") const {
        const std::size_t offset = check_utf8 ? detail::ill_formed_offset(utf8) : std::string::npos;
        if (offset != std::string::npos) {
            throw std::invalid_argument(
                "json: byte " + std::to_string(offset) + " of " + place +
                " is not well-formed UTF-8" +
                (layout.ascii_only() ? ", which ASCII-only text cannot write"
                                     : " (WriteOptions::allow_invalid_utf8 writes it as it is)"));
        }
    }

    // Checks every string, member name and number in `document` as the events for them would
    // be checked, before any of it is written.
    void check_document(const Value& document) const;

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
        began = true;
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

    // When the Writer goes: a complete document is handed on; an incomplete one is taken back
    // from a string, and a stream is told (failbit) and given no more of it.
    void finish() {
        if (finished || !began) {
            buffer.flush();
        } else if (text != nullptr) {
            text->resize(text_size_before);
        } else {
            stream->setstate(std::ios::failbit); // throws if the caller enabled it: swallowed
        }
    }

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

    static bool checks_utf8(const WriteOptions& options) {
        return options.ascii_only || !options.allow_invalid_utf8;
    }

    std::string* text;            // the string written to, or null
    std::size_t text_size_before; // its size when the Writer was made
    std::ostream* stream;         // the stream written to, or null
    bool check_utf8;
    std::vector<Frame> open; // innermost last
    bool member_value_due = false;
    bool began = false; // some of the top-level value is written
    bool finished = false;
    bool failed = false;
};

// The walk keeps the containers it is in, so that a refusal can name its place as a JSON
// Pointer; iterative, so that the call stack stays flat whatever the depth.
void Writer::State::check_document(const Value& document) const {
    struct Open {
        const Value* container;
        std::size_t next_index;             // in an Array: the next element to check
        Object::const_iterator next_member; // in an Object: the next member to check
    };
    std::vector<Open> open_containers;
    Pointer place;
    const auto here = [&place](const char* what) {
        return place.empty() ? std::string(what)
                             : std::string(what) + " at \"" + place.text() + "\"";
    };
    const auto check_value = [&](const Value& value) {
        if (value.is_string()) {
            check_string(value.as_string(), here("the string"));
        } else if (value.is_number()) {
            try {
                layout.check_finite(value.as_number());
            } catch (const std::invalid_argument& error) {
                throw std::invalid_argument(std::string(error.what()) + " (" + here("the number") +
                                            ")");
            }
        } else if (value.is_array() || value.is_object()) {
            open_containers.push_back(
                {&value, 0,
                 value.is_object() ? value.as_object().begin() : Object::const_iterator()});
            return;
        }
        if (!open_containers.empty()) {
            place.pop_back();
        }
    };
    check_value(document);
    while (!open_containers.empty()) {
        Open& top = open_containers.back();
        const Value& container = *top.container;
        const bool done = container.is_array() ? top.next_index == container.as_array().size()
                                               : top.next_member == container.as_object().end();
        if (done) {
            open_containers.pop_back();
            if (!open_containers.empty()) {
                place.pop_back();
            }
            continue;
        }
        if (container.is_array()) {
            const std::size_t index = top.next_index++;
            place.push_back(index);
            check_value(container.as_array()[index]);
        } else {
            const auto& [name, member] = *top.next_member++;
            place.push_back(name);
            check_string(name, here("the member name"));
            check_value(member);
        }
    }
}

Writer::Writer(std::string& text, const WriteOptions& options) : state(new State(text, options)) {}

Writer::Writer(std::ostream& out, const WriteOptions& options) : state(new State(out, options)) {}

Writer::~Writer() {
    try {
        state->finish();
    } catch (...) { // NOLINT(bugprone-empty-catch): a destructor cannot report it
    }
    delete state;
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
    const detail::NumberScan scan =
        detail::scan_number(literal.data(), literal.data() + literal.size());
    if (scan.error != ParseResult::SUCCESS || scan.end != literal.data() + literal.size()) {
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
    state->layout.check_finite(value);
    return state->write([this, value] {
        state->start_value();
        state->layout.number(value);
        state->end_value();
    });
}

bool Writer::string(std::string_view utf8) {
    state->expect_value();
    state->check_string(utf8);
    return state->write([this, utf8] {
        state->start_value();
        state->layout.string(utf8);
        state->end_value();
    });
}

bool Writer::key(std::string_view utf8) {
    state->expect_key();
    state->check_string(utf8, "a member name");
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
    state->check_document(document);
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
