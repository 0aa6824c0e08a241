#include "signals.h"

#include <kiss_fftr.h>

#include <algorithm>
#include <array>
#include <cmath>
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

// Standard normal value number `index` of the stream: a counter-based generator, so any sample can
// be drawn on its own and blocks can be rendered in any order.
double gaussian(uint64_t stream, uint64_t index) {
    const uint64_t a = mix64(stream ^ mix64(index));
    const uint64_t b = mix64(a ^ 0xd1b54a32d192ed03ULL);
    const double u1 = static_cast<double>((a >> 11) + 1) * 0x1p-53;  // (0, 1]
    const double u2 = static_cast<double>(b >> 11) * 0x1p-53;        // [0, 1)
    return std::sqrt(-2.0 * std::log(u1)) * std::cos(two_pi * u2);
}

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
// consecutive samples draw one new value each. The sum always runs in index order, so the result
// depends on k alone and not on where a block starts.
class ZoomFilter {
  public:
    explicit ZoomFilter(uint64_t stream) : stream_(stream) {
        double power = 0.0;
        for (int j = 0; j < zoom_taps; ++j) {
            const double s = std::sin(std::numbers::pi * (j + 1) / (zoom_taps + 1));
            weights_[j] = s * s;
            power += weights_[j] * weights_[j];
        }
        for (double& w : weights_) {
            w /= std::sqrt(power);  // unit variance out for unit variance in
        }
    }

    double at(int64_t k) {
        if (!filled_ || k != last_ + 1) {
            for (int64_t j = 0; j < zoom_taps; ++j) {
                ring_[wrap(k - j, zoom_taps)] = gaussian(stream_, static_cast<uint64_t>(k - j));
            }
            filled_ = true;
        } else {
            ring_[wrap(k, zoom_taps)] = gaussian(stream_, static_cast<uint64_t>(k));
        }
        last_ = k;
        double sum = 0.0;
        for (int64_t j = 0; j < zoom_taps; ++j) {
            sum += weights_[j] * ring_[wrap(k - j, zoom_taps)];
        }
        return sum;
    }

  private:
    uint64_t stream_;
    std::array<double, zoom_taps> weights_{};
    std::array<double, zoom_taps> ring_{};
    int64_t last_ = 0;
    bool filled_ = false;
};

double cut(double v, double limit) {
    return std::clamp(v, -limit, limit);
}

}  // namespace

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
    if (!known || !puts_out_signal(p.output) || !(p.sample_rate > 0.0)) {
        std::fill(out.begin(), out.end(), 0.0);
        return;
    }
    const double range = peak(p);
    const double mean = ac_coupled ? output_mean(p) : 0.0;
    const double phase_turns = p.phase_deg / 360.0;
    const double noise_rms = range / noise_peak_factor;
    const double arb_scale = range * p.amp_scale / full_scale;
    const uint64_t stream = source_stream(p.seed);
    const bool burst = is_burst(p.mode);
    ZoomFilter zoom(stream);

    for (size_t i = 0; i < out.size(); ++i) {
        const double t = t0 + static_cast<double>(i) * dt;
        const double gain = ramp_gain(p, t);
        const int64_t k = sample_index(t, p.sample_rate);
        if (gain == 0.0) {
            out[i] = 0.0;
            continue;
        }
        double v = 0.0;
        if (!burst || burst_on(p, k)) {
            if (mode == code::mode_sine) {
                v = range * std::sin(two_pi * turns(frequency(p), t, phase_turns));
            } else if (mode == code::mode_random) {
                v = cut(noise_rms * gaussian(stream, static_cast<uint64_t>(k)), range);
            } else if (mode == code::mode_zoom_random) {
                double lp = zoom.at(k);
                if (p.frequency > 0.0) {
                    lp *= std::numbers::sqrt2 * std::cos(two_pi * turns(p.frequency, t, 0.0));
                }
                v = cut(noise_rms * lp, range);
            } else if (!p.arb_table.empty()) {
                const auto size = static_cast<int64_t>(p.arb_table.size());
                v = p.arb_table[wrap(k, size)] * arb_scale;
            }
        }
        out[i] = gain * (v - mean);
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
    const uint64_t stream = mix64(input_stream_salt ^ channel_seed);
    for (size_t i = 0; i < out.size(); ++i) {
        out[i] += rms * gaussian(stream, first_sample_index + i);
    }
}

bool clip(std::span<double> v, double range) {
    const double r = range > 0.0 ? range : 0.0;
    bool cut_any = false;
    for (double& x : v) {
        if (x > r) {
            x = r;
            cut_any = true;
        } else if (x < -r) {
            x = -r;
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
        out[k] = std::hypot(re, im) * (k == 0 ? gain / 2.0 : gain);
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
