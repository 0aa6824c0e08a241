// The pieces of source programming that stand on their own: the arbitrary test waveform and the
// limits a numeric setting is brought within before it is sent.
#pragma once

#include <array>
#include <cstdint>

#include "ost7720_codes.h"

// Driver codes of the source settings, as the page reads and writes them.
namespace srccode {
inline constexpr int32_t on = ost7720_code::on;  // active, trigger channel
inline constexpr int32_t off = ost7720_code::off;
inline constexpr int32_t first_mode = ost7720_code::mode_sine;
inline constexpr std::array<const char*, 8> mode_names = {
    "Sine",        "Burst Sine",        "Random",    "Burst Random",
    "Zoom Random", "Burst Zoom Random", "Arbitrary", "Burst Arbitrary"};
inline constexpr int32_t mode_arbitrary = ost7720_code::mode_arbitrary;
inline constexpr int32_t mode_burst_arbitrary = ost7720_code::mode_burst_arbitrary;
inline constexpr int32_t first_output = ost7720_code::output_normal;
inline constexpr std::array<const char*, 5> output_names = {"Normal", "Grounded", "Open", "Cal", "Multi"};
inline constexpr int32_t cola_off = ost7720_code::cola_off;
inline constexpr int32_t cola_on = ost7720_code::cola_on;
inline constexpr int32_t sum_off = ost7720_code::sum_off;
inline constexpr int32_t sum_on = ost7720_code::sum_on;
}  // namespace srccode

inline constexpr int arb_table_points = 1024;

// A rising ramp over 0..2147000000 whose first and second quarters, and third and fourth
// quarters, have changed places.
std::array<int32_t, arb_table_points> arb_test_waveform();

// value brought within lower..upper. A value that is no number gives the lower limit.
double source_limit(double value, double lower, double upper);
