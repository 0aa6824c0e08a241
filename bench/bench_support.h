// What every benchmark program shares: a reporter that keeps the time of each benchmark, so a
// program can divide one by another within the same run, the lines that bench/run collects,
// and the test signals.
#pragma once

#include <benchmark/benchmark.h>

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace bench {

// Prints what the console reporter prints and keeps the time per iteration of every run, by
// benchmark name (the median when the runs are repeated). The ratios use the process's CPU
// time (user and system, so the kernel's share of a file write counts): on a machine shared
// with other work it says what the code costs, where the wall-clock time also holds the
// waits for a processor. Both are kept.
class Timings : public benchmark::ConsoleReporter {
  public:
    Timings();  // colours only on a terminal
    void ReportRuns(const std::vector<Run>& reports) override;

    // CPU seconds per iteration of the named benchmark; 0 when it did not run (a filter left it
    // out) or reported an error.
    double seconds(const std::string& name) const { return median(cpu_, name); }
    // Wall-clock seconds per iteration.
    double real_seconds(const std::string& name) const { return median(real_, name); }

  private:
    using Runs = std::map<std::string, std::vector<double>>;
    static double median(const Runs& runs, const std::string& name);
    Runs cpu_, real_;
};

// Runs the benchmarks named on the command line (all by default) with a Timings reporter.
// Returns false when the arguments were not understood.
bool run_all(int argc, char** argv, Timings& timings);

// The lines bench/run collects: "ratio <name> <value>" for a target (lower is better) and
// "figure <name> <what> <value>" for the other figures worth keeping.
void print_ratio(const std::string& name, double value);
void print_figure(const std::string& name, const std::string& what, double value);

// A ratio of two timings, or NaN when either is missing.
double ratio(double numerator, double denominator);

// Fails the program with a message on stderr (a check of the results did not hold).
[[noreturn]] void fail(const std::string& message);

// A block as the module delivers it: a sine of amplitude 0.7 over five periods plus Gaussian
// noise of 0.1 RMS, from a fixed seed.
std::vector<double> noisy_sine(int32_t n, uint32_t seed);

// x coordinates as the block read sets them: sample k at k + 1.
std::vector<float> sample_positions(int32_t n);

// Selects Qt's offscreen platform unless the caller chose one; call before the QApplication.
void use_offscreen_platform();

}  // namespace bench
