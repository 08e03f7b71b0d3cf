#ifndef NUMBER_TEXT_HPP
#define NUMBER_TEXT_HPP

// Number text: shortest round-trip formatting and locale-independent reading of numbers.
// Exported in the global namespace; programs may substitute their own library with the same
// three functions.

#define NUMBER_TEXT_API __attribute__((visibility("default")))

/// Writes the shortest text that reads back to the same double into `buffer` (at least 80
/// bytes), NUL-terminated, and returns its length (at most 79). The text is a valid JSON number
/// in the C locale's form whatever the global locale: "0.5", "1e+300", "-0". Non-finite values
/// have no JSON number; they are written as "1e999", "-1e999" (which read back as the
/// infinities) and "0" for NaN.
NUMBER_TEXT_API int getDoubleValueStr(char* buffer, double value);

/// The same for a float, shortest in single precision: 0.1f is written "0.1".
NUMBER_TEXT_API int getFloatValueStr(char* buffer, float value);

/// The value of the number at the start of the NUL-terminated `text`, read in the C locale's
/// form whatever the global locale. A value beyond the range of double reads as plus or minus
/// infinity, one too small for it as plus or minus zero, as strtod does; text that does not
/// start with a number reads as 0.
NUMBER_TEXT_API double convertStrToDouble(const char* text);

#endif
