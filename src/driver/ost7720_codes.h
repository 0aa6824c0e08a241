// The driver's enumeration codes: what the panel passes and reads for each setting. The
// simulator answers with the same numbers.
#pragma once

#include <cstdint>

namespace ost7720_code {

// Switches shared by several settings (channel activity, trigger participation).
inline constexpr int32_t on = 420;
inline constexpr int32_t off = 421;

// Input analog set-up.
inline constexpr int32_t coupling_ac = 100;
inline constexpr int32_t coupling_dc = 101;
inline constexpr int32_t input_volt = 130;
inline constexpr int32_t input_icp = 131;
inline constexpr int32_t input_charge = 132;
inline constexpr int32_t input_mic = 133;
inline constexpr int32_t input_mic_200v = 134;
inline constexpr int32_t anti_alias_on = 615;
inline constexpr int32_t anti_alias_off = 616;

// Input triggering.
inline constexpr int32_t slope_positive = 410;  // "Pos/Exit"
inline constexpr int32_t slope_negative = 411;  // "Neg/Enter"
inline constexpr int32_t trigger_level = 414;
inline constexpr int32_t trigger_bound = 415;
inline constexpr int32_t level_lower = 416;
inline constexpr int32_t level_upper = 417;

// Measurement.
inline constexpr int32_t data_block = 340;
inline constexpr int32_t data_continuous = 341;
inline constexpr int32_t read_time = 345;
inline constexpr int32_t read_frequency = 346;
inline constexpr int32_t kind_time = 270;
inline constexpr int32_t kind_frequency = 271;
inline constexpr int32_t enable_on = 280;
inline constexpr int32_t enable_off = 281;
inline constexpr int32_t calc_time = 724;
inline constexpr int32_t calc_frequency = 725;
inline constexpr int32_t avg_time = 700;       // no frequency averaging: blocks in the time domain
inline constexpr int32_t avg_rms = 701;        // power average of spectra
inline constexpr int32_t avg_peak_hold = 702;  // peak hold of spectra
inline constexpr int32_t avg_frequency = 703;  // linear average of spectra
inline constexpr int32_t window_uniform = 710;
inline constexpr int32_t window_hann = 711;
inline constexpr int32_t window_flat_top = 712;
inline constexpr int32_t arm_multi = 430;
inline constexpr int32_t arm_single = 431;
inline constexpr int32_t auto_trigger_off = 440;
inline constexpr int32_t auto_trigger_on = 441;

// Source.
inline constexpr int32_t mode_sine = 170;
inline constexpr int32_t mode_burst_sine = 171;
inline constexpr int32_t mode_random = 172;
inline constexpr int32_t mode_burst_random = 173;
inline constexpr int32_t mode_zoom_random = 174;
inline constexpr int32_t mode_burst_zoom_random = 175;
inline constexpr int32_t mode_arbitrary = 176;
inline constexpr int32_t mode_burst_arbitrary = 177;
inline constexpr int32_t output_normal = 700;
inline constexpr int32_t output_grounded = 701;
inline constexpr int32_t output_open = 702;
inline constexpr int32_t output_cal = 703;
inline constexpr int32_t output_multi = 704;
inline constexpr int32_t cola_off = 180;
inline constexpr int32_t cola_on = 181;
inline constexpr int32_t sum_off = 190;
inline constexpr int32_t sum_on = 191;

// Arbitrary buffer modes (buffer mode, readiness check and data write): 1 single shot,
// 2 single shot with hold, 3 continuous from the start, 4 continuous cyclic playback.
inline constexpr int32_t buffer_mode_min = 1;
inline constexpr int32_t buffer_mode_max = 4;

}  // namespace ost7720_code
