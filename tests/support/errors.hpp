#ifndef JSON_TESTS_ERRORS_HPP
#define JSON_TESTS_ERRORS_HPP

#include <stdexcept>
#include <string>

namespace test_support {

/// What `operation` throws, as "invalid: MESSAGE" (std::invalid_argument) or "missing: MESSAGE"
/// (std::out_of_range), or "(nothing thrown)": the kind and the text in one comparison.
template <typename Operation>
std::string error_of(Operation operation) {
    try {
        operation();
    } catch (const std::invalid_argument& error) {
        return std::string("invalid: ") + error.what();
    } catch (const std::out_of_range& error) {
        return std::string("missing: ") + error.what();
    }
    return "(nothing thrown)";
}

} // namespace test_support

#endif
