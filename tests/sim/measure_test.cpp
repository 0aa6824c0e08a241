// The simulated measurement: timing, data modes, triggers, data, sources looped back, arming.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <numbers>
#include <numeric>
#include <thread>

#include "sim_test_util.h"

using simtest::details;

namespace {

constexpr double fs = 51200.0;  // 2.56 x the power-on span of 20000 Hz
constexpr double pi = std::numbers::pi;

// The default system opened as the panel does, on the virtual clock, with every source off.
struct Rig {
    int32_t s = 0, inputs = 0, all = 0;

    Rig() {
        sim::reset();
        sim::use_virtual_clock();
        s = simtest::open_both();
        std::vector<int32_t> ids(16);
        std::iota(ids.begin(), ids.end(), 1);
        ost7720_createChannelGroup(s, 16, ids.data(), &inputs);
        ids.insert(ids.end(), {4097, 4098, 8193, 8194});
        ost7720_createChannelGroup(s, 20, ids.data(), &all);
        ost7720_setActive(s, 4098, 421);
    }

    void start(int32_t data_mode = 340, int32_t auto_trigger = 441) {
        ASSERT_EQ(ost7720_setDataMode(s, inputs, data_mode), 0);
        ASSERT_EQ(ost7720_setAutoTrigger(s, all, auto_trigger), 0);
        ASSERT_EQ(ost7720_initMeasure(s, all), 0);
    }

    int32_t available(int32_t channel = 0) {
        int32_t a = -1;
        EXPECT_GE(ost7720_blockAvailable(s, channel ? channel : inputs, &a), 0);
        return a;
    }

    // No block until `samples` sample periods from now, one just after.
    void expect_block_after(double samples) {
        sim::advance_clock((samples - 0.5) / fs);
        EXPECT_EQ(available(), 0);
        sim::advance_clock(1.0 / fs);
        EXPECT_EQ(available(), 1);
    }

    // The status of a read; with expected 0 also that exactly `count` values came.
    int32_t read_status(int32_t channel, int32_t type = 345, int32_t count = 1024) {
        last.assign(static_cast<size_t>(std::max(count, 0)) + 1, -99.0);
        int32_t actual = 0;
        int32_t status = ost7720_readFloat64Data(s, channel, type, last.data(), count, &actual, 1);
        EXPECT_EQ(last.back(), -99.0);  // nothing written past the count
        last.pop_back();
        if (status == 0) {
            EXPECT_EQ(actual, count);
        }
        return status;
    }

    std::vector<double> read(int32_t channel, int32_t type = 345, int32_t count = 1024) {
        EXPECT_EQ(read_status(channel, type, count), 0) << details(s);
        return last;
    }

    double read_mean(int32_t channel) {
        read(channel);
        return std::accumulate(last.begin(), last.end(), 0.0) / static_cast<double>(last.size());
    }

    // A source on its own: active, Normal output, the mode and settings given.
    void source(int32_t mode, double range, double freq, double phase = 0.0) {
        ASSERT_EQ(ost7720_setSourceMode(s, 4098, mode), 0);
        ASSERT_EQ(ost7720_setRange(s, 4098, range), 0);
        ASSERT_EQ(ost7720_setSineFreq(s, 4098, freq), 0);
        ASSERT_EQ(ost7720_setSinePhase(s, 4098, phase), 0);
        ASSERT_EQ(ost7720_setActive(s, 4098, 420), 0);
    }

    void level_trigger(int32_t ch, int32_t slope, int32_t mode, double lower, double upper) {
        ASSERT_EQ(ost7720_setTriggerChannel(s, ch, 420), 0);
        ASSERT_EQ(ost7720_setTriggerSlope(s, ch, slope), 0);
        ASSERT_EQ(ost7720_setTriggerMode(s, ch, mode), 0);
        ASSERT_EQ(ost7720_setTriggerLevel(s, ch, 416, lower), 0);
        ASSERT_EQ(ost7720_setTriggerLevel(s, ch, 417, upper), 0);
    }

    std::vector<double> last;
};

}  // namespace

TEST(SimMeasure, BlocksCompleteBlockSizeOverSampleRateAfterTheStart) {
    for (const auto& [span, size] :
         {std::pair{20000.0, 1024}, {20000.0, 256}, {2500.0, 1024}, {2500.0, 4096}}) {
        SCOPED_TRACE(testing::Message() << span << " Hz, " << size);
        Rig r;
        ASSERT_EQ(ost7720_setSpan(r.s, r.inputs, span), 0);
        ASSERT_EQ(ost7720_setBlocksize(r.s, r.inputs, size), 0);
        r.start(341);
        const double block = size / (2.56 * span);  // 20 ms, 5 ms, 160 ms, 640 ms
        for (const auto& [advance, blocks] : {std::pair{0.999, 0}, {0.001, 1}, {0.998, 1}, {0.002, 2}}) {
            sim::advance_clock(block * advance);
            EXPECT_EQ(r.available(), blocks);
        }
        EXPECT_EQ(r.read(1, 345, size).size(), static_cast<size_t>(size));
        EXPECT_EQ(r.available(1), 1);
        EXPECT_EQ(r.available(2), 2);
        EXPECT_EQ(r.available(), 1);  // the fewest of the group
    }
}

TEST(SimMeasure, ContinuousBlocksJoinWithoutAGapAndBlockModeWaitsForTheRead) {
    Rig r;
    r.source(170, 1.0, 1000.0);
    r.start(341);
    sim::advance_clock(3 * 1024 / fs);
    ASSERT_EQ(r.available(), 3);
    std::vector<double> a = r.read(1), b = r.read(1), c = r.read(1);
    // A sampled sine obeys x[n+1] = 2 cos(w) x[n] - x[n-1]; across the joins too (1 mV noise).
    const double k = 2 * std::cos(2 * pi * 1000.0 / fs);
    EXPECT_NEAR(b[0], k * a[1023] - a[1022], 0.01);
    EXPECT_NEAR(b[1], k * b[0] - a[1023], 0.01);
    EXPECT_NEAR(c[0], k * b[1023] - b[1022], 0.01);
    EXPECT_NEAR(*std::max_element(a.begin(), a.end()), 1.0, 0.01);

    Rig m;  // block mode: one block, then nothing until it is read; the next follows the read
    m.start(340);
    sim::advance_clock(5 * 1024 / fs);
    EXPECT_EQ(m.available(), 1);
    for (int32_t ch = 1; ch <= 16; ++ch)
        m.read(ch);
    m.expect_block_after(1024);
}

TEST(SimMeasure, RunsOnRealTimeByDefault) {
    sim::reset();
    int32_t s = simtest::open_both(), a = 0;
    ASSERT_EQ(ost7720_initMeasure(s, 1), 0);
    for (int i = 0; i < 400 && a == 0; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
        ASSERT_EQ(ost7720_blockAvailable(s, 1, &a), 0);
    }
    EXPECT_EQ(a, 1);
    EXPECT_GE(sim::clock_seconds(), 0.02);
}

TEST(SimMeasure, ManualTriggerAndNeverTriggering) {
    Rig r;
    r.start(340, 440);
    sim::advance_clock(10.0);
    EXPECT_EQ(r.available(), 0);
    EXPECT_EQ(r.read_status(1), sim::err_no_data);
    EXPECT_EQ(details(r.s), "ost7720_readFloat64Data: no block of channel 1 is available");
    ASSERT_EQ(ost7720_triggerMeasure(r.s, r.all, 0), 0);
    r.expect_block_after(1024);
    r.read(1);
    sim::advance_clock(1.0);  // block mode needs a trigger for every block
    EXPECT_EQ(r.available(1), 0);
    Rig idle;
    EXPECT_EQ(ost7720_triggerMeasure(idle.s, idle.all, 0), sim::err_measurement_state);
}

TEST(SimMeasure, InputTriggerFiresWhereItsSignalCrossesItsLevels) {
    // Levels are percent of the 2 V range. The exact samples repeat from the measurement start.
    std::vector<double> step(1000, -1.0), leave(400, 0.25);
    std::fill(step.begin() + 300, step.end(), 1.0);
    std::fill(leave.begin() + 100, leave.end(), 1.0);
    // clang-format off
    const struct { std::vector<double> v; int32_t slope, mode; double lower, upper; int fires; } cases[] = {
        {step, 410, 414, 0, 25, 300},     // positive slope: rising through 0.5 V
        {step, 411, 414, -25, 25, 1000},  // negative slope: armed at +1, fires on the next -1
        {leave, 410, 415, 0, 25, 100},    // bound, Pos/Exit: leaving 0 .. 0.5 V
        {{0.1, 0.3, 0.2, 0.4}, 410, 414, 5, 10, -1}};  // never below the lower level: never
    // clang-format on
    for (const auto& c : cases) {
        SCOPED_TRACE(c.fires);
        Rig r;
        sim::set_input_samples(3, c.v);
        r.level_trigger(3, c.slope, c.mode, c.lower, c.upper);
        r.start(340, 440);
        if (c.fires >= 0) {
            r.expect_block_after(c.fires + 1024);
        } else {
            sim::advance_clock(20.0);
            EXPECT_EQ(r.available(), 0);
        }
    }
    // On a looped-back sine the block starts where the signal rises through 0.5 V.
    Rig r;
    r.source(170, 1.0, 1000.0);
    r.level_trigger(5, 410, 414, 0, 25);
    r.start(340, 440);
    sim::advance_clock(0.1);
    ASSERT_EQ(r.available(), 1);
    std::vector<double> v = r.read(5);
    EXPECT_GE(v[0], 0.495);
    EXPECT_LT(v[0], 0.5 + 2 * pi * 1000 / fs + 0.005);
    EXPECT_GT(v[1], v[0]);
}

TEST(SimMeasure, SourceTriggerFiresAtThePeriodStart) {
    Rig r;
    r.source(170, 1.0, 1000.0);
    ASSERT_EQ(ost7720_setTriggerChannel(r.s, 4098, 420), 0);
    const double t0 = sim::clock_seconds();
    r.start(340, 440);
    // The sine's periods start at whole milliseconds of the clock.
    sim::advance_clock(std::ceil(t0 * 1000.0) / 1000.0 - t0 + 1022.0 / fs);
    EXPECT_EQ(r.available(), 0);
    sim::advance_clock(3.0 / fs);
    EXPECT_EQ(r.available(), 1);
    std::vector<double> v = r.read(1);
    EXPECT_NEAR(v[0], 0.0, 2 * pi * 1000 / fs + 0.005);
    EXPECT_GT(v[2], v[0]);
}

TEST(SimMeasure, SpectrumOfASineIsTheHannMainLobeInItsBin) {
    Rig r;
    r.source(170, 1.0, 1000.0);  // bin 20 of 50 Hz bins
    ASSERT_EQ(ost7720_setEnable(r.s, r.inputs, 271, 280), 0);
    r.start(341);
    sim::advance_clock(1024 / fs);
    std::vector<double> spectrum = r.read(2, 346, 512);
    EXPECT_EQ(std::max_element(spectrum.begin(), spectrum.end()) - spectrum.begin(), 20);
    EXPECT_NEAR(spectrum[20], 1.0, 0.01);
    EXPECT_NEAR(spectrum[19], 0.5, 0.01);  // the Hann main lobe: half the height one bin away
    EXPECT_NEAR(spectrum[21], 0.5, 0.01);
    for (size_t k : {0, 5, 17, 23, 100, 511})
        EXPECT_LT(spectrum[k], 0.01) << k;
}

TEST(SimMeasure, LoopedBackSourcesAreClippedAcCoupledBurstAndRamped) {
    Rig r;
    r.source(170, 5.0, 1000.0);
    ASSERT_EQ(ost7720_setRange(r.s, 1, 1.0), 0);
    r.start(341);
    sim::advance_clock(1024 / fs);
    std::vector<double> v = r.read(1), wide = r.read(2);  // ranges 1 V and 2 V
    EXPECT_EQ(*std::max_element(v.begin(), v.end()), 1.0);
    EXPECT_EQ(*std::min_element(v.begin(), v.end()), -1.0);
    EXPECT_GT(std::count(v.begin(), v.end(), 1.0), 300);
    EXPECT_EQ(*std::max_element(wide.begin(), wide.end()), 2.0);

    Rig d;  // a sine at 0 Hz is a constant: range * sin(phase) = 0.8 V, and AC coupling takes it off
    d.source(170, 1.6, 0.0, 30.0);
    ASSERT_EQ(ost7720_setCoupling(d.s, 2, 100), 0);
    d.start(341);
    sim::advance_clock(1024 / fs);
    EXPECT_NEAR(d.read_mean(1), 0.8, 0.001);
    EXPECT_NEAR(d.read_mean(2), 0.0, 0.001);

    Rig b;  // a burst of a constant 1 V, on a quarter of each 1024-sample period
    b.source(171, 1.0, 0.0, 90.0);
    ASSERT_EQ(ost7720_setDutyCycle(b.s, 4098, 0.25), 0);
    ASSERT_EQ(ost7720_setBlocksize(b.s, b.inputs, 4096), 0);
    b.start(341);
    sim::advance_clock(4096 / fs);
    v = b.read(1, 345, 4096);
    EXPECT_NEAR(std::count_if(v.begin(), v.end(), [](double x) { return x > 0.5; }), 1024, 4);
    ASSERT_EQ(ost7720_setSourceOutput(b.s, 4098, 701), 0);  // Grounded: nothing
    sim::advance_clock(4096 / fs);
    v = b.read(1, 345, 4096);
    EXPECT_LT(*std::max_element(v.begin(), v.end()), 0.01);

    Rig m;  // the same constant ramped up over 2 s from its activation: 0.5 V after 1 s
    ASSERT_EQ(ost7720_setRampRate(m.s, 4098, 2.0), 0);
    m.source(170, 1.0, 0.0, 90.0);
    m.start(341);
    sim::advance_clock(1.0);
    for (int32_t a = m.available(1); a > 1; --a)
        m.read(1);
    EXPECT_NEAR(m.read_mean(1), 0.495, 0.01);  // the block over 0.98 .. 1.0 s
}

TEST(SimMeasure, ArbitraryTableIsDownloadedAndPlayedCyclically) {
    Rig r;
    std::vector<int32_t> table(1024);
    for (size_t k = 0; k < 1024; ++k)
        table[k] = static_cast<int32_t>(std::lround(static_cast<double>(k) * 2096679.6875));
    ASSERT_EQ(ost7720_setSrcBufferInit(r.s, 4098, 1), 0);
    int32_t ready = -1;
    for (int32_t expected : {0, 0, 1}) {  // ready at the third poll
        ASSERT_EQ(ost7720_checkSrcArbRdy(r.s, 4098, 4, &ready), 0);
        EXPECT_EQ(ready, expected);
    }
    ASSERT_EQ(ost7720_writeSrcBufferData(r.s, 4098, table.data(), 1024, 4), 0);
    sim::SourceView view;
    ASSERT_TRUE(sim::read_source(r.s, 4098, view));
    EXPECT_EQ(view.table, table);
    r.source(176, 1.0, 1000.0);
    r.start(341);
    sim::advance_clock(2 * 1024 / fs);
    std::vector<double> v = r.read(1), next = r.read(1);
    // One table per block: a rising ramp 0 .. 1 V that wraps round once, at the same place in each.
    size_t wrap = 0;
    for (size_t i = 1; i < v.size(); ++i) {
        if (v[i] < v[i - 1] - 0.5)
            wrap = i;
    }
    for (size_t i = 0; i < v.size(); ++i)
        EXPECT_NEAR(v[i], (i + 1024 - wrap) % 1024 / 1024.0 * 2147000000.0 / 2147483648.0, 0.005) << i;
    EXPECT_NEAR(next[wrap], 0.0, 0.005);

    sim::set_arb_ready_polls(1);
    ASSERT_EQ(ost7720_setSrcBufferInit(r.s, 4098, 1), 0);
    EXPECT_EQ(ost7720_writeSrcBufferData(r.s, 4098, table.data(), 1024, 4), sim::err_source_not_ready);
    ASSERT_EQ(ost7720_checkSrcArbRdy(r.s, 4098, 4, &ready), 0);
    EXPECT_EQ(ready, 1);
    EXPECT_EQ(ost7720_writeSrcBufferData(r.s, 4098, table.data(), 1025, 4), sim::err_invalid_count);
}

TEST(SimMeasure, MultiMainframeArmingRunsOnlyInItsOrder) {
    Rig r;
    ASSERT_EQ(ost7720_setArmMode(r.s, r.all, 430), 0);
    EXPECT_EQ(ost7720_armMeasureMasterSetup(r.s, 16), sim::err_measurement_state);
    EXPECT_EQ(details(r.s), "ost7720_armMeasureMasterSetup: no measurement: call ost7720_initMeasure first");
    r.start(340);
    EXPECT_EQ(ost7720_armMeasure(r.s, r.all, 0), sim::err_measurement_state);
    EXPECT_EQ(details(r.s), "ost7720_armMeasure: must follow armMeasureMasterSetup, not initMeasure");
    ASSERT_EQ(ost7720_armMeasureMasterSetup(r.s, 16), 0);
    EXPECT_EQ(ost7720_armMeasureSlaveFinish(r.s, 1), sim::err_measurement_state);
    ASSERT_EQ(ost7720_armMeasure(r.s, r.all, 0), 0);
    EXPECT_EQ(ost7720_armMeasureMasterFinish(r.s, 16), sim::err_measurement_state);
    ASSERT_EQ(ost7720_armMeasureSlaveFinish(r.s, 1), 0);
    EXPECT_EQ(ost7720_armMeasureMasterSetup(r.s, 0), sim::err_invalid_channel);
    sim::advance_clock(1.0);
    EXPECT_EQ(r.available(), 0);  // nothing runs before the master finishes
    ASSERT_EQ(ost7720_armMeasureMasterFinish(r.s, 16), 0);
    r.expect_block_after(1024);
    EXPECT_EQ(ost7720_armMeasureMasterFinish(r.s, 16), sim::err_measurement_state);

    Rig single;
    single.start(340);
    EXPECT_EQ(ost7720_armMeasureMasterSetup(single.s, 16), sim::err_measurement_state);
    EXPECT_EQ(details(single.s),
              "ost7720_armMeasureMasterSetup: the measurement was not started with arm mode 430");
}

TEST(SimMeasure, ReadsAreBoundedResetDiscardsAndOnlyTheEnabledKindCanBeRead) {
    Rig r;
    r.start(341);
    sim::advance_clock(3 * 1024 / fs);
    ASSERT_EQ(r.available(), 3);
    EXPECT_EQ(r.read_status(1, 346, 512), sim::err_data_not_enabled);
    EXPECT_EQ(details(r.s), "ost7720_readFloat64Data: frequency data of channel 1 is not enabled");
    EXPECT_EQ(r.read_status(1, 345, 1025), sim::err_invalid_count);
    EXPECT_EQ(r.read_status(1, 347), sim::err_invalid_code);
    EXPECT_EQ(r.read_status(r.inputs), sim::err_invalid_channel);
    EXPECT_EQ(r.read_status(4097), sim::err_wrong_channel_type);
    EXPECT_EQ(r.read(1, 345, 100).size(), 100u);  // fewer values may be read

    ASSERT_EQ(ost7720_resetMeasure(r.s, r.all), 0);
    EXPECT_EQ(r.available(), 0);
    EXPECT_EQ(r.read_status(1), sim::err_no_data);
    sim::advance_clock(1.0);
    EXPECT_EQ(r.available(), 0);

    ASSERT_EQ(ost7720_setActive(r.s, 2, 421), 0);  // inactive inputs take no part
    r.start(341);
    sim::advance_clock(1024 / fs);
    EXPECT_EQ(r.available(), 1);
    EXPECT_EQ(r.read_status(2), sim::err_no_data);
    EXPECT_EQ(details(r.s), "ost7720_readFloat64Data: channel 2 is not measuring");
}

TEST(SimMeasure, ExactSamplesAndAReaderThatFallsBehind) {
    Rig r;
    sim::set_input_samples(4, {1.5, -2, 0, 1e-20});
    r.start(341);
    sim::advance_clock(1024 / fs);
    std::vector<double> v = r.read(4);
    EXPECT_EQ(std::vector<double>(v.begin(), v.begin() + 5), (std::vector<double>{1.5, -2, 0, 1e-20, 1.5}));
    // The module keeps 2 x 65536 / 1024 = 128 blocks; a reader 200 blocks behind is warned once.
    sim::advance_clock(200 * 1024 / fs);
    int32_t a = 0;
    EXPECT_EQ(ost7720_blockAvailable(r.s, 1, &a), 1);
    EXPECT_EQ(a, 128);
    EXPECT_EQ(ost7720_blockAvailable(r.s, 1, &a), 0);
}

TEST(SimMeasure, InputsOfOneBlockSeeTheSameSourcesAndEverySettingChangeAtOnce) {
    Rig r;
    r.source(170, 1.0, 1000.0);
    r.start(341);
    sim::advance_clock(1024 / fs);
    const std::vector<double> a = r.read(1), b = r.read(2);
    // The same sine in both, each with its own 1 mV of noise: the difference has sqrt(2) mV rms.
    double square = 0;
    for (size_t i = 0; i < a.size(); ++i)
        square += (a[i] - b[i]) * (a[i] - b[i]);
    EXPECT_NEAR(std::sqrt(square / 1024.0), std::sqrt(2.0) * 1e-3, 0.15e-3);
    EXPECT_NEAR(*std::max_element(a.begin(), a.end()), 1.0, 0.005);

    // Settings changed between the reads of one block count from the next read.
    ASSERT_EQ(ost7720_setRange(r.s, 4098, 0.5), 0);
    const std::vector<double> smaller = r.read(3);
    EXPECT_NEAR(*std::max_element(smaller.begin(), smaller.end()), 0.5, 0.005);
    ASSERT_EQ(ost7720_setSinePhase(r.s, 4098, 90.0), 0);
    // A quarter period on: the two reads are sine and cosine of the same times, whatever time
    // the block started at.
    const std::vector<double> shifted = r.read(4);
    double worst = 0;
    for (size_t i = 0; i < shifted.size(); ++i)
        worst = std::max(worst, std::abs(smaller[i] * smaller[i] + shifted[i] * shifted[i] - 0.25));
    EXPECT_LT(worst, 0.01);  // 1 mV of noise on each moves the sum by a few mV at most
    ASSERT_EQ(ost7720_setSourceOutput(r.s, 4098, 701), 0);  // Grounded
    const std::vector<double> off = r.read(5);
    EXPECT_LT(*std::max_element(off.begin(), off.end()), 0.01);

    // An arbitrary table written again with the same size, in place, between two reads.
    ASSERT_EQ(ost7720_setSourceOutput(r.s, 4098, 700), 0);
    ASSERT_EQ(ost7720_setSourceMode(r.s, 4098, 176), 0);
    sim::set_arb_ready_polls(0);
    for (int32_t level : {1 << 30, -(1 << 29)}) {
        const std::vector<int32_t> table(1024, level);  // half and minus a quarter of full scale
        ASSERT_EQ(ost7720_setSrcBufferInit(r.s, 4098, 1), 0);
        ASSERT_EQ(ost7720_writeSrcBufferData(r.s, 4098, table.data(), 1024, 4), 0);
        EXPECT_NEAR(r.read_mean(level > 0 ? 6 : 7), level / 2147483648.0 * 0.5, 0.001) << level;
    }
    // AC and DC inputs taking turns on one block.
    ASSERT_EQ(ost7720_setCoupling(r.s, 9, 100), 0);
    EXPECT_NEAR(r.read_mean(8), -0.125, 0.001);
    EXPECT_NEAR(r.read_mean(9), 0.0, 0.001);
    EXPECT_NEAR(r.read_mean(10), -0.125, 0.001);
    // A source switched off and on again now was not on during the block.
    ASSERT_EQ(ost7720_setActive(r.s, 4098, 421), 0);
    ASSERT_EQ(ost7720_setActive(r.s, 4098, 420), 0);
    EXPECT_NEAR(r.read_mean(11), 0.0, 0.001);
}
