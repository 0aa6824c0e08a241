// The simulator's waveform maths, checked against values worked out by hand.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <numbers>
#include <numeric>
#include <vector>

#include "signals.h"

namespace sg = sim::signals;
namespace code = sim::code;

namespace {

constexpr double fs = 51200.0;  // the sample rate at span 20000 Hz
constexpr double dt = 1.0 / fs;
constexpr double inf = std::numeric_limits<double>::infinity();

std::vector<double> render(const sg::SourceParams& p, double t0, size_t n, bool ac = false) {
    std::vector<double> v(n);
    sg::render_source(p, t0, dt, v, ac);
    return v;
}

std::vector<double> spectrum(const std::vector<double>& block) {
    std::vector<double> out(block.size() / 2);
    EXPECT_TRUE(sg::magnitude_spectrum(block, out));
    return out;
}

double mean(const std::vector<double>& v, size_t from, size_t to) {
    return std::accumulate(v.begin() + from, v.begin() + to, 0.0) / static_cast<double>(to - from);
}

double rms(const std::vector<double>& v) {
    double s = 0.0;
    for (double x : v) {
        s += x * x;
    }
    return std::sqrt(s / static_cast<double>(v.size()));
}

// The test waveform the panel downloads: a ramp whose first and second, and third and fourth
// quarters, have changed places.
std::vector<int32_t> swapped_ramp() {
    std::vector<int32_t> t(1024);
    for (int k = 0; k < 1024; ++k) {
        t[k] = static_cast<int32_t>(std::nearbyint(k / 1024.0 * 2147000000.0));
    }
    for (int i = 0; i < 256; ++i) {
        std::swap(t[i], t[256 + i]);
        std::swap(t[512 + i], t[768 + i]);
    }
    return t;
}

sg::SourceParams source(int32_t mode) {
    sg::SourceParams p;
    p.mode = mode;
    p.sample_rate = fs;
    return p;
}

}  // namespace

TEST(SimSignals, SineHasTheHandValuesAtKnownTimes) {
    sg::SourceParams p = source(code::mode_sine);
    p.range = 2.0;
    p.frequency = 1000.0;
    // Eight samples per period: 0, 45, 90, ... degrees.
    std::vector<double> v(8);
    sg::render_source(p, 0.0, 1.25e-4, v);
    const double r2 = std::sqrt(2.0);
    const double expected[8] = {0, r2, 2, r2, 0, -r2, -2, -r2};
    for (int i = 0; i < 8; ++i) {
        EXPECT_NEAR(v[i], expected[i], 1e-12) << i;
    }

    p.phase_deg = 30.0;
    sg::render_source(p, 0.0, 1.25e-4, std::span(v).first(1));
    EXPECT_NEAR(v[0], 1.0, 1e-12);

    // An hour into the run the sine is still on time: 3600 s is a whole number of periods.
    p.phase_deg = 90.0;
    sg::render_source(p, 3600.0, 2.5e-4, std::span(v).first(3));
    EXPECT_NEAR(v[0], 2.0, 1e-6);
    EXPECT_NEAR(v[1], 0.0, 1e-6);
    EXPECT_NEAR(v[2], -2.0, 1e-6);
}

TEST(SimSignals, ContiguousBlocksJoinWithoutAGap) {
    const std::vector<int32_t> table = swapped_ramp();
    for (int32_t mode : {code::mode_sine, code::mode_random, code::mode_zoom_random, code::mode_arbitrary,
                         code::mode_burst_sine}) {
        sg::SourceParams p = source(mode);
        p.frequency = 1234.5;
        p.phase_deg = 17.0;
        p.duty_cycle = 0.5;
        p.arb_table = table;
        const double t0 = 7.3;  // well after the start, not on a period boundary
        const std::vector<double> whole = render(p, t0, 3000);
        const std::vector<double> first = render(p, t0, 1024);
        const std::vector<double> second = render(p, t0 + 1024 * dt, 1976);
        for (size_t i = 0; i < 1024; ++i) {
            ASSERT_NEAR(first[i], whole[i], 1e-9) << mode << " at " << i;
        }
        for (size_t i = 0; i < 1976; ++i) {
            ASSERT_NEAR(second[i], whole[1024 + i], 1e-9) << mode << " at " << 1024 + i;
        }
    }

    // The sine across the seam moves by one sample's worth of phase, no more.
    sg::SourceParams p = source(code::mode_sine);
    p.frequency = 1000.0;
    const std::vector<double> a = render(p, 0.0, 1024);
    const std::vector<double> b = render(p, 1024 * dt, 1);
    // 1024 samples of 1/51.2 period each are 20 whole periods: the next block starts at phase 0.
    EXPECT_NEAR(b[0], 0.0, 1e-9);
    EXPECT_NEAR(a[1023], std::sin(-2 * std::numbers::pi / 51.2), 1e-9);
}

TEST(SimSignals, SpectrumOfASinePeaksAtItsBinWithItsAmplitude) {
    // n = 1024 at 51200 Hz: 50 Hz per bin, bin 37 is 1850 Hz.
    sg::SourceParams p = source(code::mode_sine);
    p.range = 1.5;
    p.frequency = 37 * 50.0;
    p.phase_deg = 40.0;
    std::vector<double> s = spectrum(render(p, 0.0, 1024));
    ASSERT_EQ(s.size(), 512u);
    EXPECT_EQ(std::max_element(s.begin(), s.end()) - s.begin(), 37);
    EXPECT_NEAR(s[37], 1.5, 0.03);
    EXPECT_NEAR(s[36], 0.75, 0.01);  // the Hann main lobe: half the height one bin away
    EXPECT_NEAR(s[38], 0.75, 0.01);
    EXPECT_LT(s[34], 1e-4);
    EXPECT_LT(s[200], 1e-4);

    // Half-way between bins 37 and 38 both read the Hann scalloping loss, 1.42 dB (0.849).
    p.frequency = 37.5 * 50.0;
    s = spectrum(render(p, 0.0, 1024));
    EXPECT_NEAR(s[37] / 1.5, 0.849, 0.01);
    EXPECT_NEAR(s[38] / 1.5, 0.849, 0.01);

    // A constant reads its own value in bin 0.
    std::vector<double> dc(4096, 0.7);
    s = spectrum(dc);
    EXPECT_NEAR(s[0], 0.7, 1e-5);
    EXPECT_NEAR(s[1], 0.7, 1e-5);  // the leakage of +0 and -0 Hz lands together
    EXPECT_LT(s[2], 1e-5);

    // Sizes the FFT cannot take are refused and leave the output alone.
    std::vector<double> odd(63, 1.0), out(31, -1.0), wrong(10, -1.0);
    EXPECT_FALSE(sg::magnitude_spectrum(odd, out));
    EXPECT_EQ(out[0], -1.0);
    EXPECT_FALSE(sg::magnitude_spectrum(dc, wrong));
    EXPECT_EQ(wrong[0], -1.0);
}

TEST(SimSignals, SpectrumOfNoiseIsFlatAndZoomNoiseSitsInItsBand) {
    sg::SourceParams p = source(code::mode_random);
    const std::vector<double> noise = render(p, 0.0, 8192);
    const std::vector<double> s = spectrum(noise);
    const double low = mean(s, 1, 2048), high = mean(s, 2048, 4096);
    EXPECT_NEAR(low / high, 1.0, 0.2);

    std::vector<double> input(8192, 0.0);
    sg::add_input_noise(5, 0, 1e-3, input);
    const std::vector<double> si = spectrum(input);
    EXPECT_NEAR(mean(si, 1, 2048) / mean(si, 2048, 4096), 1.0, 0.2);

    // Zoom random at 10 kHz: a band of about +-3.2 kHz (+-512 bins of 6.25 Hz) round bin 1600.
    p.mode = code::mode_zoom_random;
    p.frequency = 10000.0;
    const std::vector<double> z = spectrum(render(p, 0.0, 8192));
    const double in_band = mean(z, 1400, 1800);
    EXPECT_GT(in_band, 10.0 * mean(z, 1, 400));
    EXPECT_GT(in_band, 10.0 * mean(z, 3200, 4096));
}

TEST(SimSignals, ClipCutsAtTheRangeAndReportsOverload) {
    std::vector<double> v = {-3.0, -1.0, 0.5, 2.0, 5.0};
    EXPECT_TRUE(sg::clip(v, 2.0));
    EXPECT_EQ(v, (std::vector<double>{-2.0, -1.0, 0.5, 2.0, 2.0}));

    std::vector<double> inside = {1.0, -1.99, 2.0, -2.0};
    EXPECT_FALSE(sg::clip(inside, 2.0));
    EXPECT_EQ(inside, (std::vector<double>{1.0, -1.99, 2.0, -2.0}));

    std::vector<double> any = {0.25, -0.25};
    EXPECT_TRUE(sg::clip(any, -1.0));
    EXPECT_EQ(any, (std::vector<double>{0.0, 0.0}));
}

TEST(SimSignals, AcCouplingRemovesTheDcPart) {
    std::vector<double> v(1024);
    for (size_t i = 0; i < v.size(); ++i) {
        v[i] = 0.8 + std::sin(2 * std::numbers::pi * 16.0 * static_cast<double>(i) / 1024.0);
    }
    sg::ac_couple(v);
    EXPECT_NEAR(mean(v, 0, 1024), 0.0, 1e-12);
    EXPECT_NEAR(*std::max_element(v.begin(), v.end()), 1.0, 1e-9);
    EXPECT_NEAR(v[0], 0.0, 1e-12);

    // The downloaded ramp averages 1023/2048 of 2147000000 / 2^31 of the range: 0.49940.
    const std::vector<int32_t> table = swapped_ramp();
    sg::SourceParams p = source(code::mode_arbitrary);
    p.range = 2.0;
    p.arb_table = table;
    EXPECT_NEAR(sg::output_mean(p), 2 * 0.499399, 1e-6);
    const std::vector<double> dc = render(p, 0.0, 2048);
    const std::vector<double> ac = render(p, 0.0, 2048, true);
    EXPECT_NEAR(mean(ac, 0, 2048), 0.0, 1e-9);
    EXPECT_NEAR(ac[100] - dc[100], -2 * 0.499399, 1e-6);
    // Half of each burst period on plays the first half of the table: quarter two then one,
    // mean 255.5 * 2096679.6875 / 2^31 over half the time.
    p.mode = code::mode_burst_arbitrary;
    p.duty_cycle = 0.5;
    EXPECT_NEAR(sg::output_mean(p), 2 * 0.124728, 1e-6);
    EXPECT_NEAR(mean(render(p, 0.0, 4096, true), 0, 4096), 0.0, 1e-9);

    // A sine at 0 Hz is a constant: range * sin(phase), all of it DC.
    p = source(code::mode_sine);
    p.frequency = 0.0;
    p.phase_deg = 90.0;
    p.range = 3.0;
    EXPECT_NEAR(render(p, 1.0, 1)[0], 3.0, 1e-12);
    EXPECT_NEAR(render(p, 1.0, 1, true)[0], 0.0, 1e-12);
    p.frequency = -50.0;  // no such thing: taken as 0 Hz
    EXPECT_NEAR(render(p, 1.3, 1)[0], 3.0, 1e-12);
    p.mode = code::mode_burst_sine;
    p.duty_cycle = 0.25;
    EXPECT_NEAR(sg::output_mean(p), 0.75, 1e-12);
    p.mode = code::mode_sine;
    p.frequency = 100.0;
    EXPECT_EQ(sg::output_mean(p), 0.0);
}

TEST(SimSignals, ArbitraryPlaysTheTableCyclicallyScaledToTheRange) {
    // Entries of -2^30 .. 2^29 are -1/2 .. 1/4 of full scale; entry 1000 is 2^30, half scale.
    std::vector<int32_t> table(1024);
    for (int k = 0; k < 1024; ++k) {
        table[k] = (k % 4 - 2) * (1 << 29);
    }
    table[1000] = 1 << 30;
    sg::SourceParams p = source(code::mode_arbitrary);
    p.range = 4.0;
    p.arb_table = table;
    const std::vector<double> v = render(p, 0.0, 2100);
    EXPECT_EQ(v[0], -2.0);
    EXPECT_EQ(v[1], -1.0);
    EXPECT_EQ(v[2], 0.0);
    EXPECT_EQ(v[3], 1.0);
    EXPECT_EQ(v[1000], 2.0);
    EXPECT_EQ(v[2024], 2.0);  // one table per 1024 samples
    EXPECT_EQ(v[1025], -1.0);
    // A block that starts mid-table starts at that entry.
    EXPECT_EQ(render(p, 1000 * dt, 1)[0], 2.0);
    // Full negative scale is the range.
    table[7] = std::numeric_limits<int32_t>::min();
    EXPECT_EQ(render(p, 7 * dt, 1)[0], -4.0);

    // The panel's test waveform in one block at span 20000 Hz: lowest at entry 256 (0), highest at
    // entry 767 (2144903320 of 2^31), first entry 536750000.
    const std::vector<int32_t> ramp = swapped_ramp();
    p.range = 1.0;
    p.arb_table = ramp;
    const std::vector<double> r = render(p, 0.0, 1024);
    EXPECT_EQ(std::min_element(r.begin(), r.end()) - r.begin(), 256);
    EXPECT_EQ(std::max_element(r.begin(), r.end()) - r.begin(), 767);
    EXPECT_NEAR(r[0], 0.249944, 1e-6);
    EXPECT_NEAR(r[767], 0.998798, 1e-6);

    // No table downloaded: silence.
    p.arb_table = {};
    const std::vector<double> none = render(p, 0.0, 64);
    EXPECT_TRUE(std::all_of(none.begin(), none.end(), [](double x) { return x == 0.0; }));
}

TEST(SimSignals, BurstIsOnForTheDutyCycleOfEachPeriod) {
    sg::SourceParams p = source(code::mode_burst_random);
    p.duty_cycle = 0.25;
    const std::vector<double> v = render(p, 0.0, 4096);  // four burst periods of 1024 samples
    EXPECT_EQ(std::count_if(v.begin(), v.end(), [](double x) { return x != 0.0; }), 1024);
    for (size_t start : {0u, 1024u, 2048u, 3072u}) {
        EXPECT_NE(v[start], 0.0);
        EXPECT_NE(v[start + 255], 0.0);
        EXPECT_EQ(v[start + 256], 0.0);
        EXPECT_EQ(v[start + 1023], 0.0);
    }

    // A burst sine is the continuous sine while on.
    p.mode = code::mode_burst_sine;
    p.duty_cycle = 0.5;
    p.frequency = 1000.0;
    const std::vector<double> burst = render(p, 0.0, 2048);
    p.mode = code::mode_sine;
    const std::vector<double> sine = render(p, 0.0, 2048);
    EXPECT_EQ(burst[100], sine[100]);
    EXPECT_EQ(burst[1024 + 511], sine[1024 + 511]);
    EXPECT_EQ(burst[512 + 100], 0.0);
    EXPECT_NE(sine[512 + 100], 0.0);

    // Duty cycle 1 never switches off, 0 never on, and values outside 0..1 are taken as those.
    p.mode = code::mode_burst_random;
    for (double duty : {1.0, 3.0}) {
        p.duty_cycle = duty;
        const std::vector<double> on = render(p, 0.0, 2048);
        EXPECT_EQ(std::count(on.begin(), on.end(), 0.0), 0) << duty;
    }
    for (double duty : {0.0, -1.0}) {
        p.duty_cycle = duty;
        const std::vector<double> off = render(p, 0.0, 2048);
        EXPECT_EQ(std::count(off.begin(), off.end(), 0.0), 2048) << duty;
    }
}

TEST(SimSignals, OnlyNormalCalAndMultiOutputsPutOutASignal) {
    sg::SourceParams p = source(code::mode_sine);
    p.phase_deg = 90.0;
    for (int32_t output : {code::output_normal, code::output_cal, code::output_multi}) {
        p.output = output;
        EXPECT_NEAR(render(p, 0.0, 1)[0], 1.0, 1e-12) << output;
    }
    for (int32_t output : {code::output_grounded, code::output_open, 705}) {
        p.output = output;
        for (int32_t mode = code::mode_sine; mode <= code::mode_burst_arbitrary; ++mode) {
            p.mode = mode;
            const std::vector<double> v = render(p, 0.0, 256);
            EXPECT_EQ(std::count(v.begin(), v.end(), 0.0), 256) << output << " " << mode;
        }
    }
    p.output = code::output_normal;
    p.mode = 169;
    EXPECT_EQ(render(p, 0.0, 1)[0], 0.0);
}

TEST(SimSignals, RampRaisesTheAmplitudeOverTheRampTime) {
    // A sine at 0 Hz and phase 90 degrees is a constant 1, so the output is the envelope.
    sg::SourceParams p = source(code::mode_sine);
    p.frequency = 0.0;
    p.phase_deg = 90.0;
    p.active_since = 1.0;
    p.ramp_seconds = 2.0;
    const double times[] = {0.5, 1.0, 1.5, 2.0, 2.5, 3.0, 10.0};
    const double expected[] = {0.0, 0.0, 0.25, 0.5, 0.75, 1.0, 1.0};
    for (int i = 0; i < 7; ++i) {
        EXPECT_NEAR(render(p, times[i], 1)[0], expected[i], 1e-12) << times[i];
        EXPECT_NEAR(sg::ramp_gain(p, times[i]), expected[i], 1e-12) << times[i];
    }
    // Ramp 0: full as soon as it is active, nothing before.
    p.ramp_seconds = 0.0;
    EXPECT_EQ(render(p, 0.999, 1)[0], 0.0);
    EXPECT_NEAR(render(p, 1.0, 1)[0], 1.0, 1e-12);
    // Never activated explicitly: always on.
    p.active_since = -inf;
    p.ramp_seconds = 5.0;
    EXPECT_NEAR(render(p, 0.0, 1)[0], 1.0, 1e-12);
}

TEST(SimSignals, NoiseIsReproducibleBySeed) {
    std::vector<double> a(4000, 0.0), b(4000, 0.0), other(4000, 0.0), tail(2000, 0.0);
    sg::add_input_noise(3, 100, sg::default_input_noise_rms, a);
    sg::add_input_noise(3, 100, sg::default_input_noise_rms, b);
    sg::add_input_noise(4, 100, sg::default_input_noise_rms, other);
    sg::add_input_noise(3, 2100, sg::default_input_noise_rms, tail);
    EXPECT_EQ(a, b);
    EXPECT_TRUE(std::equal(tail.begin(), tail.end(), a.begin() + 2000));
    EXPECT_NEAR(rms(a), 1e-3, 1e-4);
    double dot = 0.0;
    for (size_t i = 0; i < a.size(); ++i) {
        dot += a[i] * other[i];
    }
    EXPECT_LT(std::abs(dot / (rms(a) * rms(other) * 4000.0)), 0.1);  // uncorrelated

    // Noise adds to what is there.
    std::vector<double> offset(4000, 5.0);
    sg::add_input_noise(3, 100, sg::default_input_noise_rms, offset);
    EXPECT_NEAR(offset[17], 5.0 + a[17], 1e-15);

    // A random source: same seed same noise, another seed other noise, rms range / 4, never
    // beyond the range.
    sg::SourceParams p = source(code::mode_random);
    p.range = 2.0;
    p.seed = 7;
    const std::vector<double> s1 = render(p, 0.0, 20000);
    EXPECT_EQ(s1, render(p, 0.0, 20000));
    EXPECT_NEAR(rms(s1), 0.5, 0.025);
    EXPECT_LE(*std::max_element(s1.begin(), s1.end()), 2.0);
    EXPECT_GE(*std::min_element(s1.begin(), s1.end()), -2.0);
    p.seed = 8;
    const std::vector<double> s2 = render(p, 0.0, 20000);
    EXPECT_NE(s1, s2);
    EXPECT_NEAR(rms(s2), 0.5, 0.025);
}

TEST(SimSignals, LevelTriggerFiresOnceThroughTheLevelWithHysteresis) {
    // Rising through 0.5 with jitter round the level, re-arm level 0.3.
    const std::vector<double> noisy = {-1.0, -0.5, 0.0, 0.45, 0.55, 0.48, 0.52, 0.49, 0.6, 0.8};
    bool armed = false;
    EXPECT_EQ(sg::find_level_trigger(noisy, 0.5, 0.3, true, armed), 4u);
    EXPECT_FALSE(armed);
    EXPECT_EQ(sg::find_level_trigger(std::span(noisy).subspan(5), 0.5, 0.3, true, armed), std::nullopt);
    // Without hysteresis the jitter fires again.
    armed = false;
    EXPECT_EQ(sg::find_level_trigger(noisy, 0.5, 0.5, true, armed), 4u);
    EXPECT_EQ(sg::find_level_trigger(std::span(noisy).subspan(5), 0.5, 0.5, true, armed), 1u);
    // Levels given the wrong way round act the same.
    armed = false;
    EXPECT_EQ(sg::find_level_trigger(noisy, 0.3, 0.5, true, armed), 4u);

    // Starting above the level does not fire until the signal has been below the lower level.
    const std::vector<double> high_start = {0.9, 0.8, 0.4, 0.7, 0.2, 0.7};
    armed = false;
    EXPECT_EQ(sg::find_level_trigger(high_start, 0.5, 0.3, true, armed), 5u);

    // Negative slope: mirror image.
    const std::vector<double> falling = {1.0, 0.6, 0.35, 0.25, 0.35, 0.28, 0.1};
    armed = false;
    EXPECT_EQ(sg::find_level_trigger(falling, 0.5, 0.3, false, armed), 3u);
    EXPECT_EQ(sg::find_level_trigger(std::span(falling).subspan(4), 0.5, 0.3, false, armed), std::nullopt);
    armed = false;
    EXPECT_EQ(sg::find_level_trigger(noisy, 0.5, 0.3, false, armed), std::nullopt);

    // Armed state carries from one block to the next.
    const std::vector<double> low = {-0.2, -0.1}, high = {0.7, 0.9};
    armed = false;
    EXPECT_EQ(sg::find_level_trigger(low, 0.5, 0.3, true, armed), std::nullopt);
    EXPECT_TRUE(armed);
    EXPECT_EQ(sg::find_level_trigger(high, 0.5, 0.3, true, armed), 0u);

    // A sine that never reaches the level never fires, on either slope.
    sg::SourceParams p = source(code::mode_sine);
    p.range = 0.45;
    const std::vector<double> small = render(p, 0.0, 8192);
    for (bool positive : {true, false}) {
        armed = false;
        EXPECT_EQ(sg::find_level_trigger(small, 0.5, -0.5, positive, armed), std::nullopt);
    }
    // A sine that does fires on the rising side for a positive slope and the falling side for a
    // negative one: 1000 Hz, level 0.5 of 1 V, crossings at 30 and 150 degrees.
    p.range = 1.0;
    const std::vector<double> sine = render(p, 0.0, 1024);
    armed = true;
    const auto rise = sg::find_level_trigger(sine, 0.5, 0.0, true, armed);
    ASSERT_TRUE(rise.has_value());
    EXPECT_EQ(*rise, 5u);  // 51.2 samples per period: 30 degrees is sample 4.27
    armed = true;
    const auto fall = sg::find_level_trigger(sine, 0.0, -0.5, false, armed);
    ASSERT_TRUE(fall.has_value());
    EXPECT_EQ(*fall, 30u);  // 210 degrees is sample 29.87
}

TEST(SimSignals, BoundTriggerFiresOnLeavingOrEnteringTheBand) {
    const std::vector<double> leave = {1.0, 0.0, 0.3, 0.6, 0.2, 0.7};
    bool armed = false;
    EXPECT_EQ(sg::find_bound_trigger(leave, 0.5, -0.5, true, armed), 3u);
    EXPECT_EQ(sg::find_bound_trigger(std::span(leave).subspan(4), 0.5, -0.5, true, armed), 1u);

    const std::vector<double> enter = {0.0, 1.0, 0.7, 0.4, -0.9, -0.2};
    armed = false;
    EXPECT_EQ(sg::find_bound_trigger(enter, 0.5, -0.5, false, armed), 3u);
    EXPECT_EQ(sg::find_bound_trigger(std::span(enter).subspan(4), 0.5, -0.5, false, armed), 1u);
}

TEST(SimSignals, PeriodStartsFollowTheSourceMode) {
    sg::SourceParams p = source(code::mode_sine);
    p.frequency = 1000.0;
    EXPECT_NEAR(sg::next_period_start(p, 0.0), 0.0, 1e-15);
    EXPECT_NEAR(sg::next_period_start(p, 0.0003), 0.001, 1e-15);
    EXPECT_NEAR(sg::next_period_start(p, 5.0004), 5.001, 1e-12);
    // Phase 90 degrees: the rising zero crossing is a quarter period before each whole period.
    p.phase_deg = 90.0;
    const double t = sg::next_period_start(p, 0.0);
    EXPECT_NEAR(t, 0.00075, 1e-15);
    std::vector<double> around(2);
    sg::render_source(p, t - 1e-6, 2e-6, around);
    EXPECT_LT(around[0], 0.0);
    EXPECT_GT(around[1], 0.0);
    // Not before the source is running.
    p.active_since = 2.00005;
    EXPECT_NEAR(sg::next_period_start(p, 1.0), 2.00075, 1e-12);
    p.frequency = 0.0;
    EXPECT_EQ(sg::next_period_start(p, 1.0), inf);

    // Noise and burst forms start a period with each 1024-sample source block: 20 ms at 51200 Hz.
    for (int32_t mode : {code::mode_random, code::mode_burst_sine, code::mode_burst_arbitrary}) {
        p = source(mode);
        EXPECT_NEAR(sg::next_period_start(p, 0.001), 0.02, 1e-15) << mode;
        EXPECT_NEAR(sg::next_period_start(p, 0.04), 0.04, 1e-15) << mode;
    }
    // Arbitrary: each pass through the table.
    const std::vector<int32_t> table(512, 0);
    p = source(code::mode_arbitrary);
    p.arb_table = table;
    EXPECT_NEAR(sg::next_period_start(p, 0.001), 0.01, 1e-15);
}
