// The panel's shared state: plain process-wide variables that every window reads and writes.
// Widths follow the instrument conventions: Integer int16_t, Long int32_t, flags int16_t
// holding flag_true (-1) or flag_false (0); a flag is true only when it equals flag_true.
#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <vector>

namespace global {

inline constexpr int16_t flag_true = -1;
inline constexpr int16_t flag_false = 0;

// Instrument session and channel groups
inline int32_t session = 0;
inline int32_t group_all = 0;
inline int32_t group_inputs = 0;
inline int32_t group_sources = 0;
inline int32_t group_tachs = 0;
inline int32_t status = 0;
inline std::string driver_revision;

// Channel lists, rebuilt by open_session; sized count + 1
inline int32_t num_inputs = 0;
inline std::vector<int32_t> input_ids(1);
inline int32_t num_sources = 0;
inline std::vector<int32_t> source_ids(1);
inline int32_t num_tachs = 0;
inline std::vector<int32_t> tach_ids(1);
inline std::vector<int32_t> all_ids(1);

// Module table, built once by find_modules; sized module_count + 1
inline std::string interface_name;
inline int32_t module_count = 0;
inline std::vector<int32_t> module_address;
inline std::vector<int32_t> module_inputs;
inline std::vector<int32_t> module_sources;
inline std::vector<int32_t> module_tachs;
inline std::vector<std::string> module_memory;
inline std::vector<int16_t> module_use;

// Measurement settings
inline int16_t single_block = flag_true;
inline int16_t block_mode = flag_true;
inline int16_t trigger_source = 0;  // 0 Auto, 1 Manual, 2 Input, 3 Source
inline int32_t blocksize = 1024;
inline double span = 20000.0;
inline int16_t domain = 0;  // 0 Time, 1 Frequency
inline int32_t multi_mainframe = 0;
inline int16_t running = flag_false;
inline int32_t num_points = 0;

// Per-trace state, index 0..3 used (index 4 exists and is never touched)
inline std::array<int32_t, 5> trace_channel{};
inline std::array<double, 5> trace_high{1.0, 1.0, 1.0, 1.0, 1.0};
inline std::array<double, 5> trace_low{-1.0, -1.0, -1.0, -1.0, -1.0};
inline std::array<std::string, 5> trace_file;
inline std::array<int16_t, 5> trace_has_data{};
inline std::array<double, 5> trace_range{};
inline std::vector<double> trace1_data;
inline std::vector<double> trace2_data;
inline std::vector<double> trace3_data;
inline std::vector<double> trace4_data;
inline std::vector<float> x_values;

inline int16_t all_channels_match = flag_true;

// Main window layout metrics in twips, 32 bits wide so that no window size can overflow them.
inline int32_t trace_area_left = 0;
inline int32_t trace_area_top = 0;
inline int32_t trace_area_width = 0;
inline int32_t trace_area_height = 0;

// The data array of trace slot t (0..3).
std::vector<double>& trace_data(int t);

void set_defaults();

}  // namespace global
