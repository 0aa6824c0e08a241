// The pieces of source programming that stand on their own: the arbitrary test waveform and the
// limits a numeric setting is brought within before it is sent.
#pragma once

#include <array>
#include <cstdint>

// Driver codes of the source settings, as the page reads and writes them.
namespace srccode {
inline constexpr int32_t on = 420;  // active, trigger channel
inline constexpr int32_t off = 421;
inline constexpr int32_t first_mode = 170;
inline constexpr std::array<const char*, 8> mode_names = {
    "Sine",        "Burst Sine",        "Random",    "Burst Random",
    "Zoom Random", "Burst Zoom Random", "Arbitrary", "Burst Arbitrary"};
inline constexpr int32_t mode_arbitrary = 176;
inline constexpr int32_t mode_burst_arbitrary = 177;
inline constexpr int32_t first_output = 700;
inline constexpr std::array<const char*, 5> output_names = {"Normal", "Grounded", "Open", "Cal", "Multi"};
inline constexpr int32_t cola_off = 180;
inline constexpr int32_t cola_on = 181;
inline constexpr int32_t sum_off = 190;
inline constexpr int32_t sum_on = 191;
}  // namespace srccode

inline constexpr int arb_table_points = 1024;

// A rising ramp over 0..2147000000 whose first and second quarters, and third and fourth
// quarters, have changed places.
std::array<int32_t, arb_table_points> arb_test_waveform();

// value brought within lower..upper. A value that is no number gives the lower limit.
double source_limit(double value, double lower, double upper);
