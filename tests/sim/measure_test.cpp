// The simulated measurement: timing, data modes, triggers, data, sources looped back, arming.
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cmath>
#include <numeric>
#include <string>
#include <thread>
#include <vector>

#include "errors.h"
#include "sim_test_util.h"

using simtest::details;

namespace {

constexpr double fs = 51200.0;  // 2.56 x the power-on span of 20000 Hz
constexpr double pi = 3.14159265358979323846;

// The default system opened as the panel does, on the virtual clock, with every source off.
struct Rig {
    int32_t s = 0;
    int32_t inputs = 0;
    int32_t all = 0;

    Rig() {
        sim::reset();
        sim::use_virtual_clock();
        s = simtest::open_both();
        std::vector<int32_t> ids;
        for (int32_t i = 1; i <= 16; ++i)
            ids.push_back(i);
        ost7720_createChannelGroup(s, 16, ids.data(), &inputs);
        for (int32_t id : {4097, 4098, 8193, 8194})
            ids.push_back(id);
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

    std::vector<double> read(int32_t channel, int32_t type = 345, int32_t count = 1024) {
        std::vector<double> v(static_cast<size_t>(count) + 1, -99.0);
        int32_t actual = 0;
        EXPECT_EQ(ost7720_readFloat64Data(s, channel, type, v.data(), count, &actual, 1), 0) << details(s);
        EXPECT_EQ(actual, count);
        EXPECT_EQ(v.back(), -99.0);  // nothing written past the count
        v.pop_back();
        return v;
    }

    // A source on its own: active, Normal output, the mode and settings given.
    void source(int32_t id, int32_t mode, double range, double freq, double phase = 0.0) {
        ASSERT_EQ(ost7720_setSourceMode(s, id, mode), 0);
        ASSERT_EQ(ost7720_setRange(s, id, range), 0);
        ASSERT_EQ(ost7720_setSineFreq(s, id, freq), 0);
        ASSERT_EQ(ost7720_setSinePhase(s, id, phase), 0);
        ASSERT_EQ(ost7720_setActive(s, id, 420), 0);
    }
};

double mean(const std::vector<double>& v) {
    return std::accumulate(v.begin(), v.end(), 0.0) / v.size();
}

}  // namespace

TEST(SimMeasure, BlocksCompleteBlockSizeOverSampleRateAfterTheStart) {
    struct Case {
        double span;
        int32_t blocksize;
    };
    for (Case c : {Case{20000, 1024}, Case{20000, 256}, Case{2500, 1024}, Case{2500, 4096}}) {
        Rig r;
        ASSERT_EQ(ost7720_setSpan(r.s, r.inputs, c.span), 0);
        ASSERT_EQ(ost7720_setBlocksize(r.s, r.inputs, c.blocksize), 0);
        r.start(341);
        double block = c.blocksize / (2.56 * c.span);  // 20 ms, 5 ms, 160 ms, 640 ms
        sim::advance_clock(block * 0.999);
        EXPECT_EQ(r.available(), 0) << c.span << " " << c.blocksize;
        sim::advance_clock(block * 0.001);
        EXPECT_EQ(r.available(), 1) << c.span << " " << c.blocksize;
        sim::advance_clock(block * 0.998);
        EXPECT_EQ(r.available(), 1);
        sim::advance_clock(block * 0.002);
        EXPECT_EQ(r.available(), 2);
        EXPECT_EQ(r.read(1, 345, c.blocksize).size(), static_cast<size_t>(c.blocksize));
        EXPECT_EQ(r.available(1), 1);
        EXPECT_EQ(r.available(2), 2);
        EXPECT_EQ(r.available(), 1);  // the fewest of the group
    }
}

TEST(SimMeasure, ContinuousBlocksJoinWithoutAGapAndBlockModeWaitsForTheRead) {
    Rig r;
    r.source(4098, 170, 1.0, 1000.0);
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

    // Block mode: one block, then nothing until it is read; the next follows the read.
    Rig m;
    m.start(340);
    sim::advance_clock(5 * 1024 / fs);
    EXPECT_EQ(m.available(), 1);
    for (int32_t ch = 1; ch <= 16; ++ch)
        m.read(ch);
    EXPECT_EQ(m.available(), 0);
    sim::advance_clock(1023 / fs);
    EXPECT_EQ(m.available(), 0);
    sim::advance_clock(1.5 / fs);
    EXPECT_EQ(m.available(), 1);
}

TEST(SimMeasure, RunsOnRealTimeByDefault) {
    sim::reset();
    int32_t s = simtest::open_both();
    ASSERT_EQ(ost7720_initMeasure(s, 1), 0);
    int32_t a = 0;
    auto until = std::chrono::steady_clock::now() + std::chrono::seconds(2);
    while (a == 0 && std::chrono::steady_clock::now() < until) {
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
    std::vector<double> v(1024);
    int32_t actual = 0;
    EXPECT_EQ(ost7720_readFloat64Data(r.s, 1, 345, v.data(), 1024, &actual, 1), sim::err_no_data);
    EXPECT_EQ(details(r.s), "ost7720_readFloat64Data: no block of channel 1 is available");

    ASSERT_EQ(ost7720_triggerMeasure(r.s, r.all, 0), 0);
    sim::advance_clock(1023.5 / fs);
    EXPECT_EQ(r.available(), 0);
    sim::advance_clock(1.0 / fs);
    EXPECT_EQ(r.available(), 1);
    r.read(1);
    // Block mode needs a trigger for every block.
    sim::advance_clock(1.0);
    EXPECT_EQ(r.available(1), 0);

    Rig idle;
    EXPECT_EQ(ost7720_triggerMeasure(idle.s, idle.all, 0), sim::err_measurement_state);
}

TEST(SimMeasure, InputLevelTriggerFiresOnItsSlope) {
    // Exact samples: -1 for 300 samples, then +1; lower level 0 %, upper 25 % of 2 V.
    std::vector<double> step(1000, -1.0);
    std::fill(step.begin() + 300, step.end(), 1.0);
    {
        Rig r;
        sim::set_input_samples(3, step);
        ASSERT_EQ(ost7720_setTriggerChannel(r.s, 3, 420), 0);
        ASSERT_EQ(ost7720_setTriggerLevel(r.s, 3, 416, 0.0), 0);
        ASSERT_EQ(ost7720_setTriggerLevel(r.s, 3, 417, 25.0), 0);
        r.start(340, 440);
        sim::advance_clock((300 + 1024 - 0.5) / fs);
        EXPECT_EQ(r.available(), 0);
        sim::advance_clock(1.0 / fs);
        EXPECT_EQ(r.available(), 1);
        EXPECT_EQ(r.read(3)[0], -1.0);  // exact samples are delivered from their start
    }
    {
        // Negative slope never fires on a signal that only rises once... until it falls.
        Rig r;
        sim::set_input_samples(3, step);
        ASSERT_EQ(ost7720_setTriggerChannel(r.s, 3, 420), 0);
        ASSERT_EQ(ost7720_setTriggerSlope(r.s, 3, 411), 0);
        ASSERT_EQ(ost7720_setTriggerLevel(r.s, 3, 416, -25.0), 0);
        ASSERT_EQ(ost7720_setTriggerLevel(r.s, 3, 417, 25.0), 0);
        r.start(340, 440);
        // Arms on +1 (sample 300), fires on the -1 at sample 1000.
        sim::advance_clock((1000 + 1024 - 0.5) / fs);
        EXPECT_EQ(r.available(), 0);
        sim::advance_clock(1.0 / fs);
        EXPECT_EQ(r.available(), 1);
    }
    {
        // Bound mode, Pos/Exit: inside the band 0 .. 0.5 V arms, leaving it fires (sample 100).
        Rig r;
        std::vector<double> leave(400, 0.25);
        std::fill(leave.begin() + 100, leave.end(), 1.0);
        sim::set_input_samples(3, leave);
        ASSERT_EQ(ost7720_setTriggerChannel(r.s, 3, 420), 0);
        ASSERT_EQ(ost7720_setTriggerMode(r.s, 3, 415), 0);
        ASSERT_EQ(ost7720_setTriggerLevel(r.s, 3, 416, 0.0), 0);
        ASSERT_EQ(ost7720_setTriggerLevel(r.s, 3, 417, 25.0), 0);
        r.start(340, 440);
        sim::advance_clock((100 + 1024 - 0.5) / fs);
        EXPECT_EQ(r.available(), 0);
        sim::advance_clock(1.0 / fs);
        EXPECT_EQ(r.available(), 1);
    }
    {
        // A signal that never leaves the hysteresis band never triggers.
        Rig r;
        sim::set_input_samples(3, {0.1, 0.3, 0.2, 0.4});
        ASSERT_EQ(ost7720_setTriggerChannel(r.s, 3, 420), 0);
        r.start(340, 440);
        sim::advance_clock(20.0);
        EXPECT_EQ(r.available(), 0);
    }
    {
        // On a looped-back sine: the block starts where the signal rises through 0.5 V.
        Rig r;
        r.source(4098, 170, 1.0, 1000.0, 0.0);
        ASSERT_EQ(ost7720_setTriggerChannel(r.s, 5, 420), 0);
        ASSERT_EQ(ost7720_setTriggerLevel(r.s, 5, 416, 0.0), 0);
        ASSERT_EQ(ost7720_setTriggerLevel(r.s, 5, 417, 25.0), 0);
        r.start(340, 440);
        sim::advance_clock(0.1);
        ASSERT_EQ(r.available(), 1);
        std::vector<double> v = r.read(5);
        EXPECT_GE(v[0], 0.495);
        EXPECT_LT(v[0], 0.5 + 2 * pi * 1000 / fs + 0.005);
        EXPECT_GT(v[1], v[0]);
    }
}

TEST(SimMeasure, SourceTriggerFiresAtThePeriodStart) {
    Rig r;
    r.source(4098, 170, 1.0, 1000.0, 0.0);
    ASSERT_EQ(ost7720_setTriggerChannel(r.s, 4098, 420), 0);
    double t0 = sim::clock_seconds();
    r.start(340, 440);
    // The sine's periods start at whole milliseconds of the clock.
    double period_start = std::ceil(t0 * 1000.0) / 1000.0;
    sim::advance_clock(period_start - t0 + 1022.0 / fs);
    EXPECT_EQ(r.available(), 0);
    sim::advance_clock(3.0 / fs);
    EXPECT_EQ(r.available(), 1);
    std::vector<double> v = r.read(1);
    EXPECT_NEAR(v[0], 0.0, 2 * pi * 1000 / fs + 0.005);
    EXPECT_GT(v[2], v[0]);
}

TEST(SimMeasure, SpectrumOfASineAndOfNoise) {
    Rig r;
    r.source(4098, 170, 1.0, 1000.0);  // bin 20 of 50 Hz bins
    ASSERT_EQ(ost7720_setEnable(r.s, r.inputs, 271, 280), 0);
    r.start(341);
    sim::advance_clock(2 * 1024 / fs);
    std::vector<double> spectrum = r.read(2, 346, 512);
    EXPECT_NEAR(spectrum[20], 1.0, 0.01);
    EXPECT_EQ(std::max_element(spectrum.begin(), spectrum.end()) - spectrum.begin(), 20);
    for (int k : {0, 5, 17, 23, 100, 511})
        EXPECT_LT(spectrum[static_cast<size_t>(k)], 0.01) << k;

    ASSERT_EQ(ost7720_setSourceMode(r.s, 4098, 172), 0);
    double low = 0, high = 0;
    for (int block = 0; block < 8; ++block) {
        sim::advance_clock(1024 / fs);
        std::vector<double> noise = r.read(2, 346, 512);
        low += std::accumulate(noise.begin() + 10, noise.begin() + 200, 0.0) / 190;
        high += std::accumulate(noise.begin() + 300, noise.begin() + 490, 0.0) / 190;
    }
    EXPECT_GT(low, 0.0);
    EXPECT_NEAR(high / low, 1.0, 0.15);
}

TEST(SimMeasure, OverloadClipsAtTheRangeAndAcCouplingTakesOffDc) {
    Rig r;
    r.source(4098, 170, 5.0, 1000.0);
    ASSERT_EQ(ost7720_setRange(r.s, 1, 1.0), 0);
    r.start(341);
    sim::advance_clock(1024 / fs);
    std::vector<double> v = r.read(1);
    EXPECT_EQ(*std::max_element(v.begin(), v.end()), 1.0);
    EXPECT_EQ(*std::min_element(v.begin(), v.end()), -1.0);
    EXPECT_GT(std::count(v.begin(), v.end(), 1.0), 300);
    std::vector<double> wide = r.read(2);  // range 2 V
    EXPECT_EQ(*std::max_element(wide.begin(), wide.end()), 2.0);

    // Frequency 0 makes a sine a constant: range * sin(phase) = 0.8 V.
    Rig d;
    d.source(4098, 170, 1.6, 0.0, 30.0);
    ASSERT_EQ(ost7720_setCoupling(d.s, 2, 100), 0);
    d.start(341);
    sim::advance_clock(1024 / fs);
    EXPECT_NEAR(mean(d.read(1)), 0.8, 0.001);
    EXPECT_NEAR(mean(d.read(2)), 0.0, 0.001);
}

TEST(SimMeasure, ArbitraryTableIsDownloadedAndPlayedCyclically) {
    Rig r;
    std::vector<int32_t> table(1024);
    for (int k = 0; k < 1024; ++k)
        table[static_cast<size_t>(k)] = static_cast<int32_t>(std::lround(k * 2096679.6875));
    ASSERT_EQ(ost7720_setSrcBufferInit(r.s, 4098, 1), 0);
    int32_t ready = 0, polls = 0;
    while (!ready && polls < 10) {
        ASSERT_EQ(ost7720_checkSrcArbRdy(r.s, 4098, 4, &ready), 0);
        ++polls;
    }
    EXPECT_EQ(polls, 3);
    ASSERT_EQ(ost7720_writeSrcBufferData(r.s, 4098, table.data(), 1024, 4), 0);
    sim::SourceView view;
    ASSERT_TRUE(sim::read_source(r.s, 4098, view));
    EXPECT_EQ(view.table, table);
    EXPECT_FALSE(sim::read_source(r.s, 1, view));

    r.source(4098, 176, 1.0, 1000.0);
    r.start(341);
    sim::advance_clock(2 * 1024 / fs);
    std::vector<double> v = r.read(1);
    // One table per block: a rising ramp 0 .. 1 V that wraps round once.
    size_t wrap = 0;
    for (size_t i = 1; i < v.size(); ++i) {
        if (v[i] < v[i - 1] - 0.5)
            wrap = i;
    }
    for (size_t i = 0; i < v.size(); ++i) {
        size_t k = (i + 1024 - wrap) % 1024;
        EXPECT_NEAR(v[i], k / 1024.0 * 2147000000.0 / 2147483648.0, 0.005) << i;
    }
    std::vector<double> next = r.read(1);
    EXPECT_NEAR(next[wrap], 0.0, 0.005);

    sim::set_arb_ready_polls(1);
    ASSERT_EQ(ost7720_setSrcBufferInit(r.s, 4098, 1), 0);
    EXPECT_EQ(ost7720_writeSrcBufferData(r.s, 4098, table.data(), 1024, 4), sim::err_source_not_ready);
    ASSERT_EQ(ost7720_checkSrcArbRdy(r.s, 4098, 4, &ready), 0);
    EXPECT_EQ(ready, 1);
    EXPECT_EQ(ost7720_writeSrcBufferData(r.s, 4098, table.data(), 1025, 4), sim::err_invalid_count);
}

TEST(SimMeasure, BurstIsOnForTheDutyCycleOfEachPeriod) {
    Rig r;
    r.source(4098, 171, 1.0, 0.0, 90.0);  // a constant 1 V while on
    ASSERT_EQ(ost7720_setDutyCycle(r.s, 4098, 0.25), 0);
    ASSERT_EQ(ost7720_setBlocksize(r.s, r.inputs, 4096), 0);
    r.start(341);
    sim::advance_clock(4096 / fs);
    std::vector<double> v = r.read(1, 345, 4096);
    long on = std::count_if(v.begin(), v.end(), [](double x) { return x > 0.5; });
    EXPECT_NEAR(on, 1024, 4);  // a quarter of each 1024-sample period
    // Outputs Grounded and Open put out nothing.
    ASSERT_EQ(ost7720_setSourceOutput(r.s, 4098, 701), 0);
    sim::advance_clock(4096 / fs);
    std::vector<double> grounded = r.read(1, 345, 4096);
    EXPECT_LT(*std::max_element(grounded.begin(), grounded.end()), 0.01);
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
    sim::advance_clock(1023.5 / fs);
    EXPECT_EQ(r.available(), 0);
    sim::advance_clock(1.0 / fs);
    EXPECT_EQ(r.available(), 1);
    EXPECT_EQ(ost7720_armMeasureMasterFinish(r.s, 16), sim::err_measurement_state);

    Rig single;
    single.start(340);
    EXPECT_EQ(ost7720_armMeasureMasterSetup(single.s, 16), sim::err_measurement_state);
    EXPECT_EQ(details(single.s),
              "ost7720_armMeasureMasterSetup: the measurement was not started with arm mode 430");
}

TEST(SimMeasure, ResetDiscardsAndOnlyTheEnabledKindCanBeRead) {
    Rig r;
    r.start(341);
    sim::advance_clock(3 * 1024 / fs);
    ASSERT_EQ(r.available(), 3);
    std::vector<double> v(1025);
    int32_t actual = 0;
    EXPECT_EQ(ost7720_readFloat64Data(r.s, 1, 346, v.data(), 512, &actual, 1), sim::err_data_not_enabled);
    EXPECT_EQ(details(r.s), "ost7720_readFloat64Data: frequency data of channel 1 is not enabled");
    EXPECT_EQ(ost7720_readFloat64Data(r.s, 1, 345, v.data(), 1025, &actual, 1), sim::err_invalid_count);
    EXPECT_EQ(ost7720_readFloat64Data(r.s, 1, 347, v.data(), 1024, &actual, 1), sim::err_invalid_code);
    EXPECT_EQ(ost7720_readFloat64Data(r.s, r.inputs, 345, v.data(), 1024, &actual, 1),
              sim::err_invalid_channel);
    EXPECT_EQ(ost7720_readFloat64Data(r.s, 4097, 345, v.data(), 1024, &actual, 1),
              sim::err_wrong_channel_type);
    EXPECT_EQ(r.read(1, 345, 100).size(), 100u);  // fewer values may be read

    ASSERT_EQ(ost7720_resetMeasure(r.s, r.all), 0);
    EXPECT_EQ(r.available(), 0);
    EXPECT_EQ(ost7720_readFloat64Data(r.s, 1, 345, v.data(), 1024, &actual, 1), sim::err_no_data);
    sim::advance_clock(1.0);
    EXPECT_EQ(r.available(), 0);

    // Inactive inputs take no part.
    ASSERT_EQ(ost7720_setActive(r.s, 2, 421), 0);
    r.start(341);
    sim::advance_clock(1024 / fs);
    EXPECT_EQ(r.available(), 1);
    EXPECT_EQ(ost7720_readFloat64Data(r.s, 2, 345, v.data(), 1024, &actual, 1), sim::err_no_data);
    EXPECT_EQ(details(r.s), "ost7720_readFloat64Data: channel 2 is not measuring");
}

TEST(SimMeasure, ExactSamplesAndAReaderThatFallsBehind) {
    Rig r;
    sim::set_input_samples(4, {1.5, -2, 0, 1e-20});
    r.start(341);
    sim::advance_clock(1024 / fs);
    std::vector<double> v = r.read(4);
    EXPECT_EQ(v[0], 1.5);
    EXPECT_EQ(v[1], -2.0);
    EXPECT_EQ(v[2], 0.0);
    EXPECT_EQ(v[3], 1e-20);
    EXPECT_EQ(v[4], 1.5);

    // The module keeps 2 x 65536 / 1024 = 128 blocks; a reader 200 blocks behind is warned.
    sim::advance_clock(200 * 1024 / fs);
    int32_t a = 0;
    EXPECT_EQ(ost7720_blockAvailable(r.s, 1, &a), 1);
    EXPECT_EQ(a, 128);
    EXPECT_EQ(ost7720_blockAvailable(r.s, 1, &a), 0);
}

TEST(SimMeasure, RampRaisesTheAmplitudeAfterActivation) {
    Rig r;
    ASSERT_EQ(ost7720_setRampRate(r.s, 4098, 1.0), 0);
    r.source(4098, 170, 1.0, 0.0, 90.0);  // constant 1 V at full amplitude
    r.start(341);
    sim::advance_clock(0.5);
    std::vector<double> early = r.read(1);
    EXPECT_LT(mean(early), 0.02);
    int32_t a = 0;
    ost7720_blockAvailable(r.s, 1, &a);
    while (a-- > 1)
        r.read(1);
    std::vector<double> half = r.read(1);
    EXPECT_NEAR(mean(half), 0.49, 0.02);
    sim::advance_clock(1.0);
    ost7720_blockAvailable(r.s, 1, &a);
    while (a-- > 1)
        r.read(1);
    EXPECT_NEAR(mean(r.read(1)), 1.0, 0.002);
}
