// jsonfmt: validates JSON documents (whole files or JSON Lines) and writes them pretty (2-space
// by default) or compact, whole or the value at a JSON Pointer, to standard output, a file, or
// back into each file. The text streams from parser to writer: no document is built, so member
// order, repeated names and number literals come out as they came in.
#include "diagnostics.hpp"
#include "options.hpp"
#include "run.hpp"

#include <exception>
#include <fcntl.h>
#include <new>
#include <unistd.h>

namespace {

// Opens /dev/null on each of descriptors 0 to 2 that is closed, so that no file this program
// opens takes one of them (a diagnostic would land in the output file). Opened the other way
// round (standard input for writing only, the outputs for reading only), so that reading or
// writing a closed standard stream still fails as it did. False when /dev/null does not open.
bool occupy_standard_descriptors() {
    for (int descriptor = STDIN_FILENO; descriptor <= STDERR_FILENO; ++descriptor) {
        if (::fcntl(descriptor, F_GETFD) < 0 &&
            ::open("/dev/null", descriptor == STDIN_FILENO ? O_WRONLY : O_RDONLY) != descriptor) {
            return false;
        }
    }
    return true;
}

} // namespace

int main(int argc, char** argv) {
    using jsonfmt::TROUBLE;
    if (!occupy_standard_descriptors()) {
        return TROUBLE;
    }
    try {
        jsonfmt::Settings settings;
        if (const auto done = jsonfmt::read_arguments(argc, argv, settings)) {
            return *done;
        }
        return jsonfmt::run(settings);
    } catch (const std::bad_alloc&) {
        jsonfmt::complain("out of memory");
        return TROUBLE;
    } catch (const std::exception& error) {
        jsonfmt::complain(error.what());
        return TROUBLE;
    }
}
