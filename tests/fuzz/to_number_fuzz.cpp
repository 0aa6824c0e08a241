// Fuzz target: the strict whole-text conversion and the leading-number reading, against an
// independent reference: a small hand-written matcher for the number grammar and the C
// library's strtod for the value.
//
// Grammar: blanks (space, tab, CR, LF), an optional sign, digits with an optional "." (at least
// one digit in all), and an optional exponent (E or D in either case, an optional sign, at least
// one digit); the exponent belongs to the number only when it has a digit. to_number takes a
// text that is such a number with only blanks around it and within the double range; val takes
// the number at the start (0 when there is none) and saturates beyond the range.
#include <cerrno>
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

bool blank(char c) {
    return c == ' ' || c == '\t' || c == '\r' || c == '\n';
}
bool digit(char c) {
    return c >= '0' && c <= '9';
}

// Length of the number at the start of s (0 when there is none), and whether its mantissa holds
// a digit other than 0.
size_t number_length(std::string_view s, bool& nonzero) {
    size_t i = 0;
    nonzero = false;
    if (i < s.size() && (s[i] == '+' || s[i] == '-'))
        ++i;
    size_t digits = 0;
    while (i < s.size() && digit(s[i])) {
        nonzero |= s[i] != '0';
        ++i;
        ++digits;
    }
    if (i < s.size() && s[i] == '.') {
        ++i;
        while (i < s.size() && digit(s[i])) {
            nonzero |= s[i] != '0';
            ++i;
            ++digits;
        }
    }
    if (digits == 0)
        return 0;
    if (i < s.size() && (s[i] == 'E' || s[i] == 'e' || s[i] == 'D' || s[i] == 'd')) {
        size_t j = i + 1;
        if (j < s.size() && (s[j] == '+' || s[j] == '-'))
            ++j;
        if (j < s.size() && digit(s[j])) {
            while (j < s.size() && digit(s[j]))
                ++j;
            i = j;
        }
    }
    return i;
}

enum class Range { inside, overflow, underflow };

// The value of a matched number by strtod (the D exponent spelt E), and where it lies.
double reference_value(std::string_view number, bool nonzero, Range& range) {
    std::string copy(number);
    for (char& c : copy)
        if (c == 'D' || c == 'd')
            c = 'e';
    errno = 0;
    const double v = std::strtod(copy.c_str(), nullptr);
    range = Range::inside;
    if (std::isinf(v))
        range = Range::overflow;
    else if (v == 0 && nonzero)
        range = Range::underflow;
    return v;
}

[[noreturn]] void fail(const char* what, std::string_view text, const std::string& got,
                       const std::string& want) {
    std::fprintf(stderr, "%s: text \"%.*s\" (%zu bytes): got %s, want %s\n", what,
                 static_cast<int>(text.size() < 120 ? text.size() : 120), text.data(), text.size(),
                 got.c_str(), want.c_str());
    std::abort();
}

std::string show(double v) {
    char b[64];
    std::snprintf(b, sizeof b, "%a (%.17g)", v, v);
    return b;
}

bool same(double a, double b) {
    return a == b && std::signbit(a) == std::signbit(b);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    size_t start = 0;
    while (start < text.size() && blank(text[start]))
        ++start;
    bool nonzero = false;
    const size_t length = number_length(text.substr(start), nonzero);

    // The leading number.
    double want_val = 0.0;
    Range range = Range::inside;
    if (length > 0) {
        want_val = reference_value(text.substr(start, length), nonzero, range);
        if (range == Range::overflow)
            want_val = std::copysign(DBL_MAX, want_val);
    }
    const double got_val = numtext::val(text);
    // An underflow may come back as 0 or as the nearest subnormal; its sign must stay.
    const bool val_ok = range == Range::underflow ? std::fabs(got_val) <= DBL_TRUE_MIN &&
                                                        std::signbit(got_val) == std::signbit(want_val)
                                                  : same(got_val, want_val);
    if (!val_ok)
        fail("val", text, show(got_val), show(want_val));

    // The whole text.
    size_t end = start + length;
    while (end < text.size() && blank(text[end]))
        ++end;
    const bool whole = length > 0 && end == text.size();
    const std::optional<double> got = numtext::to_number(text);
    if (!whole || range == Range::overflow) {
        if (got)
            fail("to_number", text, show(*got), "nothing");
    } else if (!got) {
        fail("to_number", text, "nothing", show(want_val));
    } else if (!same(*got, got_val)) {
        fail("to_number differs from val", text, show(*got), show(got_val));
    }
    return 0;
}
