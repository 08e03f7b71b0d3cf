#include "line_reader.hpp"

#include <new>
#include <string_view>

namespace jsonfmt {

bool LineReader::next() {
    held_text.clear();
    current = Line{current.number + 1, 0, true};
    bool any = false; // any byte of the line, or its line feed
    for (;;) {
        const std::string_view piece = input.peek();
        if (piece.empty()) {
            return any;
        }
        any = true;
        const std::size_t line_end = piece.find('\n');
        const std::size_t length = line_end == std::string_view::npos ? piece.size() : line_end;
        if (current.held) {
            try {
                held_text.append(piece.data(), length);
            } catch (const std::bad_alloc&) {
                // The rest of the line is only counted; its memory goes back at once.
                current.held = false;
                std::string().swap(held_text);
            }
        }
        current.length += length;
        input.take(line_end == std::string_view::npos ? length : length + 1);
        if (line_end != std::string_view::npos) {
            return true;
        }
    }
}

} // namespace jsonfmt
