// The number <-> text conversions: the standard number text against hand-worked examples and
// against an independent reference built on the C library's exact "%.14e", reading numbers
// back, the strict conversion and the rounding to integers.
#include "core/number_text.h"

#include <gtest/gtest.h>

#include <bit>
#include <cfloat>
#include <clocale>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <random>
#include <string>
#include <utility>
#include <vector>

using numtext::str;
using numtext::text;
using numtext::to_int16;
using numtext::to_int32;
using numtext::to_number;
using numtext::val;

namespace {

// Reference text: the 15 correctly rounded digits from "%.14e", laid out with plain string
// handling.
std::string reference_str(double v) {
    if (std::isnan(v))
        return "NaN";
    if (std::isinf(v))
        return v < 0 ? "-Inf" : " Inf";
    if (v == 0)
        return " 0";
    char b[64];
    std::snprintf(b, sizeof b, "%.14e", std::fabs(v));
    std::string digits;
    const char* s = b;
    for (; *s != 'e'; ++s)
        if (*s >= '0' && *s <= '9')
            digits += *s;
    const int e = std::atoi(s + 1);
    while (digits.size() > 1 && digits.back() == '0')
        digits.pop_back();
    std::string body;
    if (e < -4 || e >= 15) {
        body = digits.substr(0, 1);
        if (digits.size() > 1)
            body += "." + digits.substr(1);
        char eb[16];
        std::snprintf(eb, sizeof eb, "E%c%02d", e < 0 ? '-' : '+', std::abs(e));
        body += eb;
    } else if (e >= 0) {
        std::string d = digits;
        while (static_cast<int>(d.size()) < e + 1)
            d += '0';
        body = d.substr(0, e + 1);
        if (static_cast<int>(d.size()) > e + 1)
            body += "." + d.substr(e + 1);
    } else {
        body = "." + std::string(-e - 1, '0') + digits;
    }
    return (std::signbit(v) ? "-" : " ") + body;
}

// The value of the 15-digit text, read by the C library.
double reference_round15(double v) {
    char b[64];
    std::snprintf(b, sizeof b, "%.14e", v);
    return std::strtod(b, nullptr);
}

// Checks str, and that format_to keeps within its 32 characters.
void expect_reference(double v) {
    char buffer[64];
    std::memset(buffer, '#', sizeof buffer);
    const int n = numtext::format_to(buffer, v);
    const std::string want = reference_str(v);
    ASSERT_EQ(std::string(buffer, static_cast<size_t>(n)), want) << "value " << std::hexfloat << v;
    for (size_t i = 32; i < sizeof buffer; ++i)
        ASSERT_EQ(buffer[i], '#') << "wrote past 32 for " << want;
}

TEST(StandardText, HandWorkedExamples) {
    const std::vector<std::pair<double, const char*>> cases = {
        {0.5, " .5"},
        {-0.25, "-.25"},
        {1E-05, " 1E-05"},
        {-1E-05, "-1E-05"},
        {1E-20, " 1E-20"},
        {1.5E+20, " 1.5E+20"},
        {123456789012345.0, " 123456789012345"},
        {1234567890123456.0, " 1.23456789012346E+15"},
        {1E15, " 1E+15"},
        {1E14, " 100000000000000"},
        {999999999999999.0, " 999999999999999"},
        {999999999999999.4, " 999999999999999"},
        {999999999999999.9, " 1E+15"},
        {0.0001, " .0001"},
        {0.00012, " .00012"},
        {9.999999999999E-05, " 9.999999999999E-05"},
        {0.0000999999999999999999, " .0001"},
        {0.1 + 0.2, " .3"},
        {1.0 / 3.0, " .333333333333333"},
        {2.0 / 3.0, " .666666666666667"},
        {-2.0 / 3.0, "-.666666666666667"},
        {100.0, " 100"},
        {1.5, " 1.5"},
        {-2.0, "-2"},
        {12345.678, " 12345.678"},
        {0.1, " .1"},
        {1E100, " 1E+100"},
        {1.5E-300, " 1.5E-300"},
        {DBL_MAX, " 1.79769313486232E+308"},
        {-DBL_MAX, "-1.79769313486232E+308"},
        {DBL_MIN, " 2.2250738585072E-308"},
        {DBL_TRUE_MIN, " 4.94065645841247E-324"},
        {0.0, " 0"},
        {-0.0, " 0"},
        // Exact halves at the 16th digit go to the even neighbour.
        {123456789012345.5, " 123456789012346"},
        {123456789012344.5, " 123456789012344"},
        {1000000000000005.0, " 1E+15"},
        {1000000000000015.0, " 1.00000000000002E+15"},
        {10000000000000050.0, " 1E+16"},
        {10000000000000150.0, " 1.00000000000002E+16"},
        {1.0 + std::ldexp(1.0, -15), " 1.00003051757812"},
        {1.0 + 3 * std::ldexp(1.0, -15), " 1.00009155273438"},
        {NAN, "NaN"},
        {INFINITY, " Inf"},
        {-INFINITY, "-Inf"},
    };
    for (const auto& [value, expected] : cases) {
        EXPECT_EQ(str(value), expected) << std::hexfloat << value;
        EXPECT_EQ(reference_str(value), expected) << "reference disagrees for " << expected;
    }
    EXPECT_EQ(text(0.5), ".5");
    EXPECT_EQ(text(0.0), "0");
    EXPECT_EQ(text(-2.0), "-2");
    EXPECT_EQ(text(1E-20), "1E-20");
    EXPECT_EQ(text(INFINITY), "Inf");
}

TEST(StandardText, PowersOfTenAndTwoWithNeighboursAcrossTheRange) {
    for (int i = -330; i <= 310; ++i) {
        const double p = std::pow(10.0, i);
        for (double v : {p, std::nextafter(p, 0.0), std::nextafter(p, INFINITY), -p})
            expect_reference(v);
    }
    for (int i = -1074; i <= 1023; ++i) {
        const double p = std::ldexp(1.0, i);
        for (double v : {p, std::nextafter(p, 0.0), std::nextafter(p, INFINITY), 3 * p, 5 * p})
            expect_reference(v);
    }
}

TEST(StandardText, MatchesCorrectlyRoundedReferenceOnRandomValues) {
    std::mt19937_64 rng(20240611);
    std::uniform_real_distribution<double> decade(-20.0, 20.0);
    for (int i = 0; i < 150000; ++i) {
        // Any bit pattern: every exponent, subnormals included.
        const double any = std::bit_cast<double>(rng());
        if (std::isfinite(any))
            expect_reference(any);
        // Measured values and their float-precision forms.
        const double measured = std::pow(10.0, decade(rng)) * ((rng() & 1) != 0 ? -1 : 1);
        expect_reference(measured);
        expect_reference(static_cast<double>(static_cast<float>(measured)));
        expect_reference(static_cast<int16_t>(rng()) / 32768.0 * 10.0);
        // The doubles nearest to a half at the 16th digit, and their neighbours.
        const unsigned long long digits = 100000000000000ULL + rng() % 900000000000000ULL;
        char tie[64];
        std::snprintf(tie, sizeof tie, "%llu5e%d", digits, static_cast<int>(rng() % 640) - 335);
        const double near = std::strtod(tie, nullptr);
        if (near != 0 && std::isfinite(near))
            for (double v : {near, std::nextafter(near, 0.0), std::nextafter(near, INFINITY)})
                expect_reference(v);
        // Exact halves scaled by powers of two.
        expect_reference(std::ldexp(static_cast<double>(digits) + 0.5, static_cast<int>(rng() % 200) - 100));
        if (testing::Test::HasFatalFailure())
            return;
    }
}

TEST(StandardText, RoundingBoundaryBelowEachPowerOfTenAcrossTheRange) {
    // 999999999999999.5 * 10^j is where a number's 15-digit text moves to the next decade: just
    // below it the text has fifteen 9s, at or above it the text is a power of ten. Both sides,
    // and the powers of ten themselves, a few units in the last place either way.
    for (int j = -338; j <= 293; ++j) {
        for (const char* form : {"999999999999999.5e%d", "1e%d"}) {
            char text[32];
            std::snprintf(text, sizeof text, form, form[0] == '1' ? j + 15 : j);
            const double boundary = std::strtod(text, nullptr);
            if (boundary == 0 || !std::isfinite(boundary))
                continue;
            double v = boundary;
            for (int step = 0; step < 3; ++step)
                v = std::nextafter(v, 0.0);
            for (int step = 0; step < 7; ++step, v = std::nextafter(v, INFINITY))
                if (std::isfinite(v))
                    expect_reference(v);
        }
    }
    EXPECT_EQ(str(999999999999999.5), " 1E+15");
    EXPECT_EQ(str(99999999999999.95), " 100000000000000");
    EXPECT_EQ(str(std::nextafter(99999999999999.95, 0.0)), " 99999999999999.9");
}

TEST(FormatLines, SameTextsAsFormatToBetweenAnyEndsWithinTheBuffer) {
    std::mt19937_64 rng(4242);
    const std::vector<double> specials = {0.0,          -0.0,         NAN,  INFINITY,          -INFINITY,
                                          DBL_TRUE_MIN, -DBL_MIN / 3, 1E15, 999999999999999.5, 1E-05,
                                          0.0001,       -1E300};
    const std::vector<std::string> ends = {"", "\"", "\"\r\n", "12345678", "123456789", "<value is>"};
    for (int run = 0; run < 300; ++run) {
        // Up to a few batches, with every kind of number anywhere in them.
        std::vector<double> values(rng() % 300);
        for (double& v : values) {
            switch (rng() % 4) {
                case 0:
                    v = specials[rng() % specials.size()];
                    break;
                case 1:
                    v = std::bit_cast<double>(rng());
                    break;
                default:
                    v = (static_cast<double>(rng() % 2000001) - 1E6) /
                        std::pow(10.0, static_cast<int>(rng() % 12));
            }
        }
        const std::string& before = ends[rng() % ends.size()];
        const std::string& after = ends[rng() % ends.size()];
        std::string want;
        for (double v : values) {
            char text[32];
            want += before + std::string(text, static_cast<size_t>(numtext::format_to(text, v))) + after;
        }
        const size_t room = values.size() * (before.size() + 22 + after.size()) + 32;
        std::vector<char> buffer(room + 16, '#');
        const size_t length =
            numtext::format_lines(buffer.data(), values.data(), values.size(), before, after);
        ASSERT_EQ(std::string(buffer.data(), length), want) << "run " << run;
        for (size_t i = room; i < buffer.size(); ++i)
            ASSERT_EQ(buffer[i], '#') << "wrote past the buffer in run " << run;
    }
}

TEST(StandardText, ExactPathDoesNotDependOnTheLocalesPoint) {
    // 10000000000000050 is an exact half that only the exact path can decide.
    const std::string saved = std::setlocale(LC_NUMERIC, nullptr);
    if (std::setlocale(LC_NUMERIC, "de_DE.UTF-8") == nullptr)
        GTEST_SKIP() << "no German locale";
    const std::string got = str(10000000000000150.0);
    std::setlocale(LC_NUMERIC, saved.c_str());
    EXPECT_EQ(got, " 1.00000000000002E+16");
}

TEST(Val, ReadsTheNumberAtTheStartOfTheText) {
    EXPECT_EQ(val(".5"), 0.5);
    EXPECT_EQ(val("-.25"), -0.25);
    EXPECT_EQ(val("1E-05"), 1E-05);
    EXPECT_EQ(val("1e-05"), 1E-05);
    EXPECT_EQ(val("1.5D+20"), 1.5E+20);
    EXPECT_EQ(val("2d3"), 2000.0);
    EXPECT_EQ(val("  \t 42"), 42.0);
    EXPECT_EQ(val("+7"), 7.0);
    EXPECT_EQ(val("12abc"), 12.0);
    EXPECT_EQ(val("1.2.3"), 1.2);
    EXPECT_EQ(val("5."), 5.0);
    EXPECT_EQ(val("1E"), 1.0);
    EXPECT_EQ(val("1E+"), 1.0);
    EXPECT_EQ(val("3e-x"), 3.0);
    EXPECT_EQ(val("1,5"), 1.0);
    EXPECT_EQ(val(" 123456789012345"), 123456789012345.0);
    EXPECT_EQ(val("abc"), 0.0);
    EXPECT_EQ(val(""), 0.0);
    EXPECT_EQ(val("   "), 0.0);
    EXPECT_EQ(val("-"), 0.0);
    EXPECT_EQ(val("."), 0.0);
    EXPECT_EQ(val(".e5"), 0.0);
    EXPECT_EQ(val("inf"), 0.0);
    EXPECT_EQ(val("nan"), 0.0);
    EXPECT_EQ(val("&H10"), 0.0);
    EXPECT_EQ(val("0x10"), 0.0);
    EXPECT_TRUE(std::signbit(val("-0")));
    EXPECT_EQ(val("4.9e-324"), DBL_TRUE_MIN);
}

TEST(Val, HostileTextsSaturateAndNeverReadPastTheView) {
    // Beyond the double range: the largest finite magnitude, so later sums stay finite.
    EXPECT_EQ(val("1e999"), DBL_MAX);
    EXPECT_EQ(val("-1e999"), -DBL_MAX);
    EXPECT_EQ(val("1e99999999999999999999999999"), DBL_MAX);
    EXPECT_EQ(val("0.0000001e316"), DBL_MAX);
    EXPECT_EQ(val("0.0000001e315"), 1e308);
    EXPECT_EQ(val("-0.0000001e-318"), 0.0);
    EXPECT_EQ(val("1e-999"), 0.0);
    EXPECT_EQ(val("-1e-99999999999999999999"), 0.0);
    EXPECT_EQ(val("123456e-330"), 0.0);
    EXPECT_EQ(val("0e99999999"), 0.0);
    EXPECT_EQ(val("1e308"), 1e308);

    // Long texts: a million digits, and a tiny mantissa lifted by a huge exponent.
    EXPECT_EQ(val(std::string(1000000, '9')), DBL_MAX);
    EXPECT_EQ(val("0." + std::string(1000000, '0') + "1e1000001"), 1.0);
    EXPECT_EQ(val("1" + std::string(400, '0') + "e-400"), 1.0);
    EXPECT_EQ(val(std::string(100000, ' ') + "2.5"), 2.5);

    // Embedded NUL and non-ASCII bytes end the number; the view's end is respected.
    EXPECT_EQ(val(std::string_view("12\0"
                                   "34",
                                   5)),
              12.0);
    EXPECT_EQ(val(std::string_view("\0"
                                   "34",
                                   3)),
              0.0);
    EXPECT_EQ(val("7\xc3\xa9"), 7.0);
    EXPECT_EQ(val("\xff\xfe"), 0.0);
    const char digits[] = "123456";
    EXPECT_EQ(val(std::string_view(digits, 3)), 123.0);
    EXPECT_EQ(val(std::string_view("1e5", 2)), 1.0);
}

TEST(RoundTrip, TextReadsBackToTheSameValueToFifteenDigits) {
    std::mt19937_64 rng(77);
    std::uniform_real_distribution<double> decade(-30.0, 30.0);
    for (int i = 0; i < 100000; ++i) {
        const double any = std::bit_cast<double>(rng());
        const double measured = std::pow(10.0, decade(rng)) * ((rng() & 1) != 0 ? -1 : 1);
        for (double v : {any, measured}) {
            if (!std::isfinite(v))
                continue;
            const std::string s = str(v);
            const double back = val(s);
            // The 15-digit text of a value near the largest double lies beyond it; reading it
            // back saturates.
            const double want = reference_round15(v);
            ASSERT_EQ(back, std::isinf(want) ? std::copysign(DBL_MAX, want) : want) << s;
            ASSERT_EQ(str(back), s);
            ASSERT_EQ(to_number(s), back) << s;
            ASSERT_EQ(val(text(v)), back) << s;
        }
    }
    EXPECT_EQ(val(str(DBL_MAX)), DBL_MAX);  // 1.79769313486232E+308 is just above: saturates
    EXPECT_EQ(val(str(DBL_TRUE_MIN)), DBL_TRUE_MIN);
}

TEST(ToNumber, WholeTextMustBeANumber) {
    EXPECT_EQ(to_number("1.5"), 1.5);
    EXPECT_EQ(to_number("  -.25 \t"), -0.25);
    EXPECT_EQ(to_number("+3"), 3.0);
    EXPECT_EQ(to_number("5."), 5.0);
    EXPECT_EQ(to_number("1E-05"), 1E-05);
    EXPECT_EQ(to_number("2D2"), 200.0);
    EXPECT_EQ(to_number("1e308"), 1e308);
    EXPECT_EQ(to_number("-1e308"), -1e308);
    EXPECT_EQ(to_number("1e-999"), 0.0);  // below the smallest double: zero
    EXPECT_EQ(to_number("40000"), 40000.0);

    for (const char* bad :
         {"",    "   ",   "1,5",    "12abc", "abc", "1E",  "1E+",  ".",    "-",     "+",       "1 2",
          "--1", "1e999", "-1e999", "nan",   "inf", "NaN", "&H10", "0x10", "1.2.3", "\xc3\xa9"})
        EXPECT_EQ(to_number(bad), std::nullopt) << '"' << bad << '"';
    EXPECT_EQ(to_number(std::string_view("1\0", 2)), std::nullopt);
    EXPECT_EQ(to_number(std::string(200000, '1')), std::nullopt);
    EXPECT_EQ(to_number(std::string(300, '1')), std::strtod(std::string(300, '1').c_str(), nullptr));
}

TEST(ToInt, RoundsHalvesToEvenAndReportsValuesThatDoNotFit) {
    EXPECT_EQ(to_int16(2.5), 2);
    EXPECT_EQ(to_int16(3.5), 4);
    EXPECT_EQ(to_int16(-2.5), -2);
    EXPECT_EQ(to_int16(-3.5), -4);
    EXPECT_EQ(to_int16(0.5), 0);
    EXPECT_EQ(to_int16(-0.5), 0);
    EXPECT_EQ(to_int16(1.4999999999999998), 1);
    EXPECT_EQ(to_int16(2.5000000000000004), 3);
    EXPECT_EQ(to_int16(-7.6), -8);
    EXPECT_EQ(to_int16(32767.0), 32767);
    EXPECT_EQ(to_int16(32767.4), 32767);
    EXPECT_EQ(to_int16(32766.5), 32766);
    EXPECT_EQ(to_int16(32767.5), std::nullopt);
    EXPECT_EQ(to_int16(-32768.5), -32768);
    EXPECT_EQ(to_int16(-32769.5), std::nullopt);
    EXPECT_EQ(to_int16(40000.0), std::nullopt);
    EXPECT_EQ(to_int16(-40000.0), std::nullopt);
    EXPECT_EQ(to_int16(NAN), std::nullopt);
    EXPECT_EQ(to_int16(INFINITY), std::nullopt);
    EXPECT_EQ(to_int16(-INFINITY), std::nullopt);
    EXPECT_EQ(to_int16(DBL_MAX), std::nullopt);
    EXPECT_EQ(to_int16(DBL_TRUE_MIN), 0);

    EXPECT_EQ(to_int32(2147483647.0), 2147483647);
    EXPECT_EQ(to_int32(2147483646.5), 2147483646);
    EXPECT_EQ(to_int32(2147483647.5), std::nullopt);
    EXPECT_EQ(to_int32(-2147483648.5), -2147483647 - 1);
    EXPECT_EQ(to_int32(-2147483649.5), std::nullopt);
    EXPECT_EQ(to_int32(40000.0), 40000);
    EXPECT_EQ(to_int32(1e10), std::nullopt);
    EXPECT_EQ(to_int32(4503599627370497.0), std::nullopt);
    EXPECT_EQ(to_int32(NAN), std::nullopt);
    EXPECT_EQ(to_int32(12345678.5), 12345678);
    EXPECT_EQ(to_int32(12345679.5), 12345680);
}

}  // namespace
