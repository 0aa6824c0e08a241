// The output files of one block: write_trace_files for four traces of 65536 points against
// writing the same bytes to the same files with one fwrite each. Both rewrite the files, as a
// single-block run does, so every iteration writes one block per file.
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "bench_support.h"
#include "core/dialogs.h"
#include "core/global.h"
#include "display/output_files.h"

namespace {

constexpr int32_t points = 65536;

std::filesystem::path folder() {
    static const std::filesystem::path dir = [] {
        auto d = std::filesystem::temp_directory_path() / ("k7720_bench_files_" + std::to_string(::getpid()));
        std::filesystem::create_directories(d);
        return d;
    }();
    return dir;
}

// Four traces on channels 1..4, each with its file and a block of samples; element num_points
// stays 0, as the block read leaves it.
void set_up_traces() {
    global::num_points = points;
    for (int t = 0; t < 4; ++t) {
        global::trace_channel[t] = t + 1;
        global::trace_file[t] = (folder() / ("trace" + std::to_string(t + 1) + ".txt")).string();
        std::vector<double> block = bench::noisy_sine(points, static_cast<uint32_t>(500 + t));
        for (double& v : block)
            v *= 5.0;  // volts on a 10 V range
        block.push_back(0.0);
        global::trace_data(t) = std::move(block);
    }
}

std::vector<char> read_file(const std::string& name) {
    std::ifstream in(name, std::ios::binary);
    return std::vector<char>(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// What the panel writes, taken from its own files: the baseline writes exactly these bytes.
std::vector<std::vector<char>>& file_bytes() {
    static std::vector<std::vector<char>> bytes;
    return bytes;
}

void BM_write_trace_files(benchmark::State& state) {
    for (auto _ : state) {
        int16_t append = global::flag_false;
        write_trace_files(append);
    }
    state.SetItemsProcessed(state.iterations() * 4 * (points + 1));
}

void BM_fwrite_same_bytes(benchmark::State& state) {
    for (auto _ : state) {
        for (int t = 0; t < 4; ++t) {
            std::FILE* f = std::fopen(global::trace_file[t].c_str(), "wb");
            if (f == nullptr)
                bench::fail("cannot open " + global::trace_file[t]);
            const std::vector<char>& b = file_bytes()[t];
            if (std::fwrite(b.data(), 1, b.size(), f) != b.size())
                bench::fail("cannot write " + global::trace_file[t]);
            std::fclose(f);
        }
    }
    state.SetItemsProcessed(state.iterations() * 4 * (points + 1));
}

BENCHMARK(BM_write_trace_files)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_fwrite_same_bytes)->Unit(benchmark::kMillisecond);

// The files hold every sample: points + 1 lines each, and the raw writes reproduce them.
void take_file_bytes() {
    int16_t append = global::flag_false;
    write_trace_files(append);
    for (int t = 0; t < 4; ++t) {
        std::vector<char> b = read_file(global::trace_file[t]);
        size_t lines = 0;
        for (char c : b)
            lines += c == '\n';
        if (lines != points + 1)
            bench::fail(global::trace_file[t] + " holds " + std::to_string(lines) + " lines");
        file_bytes().push_back(std::move(b));
    }
}

}  // namespace

int main(int argc, char** argv) {
    dialogs::set_responder(
        [](dialogs::Kind, const std::string& text) -> dialogs::Answer { bench::fail("message: " + text); });
    set_up_traces();
    take_file_bytes();
    bench::Timings timings;
    const bool ran = bench::run_all(argc, argv, timings);
    for (int t = 0; t < 4; ++t)
        if (read_file(global::trace_file[t]) != file_bytes()[t])
            bench::fail("the files changed");
    std::filesystem::remove_all(folder());
    if (!ran)
        return 1;
    const double panel = timings.seconds("BM_write_trace_files");
    const double raw = timings.seconds("BM_fwrite_same_bytes");
    size_t bytes = 0;
    for (const auto& b : file_bytes())
        bytes += b.size();
    bench::print_figure("write_files_vs_raw", "write_trace_files_ms", panel * 1e3);
    bench::print_figure("write_files_vs_raw", "fwrite_ms", raw * 1e3);
    bench::print_figure("write_files_vs_raw", "megabytes_per_block", static_cast<double>(bytes) / 1e6);
    bench::print_ratio("write_files_vs_raw", bench::ratio(panel, raw));
    return 0;
}
