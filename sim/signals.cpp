#include "signals.h"

#include <kiss_fftr.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstring>
#include <map>
#include <memory>
#include <numbers>
#include <vector>

namespace sim::signals {

namespace {

constexpr double two_pi = 2.0 * std::numbers::pi;
constexpr double full_scale = 2147483648.0;  // 2^31: an int32 table entry at full scale
constexpr double noise_peak_factor = 4.0;    // random sources: rms = range / 4
// Tolerance when turning a time into a sample index, so t = k / rate computed in floating point
// never lands just below k.
constexpr double index_tolerance = 1e-6;
// Separate hash streams for source noise and input noise, so a seed shared by both still gives
// unrelated signals.
constexpr uint64_t source_stream_salt = 0x5ec0'5eed'0000'0000ULL;
constexpr uint64_t input_stream_salt = 0x1a97'0000'0000'0000ULL;

uint64_t mix64(uint64_t x) {
    x += 0x9e3779b97f4a7c15ULL;
    x = (x ^ (x >> 30)) * 0xbf58476d1ce4e5b9ULL;
    x = (x ^ (x >> 27)) * 0x94d049bb133111ebULL;
    return x ^ (x >> 31);
}

// Standard normal values of a stream: a counter-based generator, so any sample can be drawn on its
// own and blocks can be rendered in any order. Values 2j and 2j+1 are the two Box-Muller deviates
// of pair j (one logarithm, square root and sine/cosine for both); the last pair is remembered, so
// a run of consecutive indexes costs half a pair each.
class Gaussians {
  public:
    explicit Gaussians(uint64_t stream) : stream_(stream) {}

    double at(uint64_t index) {
        const uint64_t pair = index >> 1;
        if (!valid_ || pair != pair_) {
            const uint64_t a = mix64(stream_ ^ mix64(pair));
            const uint64_t b = mix64(a ^ 0xd1b54a32d192ed03ULL);
            const double u1 = static_cast<double>((a >> 11) + 1) * 0x1p-53;  // (0, 1]
            const double u2 = static_cast<double>(b >> 11) * 0x1p-53;        // [0, 1)
            const double radius = std::sqrt(-2.0 * std::log(u1));
            const double angle = two_pi * u2;
            values_[0] = radius * std::cos(angle);
            values_[1] = radius * std::sin(angle);
            pair_ = pair;
            valid_ = true;
        }
        return values_[index & 1];
    }

  private:
    uint64_t stream_;
    uint64_t pair_ = 0;
    bool valid_ = false;
    double values_[2] = {0.0, 0.0};
};

uint64_t source_stream(int32_t seed) {
    return mix64(source_stream_salt ^ static_cast<uint32_t>(seed));
}

int64_t sample_index(double t, double rate) {
    return static_cast<int64_t>(std::floor(t * rate + index_tolerance));
}

int64_t wrap(int64_t k, int64_t n) {
    const int64_t r = k % n;
    return r < 0 ? r + n : r;
}

// Fraction of a turn, 0..1, of f * t + offset; reduced before scaling by 2 pi so large times keep
// their precision.
double turns(double f, double t, double offset) {
    const double c = f * t + offset;
    return c - std::floor(c);
}

bool puts_out_signal(int32_t output) {
    return output == code::output_normal || output == code::output_cal || output == code::output_multi;
}

bool is_burst(int32_t mode) {
    return mode == code::mode_burst_sine || mode == code::mode_burst_random ||
           mode == code::mode_burst_zoom_random || mode == code::mode_burst_arbitrary;
}

// The continuous form of a burst mode.
int32_t base_mode(int32_t mode) {
    return is_burst(mode) ? mode - 1 : mode;
}

double duty(const SourceParams& p) {
    return std::isnan(p.duty_cycle) ? 0.0 : std::clamp(p.duty_cycle, 0.0, 1.0);
}

double peak(const SourceParams& p) {
    return p.range > 0.0 ? p.range : 0.0;
}

// Sine frequency; a negative or undefined one counts as 0 (a constant).
double frequency(const SourceParams& p) {
    return p.frequency > 0.0 ? p.frequency : 0.0;
}

// Source samples on at the start of each burst period: positions below duty * block_size.
int64_t on_samples(const SourceParams& p) {
    const int64_t block = std::max<int32_t>(p.block_size, 1);
    return std::min(block, static_cast<int64_t>(std::ceil(duty(p) * static_cast<double>(block))));
}

bool burst_on(const SourceParams& p, int64_t k) {
    const int64_t block = std::max<int32_t>(p.block_size, 1);
    return static_cast<double>(wrap(k, block)) < duty(p) * static_cast<double>(block);
}

// The low-pass stage of zoom random: a Hann-weighted moving average, remembering the last taps so
// consecutive samples draw one new value each. The sum is always formed the same way over the same
// values, so the result depends on k alone and not on where a block starts.
class ZoomFilter {
  public:
    explicit ZoomFilter(uint64_t stream) : noise_(stream) {
        std::array<double, zoom_taps> weights{};
        double power = 0.0;
        for (int j = 0; j < zoom_taps; ++j) {
            const double s = std::sin(std::numbers::pi * (j + 1) / (zoom_taps + 1));
            weights[j] = s * s;
            power += weights[j] * weights[j];
        }
        for (int j = 0; j < zoom_taps; ++j) {
            // Unit variance out for unit variance in; oldest value first, as the window runs.
            reversed_[zoom_taps - 1 - j] = weights[j] / std::sqrt(power);
        }
    }

    double at(int64_t k) {
        if (!filled_ || k != last_ + 1) {
            for (int64_t j = zoom_taps - 1; j >= 0; --j)
                put(k - j);
            filled_ = true;
        } else {
            put(k);
        }
        last_ = k;
        // The window k - taps + 1 .. k lies in order right after the newest value's first copy.
        const double* window = ring_.data() + wrap(k, zoom_taps) + 1;
        // Four partial sums, always added the same way: the result depends on k alone.
        double sum[4] = {0.0, 0.0, 0.0, 0.0};
        for (int j = 0; j < zoom_taps; j += 4) {
            for (int l = 0; l < 4; ++l)
                sum[l] += reversed_[j + l] * window[j + l];
        }
        return (sum[0] + sum[1]) + (sum[2] + sum[3]);
    }

  private:
    // Each value goes in twice, taps apart, so every window is one run of the ring.
    void put(int64_t k) {
        const double v = noise_.at(static_cast<uint64_t>(k));
        const auto at = static_cast<size_t>(wrap(k, zoom_taps));
        ring_[at] = v;
        ring_[at + zoom_taps] = v;
    }

    Gaussians noise_;
    std::array<double, zoom_taps> reversed_{};  // the weights, the oldest value's first
    std::array<double, 2 * zoom_taps> ring_{};
    int64_t last_ = 0;
    bool filled_ = false;
};

// range * sin(2 pi (f t_i + offset)) at t_i = t0 + i dt. Each run of sine_run samples starts
// from the exact phase of its first sample; the others add their offset from it by the angle-sum
// rule, from a table of the step angles made once per call. So no error builds up along a block,
// and blocks join to rounding wherever they are cut.
constexpr size_t sine_run = 64;

void render_sine(double amplitude, double f, double offset, double t0, double dt, std::span<double> out) {
    std::array<double, sine_run> sin_step{}, cos_step{};
    const double step_turns = f * dt;
    for (size_t m = 0; m < std::min(out.size(), sine_run); ++m) {
        const double x = static_cast<double>(m) * step_turns;
        const double angle = two_pi * (x - std::floor(x));
        sin_step[m] = std::sin(angle);
        cos_step[m] = std::cos(angle);
    }
    for (size_t first = 0; first < out.size(); first += sine_run) {
        const double angle = two_pi * turns(f, t0 + static_cast<double>(first) * dt, offset);
        const double s = amplitude * std::sin(angle), c = amplitude * std::cos(angle);
        const size_t run = std::min(sine_run, out.size() - first);
        double* o = out.data() + first;
        o[0] = s;  // exactly the phase's sine
        for (size_t m = 1; m < run; ++m)
            o[m] = s * cos_step[m] + c * sin_step[m];
    }
}

double cut(double v, double limit) {
    return std::clamp(v, -limit, limit);
}

}  // namespace

bool same_output(const SourceParams& a, const SourceParams& b) {
    const auto same = [](double x, double y) {
        return std::bit_cast<uint64_t>(x) == std::bit_cast<uint64_t>(y);
    };
    return a.mode == b.mode && a.output == b.output && same(a.range, b.range) &&
           same(a.frequency, b.frequency) && same(a.phase_deg, b.phase_deg) &&
           same(a.duty_cycle, b.duty_cycle) && a.seed == b.seed && same(a.ramp_seconds, b.ramp_seconds) &&
           same(a.sample_rate, b.sample_rate) && a.block_size == b.block_size &&
           same(a.amp_scale, b.amp_scale) && same(a.active_since, b.active_since) &&
           std::ranges::equal(a.arb_table, b.arb_table);
}

double ramp_gain(const SourceParams& p, double t) {
    if (!(t >= p.active_since)) {
        return 0.0;
    }
    if (!(p.ramp_seconds > 0.0)) {
        return 1.0;
    }
    return std::min(1.0, (t - p.active_since) / p.ramp_seconds);
}

double output_mean(const SourceParams& p) {
    if (!puts_out_signal(p.output)) {
        return 0.0;
    }
    const int32_t mode = base_mode(p.mode);
    const bool burst = is_burst(p.mode);
    const int64_t block = std::max<int32_t>(p.block_size, 1);
    const int64_t on = burst ? on_samples(p) : block;
    if (mode == code::mode_sine) {
        if (frequency(p) > 0.0) {
            return 0.0;
        }
        const double level = peak(p) * std::sin(p.phase_deg * std::numbers::pi / 180.0);
        return level * static_cast<double>(on) / static_cast<double>(block);
    }
    if (mode != code::mode_arbitrary || p.arb_table.empty()) {
        return 0.0;
    }
    const double scale = peak(p) * p.amp_scale / full_scale;
    const auto size = static_cast<int64_t>(p.arb_table.size());
    double table_sum = 0.0;
    for (int32_t v : p.arb_table) {
        table_sum += v;
    }
    if (!burst) {
        return table_sum / static_cast<double>(size) * scale;
    }
    if (block % size != 0) {
        // Bursts start at a different table entry each time: the long-run mean is close to this.
        return duty(p) * table_sum / static_cast<double>(size) * scale;
    }
    // Every burst plays the same entries: whole tables, then the start of one.
    double sum = static_cast<double>(on / size) * table_sum;
    for (int64_t k = 0; k < on % size; ++k) {
        sum += p.arb_table[k];
    }
    return sum / static_cast<double>(block) * scale;
}

void render_source(const SourceParams& p, double t0, double dt, std::span<double> out, bool ac_coupled) {
    const int32_t mode = base_mode(p.mode);
    const bool known = mode == code::mode_sine || mode == code::mode_random ||
                       mode == code::mode_zoom_random || mode == code::mode_arbitrary;
    const size_t n = out.size();
    if (!known || !puts_out_signal(p.output) || !(p.sample_rate > 0.0) || n == 0) {
        std::fill(out.begin(), out.end(), 0.0);
        return;
    }
    const auto time = [&](size_t i) { return t0 + static_cast<double>(i) * dt; };
    const auto index = [&](size_t i) { return sample_index(time(i), p.sample_rate); };
    // The envelope never falls as time goes on, so a block running forward is all off when its
    // last sample is, and all full when its first is.
    const bool forward = dt >= 0.0;
    if (forward && ramp_gain(p, time(n - 1)) == 0.0) {
        std::fill(out.begin(), out.end(), 0.0);
        return;
    }
    const bool full = forward && ramp_gain(p, time(0)) == 1.0;
    const double range = peak(p);
    const double noise_rms = range / noise_peak_factor;

    const bool burst = is_burst(p.mode) && duty(p) < 1.0;
    const auto on = [&](int64_t k) { return !burst || burst_on(p, k); };

    // The waveform at full amplitude (the noise forms skip what a burst leaves off).
    if (mode == code::mode_sine) {
        render_sine(range, frequency(p), p.phase_deg / 360.0, t0, dt, out);
    } else if (mode == code::mode_random) {
        Gaussians noise(source_stream(p.seed));
        for (size_t i = 0; i < n; ++i) {
            const int64_t k = index(i);
            out[i] = on(k) ? cut(noise_rms * noise.at(static_cast<uint64_t>(k)), range) : 0.0;
        }
    } else if (mode == code::mode_zoom_random) {
        ZoomFilter zoom(source_stream(p.seed));
        for (size_t i = 0; i < n; ++i) {
            const int64_t k = index(i);
            out[i] = on(k) ? zoom.at(k) : 0.0;
        }
        if (p.frequency > 0.0) {
            // The shift up to the frequency: sqrt(2) cos(2 pi f t), a quarter turn ahead of the sine.
            std::vector<double> shift(n);
            render_sine(std::numbers::sqrt2, p.frequency, 0.25, t0, dt, shift);
            for (size_t i = 0; i < n; ++i)
                out[i] *= shift[i];
        }
        for (double& v : out)
            v = cut(noise_rms * v, range);
    } else if (p.arb_table.empty()) {
        std::fill(out.begin(), out.end(), 0.0);
    } else {
        const auto size = static_cast<int64_t>(p.arb_table.size());
        const double arb_scale = range * p.amp_scale / full_scale;
        for (size_t i = 0; i < n; ++i)
            out[i] = p.arb_table[static_cast<size_t>(wrap(index(i), size))] * arb_scale;
    }

    // Bursts off, the ramp and the AC coupling's mean.
    const double mean = ac_coupled ? output_mean(p) : 0.0;
    if (!burst && full && mean == 0.0)
        return;
    for (size_t i = 0; i < n; ++i) {
        const double gain = full ? 1.0 : ramp_gain(p, time(i));
        const double v = on(index(i)) ? out[i] : 0.0;
        out[i] = gain == 0.0 ? 0.0 : gain * (v - mean);
    }
}

double next_period_start(const SourceParams& p, double t) {
    constexpr double never = std::numeric_limits<double>::infinity();
    t = std::max(t, p.active_since);  // a source not yet running starts no period
    if (std::isnan(t)) {
        return never;
    }
    if (p.mode == code::mode_sine) {
        if (!(p.frequency > 0.0)) {
            return never;
        }
        const double phase_turns = p.phase_deg / 360.0;
        const double n = std::ceil(p.frequency * t + phase_turns);
        return std::max(t, (n - phase_turns) / p.frequency);
    }
    if (!(p.sample_rate > 0.0)) {
        return never;
    }
    const int64_t samples = p.mode == code::mode_arbitrary && !p.arb_table.empty()
                                ? static_cast<int64_t>(p.arb_table.size())
                                : std::max<int32_t>(p.block_size, 1);
    const double period = static_cast<double>(samples) / p.sample_rate;
    return std::max(t, std::ceil(t / period) * period);
}

void add_input_noise(uint32_t channel_seed, uint64_t first_sample_index, double rms, std::span<double> out) {
    // Sample k draws 64 random bits, SplitMix64 output k of the channel's stream, and adds up their
    // eight bytes: a sum of eight independent uniform values 0..255, mean 1020 and variance
    // 8 (256^2 - 1) / 12 = 43690. That is close to normal (4 % fewer values beyond 2 standard
    // deviations, 40 % fewer beyond 3, none beyond 4.88), in steps of 1/209 of the rms, and costs
    // a few integer operations instead of a logarithm and a cosine.
    constexpr uint64_t golden = 0x9e3779b97f4a7c15ULL;
    constexpr uint64_t low_bytes = 0x00ff00ff00ff00ffULL;
    const double scale = rms / std::sqrt(43690.0);
    uint64_t state = mix64(input_stream_salt ^ channel_seed) + first_sample_index * golden;
    for (double& v : out) {
        const uint64_t bits = mix64(state);
        state += golden;
        const uint64_t pairs = (bits & low_bytes) + ((bits >> 8) & low_bytes);  // four sums of two bytes
        const auto sum = static_cast<int64_t>((pairs * 0x0001000100010001ULL) >> 48);
        v += scale * static_cast<double>(sum - 1020);
    }
}

bool clip(std::span<double> v, double range) {
    // Two samples at a time (SSE2 on x86-64), without branches: each pair is cut and the highest
    // and lowest samples kept; a NaN passes and is not a cut.
    using Pair = double __attribute__((vector_size(16)));
    const double r = range > 0.0 ? range : 0.0;
    const Pair high = {r, r}, low = {-r, -r};
    Pair top = low, bottom = high;
    size_t i = 0;
    for (; i + 2 <= v.size(); i += 2) {
        Pair x;
        std::memcpy(&x, v.data() + i, sizeof x);
        top = x > top ? x : top;
        bottom = x < bottom ? x : bottom;
        x = x > high ? high : x;
        x = x < low ? low : x;
        std::memcpy(v.data() + i, &x, sizeof x);
    }
    bool cut_any = top[0] > r || top[1] > r || bottom[0] < -r || bottom[1] < -r;
    for (; i < v.size(); ++i) {
        if (v[i] > r) {
            v[i] = r;
            cut_any = true;
        } else if (v[i] < -r) {
            v[i] = -r;
            cut_any = true;
        }
    }
    return cut_any;
}

void ac_couple(std::span<double> v) {
    if (v.empty()) {
        return;
    }
    double sum = 0.0;
    for (double x : v) {
        sum += x;
    }
    const double mean = sum / static_cast<double>(v.size());
    for (double& x : v) {
        x -= mean;
    }
}

namespace {

// One FFT size: the real-FFT plan, the Hann window and the work buffers.
struct SpectrumPlan {
    explicit SpectrumPlan(size_t n)
        : cfg(kiss_fftr_alloc(static_cast<int>(n), 0, nullptr, nullptr)),
          window(n),
          input(n),
          bins(n / 2 + 1) {
        for (size_t i = 0; i < n; ++i) {
            window[i] = 0.5 - 0.5 * std::cos(two_pi * static_cast<double>(i) / static_cast<double>(n));
            window_sum += window[i];
        }
    }
    ~SpectrumPlan() { kiss_fftr_free(cfg); }
    SpectrumPlan(const SpectrumPlan&) = delete;
    SpectrumPlan& operator=(const SpectrumPlan&) = delete;

    kiss_fftr_cfg cfg;
    std::vector<double> window;
    double window_sum = 0.0;
    std::vector<kiss_fft_scalar> input;
    std::vector<kiss_fft_cpx> bins;
};

SpectrumPlan* plan_for(size_t n) {
    thread_local std::map<size_t, std::unique_ptr<SpectrumPlan>> plans;
    auto& plan = plans[n];
    if (!plan) {
        plan = std::make_unique<SpectrumPlan>(n);
        if (plan->cfg == nullptr) {
            plans.erase(n);
            return nullptr;
        }
    }
    return plan.get();
}

}  // namespace

bool magnitude_spectrum(std::span<const double> block, std::span<double> out) {
    const size_t n = block.size();
    if (n < 2 || n % 2 != 0 || out.size() != n / 2 ||
        n > static_cast<size_t>(std::numeric_limits<int>::max())) {
        return false;
    }
    SpectrumPlan* plan = plan_for(n);
    if (plan == nullptr) {
        return false;
    }
    for (size_t i = 0; i < n; ++i) {
        plan->input[i] = static_cast<kiss_fft_scalar>(block[i] * plan->window[i]);
    }
    kiss_fftr(plan->cfg, plan->input.data(), plan->bins.data());
    // A sine splits into two half-height lines (positive and negative frequency); a constant does
    // not, so bin 0 takes half the gain of the others.
    const double gain = 2.0 / plan->window_sum;
    for (size_t k = 0; k < n / 2; ++k) {
        const double re = plan->bins[k].r;
        const double im = plan->bins[k].i;
        out[k] = std::sqrt(re * re + im * im) * (k == 0 ? gain / 2.0 : gain);
    }
    return true;
}

std::optional<size_t> find_level_trigger(std::span<const double> v, double upper, double lower,
                                         bool positive_slope, bool& armed) {
    if (upper < lower) {
        std::swap(upper, lower);
    }
    for (size_t i = 0; i < v.size(); ++i) {
        const double x = v[i];
        if (positive_slope) {
            if (armed && x >= upper) {
                armed = false;
                return i;
            }
            if (x < lower) {
                armed = true;
            }
        } else {
            if (armed && x <= lower) {
                armed = false;
                return i;
            }
            if (x > upper) {
                armed = true;
            }
        }
    }
    return std::nullopt;
}

std::optional<size_t> find_bound_trigger(std::span<const double> v, double upper, double lower, bool exit,
                                         bool& armed) {
    if (upper < lower) {
        std::swap(upper, lower);
    }
    for (size_t i = 0; i < v.size(); ++i) {
        const bool inside = v[i] >= lower && v[i] <= upper;
        if (armed && inside != exit) {
            armed = false;
            return i;
        }
        if (inside == exit) {
            armed = true;
        }
    }
    return std::nullopt;
}

}  // namespace sim::signals
