#include "output.hpp"

#include "diagnostics.hpp"

#include <cstring>

namespace jsonfmt {

bool Output::finish() {
    if (!buffer.finish() || stream.bad()) {
        complain("writing " + destination + ": " + std::strerror(buffer.error()));
        return false;
    }
    return true;
}

} // namespace jsonfmt
