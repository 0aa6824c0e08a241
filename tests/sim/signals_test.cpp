// The simulator's waveform maths, checked against values worked out by hand.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <numbers>
#include <numeric>
#include <optional>
#include <vector>

#include "signals.h"

namespace sg = sim::signals;
namespace code = sim::code;

namespace {

constexpr double fs = 51200.0;  // the sample rate at span 20000 Hz
constexpr double dt = 1.0 / fs;
constexpr std::optional<size_t> never = std::nullopt;

sg::SourceParams source(int32_t mode, double range = 1.0, double frequency = 1000.0, double phase = 0.0) {
    sg::SourceParams p;
    p.mode = mode;
    p.range = range;
    p.frequency = frequency;
    p.phase_deg = phase;
    return p;
}

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

double mean(const std::vector<double>& v, size_t from = 0, size_t to = 0) {
    to = to ? to : v.size();
    return std::accumulate(v.begin() + from, v.begin() + to, 0.0) / static_cast<double>(to - from);
}

double rms(const std::vector<double>& v) {
    return std::sqrt(std::inner_product(v.begin(), v.end(), v.begin(), 0.0) / static_cast<double>(v.size()));
}

long zeros(const std::vector<double>& v) {
    return std::count(v.begin(), v.end(), 0.0);
}

// The panel's test waveform: a ramp whose first and second, and third and fourth quarters, have
// changed places.
std::vector<int32_t> swapped_ramp() {
    std::vector<int32_t> t(1024);
    for (int k = 0; k < 1024; ++k)
        t[k] = static_cast<int32_t>(std::nearbyint(k / 1024.0 * 2147000000.0));
    for (int i = 0; i < 256; ++i) {
        std::swap(t[i], t[256 + i]);
        std::swap(t[512 + i], t[768 + i]);
    }
    return t;
}

}  // namespace

TEST(SimSignals, SineHasTheHandValuesAtKnownTimes) {
    // Eight samples per period: 0, 45, 90, ... degrees.
    sg::SourceParams p = source(code::mode_sine, 2.0);
    std::vector<double> v(8);
    sg::render_source(p, 0.0, 1.25e-4, v);
    const double r2 = std::sqrt(2.0), expected[8] = {0, r2, 2, r2, 0, -r2, -2, -r2};
    for (int i = 0; i < 8; ++i)
        EXPECT_NEAR(v[i], expected[i], 1e-12) << i;
    // An hour into the run the sine is still on time: 3600 s is a whole number of periods.
    p.phase_deg = 90.0;
    sg::render_source(p, 3600.0, 2.5e-4, std::span(v).first(3));
    EXPECT_NEAR(v[0], 2.0, 1e-6);
    EXPECT_NEAR(v[1], 0.0, 1e-6);
    EXPECT_NEAR(v[2], -2.0, 1e-6);
    // Every sample of a long block, well into a run, against the sine of its own time.
    p = source(code::mode_sine, 3.0, 1234.5, 17.0);
    const std::vector<double> w = render(p, 7.3, 5000);
    for (size_t i = 0; i < w.size(); ++i) {
        const double t = 7.3 + static_cast<double>(i) * dt;
        ASSERT_NEAR(w[i], 3.0 * std::sin(2 * std::numbers::pi * (1234.5 * t + 17.0 / 360.0)), 1e-10) << i;
    }
}

TEST(SimSignals, ContiguousBlocksJoinWithoutAGap) {
    const std::vector<int32_t> table = swapped_ramp();
    for (int32_t mode : {code::mode_sine, code::mode_random, code::mode_zoom_random, code::mode_arbitrary,
                         code::mode_burst_sine}) {
        sg::SourceParams p = source(mode, 1.0, 1234.5, 17.0);
        p.duty_cycle = 0.5;
        p.arb_table = table;
        const double t0 = 7.3;  // well after the start, not on a period boundary
        const std::vector<double> whole = render(p, t0, 3000), first = render(p, t0, 1024),
                                  second = render(p, t0 + 1024 * dt, 1976);
        for (size_t i = 0; i < 3000; ++i)
            ASSERT_NEAR(i < 1024 ? first[i] : second[i - 1024], whole[i], 1e-9) << mode << " at " << i;
    }
}

TEST(SimSignals, NoiseIsFlatReproducibleBySeedAndZoomNoiseSitsInItsBand) {
    sg::SourceParams p = source(code::mode_random, 2.0);
    p.seed = 7;
    const std::vector<double> s1 = render(p, 0.0, 16384), sp = spectrum(s1);
    EXPECT_NEAR(mean(sp, 1, 4096) / mean(sp, 4096, 8192), 1.0, 0.2);
    EXPECT_EQ(s1, render(p, 0.0, 16384));
    EXPECT_NEAR(rms(s1), 0.5, 0.025);  // rms range / 4, never beyond the range
    EXPECT_LE(*std::max_element(s1.begin(), s1.end()), 2.0);
    EXPECT_GE(*std::min_element(s1.begin(), s1.end()), -2.0);
    p.seed = 8;
    EXPECT_NE(s1, render(p, 0.0, 16384));

    // Input noise: a stream per channel seed that continues across blocks and adds to the signal.
    std::vector<double> a(8192, 0.0), other(8192, 0.0), tail(4096, 0.0), offset(8192, 5.0);
    sg::add_input_noise(3, 100, sg::default_input_noise_rms, a);
    sg::add_input_noise(4, 100, sg::default_input_noise_rms, other);
    sg::add_input_noise(3, 4196, sg::default_input_noise_rms, tail);
    sg::add_input_noise(3, 100, sg::default_input_noise_rms, offset);
    EXPECT_TRUE(std::equal(tail.begin(), tail.end(), a.begin() + 4096));
    EXPECT_NEAR(offset[17], 5.0 + a[17], 1e-15);
    EXPECT_NEAR(rms(a), 1e-3, 1e-4);
    const double dot = std::inner_product(a.begin(), a.end(), other.begin(), 0.0);
    EXPECT_LT(std::abs(dot / (rms(a) * rms(other) * 8192.0)), 0.1);  // uncorrelated
    const std::vector<double> sa = spectrum(a);
    EXPECT_NEAR(mean(sa, 1, 2048) / mean(sa, 2048, 4096), 1.0, 0.2);
    // Close to normal: 68.3 % of the values within one rms, 4.6 % beyond two, 0.27 % beyond three
    // (a uniform deviate of the same rms has 57.7 %, 0 and 0), and none far out.
    std::vector<double> many(262144, 0.0);
    sg::add_input_noise(5, 0, 1.0, many);
    const auto beyond = [&](double x) {
        return std::count_if(many.begin(), many.end(), [x](double v) { return std::abs(v) > x; }) /
               static_cast<double>(many.size());
    };
    EXPECT_NEAR(rms(many), 1.0, 0.01);
    EXPECT_NEAR(mean(many), 0.0, 0.01);
    EXPECT_NEAR(1.0 - beyond(1.0), 0.683, 0.01);
    EXPECT_NEAR(beyond(2.0), 0.0455, 0.004);
    EXPECT_GT(beyond(3.0), 0.001);
    EXPECT_LT(beyond(3.0), 0.004);
    EXPECT_EQ(beyond(5.0), 0.0);

    // Zoom random at 10 kHz: a band of about +-3.2 kHz (+-512 bins of 6.25 Hz) round bin 1600.
    const std::vector<double> z = spectrum(render(source(code::mode_zoom_random, 1.0, 10000.0), 0.0, 8192));
    EXPECT_GT(mean(z, 1400, 1800), 10.0 * mean(z, 1, 400));
    EXPECT_GT(mean(z, 1400, 1800), 10.0 * mean(z, 3200, 4096));
}

TEST(SimSignals, AcCouplingTakesOffTheLongRunMean) {
    // The test ramp averages 1023/2048 of 2147000000 / 2^31 of the range: 0.49940.
    const std::vector<int32_t> table = swapped_ramp();
    sg::SourceParams p = source(code::mode_arbitrary, 2.0);
    p.arb_table = table;
    const std::vector<double> dc = render(p, 0.0, 2048), ac = render(p, 0.0, 2048, true);
    EXPECT_NEAR(mean(dc), 2 * 0.499399, 1e-6);
    EXPECT_NEAR(mean(ac), 0.0, 1e-9);
    EXPECT_NEAR(ac[100] - dc[100], -2 * 0.499399, 1e-6);
    // Half of each burst period plays the first half of the table: quarter two then one, mean
    // 255.5 * 2096679.6875 / 2^31 over half the time.
    p.mode = code::mode_burst_arbitrary;
    p.duty_cycle = 0.5;
    EXPECT_NEAR(mean(render(p, 0.0, 4096)), 2 * 0.124728, 1e-6);
    EXPECT_NEAR(mean(render(p, 0.0, 4096, true)), 0.0, 1e-9);
    // A sine at 0 Hz is the constant range * sin(phase), all of it DC, also while a burst is on.
    p = source(code::mode_sine, 3.0, 0.0, 90.0);
    EXPECT_NEAR(render(p, 1.0, 1)[0], 3.0, 1e-12);
    EXPECT_NEAR(render(p, 1.0, 1, true)[0], 0.0, 1e-12);
    p.mode = code::mode_burst_sine;
    p.duty_cycle = 0.25;
    EXPECT_NEAR(render(p, 0.0, 1, true)[0], 3.0 - 0.75, 1e-12);
}

TEST(SimSignals, ArbitraryPlaysTheTableCyclicallyScaledToTheRange) {
    // Entries (k % 4 - 2) * 2^29 are -1/2 .. 1/4 of full scale; entry 1000 is 2^30, half scale.
    std::vector<int32_t> table(1024);
    for (int k = 0; k < 1024; ++k)
        table[k] = (k % 4 - 2) * (1 << 29);
    table[1000] = 1 << 30;
    table[7] = std::numeric_limits<int32_t>::min();
    sg::SourceParams p = source(code::mode_arbitrary, 4.0);
    p.arb_table = table;
    const std::vector<double> v = render(p, 0.0, 2100);
    EXPECT_EQ(std::vector<double>(v.begin(), v.begin() + 8),
              (std::vector<double>{-2, -1, 0, 1, -2, -1, 0, -4}));
    EXPECT_EQ(v[1000], 2.0);
    EXPECT_EQ(v[2024], 2.0);                     // one table per 1024 samples
    EXPECT_EQ(render(p, 1000 * dt, 1)[0], 2.0);  // a block that starts mid-table starts there
    p.arb_table = {};
    EXPECT_EQ(zeros(render(p, 0.0, 64)), 64);  // no table downloaded: silence
}

TEST(SimSignals, BurstIsOnForTheDutyCycleAndGroundedOrOpenOutputsPutOutNothing) {
    sg::SourceParams p = source(code::mode_burst_random);
    p.duty_cycle = 0.25;
    const std::vector<double> v = render(p, 0.0, 4096);  // four burst periods of 1024 samples
    EXPECT_EQ(zeros(v), 3072);
    for (size_t start : {0u, 1024u, 2048u, 3072u}) {
        EXPECT_NE(v[start], 0.0);
        EXPECT_NE(v[start + 255], 0.0);
        EXPECT_EQ(v[start + 256], 0.0);
        EXPECT_EQ(v[start + 1023], 0.0);
    }
    p.duty_cycle = 1.0;  // never off
    EXPECT_EQ(zeros(render(p, 0.0, 2048)), 0);
    // A burst sine is the continuous sine while on.
    p = source(code::mode_burst_sine);
    p.duty_cycle = 0.5;
    const std::vector<double> burst = render(p, 0.0, 2048), sine = render(source(code::mode_sine), 0.0, 2048);
    EXPECT_EQ(burst[100], sine[100]);
    EXPECT_EQ(burst[1024 + 511], sine[1024 + 511]);
    EXPECT_EQ(burst[512 + 100], 0.0);

    p = source(code::mode_sine, 1.0, 1000.0, 90.0);
    for (int32_t output : {code::output_normal, code::output_cal, code::output_multi}) {
        p.output = output;
        EXPECT_NEAR(render(p, 0.0, 1)[0], 1.0, 1e-12) << output;
    }
    for (int32_t output : {code::output_grounded, code::output_open}) {
        p.output = output;
        for (int32_t mode = code::mode_sine; mode <= code::mode_burst_arbitrary; ++mode) {
            p.mode = mode;
            EXPECT_EQ(zeros(render(p, 0.0, 256)), 256) << output << " " << mode;
        }
    }
}

TEST(SimSignals, RampRaisesTheAmplitudeOverTheRampTimeFromActivation) {
    // A sine at 0 Hz and phase 90 degrees is a constant 1, so the output is the envelope.
    sg::SourceParams p = source(code::mode_sine, 1.0, 0.0, 90.0);
    p.active_since = 1.0;
    p.ramp_seconds = 2.0;
    for (const auto& [t, gain] :
         {std::pair{0.5, 0.0}, {1.0, 0.0}, {1.5, 0.25}, {2.0, 0.5}, {2.5, 0.75}, {3.0, 1.0}, {10.0, 1.0}})
        EXPECT_NEAR(render(p, t, 1)[0], gain, 1e-12) << t;
    p.ramp_seconds = 0.0;  // full as soon as it is active, nothing before
    EXPECT_EQ(render(p, 0.999, 1)[0], 0.0);
    EXPECT_NEAR(render(p, 1.0, 1)[0], 1.0, 1e-12);
}

TEST(SimSignals, LevelAndBoundTriggersFireWithHysteresis) {
    const std::vector<double> jitter = {-1.0, -0.5, 0.0, 0.45, 0.55, 0.48, 0.52, 0.49, 0.6, 0.8};
    const std::vector<double> high_start = {0.9, 0.8, 0.4, 0.7, 0.2, 0.7}, low_high = {-0.2, -0.1, 0.7, 0.9};
    const std::vector<double> falling = {1.0, 0.6, 0.35, 0.25, 0.35, 0.28, 0.1};
    const std::vector<double> leave = {1.0, 0.0, 0.3, 0.6, 0.2, 0.7},
                              enter = {0.0, 1.0, 0.7, 0.4, -0.9, -0.2};
    const std::vector<double> small = render(source(code::mode_sine, 0.45), 0.0, 8192);
    const std::vector<double> sine = render(source(code::mode_sine), 0.0, 1024);
    // Each signal is fed as two blocks split at `split`, the armed state carried across; 51.2
    // samples a sine period: rising through 0.5 at 30 degrees, samples 4.27 and 55.47, falling
    // through -0.5 at 210 degrees, samples 29.87 and 81.07.
    // clang-format off
    const struct {
        const std::vector<double>& v; size_t split; bool bound; double upper, lower; bool positive, armed;
        std::optional<size_t> first, second;  // the firing index in each block
    } cases[] = {
        {jitter, 5, false, 0.5, 0.3, true, false, 4, never},   // the jitter round 0.5 does not re-arm
        {jitter, 5, false, 0.5, 0.5, true, false, 4, 1},       // without hysteresis it does
        {jitter, 5, false, 0.3, 0.5, true, false, 4, never},   // levels the wrong way round
        {high_start, 6, false, 0.5, 0.3, true, false, 5, never},  // starting high: arms below 0.3 first
        {falling, 4, false, 0.5, 0.3, false, false, 3, never},    // negative slope mirrors it
        {jitter, 5, false, 0.5, 0.3, false, false, never, never},
        {low_high, 2, false, 0.5, 0.3, true, false, never, 0},    // armed in one block, fires in the next
        {small, 4096, false, 0.5, -0.5, true, false, never, never},  // a sine below the level
        {small, 4096, false, 0.5, -0.5, false, false, never, never},
        {sine, 20, false, 0.5, 0.0, true, true, 5, 56 - 20},
        {sine, 40, false, 0.0, -0.5, false, true, 30, 82 - 40},
        {leave, 4, true, 0.5, -0.5, true, false, 3, 1},        // bound, exit
        {enter, 4, true, 0.5, -0.5, false, false, 3, 1}};      // bound, enter
    // clang-format on
    for (size_t i = 0; i < std::size(cases); ++i) {
        const auto& c = cases[i];
        SCOPED_TRACE(i);
        const auto find = c.bound ? sg::find_bound_trigger : sg::find_level_trigger;
        bool armed = c.armed;
        EXPECT_EQ(find(std::span(c.v).first(c.split), c.upper, c.lower, c.positive, armed), c.first);
        EXPECT_EQ(find(std::span(c.v).subspan(c.split), c.upper, c.lower, c.positive, armed), c.second);
    }
}

TEST(SimSignals, PeriodStartsFollowTheSourceMode) {
    sg::SourceParams p = source(code::mode_sine);
    EXPECT_NEAR(sg::next_period_start(p, 5.0004), 5.001, 1e-12);
    p.phase_deg = 90.0;  // the rising zero crossing a quarter period before each whole period
    EXPECT_NEAR(sg::next_period_start(p, 0.0), 0.00075, 1e-15);
    p.active_since = 2.00005;  // not before the source is running
    EXPECT_NEAR(sg::next_period_start(p, 1.0), 2.00075, 1e-12);
    p.frequency = 0.0;
    EXPECT_EQ(sg::next_period_start(p, 1.0), std::numeric_limits<double>::infinity());
    // Noise and burst forms start a period with each 1024-sample source block: 20 ms at 51200 Hz.
    for (int32_t mode : {code::mode_random, code::mode_burst_sine, code::mode_burst_arbitrary})
        EXPECT_NEAR(sg::next_period_start(source(mode), 0.001), 0.02, 1e-15) << mode;
    const std::vector<int32_t> table(512, 0);  // arbitrary: each pass through the table
    p = source(code::mode_arbitrary);
    p.arb_table = table;
    EXPECT_NEAR(sg::next_period_start(p, 0.001), 0.01, 1e-15);
}

TEST(SimSignals, SameOutputComparesEverySettingAndTheTableByContent) {
    const std::vector<int32_t> table = swapped_ramp(), copy = table;
    std::vector<int32_t> changed = table;
    changed[600] += 1;
    sg::SourceParams a = source(code::mode_arbitrary);
    a.arb_table = table;
    sg::SourceParams b = a;
    b.arb_table = copy;
    EXPECT_TRUE(sg::same_output(a, b));
    const std::vector<void (*)(sg::SourceParams&)> changes = {
        [](sg::SourceParams& p) { p.mode = code::mode_burst_arbitrary; },
        [](sg::SourceParams& p) { p.output = code::output_cal; },
        [](sg::SourceParams& p) { p.range = 1.5; },
        [](sg::SourceParams& p) { p.frequency = 999.0; },
        [](sg::SourceParams& p) { p.phase_deg = -0.0; },
        [](sg::SourceParams& p) { p.duty_cycle = 0.5; },
        [](sg::SourceParams& p) { p.seed = 2; },
        [](sg::SourceParams& p) { p.ramp_seconds = 1.0; },
        [](sg::SourceParams& p) { p.sample_rate = 25600.0; },
        [](sg::SourceParams& p) { p.block_size = 2048; },
        [](sg::SourceParams& p) { p.amp_scale = 0.5; },
        [](sg::SourceParams& p) { p.active_since = 3.0; },
        [](sg::SourceParams& p) { p.arb_table = p.arb_table.first(1000); }};
    for (size_t i = 0; i < changes.size(); ++i) {
        sg::SourceParams c = a;
        changes[i](c);
        EXPECT_FALSE(sg::same_output(a, c)) << i;
    }
    b.arb_table = changed;
    EXPECT_FALSE(sg::same_output(a, b));
    a.frequency = b.frequency = std::numeric_limits<double>::quiet_NaN();
    b.arb_table = copy;
    EXPECT_TRUE(sg::same_output(a, b));
}
