// The number <-> text conversions: the standard number text against hand-worked examples and
// against an independent reference built on the C library's exact "%.14e", reading numbers
// back (round trips), the strict conversion and the rounding to integers.
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

using namespace std::string_literals;

namespace {

// Reference text: the 15 correctly rounded digits from "%.14e", laid out with plain string
// handling.
std::string reference_str(double v) {
    if (std::isnan(v))
        return "NaN";
    if (v == 0)
        return " 0";
    const std::string sign = std::signbit(v) ? "-" : " ";
    if (std::isinf(v))
        return sign + "Inf";
    char b[64];
    std::snprintf(b, sizeof b, "%.14e", std::fabs(v));  // d.dddddddddddddde+xx
    std::string digits = b[0] + std::string(b + 2, 14);
    const int e = std::atoi(b + 17);
    digits.erase(digits.find_last_not_of('0') + 1);  // the first digit is never 0
    if (e < -4 || e >= 15) {
        char exponent[16];
        std::snprintf(exponent, sizeof exponent, "E%c%02d", e < 0 ? '-' : '+', std::abs(e));
        return sign + digits[0] + (digits.size() > 1 ? "." + digits.substr(1) : "") + exponent;
    }
    if (e < 0)
        return sign + "." + std::string(-e - 1, '0') + digits;
    digits.resize(std::max(digits.size(), static_cast<size_t>(e) + 1), '0');
    return sign + digits.substr(0, e + 1) +
           (digits.size() > static_cast<size_t>(e) + 1 ? "." + digits.substr(e + 1) : "");
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
    ASSERT_EQ(std::string(buffer + 32, 32), std::string(32, '#')) << "wrote past 32 for " << want;
}

// Reading the text back gives the value to 15 digits, whichever way it is read. The 15-digit
// text of a value near the largest double lies beyond it: reading it back saturates.
void expect_round_trip(double v) {
    const std::string s = str(v);
    const double back = val(s), want = reference_round15(v);
    ASSERT_EQ(back, std::isinf(want) ? std::copysign(DBL_MAX, want) : want) << s;
    ASSERT_EQ(str(back), s);
    ASSERT_EQ(to_number(s), back) << s;
    ASSERT_EQ(val(text(v)), back) << s;
}

TEST(StandardText, HandWorkedExamples) {
    const std::vector<std::pair<double, std::string>> cases = {
        {0.5, " .5"},
        {-0.25, "-.25"},
        {1E-05, " 1E-05"},
        {1E-20, " 1E-20"},
        {1.5E+20, " 1.5E+20"},
        {123456789012345.0, " 123456789012345"},
        {1E15, " 1E+15"},
        {999999999999999.9, " 1E+15"},
        {1234567890123456.0, " 1.23456789012346E+15"},
        {0.0001, " .0001"},
        {9.999999999999E-05, " 9.999999999999E-05"},
        {0.0000999999999999999999, " .0001"},
        {0.1 + 0.2, " .3"},
        {-2.0 / 3.0, "-.666666666666667"},
        {DBL_MAX, " 1.79769313486232E+308"},
        {DBL_TRUE_MIN, " 4.94065645841247E-324"},
        {-0.0, " 0"},
        {NAN, "NaN"},
        {INFINITY, " Inf"},
        {-INFINITY, "-Inf"},
        // Exact halves at the 16th digit go to the even neighbour.
        {123456789012345.5, " 123456789012346"},
        {123456789012344.5, " 123456789012344"},
        {1000000000000005.0, " 1E+15"},
        {10000000000000150.0, " 1.00000000000002E+16"},
        {1.0 + std::ldexp(1.0, -15), " 1.00003051757812"}};
    for (const auto& [value, expected] : cases) {
        SCOPED_TRACE(expected);
        EXPECT_EQ(str(value), expected);
        EXPECT_EQ(text(value), expected.substr(expected[0] == ' ' ? 1 : 0));
        EXPECT_EQ(reference_str(value), expected) << "the reference disagrees";
    }
}

TEST(StandardText, MatchesCorrectlyRoundedReferenceAndReadsBackOnRandomValues) {
    std::mt19937_64 rng(20240611);
    std::uniform_real_distribution<double> decade(-20.0, 20.0);
    for (int i = 0; i < 150000; ++i) {
        // Any bit pattern: every exponent, subnormals included.
        const double any = std::bit_cast<double>(rng());
        if (std::isfinite(any)) {
            expect_reference(any);
            expect_round_trip(any);
        }
        // Measured values and their float-precision forms.
        const double measured = std::pow(10.0, decade(rng)) * ((rng() & 1) != 0 ? -1 : 1);
        expect_reference(measured);
        expect_round_trip(measured);
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

TEST(StandardText, PowersOfTwoAndTheDecadeBoundariesAcrossTheRange) {
    for (int i = -1074; i <= 1023; ++i) {
        const double p = std::ldexp(1.0, i);
        for (double v : {p, std::nextafter(p, 0.0), std::nextafter(p, INFINITY), 3 * p, 5 * p})
            expect_reference(v);
    }
    // 999999999999999.5 * 10^j is where a number's 15-digit text moves to the next decade: just
    // below it the text has fifteen 9s, at or above it the text is a power of ten. Both sides,
    // and the powers of ten themselves, a few units in the last place either way.
    for (int j = -338; j <= 293; ++j) {
        for (const char* form : {"999999999999999.5e%d", "1e%d"}) {
            char text[32];
            std::snprintf(text, sizeof text, form, form[0] == '1' ? j + 15 : j);
            double v = std::strtod(text, nullptr);
            if (v == 0 || !std::isfinite(v))
                continue;
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
    EXPECT_EQ(val(str(DBL_MAX)), DBL_MAX);  // 1.79769313486232E+308 is just above: saturates
    EXPECT_EQ(val(str(DBL_TRUE_MIN)), DBL_TRUE_MIN);
}

// A locale with a decimal comma, made for the test when the system has none installed.
bool use_comma_locale() {
    if (std::setlocale(LC_NUMERIC, "de_DE.UTF-8") != nullptr)
        return true;
    const std::string dir = testing::TempDir() + "k7720-locale";
    const std::string make =
        "mkdir -p " + dir + " && localedef -i de_DE -f UTF-8 " + dir + "/de_DE.UTF-8 >/dev/null 2>&1";
    if (std::system(make.c_str()) != 0)
        return false;
    setenv("LOCPATH", dir.c_str(), 1);
    return std::setlocale(LC_NUMERIC, "de_DE.UTF-8") != nullptr;
}

TEST(StandardText, ExactPathDoesNotDependOnTheLocalesPoint) {
    // 10000000000000150 is an exact half that only the exact path can decide.
    const std::string saved = std::setlocale(LC_NUMERIC, nullptr);
    if (!use_comma_locale())
        GTEST_SKIP() << "no German locale and none could be made (Debian package locales)";
    ASSERT_STREQ(std::localeconv()->decimal_point, ",");
    const std::string got = str(10000000000000150.0);
    std::setlocale(LC_NUMERIC, saved.c_str());
    unsetenv("LOCPATH");
    EXPECT_EQ(got, " 1.00000000000002E+16");
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
            const auto kind = rng() % 4;
            v = kind == 0   ? specials[rng() % specials.size()]
                : kind == 1 ? std::bit_cast<double>(rng())
                            : (static_cast<double>(rng() % 2000001) - 1E6) /
                                  std::pow(10.0, static_cast<int>(rng() % 12));
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
        ASSERT_EQ(std::string(buffer.begin() + room, buffer.end()), std::string(16, '#')) << "run " << run;
    }
}

TEST(Val, ReadsTheNumberAtTheStartOfTheTextAndSaturates) {
    const std::vector<std::pair<std::string, double>> cases = {{".5", 0.5},
                                                               {"-.25", -0.25},
                                                               {"1E-05", 1E-05},
                                                               {"1.5D+20", 1.5E+20},
                                                               {"2d3", 2000.0},
                                                               {"  \t 42", 42.0},
                                                               {"+7", 7.0},
                                                               {"12abc", 12.0},
                                                               {"1.2.3", 1.2},
                                                               {"5.", 5.0},
                                                               {"3e-x", 3.0},
                                                               {" 123456789012345", 123456789012345.0},
                                                               {"4.9e-324", DBL_TRUE_MIN},
                                                               {"0.0000001e315", 1e308},
                                                               {"-1e999", -DBL_MAX},
                                                               {std::string(100000, ' ') + "2.5", 2.5},
                                                               {"12\0x"s, 12.0},  // a NUL ends the number
                                                               {"7\xc3\xa9", 7.0}};
    for (const auto& [text, expected] : cases)
        EXPECT_EQ(val(text), expected) << '"' << text.substr(0, 40) << '"';
    // Cut short: the number before the first character that cannot go on.
    for (const std::string& one : {"1E"s, "1E+"s, "1,5"s, "1.e"s, "1" + std::string(400, '0') + "e-400",
                                   "0." + std::string(1000000, '0') + "1e1000001"})
        EXPECT_EQ(val(one), 1.0) << one.substr(0, 40);
    // No number at the start, or one below the smallest subnormal.
    for (const std::string& zero :
         {""s, "-"s, "."s, ".e5"s, "abc"s, "inf"s, "nan"s, "&H10"s, "0x10"s, "\xff\xfe"s, "\0x34"s, "1e-999"s,
          "-1e-99999999999999999999"s, "123456e-330"s, "-0.0000001e-318"s, "0e99999999"s})
        EXPECT_EQ(val(zero), 0.0) << zero;
    // Beyond the double range: the largest finite magnitude, so later sums stay finite.
    for (const std::string& huge :
         {"1e999"s, "1e99999999999999999999999999"s, "0.0000001e316"s, std::string(1000000, '9')})
        EXPECT_EQ(val(huge), DBL_MAX) << huge.substr(0, 40);
    EXPECT_TRUE(std::signbit(val("-0")));
    // The view's end is respected.
    EXPECT_EQ(val(std::string_view("123456", 3)), 123.0);
    EXPECT_EQ(val(std::string_view("1e5", 2)), 1.0);
}

TEST(ToNumber, WholeTextMustBeANumber) {
    const std::vector<std::pair<std::string, double>> good = {
        {"  -.25 \t", -0.25},
        {"+3", 3.0},
        {"5.", 5.0},
        {"2D2", 200.0},
        {"-1e308", -1e308},
        {"40000", 40000.0},
        {"1e-999", 0.0},  // below the smallest double: zero
        {std::string(300, '1'), std::strtod(std::string(300, '1').c_str(), nullptr)}};
    for (const auto& [text, expected] : good)
        EXPECT_EQ(to_number(text), expected) << '"' << text << '"';
    for (const char* bad :
         {"",    "   ", "1,5",   "12abc",  "abc", "1E",  "1E+",  ".",    "-",     "+",
          "1 2", "--1", "1e999", "-1e999", "nan", "inf", "&H10", "0x10", "1.2.3", "\xc3\xa9"})
        EXPECT_EQ(to_number(bad), std::nullopt) << '"' << bad << '"';
    EXPECT_EQ(to_number("1\0"s), std::nullopt);
    EXPECT_EQ(to_number(std::string(200000, '1')), std::nullopt);
}

TEST(ToInt, RoundsHalvesToEvenAndReportsValuesThatDoNotFit) {
    // Whole numbers both widths give alike.
    const std::vector<std::pair<double, int16_t>> both = {{2.5, 2},
                                                          {3.5, 4},
                                                          {-2.5, -2},
                                                          {-3.5, -4},
                                                          {0.5, 0},
                                                          {-0.5, 0},
                                                          {-7.6, -8},
                                                          {32767.4, 32767},
                                                          {32766.5, 32766},
                                                          {-32768.5, -32768},
                                                          {DBL_TRUE_MIN, 0},
                                                          {1.4999999999999998, 1},
                                                          {2.5000000000000004, 3}};
    for (const auto& [value, expected] : both) {
        EXPECT_EQ(to_int16(value), expected) << value;
        EXPECT_EQ(to_int32(value), expected) << value;
    }
    const std::vector<std::pair<double, int32_t>> only32 = {
        {32767.5, 32768},           {-32769.5, -32770},         {40000.0, 40000},
        {-40000.0, -40000},         {12345678.5, 12345678},     {12345679.5, 12345680},
        {2147483646.5, 2147483646}, {2147483647.0, 2147483647}, {-2147483648.5, -2147483647 - 1}};
    for (const auto& [value, expected] : only32) {
        EXPECT_EQ(to_int16(value), std::nullopt) << value;
        EXPECT_EQ(to_int32(value), expected) << value;
    }
    for (double neither : std::initializer_list<double>{2147483647.5, -2147483649.5, 1e10, 4503599627370497.0,
                                                        DBL_MAX, NAN, INFINITY, -INFINITY}) {
        EXPECT_EQ(to_int16(neither), std::nullopt) << neither;
        EXPECT_EQ(to_int32(neither), std::nullopt) << neither;
    }
}

}  // namespace
