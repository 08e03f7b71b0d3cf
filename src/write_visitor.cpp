#include "write_visitor.hpp"

#include <type_traits>
#include <vector>

namespace json::detail {

namespace {

// Writes a scalar alternative; containers are handed back to the caller's walk.
class ScalarWriter : public boost::static_visitor<void> {
  public:
    explicit ScalarWriter(TextLayout& layout) : layout(layout) {}

    void operator()(const Undefined&) const {}
    void operator()(const Null&) const { layout.null(); }
    void operator()(bool boolean) const { layout.boolean(boolean); }
    void operator()(double number) const { layout.number(number); }
    void operator()(float number) const { layout.number(number); }
    void operator()(const std::string& text) const { layout.string(text); }
    void operator()(const Array&) const {}
    void operator()(const Object&) const {}

  private:
    TextLayout& layout;
};

// Writes one container, and every container inside it, from an explicit stack of open
// containers.
class ContainerWriter {
  public:
    // Room for SHALLOW_DEPTH levels from the start: a shallow document, as most are, makes one
    // allocation for its open containers instead of one per doubling. (Storage for them on the
    // call stack through a std::pmr resource was measured slower, for large documents too.)
    explicit ContainerWriter(TextLayout& layout) : layout(layout) {
        open_containers.reserve(SHALLOW_DEPTH);
    }

    template <typename Container>
    void write(const Container& container, std::size_t level) {
        write_container(container, level);
        while (!open_containers.empty()) {
            Frame& top = open_containers.back();
            const Value* next = top.is_object ? next_member(top) : next_item(top);
            if (next == nullptr) {
                layout.close(top.is_object ? '}' : ']', top.empty, top.level);
                open_containers.pop_back();
            } else {
                write_entry(*next, top.level + 1);
            }
        }
    }

  private:
    // Built in place by emplace_back: a frame assembled on the stack and then copied in was
    // read back as whole blocks before its narrow fields had reached memory, which stalled
    // every opened container.
    struct Frame {
        Frame(std::size_t level, const Array& items)
            : level(level), is_object(false), item(items.begin()), items_end(items.end()) {}
        Frame(std::size_t level, const Object& members)
            : level(level), is_object(true), member(members.begin()), members_end(members.end()) {}

        std::size_t level;
        bool is_object;
        bool empty = true;
        Array::const_iterator item, items_end;
        Object::const_iterator member, members_end;
    };

    // The next element, after its separator; null at the end of the array.
    const Value* next_item(Frame& frame) {
        if (frame.item == frame.items_end) {
            return nullptr;
        }
        layout.start_entry(frame.empty, frame.level);
        frame.empty = false;
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
        layout.start_entry(frame.empty, frame.level);
        frame.empty = false;
        const auto& [key, value] = *frame.member++;
        layout.member_name(key);
        return &value;
    }

    // An element or member value at `level`: containers are opened here and finished by the
    // loop; an Undefined element stands as null so that the array stays valid JSON.
    __attribute__((always_inline)) void write_entry(const Value& value, std::size_t level) {
        switch (value.which()) {
        case ARRAY_INDEX:
            write_container(boost::get<Array>(value), level);
            break;
        case OBJECT_INDEX:
            write_container(boost::get<Object>(value), level);
            break;
        case UNDEFINED_INDEX:
            layout.null();
            break;
        default:
            // A scalar's text does not depend on its level.
            boost::apply_visitor(ScalarWriter(layout), value);
        }
    }

    // An empty container has nothing left to write after its brackets, so it is written whole
    // instead of being opened.
    template <typename Container>
    void write_container(const Container& container, std::size_t level) {
        constexpr bool is_object = std::is_same_v<Container, Object>;
        if (container.empty()) {
            layout.empty_container(is_object ? "{}" : "[]", level);
            return;
        }
        layout.open(is_object ? '{' : '[');
        open_containers.emplace_back(level, container);
    }

    static constexpr std::size_t SHALLOW_DEPTH = 16;

    TextLayout& layout;
    std::vector<Frame> open_containers;
};

} // namespace

void write_value(TextLayout& layout, const Value& value, std::size_t level) {
    switch (value.which()) {
    case ARRAY_INDEX:
        ContainerWriter(layout).write(boost::get<Array>(value), level);
        break;
    case OBJECT_INDEX:
        ContainerWriter(layout).write(boost::get<Object>(value), level);
        break;
    default:
        boost::apply_visitor(ScalarWriter(layout), value);
    }
}

} // namespace json::detail
