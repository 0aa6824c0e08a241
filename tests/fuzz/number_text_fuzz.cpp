// Fuzz target: the standard number text and reading numbers back.
//
// The first 8 bytes are taken as a double: its text must match a reference laid out by plain
// string handling from the C library's exactly rounded "%.14e", and must read back as the value
// rounded to 15 significant digits. The rounding to 16- and 32-bit integers is checked against
// nearbyint. Every whole 8 bytes of the input, as a batch of doubles, must give format_lines
// the reference line for each, within the buffer it asks for. The whole input, as text, must
// read without a crash and give a finite number.
#include <algorithm>
#include <cfenv>
#include <cfloat>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
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

// The 15 significant digits and the decimal exponent of |x| as the C library rounds them.
void digits15(double x, std::string& digits, int& exponent) {
    char b[64];
    std::snprintf(b, sizeof b, "%.14e", std::fabs(x));
    digits.clear();
    const char* s = b;
    for (; *s != 'e'; ++s)
        if (*s >= '0' && *s <= '9')
            digits += *s;
    exponent = std::atoi(s + 1);
}

std::string reference_str(double x) {
    if (std::isnan(x))
        return "NaN";
    if (std::isinf(x))
        return x < 0 ? "-Inf" : " Inf";
    if (x == 0)
        return " 0";
    std::string digits;
    int e = 0;
    digits15(x, digits, e);
    while (digits.size() > 1 && digits.back() == '0')
        digits.pop_back();
    const int n = static_cast<int>(digits.size());
    std::string body;
    if (e >= 0 && e < 15) {
        body = n > e + 1 ? digits.substr(0, e + 1) + "." + digits.substr(e + 1)
                         : digits + std::string(e + 1 - n, '0');
    } else if (e < 0 && e >= -4) {
        body = "." + std::string(-e - 1, '0') + digits;
    } else {
        body = digits.substr(0, 1) + (n > 1 ? "." + digits.substr(1) : "");
        char exp[16];
        std::snprintf(exp, sizeof exp, "E%c%02d", e < 0 ? '-' : '+', std::abs(e));
        body += exp;
    }
    return (std::signbit(x) ? "-" : " ") + body;
}

void check_integers(double x) {
    const double r = std::nearbyint(x);  // to nearest, halves to even: the default mode
    const auto i16 = numtext::to_int16(x);
    const bool fits16 = !std::isnan(x) && r >= -32768.0 && r <= 32767.0;
    if (i16.has_value() != fits16 || (fits16 && *i16 != static_cast<int16_t>(r)))
        fail("to_int16", x, i16 ? std::to_string(*i16) : "nothing", fits16 ? std::to_string(r) : "nothing");
    const auto i32 = numtext::to_int32(x);
    const bool fits32 = !std::isnan(x) && r >= -2147483648.0 && r <= 2147483647.0;
    if (i32.has_value() != fits32 || (fits32 && *i32 != static_cast<int32_t>(r)))
        fail("to_int32", x, i32 ? std::to_string(*i32) : "nothing", fits32 ? std::to_string(r) : "nothing");
}

void check_double(double x) {
    const std::string want = reference_str(x);
    char buffer[48];
    std::memset(buffer, '#', sizeof buffer);
    const int n = numtext::format_to(buffer, x);
    if (n < 0 || n > 22)
        fail("format_to length", x, std::to_string(n), "0..22");
    for (size_t i = 32; i < sizeof buffer; ++i)
        if (buffer[i] != '#')
            fail("format_to wrote beyond 32 characters", x, std::string(buffer, sizeof buffer), want);
    const std::string formatted(buffer, static_cast<size_t>(n));
    if (formatted != want)
        fail("format_to", x, formatted, want);
    if (numtext::str(x) != want)
        fail("str", x, numtext::str(x), want);
    const std::string plain = want[0] == ' ' ? want.substr(1) : want;
    if (numtext::text(x) != plain)
        fail("text", x, numtext::text(x), plain);

    if (std::isfinite(x)) {
        char b[64];
        std::snprintf(b, sizeof b, "%.14e", x);
        // Near the largest double the 15-digit text lies beyond the range: it reads back as the
        // largest double, and is no number for the strict conversion.
        const double exact = std::strtod(b, nullptr);
        const bool beyond = std::isinf(exact);
        const double rounded = beyond ? std::copysign(DBL_MAX, x) : exact;
        const double back = numtext::val(want);
        if (back != rounded) {
            char g[64];
            std::snprintf(g, sizeof g, "%.17g", back);
            fail("val(str(x)) is not x to 15 digits", x, g, b);
        }
        const auto strict = numtext::to_number(want);
        if (beyond ? strict.has_value() : (!strict || *strict != rounded))
            fail("to_number(str(x)) is not x to 15 digits", x, strict ? numtext::str(*strict) : "nothing",
                 beyond ? "nothing" : b);
    }
    check_integers(x);
}

// The batch form: the line of each value, framed as the output files frame it or otherwise,
// in a buffer of exactly the size it asks for (the address sanitizer catches a write beyond).
void check_lines(const uint8_t* data, size_t size) {
    // Two whole batches of 64 and a part of a third are enough; more only slows the run.
    const size_t count = std::min<size_t>(size / sizeof(double), 150);
    std::vector<double> values(count);
    if (count > 0)
        std::memcpy(values.data(), data, count * sizeof(double));
    static const std::string_view frames[][2] = {{"\"", "\"\r\n"}, {"", ""}, {"", ","}, {"<<", ">>\n"}};
    const auto& frame = frames[size % 4];
    const std::string_view before = frame[0];
    const std::string_view after = frame[1];
    std::vector<char> buffer(count * (before.size() + 22 + after.size()) + 32);
    const size_t n = numtext::format_lines(buffer.data(), values.data(), count, before, after);
    std::string want;
    for (double x : values)
        want += std::string(before) + reference_str(x) + std::string(after);
    const std::string got(buffer.data(), std::min(n, buffer.size()));
    if (n != want.size() || got != want) {
        size_t at = 0;
        while (at < got.size() && at < want.size() && got[at] == want[at])
            ++at;
        fail("format_lines", count > 0 ? values[0] : 0.0, got.substr(at > 20 ? at - 20 : 0, 60),
             want.substr(at > 20 ? at - 20 : 0, 60));
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
    check_integers(v);
    if (const auto strict = numtext::to_number(text)) {
        if (!std::isfinite(*strict))
            fail("to_number of raw text is not finite", *strict, std::string(text.substr(0, 80)), "finite");
        // A whole-text number is also the number at the start of the text.
        if (*strict != v)
            fail("to_number and val disagree", *strict, std::string(text.substr(0, 80)), numtext::str(v));
    }
    return 0;
}
