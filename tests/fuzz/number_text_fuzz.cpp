// Fuzz target: the standard number text and reading numbers back.
//
// The first 8 bytes are taken as a double: its text must match a reference laid out by plain
// string handling from the C library's exactly rounded "%.14e", and must read back as the value
// rounded to 15 significant digits. The rounding to 16- and 32-bit integers is checked against
// nearbyint. Every whole 8 bytes of the input, as a batch of doubles, must give format_lines
// the reference line for each, within the buffer it asks for. The whole input, as text, must
// read without a crash and give a finite number.
#include <algorithm>
#include <cfloat>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "core/number_text.h"

namespace {

[[noreturn]] void fail(const char* what, double x, const std::string& got, const std::string& want) {
    std::fprintf(stderr, "%s: value %a (%.17g): got \"%s\", want \"%s\"\n", what, x, x, got.c_str(),
                 want.c_str());
    std::abort();
}

std::string g17(double v) {
    char b[32];
    std::snprintf(b, sizeof b, "%.17g", v);
    return b;
}

std::string reference_str(double x) {
    if (std::isnan(x))
        return "NaN";
    if (std::isinf(x))
        return x < 0 ? "-Inf" : " Inf";
    if (x == 0)
        return " 0";
    // The 15 significant digits and the decimal exponent of |x| as the C library rounds them:
    // "d.dddddddddddddde+XX", without the trailing zeros.
    char b[32];
    std::snprintf(b, sizeof b, "%.14e", std::fabs(x));
    std::string digits = b[0] + std::string(b + 2, 14);
    digits.erase(digits.find_last_not_of('0') + 1);
    const int e = std::atoi(b + 17);
    const int n = static_cast<int>(digits.size());
    std::string body;
    if (e >= 0 && e < 15) {
        body = n > e + 1 ? digits.insert(e + 1, ".") : digits + std::string(e + 1 - n, '0');
    } else if (e < 0 && e >= -4) {
        body = "." + std::string(-e - 1, '0') + digits;
    } else {
        char exp[16];
        std::snprintf(exp, sizeof exp, "E%c%02d", e < 0 ? '-' : '+', std::abs(e));
        body = digits.substr(0, 1) + (n > 1 ? "." + digits.substr(1) : "") + exp;
    }
    return (std::signbit(x) ? "-" : " ") + body;
}

// x rounded to nearest, halves to even (the default mode); nothing when it does not fit (or is NaN).
template <typename Int>
void check_integer(double x, std::optional<Int> got, const char* name) {
    const double r = std::nearbyint(x);
    const bool fits = r >= std::numeric_limits<Int>::min() && r <= std::numeric_limits<Int>::max();
    if (got.has_value() != fits || (fits && *got != static_cast<Int>(r)))
        fail(name, x, got ? std::to_string(*got) : "nothing", fits ? g17(r) : "nothing");
}

void check_double(double x) {
    check_integer(x, numtext::to_int16(x), "to_int16");
    check_integer(x, numtext::to_int32(x), "to_int32");
    const std::string want = reference_str(x);
    char buffer[32];  // just what it may use: the address sanitizer catches a write beyond
    const int n = numtext::format_to(buffer, x);
    if (n < 0 || n > 22 || std::string(buffer, n) != want)
        fail("format_to", x, std::string(buffer, std::clamp(n, 0, 22)), want);
    if (numtext::str(x) != want)
        fail("str", x, numtext::str(x), want);
    if (numtext::text(x) != (want[0] == ' ' ? want.substr(1) : want))
        fail("text", x, numtext::text(x), want);
    if (!std::isfinite(x))
        return;
    // Near the largest double the 15-digit text lies beyond the range: it reads back as the
    // largest double, and is no number for the strict conversion.
    char b[32];
    std::snprintf(b, sizeof b, "%.14e", x);
    const double exact = std::strtod(b, nullptr);
    const bool beyond = std::isinf(exact);
    const double rounded = beyond ? std::copysign(DBL_MAX, x) : exact;
    if (numtext::val(want) != rounded)
        fail("val(str(x)) is not x to 15 digits", x, g17(numtext::val(want)), b);
    const std::optional<double> strict = numtext::to_number(want);
    if (beyond ? strict.has_value() : strict != rounded)
        fail("to_number(str(x)) is not x to 15 digits", x, strict ? g17(*strict) : "nothing",
             beyond ? "nothing" : b);
}

// The batch form: the line of each value, framed as the output files frame it or otherwise,
// in a buffer of exactly the size it asks for (the address sanitizer catches a write beyond).
void check_lines(const uint8_t* data, size_t size) {
    // Two whole batches of 64 and a part of a third are enough; more only slows the run.
    std::vector<double> values(std::min<size_t>(size / sizeof(double), 150));
    if (!values.empty())
        std::memcpy(values.data(), data, values.size() * sizeof(double));
    static const std::string_view frames[][2] = {{"\"", "\"\r\n"}, {"", ""}, {"", ","}, {"<<", ">>\n"}};
    const std::string_view before = frames[size % 4][0], after = frames[size % 4][1];
    std::vector<char> buffer(values.size() * (before.size() + 22 + after.size()) + 32);
    const size_t n = numtext::format_lines(buffer.data(), values.data(), values.size(), before, after);
    std::string want;
    for (double x : values)
        want += std::string(before) + reference_str(x) + std::string(after);
    const std::string got(buffer.data(), std::min(n, buffer.size()));
    if (got != want) {
        const size_t at = std::mismatch(got.begin(), got.end(), want.begin(), want.end()).first - got.begin();
        const size_t from = at > 20 ? at - 20 : 0;
        fail("format_lines", values.empty() ? 0.0 : values[0], got.substr(from, 60), want.substr(from, 60));
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size >= sizeof(double)) {
        double x;
        std::memcpy(&x, data, sizeof x);
        check_double(x);
    }
    check_lines(data, size);
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    const double v = numtext::val(text);
    if (!std::isfinite(v))
        fail("val of raw text is not finite", v, std::string(text.substr(0, 80)), "a finite number");
    check_integer(v, numtext::to_int16(v), "to_int16");
    check_integer(v, numtext::to_int32(v), "to_int32");
    // A whole-text number is also the number at the start of the text.
    if (const std::optional<double> strict = numtext::to_number(text); strict && *strict != v)
        fail("to_number and val disagree", *strict, std::string(text.substr(0, 80)), numtext::str(v));
    return 0;
}
