// Waveform and spectrum maths of the simulated module: what a source puts out, the noise an
// input adds, overload clipping, AC coupling, the magnitude spectrum and level triggering.
//
// Everything here is a pure function of its arguments except where a state argument says
// otherwise, so blocks can be rendered in any order and contiguous blocks join seamlessly.
//
// The source model:
//   - Every source runs on a sample clock of `sample_rate` (the simulator gives it the
//     measurement's rate, 2.56 x span, as the module shares one clock). Sample k of the source
//     covers absolute times [k, k+1) / sample_rate; a sine is evaluated at the exact time instead.
//   - Sine: range * sin(2 pi f t + phase); a frequency of 0 or below gives the constant
//     range * sin(phase).
//   - Random: white Gaussian noise, one independent value per source sample (flat up to half the
//     sample rate), rms range / 4 and cut at +-range, drawn from a counter-based hash of
//     (seed, sample index): the same seed gives the same noise at the same time.
//   - Zoom random: the random noise low-passed by a Hann-weighted moving average of `zoom_taps`
//     samples (a band of +-2 * sample_rate / zoom_taps to the first nulls, +-3200 Hz at span
//     20000 Hz) and shifted up to the sine frequency by multiplying with sqrt(2) cos(2 pi f t) (no
//     shift at frequency 0); same rms and cut as random.
//   - Arbitrary: the table played cyclically, one entry per source sample (at span 20000 Hz and
//     block size 1024 one block shows the table once); entry v gives v / 2^31 * range * amp_scale.
//     An empty table plays silence.
//   - Burst forms: the burst period is `block_size` source samples, aligned to absolute sample 0;
//     the output is on for the first duty_cycle fraction of each period and 0 for the rest.
//   - Outputs Normal, Cal and Multi put out the signal; Grounded, Open and any unknown output code
//     put out 0. An unknown mode code puts out 0.
//   - Ramp: the amplitude rises linearly from 0 at `active_since` to full at active_since +
//     ramp_seconds (0 or less: full at once); before active_since the source puts out 0.
#pragma once

#include <cstddef>
#include <cstdint>
#include <limits>
#include <optional>
#include <span>

#include "codes.h"

namespace sim::signals {

inline constexpr int32_t default_block_size = 1024;  // source samples per burst period
inline constexpr int zoom_taps = 32;
inline constexpr double default_input_noise_rms = 1e-3;  // volts

struct SourceParams {
    int32_t mode = code::mode_sine;
    int32_t output = code::output_normal;
    double range = 1.0;         // peak volts
    double frequency = 1000.0;  // Hz; sine, and the centre of the zoom band
    double phase_deg = 0.0;
    double duty_cycle = 1.0;  // burst forms only; clamped to 0..1
    int32_t seed = 1;
    double ramp_seconds = 0.0;
    double sample_rate = 51200.0;  // Hz, the source's sample clock
    int32_t block_size = default_block_size;
    double amp_scale = 1.0;                // arbitrary forms only
    std::span<const int32_t> arb_table{};  // played cyclically; normally 1024 entries
    double active_since = -std::numeric_limits<double>::infinity();  // seconds, absolute
};

// True when a and b give the same output at every time: every field equal to the bit (so -0 and 0
// differ and a NaN equals itself), the tables by content. A new field of SourceParams goes in here.
bool same_output(const SourceParams& a, const SourceParams& b);

// The source's output at the absolute times t0 + i * dt, i = 0 .. out.size()-1. With ac_coupled
// the long-run mean of the output (output_mean, scaled by the ramp) is taken off, which is how an
// AC-coupled input sees a looped-back source: exact, and contiguous blocks still join.
void render_source(const SourceParams& p, double t0, double dt, std::span<double> out,
                   bool ac_coupled = false);

// The output's mean over a long run at full amplitude: the table mean for arbitrary forms (of the
// part played, for the burst form), range * sin(phase) (times the duty cycle for the burst form)
// for a sine at frequency 0 or below, and 0 for everything else (noise, and a sine is taken as
// zero-mean over many bursts).
double output_mean(const SourceParams& p);

// The ramp envelope at absolute time t, 0..1.
double ramp_gain(const SourceParams& p, double t);

// The start of the first period of the source's output at or after t: for Sine, the times at which
// its phase 2 pi f t + phase passes a whole number of turns (the rising zero crossing), +infinity
// when the frequency is 0 or below; for Arbitrary, the table's start (every table-size samples);
// for every other mode, the start of each block_size-sample source block (the burst start for
// burst forms). Times are absolute seconds, never before active_since; +infinity when there is no
// next period. The output connection does not matter: the generator runs on behind a grounded or
// open output.
double next_period_start(const SourceParams& p, double t);

// Adds reproducible, nearly Gaussian noise of `rms` volts (a sum of eight uniform deviates, so it
// ends at 4.9 x rms): sample i gets the value for the absolute sample index first_sample_index + i
// of the stream chosen by channel_seed, so contiguous blocks continue the same stream.
void add_input_noise(uint32_t channel_seed, uint64_t first_sample_index, double rms, std::span<double> out);

// Cuts every sample to -range .. +range (a negative range counts as 0); true when any sample was
// cut (overload).
bool clip(std::span<double> v, double range);

// Takes the block's mean off every sample: AC coupling of data whose DC part is not known in
// advance. For a looped-back source prefer render_source(..., ac_coupled = true), which does not
// step between contiguous blocks.
void ac_couple(std::span<double> v);

// The magnitude spectrum of the Hann-windowed block: out[k] for bins k = 0 .. n/2-1 of an n-point
// block (bin width sample_rate / n). Scaled so a sine of amplitude A centred in bin k reads A there
// and a constant c reads c in bin 0. n must be even and at least 2 and out must hold exactly n/2
// values; otherwise out is left alone and the result is false. The FFT plan and window are cached
// per size and per thread.
bool magnitude_spectrum(std::span<const double> block, std::span<double> out);

// Level trigger with hysteresis over a stream fed block by block. `armed` carries over between
// calls (start with false). Positive slope: a sample below the lower level arms; the first armed
// sample at or above the upper level fires. Negative slope: a sample above the upper level arms;
// the first armed sample at or below the lower level fires. Firing disarms. Returns the index of
// the firing sample, or nothing when none fires in v. Levels given the wrong way round are swapped.
std::optional<size_t> find_level_trigger(std::span<const double> v, double upper, double lower,
                                         bool positive_slope, bool& armed);

// Bound (window) trigger over the band lower .. upper. Exit: a sample inside the band arms, the
// first armed sample outside it fires. Enter: a sample outside arms, the first armed sample inside
// fires. Otherwise as find_level_trigger.
std::optional<size_t> find_bound_trigger(std::span<const double> v, double upper, double lower, bool exit,
                                         bool& armed);

}  // namespace sim::signals
