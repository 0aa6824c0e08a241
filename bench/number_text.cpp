// The standard number text of 262144 varied doubles: numtext::format_to against the C library's
// snprintf("%.15G") with the post-processing that turns its text into the panel's (leading blank,
// no zero before the point, no minus on zero, NaN and Inf spelt the panel's way). Both must give
// the same text for every value.
#include <bit>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "bench_support.h"
#include "core/number_text.h"

namespace {

constexpr size_t value_count = 262144;

// The panel's text from snprintf's: "%.15G" already rounds to 15 significant digits, drops
// trailing zeros and picks the exponent form exactly where the panel does.
int printf_text(char* out, double value) {
    if (std::isnan(value)) {
        std::memcpy(out, "NaN", 3);
        return 3;
    }
    if (std::isinf(value)) {
        std::memcpy(out, value < 0 ? "-Inf" : " Inf", 4);
        return 4;
    }
    if (value == 0.0) {
        std::memcpy(out, " 0", 2);
        return 2;
    }
    char raw[40];
    const int n = std::snprintf(raw, sizeof raw, "%.15G", value);
    const char* p = raw;
    char* o = out;
    if (*p == '-')
        *o++ = *p++;
    else
        *o++ = ' ';
    if (p[0] == '0' && p[1] == '.')
        ++p;
    const size_t rest = static_cast<size_t>(raw + n - p);
    std::memcpy(o, p, rest);
    return static_cast<int>(o - out + rest);
}

// Values of every kind the panel meets and more: samples of a measurement, short decimals as
// people type them, any bit pattern, and the places where the rounding or the form changes.
std::vector<double> varied_values() {
    std::mt19937_64 rng(20240611);
    std::uniform_real_distribution<double> unit(-1.0, 1.0);
    std::uniform_int_distribution<int> decimals(0, 9), exponents(-320, 310);
    std::vector<double> v;
    v.reserve(value_count);
    while (v.size() < value_count) {
        switch (v.size() % 4) {
            case 0:  // measurement samples around a few volts
                v.push_back(10.0 * unit(rng));
                break;
            case 1: {  // short decimals: a whole number over a power of ten
                const auto whole = static_cast<double>(rng() % 2000001) - 1000000.0;
                v.push_back(whole / std::pow(10.0, decimals(rng)));
                break;
            }
            case 2: {  // any finite bit pattern
                double x;
                do
                    x = std::bit_cast<double>(rng());
                while (!std::isfinite(x));
                v.push_back(x);
                break;
            }
            default: {  // a power of ten (the form's limits among them) a few units in the last place off
                const double p = std::pow(10.0, exponents(rng) / 10);
                double x = p;
                for (int steps = static_cast<int>(rng() % 9) - 4; steps != 0; steps += steps < 0 ? 1 : -1)
                    x = std::nextafter(x, steps < 0 ? 0.0 : std::numeric_limits<double>::infinity());
                v.push_back((rng() & 1) ? -x : x);
                break;
            }
        }
    }
    const double specials[] = {0.0,
                               -0.0,
                               1E15,
                               999999999999999.4,
                               999999999999999.5,
                               1E-4,
                               9.99999999999995E-05,
                               1000000000000005.0,
                               1000000000000015.0,
                               0.5,
                               -0.25,
                               1E-05,
                               5E-324,
                               1.7976931348623157E308,
                               std::numeric_limits<double>::infinity(),
                               -std::numeric_limits<double>::infinity(),
                               std::numeric_limits<double>::quiet_NaN()};
    for (size_t i = 0; i < std::size(specials); ++i)
        v[i * 997] = specials[i];
    return v;
}

const std::vector<double>& values() {
    static const std::vector<double> v = varied_values();
    return v;
}

template <int (*Format)(char*, double)>
void BM_format(benchmark::State& state) {
    const std::vector<double>& v = values();
    std::vector<char> out(v.size() * 24 + 32);
    for (auto _ : state) {
        char* o = out.data();
        for (double x : v)
            o += Format(o, x);
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(v.size()));
}

void BM_numtext_format_to(benchmark::State& state) {
    BM_format<numtext::format_to>(state);
}
void BM_printf_text(benchmark::State& state) {
    BM_format<printf_text>(state);
}

// numtext::str as the pages and scale boxes use it: one string per number.
void BM_numtext_str(benchmark::State& state) {
    const std::vector<double>& v = values();
    size_t total = 0;
    for (auto _ : state) {
        for (double x : v)
            total += numtext::str(x).size();
        benchmark::DoNotOptimize(total);
    }
    state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(v.size()));
}

BENCHMARK(BM_numtext_format_to)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_printf_text)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_numtext_str)->Unit(benchmark::kMillisecond);

void check_same_texts() {
    size_t differ = 0;
    for (double x : values()) {
        char a[32], b[48];
        const int na = numtext::format_to(a, x);
        const int nb = printf_text(b, x);
        if (std::string(a, na) != std::string(b, nb)) {
            if (++differ <= 5)
                std::fprintf(stderr, "%.17g: numtext \"%.*s\", printf \"%.*s\"\n", x, na, a, nb, b);
        }
    }
    if (differ > 0)
        bench::fail(std::to_string(differ) + " of " + std::to_string(values().size()) + " texts differ");
}

}  // namespace

int main(int argc, char** argv) {
    check_same_texts();
    bench::Timings timings;
    if (!bench::run_all(argc, argv, timings))
        return 1;
    const double fast = timings.seconds("BM_numtext_format_to");
    const double slow = timings.seconds("BM_printf_text");
    const double per_value = 1e9 / static_cast<double>(value_count);
    bench::print_figure("number_text_vs_printf", "format_to_ns_per_value", fast * per_value);
    bench::print_figure("number_text_vs_printf", "printf_ns_per_value", slow * per_value);
    bench::print_figure("number_text_vs_printf", "str_ns_per_value",
                        timings.seconds("BM_numtext_str") * per_value);
    bench::print_ratio("number_text_vs_printf", bench::ratio(fast, slow));
    return 0;
}
