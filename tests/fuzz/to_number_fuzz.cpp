// Fuzz target: the strict whole-text conversion and the leading-number reading, against an
// independent reference: a small hand-written matcher for the number grammar and the C
// library's strtod for the value.
//
// Grammar: blanks (space, tab, CR, LF), an optional sign, digits with an optional "." (at least
// one digit in all), and an optional exponent (E or D in either case, an optional sign, at least
// one digit); the exponent belongs to the number only when it has a digit. to_number takes a
// text that is such a number with only blanks around it and within the double range; val takes
// the number at the start (0 when there is none) and saturates beyond the range.
#include <algorithm>
#include <cfloat>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <optional>
#include <string>
#include <string_view>

#include "core/number_text.h"

namespace {

bool one_of(std::string_view s, size_t i, std::string_view chars) {
    return i < s.size() && chars.find(s[i]) != std::string_view::npos;
}

// Length of the number at the start of s (0 when there is none), and whether its mantissa holds
// a digit other than 0.
size_t number_length(std::string_view s, bool& nonzero) {
    size_t i = one_of(s, 0, "+-") ? 1 : 0;
    size_t digits = 0;
    bool point = false;
    nonzero = false;
    for (; one_of(s, i, "0123456789") || (!point && one_of(s, i, ".")); ++i) {
        point |= s[i] == '.';
        digits += s[i] != '.';
        nonzero |= s[i] != '.' && s[i] != '0';
    }
    if (digits == 0)
        return 0;
    if (one_of(s, i, "EeDd")) {
        size_t j = one_of(s, i + 1, "+-") ? i + 2 : i + 1;
        while (one_of(s, j, "0123456789"))
            i = ++j;
    }
    return i;
}

// NaN stands for no number.
[[noreturn]] void fail(const char* what, std::string_view text, double got, double want) {
    std::fprintf(stderr, "%s: text \"%.*s\" (%zu bytes): got %a (%.17g), want %a (%.17g)\n", what,
                 static_cast<int>(std::min<size_t>(text.size(), 120)), text.data(), text.size(), got, got,
                 want, want);
    std::abort();
}

bool same(double a, double b) {
    return a == b && std::signbit(a) == std::signbit(b);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    size_t start = 0;
    while (one_of(text, start, " \t\r\n"))
        ++start;
    bool nonzero = false;
    const size_t length = number_length(text.substr(start), nonzero);
    size_t end = start + length;
    while (one_of(text, end, " \t\r\n"))
        ++end;

    // The leading number by strtod, the D exponent spelt E; beyond the range the largest double.
    std::string number(text.substr(start, length));
    std::replace_if(
        number.begin(), number.end(), [](char c) { return c == 'D' || c == 'd'; }, 'e');
    double want = length > 0 ? std::strtod(number.c_str(), nullptr) : 0.0;
    const bool overflow = std::isinf(want);
    const bool underflow = want == 0 && nonzero;
    if (overflow)
        want = std::copysign(DBL_MAX, want);
    const double got = numtext::val(text);
    // An underflow may come back as 0 or as the nearest subnormal; its sign must stay.
    if (underflow ? std::fabs(got) > DBL_TRUE_MIN || std::signbit(got) != std::signbit(want)
                  : !same(got, want))
        fail("val", text, got, want);

    // The whole text: such a number with only blanks around it, within the range, read as val reads it.
    const std::optional<double> strict = numtext::to_number(text);
    const bool whole = length > 0 && end == size && !overflow;
    if (strict.has_value() != whole || (strict && !same(*strict, got)))
        fail("to_number", text, strict.value_or(NAN), whole ? got : NAN);
    return 0;
}
