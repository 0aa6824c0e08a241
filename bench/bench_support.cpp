#include "bench_support.h"

#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <numbers>
#include <random>

namespace bench {

Timings::Timings() : ConsoleReporter(isatty(STDOUT_FILENO) ? OO_ColorTabular : OO_Tabular) {}

void Timings::ReportRuns(const std::vector<Run>& reports) {
    ConsoleReporter::ReportRuns(reports);
    for (const Run& run : reports) {
        if (run.run_type != Run::RT_Iteration || run.error_occurred)
            continue;
        const double unit = benchmark::GetTimeUnitMultiplier(run.time_unit);
        cpu_[run.run_name.str()].push_back(run.GetAdjustedCPUTime() / unit);
        real_[run.run_name.str()].push_back(run.GetAdjustedRealTime() / unit);
    }
}

double Timings::median(const Runs& runs, const std::string& name) {
    const auto found = runs.find(name);
    if (found == runs.end() || found->second.empty())
        return 0.0;
    std::vector<double> v = found->second;
    std::sort(v.begin(), v.end());
    const size_t m = v.size() / 2;
    return v.size() % 2 ? v[m] : (v[m - 1] + v[m]) / 2;
}

bool run_all(int argc, char** argv, Timings& timings) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return false;
    benchmark::RunSpecifiedBenchmarks(&timings);
    benchmark::Shutdown();
    return true;
}

void print_ratio(const std::string& name, double value) {
    std::printf("ratio %s %.4g\n", name.c_str(), value);
    std::fflush(stdout);
}

void print_figure(const std::string& name, const std::string& what, double value) {
    std::printf("figure %s %s %.4g\n", name.c_str(), what.c_str(), value);
    std::fflush(stdout);
}

double ratio(double numerator, double denominator) {
    if (numerator <= 0 || denominator <= 0)
        return std::numeric_limits<double>::quiet_NaN();
    return numerator / denominator;
}

void fail(const std::string& message) {
    std::fprintf(stderr, "FAILED: %s\n", message.c_str());
    std::exit(1);
}

std::vector<double> noisy_sine(int32_t n, uint32_t seed) {
    std::mt19937 rng(seed);
    std::normal_distribution<double> noise(0.0, 0.1);
    std::vector<double> ys(static_cast<size_t>(n));
    const double step = 2 * std::numbers::pi * 5 / n;
    for (int32_t k = 0; k < n; ++k)
        ys[k] = 0.7 * std::sin(step * k) + noise(rng);
    return ys;
}

std::vector<float> sample_positions(int32_t n) {
    std::vector<float> xs(static_cast<size_t>(n));
    for (int32_t k = 0; k < n; ++k)
        xs[k] = static_cast<float>(k + 1);
    return xs;
}

void use_offscreen_platform() {
    setenv("QT_QPA_PLATFORM", "offscreen", 0);
}

}  // namespace bench
