// The panel's number <-> text conversions. Everything that turns a number into text, or text
// into a number, goes through these.
#pragma once

#include <cstddef>
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

// Writes str(value) at buffer without allocating and returns its length (at most 22); no NUL
// is added. buffer must hold at least 32 characters: all of them may be used as scratch.
int format_to(char* buffer, double value);

// One line per value, one after the other at buffer: `before`, the text format_to gives, then
// `after`. Returns how many characters that took. buffer must hold at least
// count * (before.size() + 22 + after.size()) + 32 characters: all of them may be used as
// scratch. For writing many numbers at once, without a call per number.
size_t format_lines(char* buffer, const double* values, size_t count, std::string_view before,
                    std::string_view after);

// The number at the start of a text: leading blanks (spaces, tabs, CR, LF) skipped, optional
// sign, digits with "." as the point, an optional exponent (E or D, either case); 0 when the
// text does not start with a number. A number beyond the double range reads as the largest
// finite double of its sign, one below the smallest subnormal as 0, so the result is always
// finite.
double val(std::string_view text);

// Strict whole-text conversion for the scale boxes: the whole text (blanks around it allowed)
// must be a number as val reads it, and within the double range; otherwise nothing.
std::optional<double> to_number(std::string_view text);

// Rounding to the nearest integer, an exact half to the even neighbour; nothing when the
// rounded value does not fit (or the value is not a number).
std::optional<int16_t> to_int16(double value);
std::optional<int32_t> to_int32(double value);

}  // namespace numtext
