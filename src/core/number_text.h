// The panel's number <-> text conversions. Everything that turns a number into text, or text
// into a number, goes through these.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace numtext {

// Standard number text: up to 15 significant digits, "." as the point, no zero before the
// point (.5, -.25), no trailing zeros, exponent form (1E-05, 1.5E+20) outside
// 1E-4 <= |x| < 1E15, and a blank in front of a non-negative number. NaN and infinities,
// which no instrument value should be, read "NaN", " Inf" and "-Inf".
std::string str(double value);

// The same without the leading blank.
std::string text(double value);

// Appends str(value) to out without allocating; returns the number of characters written.
// buffer must hold at least 32 characters.
int format_to(char* buffer, double value);

// The number at the start of a text: leading blanks skipped, optional sign, digits with "."
// as the point, an optional exponent (E or D); 0 when the text does not start with a number.
double val(std::string_view text);

// Strict whole-text conversion for the scale boxes: the whole text (blanks around it allowed)
// must be a number; otherwise nothing.
std::optional<double> to_number(std::string_view text);

// Rounding to the nearest integer, an exact half to the even neighbour; nothing when the
// rounded value does not fit (or the value is not a number).
std::optional<int16_t> to_int16(double value);
std::optional<int32_t> to_int32(double value);

}  // namespace numtext
