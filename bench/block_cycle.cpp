// One whole timer tick of the main window with a block ready, on the simulated K7720A with a
// virtual clock: the poll, the read of the 16 enabled inputs, trace_update with four traces
// and the four output files appended, with the window shown so that the events the tick lets
// run (painting among them) are part of it. Divided by the time the module takes to acquire
// the block at the 20000 Hz span (51200 samples per second). The simulator's own share (its
// signal for 16 inputs per block) is timed apart by making the same driver calls alone, and the
// panel's by the same tick with inputs that hold fixed samples, which cost the simulator a copy.
#include <unistd.h>

#include <QApplication>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "bench_support.h"
#include "core/dialogs.h"
#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "ost7720.h"
#include "sim_control.h"

namespace {

constexpr double sample_rate = 51200.0;  // 2.56 x the 20000 Hz span
constexpr int32_t kind_time = 270;
constexpr int32_t type_time = 345;

int messages = 0;

std::filesystem::path folder() {
    static const std::filesystem::path dir = [] {
        auto d = std::filesystem::temp_directory_path() / ("k7720_bench_cycle_" + std::to_string(::getpid()));
        std::filesystem::create_directories(d);
        return d;
    }();
    return dir;
}

// A 1920 x 1080 screen at 96 dots per inch, so that the main window (two thirds of it) and its
// pictures have the size they have on a common desktop.
void use_desktop_sized_offscreen_screen() {
    if (std::getenv("QT_QPA_PLATFORM") != nullptr)
        return;
    const std::string config = (folder() / "screen.json").string();
    std::ofstream(config)
        << R"({"screens": [{"name": "bench", "x": 0, "y": 0, "width": 1920, "height": 1080,)"
        << R"( "logicalDpi": 96, "logicalBaseDpi": 96, "dpr": 1}]})";
    setenv("QT_QPA_PLATFORM", ("offscreen:configfile=" + config).c_str(), 1);
}

MainFrm& main_window() {
    return forms::get<MainFrm>();
}

// Stops any run, then starts a repeating one of this block size with four traces on channels
// 1..4 and a file each.
void start_run(int32_t blocksize) {
    MainFrm& m = main_window();
    if (global::running != 0)
        m.GoBtn_Click();
    global::single_block = global::flag_false;
    global::blocksize = blocksize;
    for (int t = 0; t < 4; ++t) {
        global::trace_channel[t] = t + 1;
        global::trace_file[t] = (folder() / ("trace" + std::to_string(t + 1) + ".txt")).string();
    }
    m.GoBtn_Click();
    if (global::running == 0 || global::num_points != blocksize)
        bench::fail("no run of " + std::to_string(blocksize) + " points started");
}

void next_block_ready(int32_t blocksize) {
    sim::advance_clock(blocksize / sample_rate * 1.0001);
}

// Between ticks, outside the timing: the call log back to empty and, now and then, the files
// removed, so that a long run fills neither the memory nor the disk. The files are removed
// rather than cut back: a file cut to nothing and written again is flushed to disk when it is
// closed (ext4 does that for programs that rewrite files in place), which a run of appended
// blocks never asks for.
void tidy_up() {
    for (int t = 0; t < 4; ++t) {
        std::error_code ec;
        if (std::filesystem::file_size(global::trace_file[t], ec) > (64u << 20))
            std::filesystem::remove(global::trace_file[t], ec);
    }
    sim::clear_call_log();
}

// Gives the 16 inputs fixed blocks of samples (a noisy sine each), which the simulator hands
// out without working out a signal: the tick is then the panel's work and a copy per read.
// An empty block gives them their simulated signal back.
void use_exact_samples(int32_t blocksize) {
    for (int32_t c = 0; c < global::num_inputs; ++c) {
        std::vector<double> samples;
        if (blocksize > 0)
            samples = bench::noisy_sine(blocksize, static_cast<uint32_t>(c + 1));
        sim::set_input_samples(global::input_ids[c], samples);
    }
}

void tick_loop(benchmark::State& state, bool exact) {
    const auto blocksize = static_cast<int32_t>(state.range(0));
    start_run(blocksize);
    use_exact_samples(exact ? blocksize : 0);
    MainFrm& m = main_window();
    for (auto _ : state) {
        state.PauseTiming();
        tidy_up();
        state.ResumeTiming();
        next_block_ready(blocksize);
        m.MainTimer_Timer();
    }
    use_exact_samples(0);
}

void BM_tick(benchmark::State& state) {
    tick_loop(state, false);
}

void BM_tick_exact_samples(benchmark::State& state) {
    tick_loop(state, true);
}

// The driver's part of a tick alone: the poll, a read of each enabled input and the range of
// the four traces' channels, as the block read makes them.
void BM_simulator(benchmark::State& state) {
    const auto blocksize = static_cast<int32_t>(state.range(0));
    start_run(blocksize);
    std::vector<double> data(static_cast<size_t>(blocksize) + 1);
    using namespace global;
    for (auto _ : state) {
        state.PauseTiming();
        sim::clear_call_log();
        state.ResumeTiming();
        next_block_ready(blocksize);
        int32_t available = 0;
        ost7720_blockAvailable(session, group_inputs, &available);
        if (available < 1)
            state.SkipWithError("no block ready");
        for (int32_t c = 0; c < num_inputs; ++c) {
            int32_t on = 0, count = 0;
            ost7720_getEnable(session, input_ids[c], kind_time, &on);
            ost7720_readFloat64Data(session, input_ids[c], type_time, data.data(), blocksize, &count, 1);
        }
        for (int t = 0; t < 4; ++t) {
            double range = 0;
            ost7720_getRange(session, trace_channel[t], &range);
        }
    }
}

BENCHMARK(BM_tick)->RangeMultiplier(2)->Range(1024, 65536)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_tick_exact_samples)->RangeMultiplier(2)->Range(1024, 65536)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_simulator)->RangeMultiplier(2)->Range(1024, 65536)->Unit(benchmark::kMillisecond);

size_t lines_in(const std::string& name) {
    std::ifstream in(name, std::ios::binary);
    size_t lines = 0;
    for (std::string line; std::getline(in, line);)
        ++lines;
    return lines;
}

// One tick reads every enabled input once and appends one block to each file.
void check_one_tick() {
    const int32_t blocksize = 1024;
    start_run(blocksize);
    for (int t = 0; t < 4; ++t)
        std::filesystem::remove(global::trace_file[t]);
    sim::clear_call_log();
    next_block_ready(blocksize);
    main_window().MainTimer_Timer();
    int reads = 0;
    for (const std::string& name : sim::call_names())
        reads += name == "ost7720_readFloat64Data";
    if (global::num_inputs != 16 || reads != 16)
        bench::fail(std::to_string(reads) + " reads of " + std::to_string(global::num_inputs) + " inputs");
    for (int t = 0; t < 4; ++t)
        if (lines_in(global::trace_file[t]) != static_cast<size_t>(blocksize) + 1)
            bench::fail(global::trace_file[t] + " does not hold one block");
    if (global::trace_has_data[3] != global::flag_true || !main_window().CRTpic[3]->isVisible())
        bench::fail("the fourth trace is not shown");
}

}  // namespace

int main(int argc, char** argv) {
    use_desktop_sized_offscreen_screen();
    QApplication app(argc, argv);
    QApplication::setApplicationName(QStringLiteral("Ostrana K7720A Soft Front Panel"));
    dialogs::set_responder([](dialogs::Kind kind, const std::string&) {
        ++messages;
        return kind == dialogs::Kind::question ? dialogs::Answer::yes : dialogs::Answer::ok;
    });
    sim::reset();
    sim::use_virtual_clock();
    MainFrm& m = main_window();
    m.Form_Load();
    m.show();
    QApplication::processEvents();
    check_one_tick();

    bench::Timings timings;
    const bool ran = bench::run_all(argc, argv, timings);
    if (global::running != 0)
        m.GoBtn_Click();
    forms::destroy_all();  // while the application still exists
    std::filesystem::remove_all(folder());
    if (!ran)
        return 1;
    if (messages > 0)
        bench::fail(std::to_string(messages) + " messages were shown during the run");

    double worst = 0;
    for (int32_t b = 1024; b <= 65536; b *= 2) {
        const std::string arg = "/" + std::to_string(b);
        const double tick = timings.seconds("BM_tick" + arg);
        const double simulator = timings.seconds("BM_simulator" + arg);
        const double block_time = b / sample_rate;
        const double r = bench::ratio(tick, block_time);
        const std::string n = "_n" + std::to_string(b);
        bench::print_figure("block_cycle_vs_block_time", "tick_ms" + n, tick * 1e3);
        bench::print_figure("block_cycle_vs_block_time", "tick_wall_ms" + n,
                            timings.real_seconds("BM_tick" + arg) * 1e3);
        bench::print_figure("block_cycle_vs_block_time", "block_time_ms" + n, block_time * 1e3);
        bench::print_figure("block_cycle_vs_block_time", "simulator_ms" + n, simulator * 1e3);
        // The simulator's share: what the tick saves when the simulator need not work out a signal.
        const double exact = timings.seconds("BM_tick_exact_samples" + arg);
        bench::print_figure("block_cycle_vs_block_time", "simulator_share" + n,
                            1.0 - bench::ratio(exact, tick));
        bench::print_figure("block_cycle_vs_block_time", "tick_exact_samples_ms" + n, exact * 1e3);
        bench::print_figure("block_cycle_vs_block_time", "panel_ratio" + n, bench::ratio(exact, block_time));
        bench::print_figure("block_cycle_vs_block_time", "ratio" + n, r);
        worst = std::max(worst, r);
    }
    bench::print_ratio("block_cycle_vs_block_time", worst);
    return 0;
}
